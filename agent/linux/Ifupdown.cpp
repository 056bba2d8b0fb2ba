#include "agent/linux/AddressMode.h"
#include "agent/linux/Words.h"

#include <algorithm>

namespace Orv::Agent::Linux {

namespace {

constexpr const char* mainFile = "/etc/network/interfaces";
constexpr const char* directory = "/etc/network/";

/** Files may source one another; a circle ends here. */
constexpr int deepestSource = 8;
constexpr int mostFiles = 1024;

/** A line that ends in a backslash goes on in the next. */
std::vector<std::string> logicalLines(std::string_view text) {
    std::vector<std::string> lines;
    bool continues = false;
    for (const std::string_view line : linesOf(text)) {
        const bool open = line.ends_with('\\');
        const std::string_view part = line.substr(0, line.size() - (open ? 1 : 0));
        if (continues) {
            lines.back().append(part);
        } else {
            lines.emplace_back(part);
        }
        continues = open;
    }
    return lines;
}

/** Files of a sourced directory have such names only; editors leave others behind. */
bool isPlainName(std::string_view name) {
    constexpr std::string_view plain = "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ0123456789_-";
    return !name.empty() && name.find_first_not_of(plain) == std::string_view::npos;
}

class Reader {
  public:
    Reader(HostFiles& files, std::map<std::string, AddressMode>& modes) : _files(files), _modes(modes) {}

    void readFile(const std::string& path, int depth) {
        if (depth > deepestSource || ++_count > mostFiles) {
            return;
        }
        const std::string text = _files.read(path).value_or("");
        for (const std::string& line : logicalLines(text)) {
            readLine(wordsOf(line), depth);
        }
    }

  private:
    void readLine(const std::vector<std::string_view>& words, int depth) {
        if (words.size() < 2 || words[0].starts_with('#')) {
            return;
        }
        if (words[0] == "iface") {
            readInterface(words);
        } else if (words[0] == "source") {
            for (std::size_t word = 1; word < words.size(); ++word) {
                for (const std::string& path : _files.expand(absolute(words[word]))) {
                    readFile(path, depth + 1);
                }
            }
        } else if (words[0] == "source-directory") {
            readDirectory(absolute(words[1]), depth);
        }
    }

    /** iface NAME FAMILY METHOD */
    void readInterface(const std::vector<std::string_view>& words) {
        if (words.size() < 4 || words[2] != "inet") {
            return;
        }
        if (words[3] == "dhcp" || words[3] == "bootp") {
            _modes.try_emplace(std::string(words[1]), AddressMode::leased);
        } else if (words[3] == "static") {
            _modes.try_emplace(std::string(words[1]), AddressMode::fixed);
        }
    }

    void readDirectory(const std::string& path, int depth) {
        for (const std::string& name : _files.list(path)) {
            if (isPlainName(name)) {
                readFile(pathIn(path, name), depth + 1);
            }
        }
    }

    static std::string absolute(std::string_view path) {
        return path.starts_with('/') ? std::string(path) : directory + std::string(path);
    }

    HostFiles& _files;
    std::map<std::string, AddressMode>& _modes;
    int _count = 0;
};

} // namespace

std::map<std::string, AddressMode> readIfupdown(HostFiles& files) {
    std::map<std::string, AddressMode> modes;
    Reader(files, modes).readFile(mainFile, 0);
    return modes;
}

} // namespace Orv::Agent::Linux

#include "agent/persistence/InterfacesFiles.h"

#include "agent/linux/HostFiles.h"
#include "agent/persistence/FileEdit.h"

#include <algorithm>
#include <filesystem>
#include <stdexcept>
#include <utility>

namespace Orv::Agent::Persistence {

namespace {

constexpr const char* mainFileName = "/etc/network/interfaces";

/** Files may source one another; a circle ends here. */
constexpr int deepestSource = 8;
constexpr std::size_t mostFiles = 1024;

/** Files of a sourced directory have such names only; editors leave others behind. */
bool isPlainName(const std::string& name) {
    constexpr std::string_view plain = "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ0123456789_-";
    return !name.empty() && name.find_first_not_of(plain) == std::string::npos;
}

} // namespace

std::string InterfacesFiles::mainPath(const std::string& root) {
    return root + mainFileName;
}

InterfacesFiles::InterfacesFiles(std::string root) : _root(std::move(root)) {
    readFile(mainFileName, 0);
}

void InterfacesFiles::readFile(const std::string& path, int depth) {
    if (depth > deepestSource || _files.size() > mostFiles) {
        throw std::runtime_error(path + ": the files of " + mainFileName + " source one another without end");
    }
    // Whatever is read twice says the same twice; it can be edited once only.
    if (!_read.insert(path).second) {
        return;
    }
    auto content = contentOf(_root + path);
    if (!content) {
        return;
    }
    const File& file = _files.emplace_back(File{_root + path, InterfacesFile(std::move(*content))});
    for (const InterfacesFile::Stanza& stanza : file.content.stanzas()) {
        const InterfacesFile::Statement& header = file.content.header(stanza);
        if (header.keyword.starts_with("source")) {
            follow(file, header, depth);
        } else {
            _stanzas.push_back({&file, &stanza});
        }
    }
}

void InterfacesFiles::follow(const File& file, const InterfacesFile::Statement& source, int depth) {
    const std::filesystem::path directory = std::filesystem::path(file.path.substr(_root.size())).parent_path();
    Linux::HostFiles files(_root);
    const std::vector<InterfacesFile::Word> words = file.content.wordsOf(source);
    for (auto word = words.begin() + 1; word != words.end(); ++word) {
        for (const std::string& path : files.expand(directory / word->text)) {
            if (std::filesystem::is_directory(_root + path)) {
                readDirectory(path, depth);
            } else if (source.keyword == "source") {
                readFile(path, depth + 1);
            }
        }
    }
}

void InterfacesFiles::readDirectory(const std::string& path, int depth) {
    for (const std::string& name : Linux::HostFiles(_root).list(path)) {
        const std::string file = Linux::pathIn(path, name);
        if (isPlainName(name) && !std::filesystem::is_directory(_root + file)) {
            readFile(file, depth + 1);
        }
    }
}

} // namespace Orv::Agent::Persistence

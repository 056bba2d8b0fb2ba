#include "host/schema/Reader.h"

#include "host/schema/Parser.h"

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <memory>
#include <set>

namespace marlo::mof {

namespace {

namespace fs = std::filesystem;

/** Files that include each other in a line; more is a mistake and would only exhaust the stack. */
constexpr int DeepestInclude = 16;

struct FileCloser {
    void operator()(std::FILE* file) const { static_cast<void>(std::fclose(file)); }
};

/** The bytes of a file; throws std::runtime_error with the reason alone. */
std::string readBytes(const std::string& path) {
    const std::unique_ptr<std::FILE, FileCloser> file(std::fopen(path.c_str(), "re"));
    if (!file) {
        throw std::runtime_error(strerror(errno));
    }
    std::string bytes;
    constexpr std::size_t Step = 65536;
    std::size_t count = 0;
    do {
        const std::size_t size = bytes.size();
        bytes.resize(size + Step);
        count = fread(bytes.data() + size, 1, Step, file.get());
        bytes.resize(size + count);
    } while (count == Step);
    if (ferror(file.get()) != 0) {
        throw std::runtime_error(strerror(errno));
    }
    return bytes;
}

class Reader {
  public:
    void readText(std::string_view text, const std::string& name, const std::string& nameSpace) {
        const std::string& file = _declarations.files.emplace_back(name);
        const auto include = [this](const std::string& included, const Location& at, const std::string& inNameSpace) {
            readIncluded(included, at, inNameSpace);
        };
        Parser(text, file, nameSpace, _declarations, include).parse();
    }

    void readFile(const std::string& path, const std::string& nameSpace) {
        if (_files.insert(fs::weakly_canonical(path).string()).second) {
            readText(readBytes(path), path, nameSpace);
        }
    }

    Declarations take() { return std::move(_declarations); }

  private:
    void readIncluded(const std::string& name, const Location& at, const std::string& nameSpace) {
        if (_depth == DeepestInclude) {
            throw Error(at, "files include each other more than " + std::to_string(DeepestInclude) + " deep");
        }
        ++_depth;
        try {
            readFile((fs::path(*at.file).parent_path() / name).string(), nameSpace);
        } catch (const Error&) {
            throw;
        } catch (const std::runtime_error& error) {
            throw Error(at, "cannot read \"" + name + "\": " + error.what());
        }
        --_depth;
    }

    Declarations _declarations;
    std::set<std::string> _files; ///< read so far
    int _depth = 0;
};

/** In the order of their names. */
std::vector<std::string> listMofFiles(const std::string& directory) {
    std::vector<std::string> paths;
    std::error_code error;
    for (fs::directory_iterator entry(directory, error), end; !error && entry != end; entry.increment(error)) {
        if (entry->path().extension() == ".mof") {
            paths.push_back(entry->path().string());
        }
    }
    if (error) {
        throw std::runtime_error("cannot read the schema directory " + directory + ": " + error.message());
    }
    std::sort(paths.begin(), paths.end());
    return paths;
}

std::string joined(const std::vector<std::string>& words) {
    std::string text;
    for (const std::string& word : words) {
        text += (text.empty() ? "" : ", ") + word;
    }
    return text;
}

} // namespace

Declarations readDirectories(const std::vector<std::string>& directories) {
    Reader reader;
    bool isEmpty = true;
    for (const std::string& directory : directories) {
        for (const std::string& path : listMofFiles(directory)) {
            isEmpty = false;
            try {
                reader.readFile(path, "");
            } catch (const Error&) {
                throw;
            } catch (const std::runtime_error& error) {
                throw std::runtime_error("cannot read " + path + ": " + error.what());
            }
        }
    }
    if (isEmpty) {
        throw std::runtime_error("no *.mof files in the schema directory " + joined(directories));
    }
    return reader.take();
}

Declarations readText(std::string_view text, const std::string& name) {
    Reader reader;
    reader.readText(text, name, "");
    return reader.take();
}

} // namespace marlo::mof

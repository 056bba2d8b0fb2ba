/**
 * @file
 * A file for one test, in a directory of its own that ends with it.
 */
#pragma once

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <stdexcept>
#include <string>

namespace Orv::Test {

class TemporaryFile {
  public:
    explicit TemporaryFile(const std::string& name = "lab.toml") {
        std::string pattern = (std::filesystem::temp_directory_path() / "agent-test-XXXXXX").string();
        if (::mkdtemp(pattern.data()) == nullptr) {
            throw std::runtime_error("no temporary directory: " + pattern);
        }
        _directory = pattern;
        _path = _directory / name;
    }

    TemporaryFile(const std::string& name, const std::string& content) : TemporaryFile(name) { write(content); }

    ~TemporaryFile() {
        std::error_code ignored;
        std::filesystem::remove_all(_directory, ignored);
    }

    TemporaryFile(const TemporaryFile&) = delete;
    TemporaryFile& operator=(const TemporaryFile&) = delete;

    /** Writes in place: the same inode. */
    void write(const std::string& content) const { writeTo(_path, content); }

    /** Renames a finished file onto this one: another inode. */
    void replace(const std::string& content) const {
        const std::filesystem::path next = _directory / "next";
        writeTo(next, content);
        std::filesystem::rename(next, _path);
    }

    void remove() const { std::filesystem::remove(_path); }

    [[nodiscard]] std::string read() const { return readFrom(_path); }

    [[nodiscard]] std::string path() const { return _path.string(); }

    [[nodiscard]] std::filesystem::path directory() const { return _directory; }

    static std::string readFrom(const std::filesystem::path& path) {
        std::ifstream file(path, std::ios::binary);
        return {std::istreambuf_iterator<char>(file), std::istreambuf_iterator<char>()};
    }

  private:
    static void writeTo(const std::filesystem::path& path, const std::string& content) {
        std::ofstream file(path, std::ios::binary | std::ios::trunc);
        file << content;
        file.close();
        if (!file) {
            throw std::runtime_error("cannot write " + path.string());
        }
    }

    std::filesystem::path _directory;
    std::filesystem::path _path;
};

/** The text of the std::exception that `work` throws; "nothing was thrown" when it does not. */
template <typename Work>
std::string messageOf(Work work) {
    try {
        work();
    } catch (const std::exception& failure) {
        return failure.what();
    }
    return "nothing was thrown";
}

} // namespace Orv::Test

/**
 * @file
 * A directory that stands for the root of a host.
 */
#pragma once

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <stdexcept>
#include <string>

namespace Orv::Test {

/** Files of a host that is not there; gone with the object. */
class TemporaryHost {
  public:
    TemporaryHost() {
        std::string name = (std::filesystem::temp_directory_path() / "marlo-host-XXXXXX").string();
        if (mkdtemp(name.data()) == nullptr) {
            throw std::runtime_error(name);
        }
        _root = name;
    }

    ~TemporaryHost() {
        std::error_code ignored;
        std::filesystem::remove_all(_root, ignored);
    }

    TemporaryHost(const TemporaryHost&) = delete;
    TemporaryHost& operator=(const TemporaryHost&) = delete;

    [[nodiscard]] std::string root() const { return _root.string(); }

    /** Where a path of the host really is. */
    [[nodiscard]] std::filesystem::path at(const std::string& path) const { return _root.string() + path; }

    void write(const std::string& path, const std::string& content) const {
        std::filesystem::create_directories(at(path).parent_path());
        std::ofstream(at(path)) << content;
    }

  private:
    std::filesystem::path _root;
};

} // namespace Orv::Test

/**
 * @file
 * The host that the agent of this process shows: one that a file describes.
 */
#pragma once

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <stdexcept>
#include <string>

#include <gtest/gtest.h>

namespace marlo::test {

/** A process has one agent, which reads one file for good: the same for all hosts that there are in turn. */
inline const std::filesystem::path& descriptionFile() {
    static const std::filesystem::path file = [] {
        std::string pattern = (std::filesystem::temp_directory_path() / "marlo-described-XXXXXX").string();
        if (mkdtemp(pattern.data()) == nullptr) {
            throw std::runtime_error("cannot make a directory like " + pattern);
        }
        const std::filesystem::path path = std::filesystem::path(pattern) / "host.toml";
        setenv("ORV_AGENT_BACKEND", "file", 1);
        setenv("ORV_AGENT_TREE", path.c_str(), 1);
        return path;
    }();
    return file;
}

/** The agent shows the host that this describes, from its next look at the file on. */
inline void describeHost(const std::string& description) {
    std::ofstream(descriptionFile()) << description;
}

class RemoveDescription : public testing::Environment {
  public:
    void TearDown() override {
        std::error_code ignored;
        std::filesystem::remove_all(descriptionFile().parent_path(), ignored);
    }
};

// NOLINTNEXTLINE(cert-err58-cpp)
inline const auto* const descriptionRemoval = testing::AddGlobalTestEnvironment(new RemoveDescription);

} // namespace marlo::test

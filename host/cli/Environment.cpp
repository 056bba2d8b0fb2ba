#include "host/cli/Environment.h"

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <memory>

namespace marlo::cli {

namespace {

namespace fs = std::filesystem;

struct FileCloser {
    void operator()(std::FILE* file) const { static_cast<void>(std::fclose(file)); }
};

/** Finds out now what would otherwise come to light as a failure of some provider. */
void requireReadable(const std::string& option, const std::string& path) {
    const auto fail = [&](const char* reason) { throw UsageError(option + ": cannot open " + path + ": " + reason); };
    std::error_code ignored;
    if (fs::is_directory(path, ignored)) {
        fail("it is a directory");
    }
    const std::unique_ptr<std::FILE, FileCloser> file(std::fopen(path.c_str(), "re"));
    if (!file) {
        fail(strerror(errno));
    }
}

void set(const char* variable, const std::string& value) {
    if (::setenv(variable, value.c_str(), 1) != 0) {
        throw std::runtime_error(std::string("cannot set ") + variable + ": " + strerror(errno));
    }
}

void setFile(const char* variable, const std::string& option, const std::string& path) {
    if (!path.empty()) {
        requireReadable(option, path);
        set(variable, fs::absolute(path).string());
    }
}

void setLevel(const char* variable, const std::optional<int>& level) {
    if (level) {
        set(variable, std::to_string(*level));
    }
}

void setSinks(const char* variable, const std::vector<std::string>& sinks) {
    std::string list;
    for (const std::string& sink : sinks) {
        list += (list.empty() ? "" : ",") + sink;
    }
    if (!list.empty()) {
        set(variable, list);
    }
}

} // namespace

ObjectManagerOptions findDirectories(const DirectoryOptions& named) {
    const fs::path root = fs::read_symlink("/proc/self/exe").parent_path().parent_path();
    const auto choose = [](const std::string& name, const fs::path& usual) {
        return name.empty() ? usual.string() : fs::absolute(name).string();
    };
    // The build tree says lib where the installed tree may say lib64 or lib/x86_64-linux-gnu.
    std::error_code ignored;
    const fs::path installed = root / MARLO_INSTALLED_LIBRARIES;
    const fs::path libraries = fs::exists(installed, ignored) ? installed : root / "lib/marlo";
    ObjectManagerOptions options;
    options.schemaDirectories = {choose(named.schema, root / "share/marlo/schema")};
    options.providerDirectories = {choose(named.providers, root / "share/marlo/providers")};
    options.libraryDirectory = choose(named.libraries, libraries);
    return options;
}

void tellAgent(const AgentOptions& agent) {
    setFile("ORV_AGENT_CONFIG", "--agent-config", agent.configurationFile);
    setFile("ORV_AGENT_TREE", "--tree", agent.treeFile);
    if (!agent.treeFile.empty()) {
        set("ORV_AGENT_BACKEND", "file");
    }
    setLevel("ORV_AGENT_LOG_LEVEL", agent.logLevel);
    setSinks("ORV_AGENT_LOG_SINKS", agent.logSinks);
    setLevel("ORV_AGENT_TRACE_LEVEL", agent.traceLevel);
    setSinks("ORV_AGENT_TRACE_SINKS", agent.traceSinks);
}

} // namespace marlo::cli

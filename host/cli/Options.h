/**
 * @file
 * What the command line asks for.
 */
#pragma once

#include <optional>
#include <stdexcept>
#include <string>
#include <vector>

namespace marlo::cli {

/** A command line that asks for something that cannot be; the program ends with exit code 2. */
class UsageError : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

enum class Command {
    Adapters,
    Enumerate,
    Names,
    Get,
    Invoke,
    Set,
    Static,
    Dhcp,
    Dns,
    Gateway,
    Restart,
    Watch,
    Classes,
    Serve,
    Status,
    Subscribe,
    Subscriptions,
    Unsubscribe,
    Completion
};

/** What is told to the agent library of this process, over its own configuration. */
struct AgentOptions {
    std::string treeFile;
    std::string configurationFile;
    std::optional<int> logLevel;
    std::vector<std::string> logSinks;
    std::optional<int> traceLevel;
    std::vector<std::string> traceSinks;
};

/** Directories that take the place of those beside the executable; empty where not given. */
struct DirectoryOptions {
    std::string schema;
    std::string providers;
    std::string libraries;
};

/** What to watch for, and how long. */
struct WatchOptions {
    std::vector<std::string> classes; ///< of indications
    std::string filter;               ///< in their place
    std::string language = "WQL";     ///< of the filter
    std::optional<unsigned> count;
    std::optional<double> timeout; ///< seconds
};

/** Where to serve and whom, over the server's own configuration. */
struct ServerOptions {
    std::string configurationFile;
    bool trial = false;
    std::optional<std::vector<std::string>> http; ///< ADDRESS:PORT, or "none"
    std::optional<std::vector<std::string>> https;
    std::optional<std::string> socket;  ///< a path, or "none"
    std::vector<std::string> schema;    ///< directories of the site, besides what is shipped
    std::vector<std::string> providers; ///< the same
};

struct Options {
    Command command = Command::Adapters;
    std::string argument; ///< a class, a path, an adapter or a shell
    std::string method;
    std::vector<std::string> values; ///< NAME=VALUE
    std::string address;             ///< with or without a prefix length
    std::string mask;
    std::string gateway;
    std::vector<std::string> servers;
    std::vector<std::string> suffixes;
    std::string domain;
    std::string nameSpace = "root/tavis";
    std::vector<std::string> properties; ///< none: all
    bool json = false;
    bool namesOnly = false;
    WatchOptions watch; ///< of subscriptions too: what to subscribe to
    bool all = false;
    ServerOptions server;
    AgentOptions agent;
    DirectoryOptions directories;
};

/** Options to be followed, or a text that answers the command line by itself (help, version, completion). */
struct CommandLine {
    std::optional<std::string> answer;
    Options options;
};

/** Reads a command line; throws UsageError. */
CommandLine readCommandLine(int argc, const char* const* argv);

} // namespace marlo::cli

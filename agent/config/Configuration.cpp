#include "agent/config/Configuration.h"

#include "agent/config/TextFile.h"
#include "agent/config/TomlReader.h"

#include <algorithm>
#include <charconv>
#include <cstdlib>
#include <filesystem>
#include <stdexcept>
#include <system_error>
#include <utility>

namespace Orv::Agent {

namespace {

constexpr int highestLevel = std::numeric_limits<int>::max();
constexpr std::string_view defaultFile = "/etc/marlo/agent.toml";
constexpr std::string_view filePrefix = "file:";

bool isSink(std::string_view sink) {
    return sink == "stderr" || sink == "syslog" || (sink.starts_with(filePrefix) && sink.size() > filePrefix.size());
}

std::string unknownSink(const std::string& sink) {
    return R"(expected "stderr", "syslog" or "file:PATH", found ")" + sink + '"';
}

std::string unknownBackEnd(const std::string& name) {
    return R"(expected "linux" or "file", found ")" + name + '"';
}

std::optional<Configuration::BackEndKind> backEndOf(std::string_view name) {
    if (name == "linux") {
        return Configuration::BackEndKind::Linux;
    }
    return name == "file" ? std::optional(Configuration::BackEndKind::File) : std::nullopt;
}

std::string unknownManager(const std::string& name) {
    return R"(expected "auto", "ifupdown", "networkd" or "none", found ")" + name + '"';
}

std::optional<ManagerChoice> managerOf(std::string_view name) {
    constexpr std::pair<std::string_view, ManagerChoice> choices[] = {{"auto", ManagerChoice::automatic},
                                                                      {"ifupdown", ManagerChoice::ifupdown},
                                                                      {"networkd", ManagerChoice::networkd},
                                                                      {"none", ManagerChoice::none}};
    const auto* const found = std::find_if(std::begin(choices), std::end(choices),
                                           [&](const auto& choice) { return choice.first == name; });
    return found == std::end(choices) ? std::nullopt : std::optional(found->second);
}

void readPersistence(TomlReader& reader, Configuration& configuration) {
    if (const auto name = reader.text("persistence")) {
        const auto choice = managerOf(*name);
        if (!choice) {
            reader.refuseKey("persistence", unknownManager(*name));
        }
        configuration.persistence = *choice;
    }
}

void readChannel(TomlReader& file, const std::string& path, std::string_view name, ChannelConfiguration& channel) {
    toml::table* table = file.table(name);
    if (table == nullptr) {
        return;
    }
    const std::string prefix = std::string(name) + ".";
    TomlReader reader(*table, path, prefix);
    channel.level = static_cast<int>(reader.integer("level", highestLevel).value_or(channel.level));
    channel.sinks = reader.texts("sinks").value_or(channel.sinks);
    for (const std::string& sink : channel.sinks) {
        if (!isSink(sink)) {
            reader.refuseKey("sinks", unknownSink(sink));
        }
    }
    reader.refuseOtherKeys();
}

void readBackEnd(TomlReader& reader, const std::string& path, Configuration& configuration) {
    if (const auto tree = reader.text("tree_file")) {
        configuration.treeFile = std::filesystem::path(path).parent_path() / *tree;
        configuration.backEnd = Configuration::BackEndKind::File;
    }
    if (const auto control = reader.text("control")) {
        configuration.control = std::filesystem::path(path).parent_path() / *control;
    }
    if (const auto name = reader.text("back_end")) {
        const auto backEnd = backEndOf(*name);
        if (!backEnd) {
            reader.refuseKey("back_end", unknownBackEnd(*name));
        }
        configuration.backEnd = *backEnd;
    }
    if (configuration.backEnd == Configuration::BackEndKind::File && configuration.treeFile.empty()) {
        reader.refuseKey("back_end", "the file back end needs tree_file");
    }
}

/** The value of a variable; none when it is not set or may not be trusted. */
std::optional<std::string> variable(const char* name) {
    const char* value = ::secure_getenv(name);
    return value == nullptr ? std::nullopt : std::optional<std::string>(value);
}

/** As variable, but an empty value counts as none. */
std::optional<std::string> filledVariable(const char* name) {
    auto value = variable(name);
    return value && value->empty() ? std::nullopt : value;
}

[[noreturn]] void refuseVariable(const std::string& name, const std::string& reason) {
    throw std::runtime_error(name + ": " + reason);
}

void overrideLevel(const char* name, int& level) {
    const auto value = filledVariable(name);
    if (!value) {
        return;
    }
    int number = 0;
    const char* end = value->data() + value->size();
    const auto [rest, error] = std::from_chars(value->data(), end, number);
    if (error != std::errc() || rest != end || number < 0) {
        refuseVariable(name,
                       "expected an integer from 0 to " + std::to_string(highestLevel) + ", found \"" + *value + '"');
    }
    level = number;
}

void overrideSinks(const char* name, std::vector<std::string>& sinks) {
    const auto value = variable(name);
    if (!value) {
        return;
    }
    sinks.clear();
    for (std::size_t start = 0; start < value->size();) {
        const std::size_t comma = std::min(value->find(',', start), value->size());
        sinks.push_back(value->substr(start, comma - start));
        if (!isSink(sinks.back())) {
            refuseVariable(name, unknownSink(sinks.back()));
        }
        start = comma + 1;
    }
}

void overrideBackEnd(Configuration& configuration) {
    if (const auto name = filledVariable("ORV_AGENT_BACKEND")) {
        const auto backEnd = backEndOf(*name);
        if (!backEnd) {
            refuseVariable("ORV_AGENT_BACKEND", unknownBackEnd(*name));
        }
        configuration.backEnd = *backEnd;
    }
    if (const auto tree = filledVariable("ORV_AGENT_TREE")) {
        configuration.treeFile = *tree;
        configuration.backEnd = Configuration::BackEndKind::File;
    }
    configuration.control = filledVariable("ORV_AGENT_CONTROL").value_or(configuration.control);
    if (configuration.backEnd == Configuration::BackEndKind::File && configuration.treeFile.empty()) {
        refuseVariable("ORV_AGENT_BACKEND", "the file back end needs ORV_AGENT_TREE");
    }
}

void overridePersistence(Configuration& configuration) {
    if (const auto name = filledVariable("ORV_AGENT_PERSISTENCE")) {
        const auto choice = managerOf(*name);
        if (!choice) {
            refuseVariable("ORV_AGENT_PERSISTENCE", unknownManager(*name));
        }
        configuration.persistence = *choice;
    }
}

Configuration readConfiguredFile() {
    if (const auto path = filledVariable("ORV_AGENT_CONFIG")) {
        return readConfigurationFile(*path);
    }
    try {
        return readConfigurationFile(std::string(defaultFile));
    } catch (const std::system_error& error) {
        if (error.code() == std::errc::no_such_file_or_directory) {
            return {};
        }
        throw;
    }
}

} // namespace

Configuration readConfigurationFile(const std::string& path) {
    const TextFile file = readTextFile(path);
    toml::table table = parseToml(file.text, path);
    TomlReader reader(table, path, "");
    Configuration configuration;
    readBackEnd(reader, path, configuration);
    readPersistence(reader, configuration);
    readChannel(reader, path, "log", configuration.log);
    readChannel(reader, path, "trace", configuration.trace);
    reader.refuseOtherKeys();
    return configuration;
}

Configuration loadConfiguration() {
    Configuration configuration = readConfiguredFile();
    overrideBackEnd(configuration);
    overridePersistence(configuration);
    overrideLevel("ORV_AGENT_LOG_LEVEL", configuration.log.level);
    overrideSinks("ORV_AGENT_LOG_SINKS", configuration.log.sinks);
    overrideLevel("ORV_AGENT_TRACE_LEVEL", configuration.trace.level);
    overrideSinks("ORV_AGENT_TRACE_SINKS", configuration.trace.sinks);
    return configuration;
}

} // namespace Orv::Agent

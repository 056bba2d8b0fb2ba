/**
 * @file
 * Builds the scripted agent's nodes, and reads its record.
 */
#pragma once

#include "tests/support/scripted_agent/ScriptedAgent.h"

#include <regex>
#include <string>
#include <vector>

namespace provider_test {

/** Types of nodes that stand above the adapters; no provider selects by them. */
inline constexpr auto NODE_ABOVE = static_cast<Orv::NodeLexicon::NodeType>(1);

/**
 * Adds an adapter under a device of its own under a grandparent that is described so, and returns it to be given
 * properties. The reference is good until the next node is added.
 */
inline scripted_agent::Node& addBareAdapter(const std::string& grandparent = "Chassis") {
    auto& nodes = scripted_agent::script().nodes;
    const std::string number = std::to_string(nodes.size());
    nodes.push_back({.type = NODE_ABOVE, .path = "g" + number, .description = grandparent});
    nodes.push_back({.type = NODE_ABOVE, .path = "d" + number, .parent = "g" + number, .description = "Device"});
    nodes.push_back({.path = "a" + number, .parent = "d" + number, .description = "Some adapter"});
    return nodes.back();
}

inline scripted_agent::Node& addAdapter(const std::string& identity, const std::string& grandparent = "Chassis") {
    scripted_agent::Node& node = addBareAdapter(grandparent);
    node.texts[Orv::NodeLexicon::PROP_NODE_STRING] = identity;
    return node;
}

/** An adapter that has every property. */
inline scripted_agent::Node& addFullAdapter(const std::string& identity, const std::string& grandparent = "Chassis") {
    using namespace Orv::NodeLexicon;
    scripted_agent::Node& node = addAdapter(identity, grandparent);
    node.texts[PROP_IPV4_ADDRESS] = "192.0.2.10";
    node.texts[PROP_IPV4_SUBNET_MASK] = "255.255.255.0";
    node.texts[PROP_IPV6_ADDRESS] = "2001:db8::10";
    node.texts[PROP_DNS_HOSTNAME] = "host";
    node.texts[PROP_DNS_DOMAIN] = "example.org";
    node.texts[PROP_DEFAULT_GATEWAY] = "192.0.2.1";
    node.texts[PROP_MAC_ADDRESS] = "00:00:5e:00:53:01";
    node.numbers[PROP_STATUS] = 1;
    node.numbers[PROP_DHCP_ENABLED] = 3;
    node.numbers[PROP_IP_SUPPORT] = 3;
    node.lists[PROP_DNS_SERVERS] = {"192.0.2.53", "192.0.2.54"};
    node.lists[PROP_DNS_SUFFIXES] = {"example.org", "example.net"};
    return node;
}

/** Lines with every line number as N, so that moving a line of the provider is no change of behaviour. */
inline std::vector<std::string> normalised(std::vector<std::string> lines) {
    static const std::regex place(R"(^((?:log|trace) \d+ \S+ \w+):\d+ )");
    static const std::regex inText(R"((Line: |at line )\d+)");
    for (std::string& line : lines) {
        line = std::regex_replace(std::regex_replace(line, place, "$1:N "), inText, "$1N");
    }
    return lines;
}

/** What was done to cursors and what was logged, in order: the record without the traces and the buffers. */
inline std::vector<std::string> flow() {
    std::vector<std::string> lines = scripted_agent::record();
    std::erase_if(lines,
                  [](const std::string& each) { return !each.starts_with("cursor ") && !each.starts_with("log "); });
    return lines;
}

/** The recorded lines of a sink, without its name. */
inline std::vector<std::string> linesOf(const std::string& sink) {
    std::vector<std::string> lines = scripted_agent::recorded(sink + " ");
    for (std::string& each : lines) {
        each.erase(0, sink.size() + 1);
    }
    return lines;
}

/** One line of the log, or of the trace, as the record has it after normalising. */
inline std::string line(const std::string& sink, int level, const std::string& logger, const std::string& unit,
                        const std::string& function, const std::string& text) {
    return sink + " " + std::to_string(level) + " " + logger + " " + unit + ":N " + function + " | " + text;
}

} // namespace provider_test

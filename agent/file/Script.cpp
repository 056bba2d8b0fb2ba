#include "agent/file/Script.h"

#include "agent/events/Differences.h"
#include "agent/text/Text.h"

#include <algorithm>
#include <charconv>
#include <optional>
#include <stdexcept>
#include <string>

namespace Orv::Agent {

namespace {

using namespace NodeLexicon;

constexpr unsigned int running = 1;
constexpr unsigned int lostCommunication = 12;

/** A line in its parts; a name may have blanks in it. */
struct Command {
    std::string_view verb;
    std::string_view name;
    std::optional<unsigned int> number;
};

struct Verb {
    std::string_view name;
    bool takesNumber;
    const char* usage;
};

constexpr Verb verbs[] = {{"status", true, "status NAME CODE"},
                          {"flap", false, "flap NAME"},
                          {"burst", true, "burst NAME COUNT"},
                          {"failover", false, "failover NAME"},
                          {"failback", false, "failback NAME"}};

std::string_view trimmed(std::string_view text) {
    constexpr std::string_view blanks = " \t\r";
    const std::size_t first = text.find_first_not_of(blanks);
    return first == std::string_view::npos ? std::string_view()
                                           : text.substr(first, text.find_last_not_of(blanks) - first + 1);
}

std::optional<unsigned int> numberIn(std::string_view text) {
    unsigned int number = 0;
    const char* end = text.data() + text.size();
    const auto [rest, error] = std::from_chars(text.data(), end, number);
    return error == std::errc() && rest == end ? std::optional(number) : std::nullopt;
}

[[noreturn]] void refuse(const std::string& reason) {
    throw std::runtime_error("control pipe: " + reason);
}

Command parse(std::string_view line) {
    const std::size_t verbEnd = std::min(line.find_first_of(" \t"), line.size());
    Command command{line.substr(0, verbEnd), trimmed(line.substr(verbEnd)), std::nullopt};
    const auto* verb = std::find_if(std::begin(verbs), std::end(verbs),
                                    [&](const Verb& known) { return known.name == command.verb; });
    if (verb == std::end(verbs)) {
        refuse("\"" + cleanText(command.verb) + "\" is no command");
    }
    if (verb->takesNumber) {
        const std::size_t nameEnd = command.name.find_last_of(" \t");
        command.number =
            nameEnd == std::string_view::npos ? std::nullopt : numberIn(command.name.substr(nameEnd + 1));
        command.name = trimmed(command.name.substr(0, std::min(nameEnd, command.name.size())));
    }
    if (command.name.empty() || (verb->takesNumber && !command.number)) {
        refuse(std::string("expected ") + verb->usage + ", found \"" + cleanText(line) + '"');
    }
    return command;
}

Tree::NodePointer adapterNamed(std::string_view name, const Tree& tree) {
    for (const Tree::NodePointer& node : tree.nodesOfType(NODE_NETWORK_ADAPTER)) {
        const auto identity = node->properties.find(PROP_NODE_STRING);
        const auto* text = identity == node->properties.end() ? nullptr : std::get_if<std::string>(&identity->second);
        if (text != nullptr && *text == name) {
            return node;
        }
    }
    refuse("there is no adapter \"" + cleanText(name) + '"');
}

std::vector<unsigned int> statusesOf(const Command& command) {
    if (command.verb == "status") {
        return {*command.number};
    }
    if (command.verb == "failover") {
        return {static_cast<unsigned int>(FailOver::switchOver)};
    }
    if (command.verb == "failback") {
        return {static_cast<unsigned int>(FailOver::switchBack)};
    }
    const unsigned int count = command.number.value_or(2);
    if (count > longestBurst) {
        refuse("a burst has at most " + std::to_string(longestBurst) + " events");
    }
    std::vector<unsigned int> statuses(count, lostCommunication);
    for (std::size_t i = 1; i < statuses.size(); i += 2) {
        statuses[i] = running;
    }
    return statuses;
}

} // namespace

std::vector<Event> play(std::string_view line, const Tree& tree) {
    line = trimmed(line);
    if (line.empty() || line.front() == '#') {
        return {};
    }
    const Command command = parse(line);
    const Tree::NodePointer node = adapterNamed(command.name, tree);
    const auto now = std::chrono::system_clock::now();
    const auto ancestors = ancestorsOf(tree, *node);
    std::vector<Event> events;
    for (const unsigned int status : statusesOf(command)) {
        // Every second one is the same again.
        const bool isKnown = events.size() > 1 && statusOf(*events[events.size() - 2].node) == status;
        events.push_back({EventCode::status, now,
                          isKnown ? events[events.size() - 2].node : withStatus(*node, status), ancestors});
    }
    return events;
}

} // namespace Orv::Agent

/**
 * @file
 * Messages about links and teams that a kernel sent while something was done to it, as tests/vm/record wrote them
 * down.
 */
#pragma once

#include "agent/linux/TeamMessages.h"
#include "tests/linux/MessageBuilder.h"

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <fstream>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

namespace Orv::Test {

/** One of rtnetlink, or of generic netlink. */
struct RecordedMessage {
    MessageBytes bytes;
    bool isGeneric = false;

    /** What follows the netlink header. */
    [[nodiscard]] Agent::Hardware::Bytes payload() const {
        const auto* begin = reinterpret_cast<const std::byte*>(&bytes.message());
        return {begin + sizeof(nlmsghdr), bytes.length() - sizeof(nlmsghdr)};
    }

    [[nodiscard]] Agent::Linux::Message parse() const {
        return isGeneric ? Agent::Linux::parseTeamMessage(payload()) : bytes.parse();
    }
};

/** What the kernel said after one step; of the first, "dump", all links that there were. */
struct RecordedStep {
    std::string command;
    std::vector<RecordedMessage> messages;
};

inline Octets octetsOf(const std::string& digits) {
    Octets octets;
    for (std::size_t i = 0; i + 1 < digits.size(); i += 2) {
        octets.push_back(static_cast<std::uint8_t>(std::stoul(digits.substr(i, 2), nullptr, 16)));
    }
    return octets;
}

inline RecordedMessage recordedMessage(const std::string& line) {
    const std::string generic = "generic ";
    const bool isGeneric = line.rfind(generic, 0) == 0;
    const std::string digits = line.substr(isGeneric ? generic.size() : 0);
    const Octets octets = octetsOf(digits);
    nlmsghdr header{};
    if (octets.size() < sizeof header) {
        throw std::runtime_error("no message: " + digits);
    }
    std::memcpy(&header, octets.data(), sizeof header);
    if (header.nlmsg_len != octets.size()) {
        throw std::runtime_error("not the whole message: " + digits);
    }
    return {MessageBytes(header.nlmsg_type, Octets(octets.begin() + sizeof header, octets.end())), isGeneric};
}

/** The steps of a recording, in order. Throws std::exception when there is none in the file. */
inline std::vector<RecordedStep> readRecording(const std::string& file) {
    std::ifstream in(file);
    std::vector<RecordedStep> steps;
    for (std::string line; std::getline(in, line);) {
        if (line.rfind("== ", 0) == 0) {
            steps.push_back({line.substr(3), {}});
        } else if (line.rfind('#', 0) != 0) {
            steps.at(steps.size() - 1).messages.push_back(recordedMessage(line));
        }
    }
    if (steps.empty()) {
        throw std::runtime_error("no recording in " + file);
    }
    return steps;
}

} // namespace Orv::Test

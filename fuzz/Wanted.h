/**
 * @file
 * What the fuzzers want to be changed: a few changes that between them touch every setting.
 */
#pragma once

#include "agent/change/AdapterSettings.h"
#include "fuzz/Require.h"

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace Orv::Fuzz {

using marlo::fuzz::require;

/** The first byte chooses the change, what follows is the text that it is made in. */
inline std::pair<Agent::AdapterSettings, std::string_view> wantedAndText(const std::uint8_t* data, std::size_t size) {
    using namespace Agent;
    const unsigned choice = size == 0 ? 0U : data[0];
    AdapterSettings wanted;
    if ((choice & 1U) != 0) {
        wanted.ipv4.emplace();
        wanted.ipv4->mode = (choice & 2U) != 0 ? AddressMode::leased : AddressMode::fixed;
        if ((choice & 6U) == 4U) {
            wanted.ipv4->address = Ipv4Prefixed{{0xC000020A}, 24};
            wanted.ipv4->gateway = Ipv4Address{0xC0000201};
        }
    }
    if ((choice & 8U) != 0) {
        wanted.names.domain = "example.org";
    }
    if ((choice & 16U) != 0) {
        wanted.names.servers = {"192.0.2.53", "2001:db8::53"};
    }
    if ((choice & 32U) != 0) {
        wanted.names.suffixes = {"a.example", "b.example"};
    }
    if ((choice & 64U) != 0) {
        wanted.names.servers.emplace();
        wanted.names.suffixes.emplace();
    }
    const char* const text = reinterpret_cast<const char*>(data); // NOLINT: libFuzzer hands bytes over
    return {wanted, size == 0 ? std::string_view() : std::string_view(text + 1, size - 1)};
}

} // namespace Orv::Fuzz

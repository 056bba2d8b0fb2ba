/**
 * @file
 * What the tests of planning share.
 */
#pragma once

#include "agent/change/AdapterSettings.h"
#include "agent/persistence/Environment.h"
#include "agent/persistence/FileTransaction.h"
#include "agent/persistence/Manager.h"
#include "tests/agent/TemporaryFile.h"
#include "tests/linux/TemporaryHost.h"

#include <string>
#include <vector>

namespace Orv::Test {

inline Agent::Ipv4Address ip(const std::string& text) {
    return Agent::Ipv4Address::parse(text).value();
}

/** "192.0.2.10/24" and a gateway, or none of them. */
inline Agent::AdapterSettings fixedAt(const std::string& address = "", const std::string& gateway = "") {
    Agent::Ipv4Settings ipv4;
    if (const std::size_t slash = address.find('/'); slash != std::string::npos) {
        ipv4.address = Agent::Ipv4Prefixed{ip(address.substr(0, slash)),
                                           static_cast<std::uint8_t>(std::stoi(address.substr(slash + 1)))};
    }
    if (!gateway.empty()) {
        ipv4.gateway = ip(gateway);
    }
    return {ipv4, {}};
}

inline Agent::AdapterSettings leased() {
    return {Agent::Ipv4Settings{Agent::AddressMode::leased, {}, {}}, {}};
}

inline Agent::Persistence::InterfaceFacts interfaceNamed(const std::string& name) {
    Agent::Persistence::InterfaceFacts facts;
    facts.index = 2;
    facts.name = name;
    facts.address = "02:00:5e:00:00:01";
    facts.ethernet = true;
    return facts;
}

/** Commands of which none is installed. */
inline Agent::Persistence::Commands noCommands() {
    Agent::Persistence::Commands commands;
    for (auto* command :
         {&commands.ifup, &commands.dhclient, &commands.udhcpc, &commands.dhcpcd, &commands.resolvconf}) {
        *command = {"/nonexistent/command"};
    }
    return commands;
}

/** A host without commands below the root. */
inline Agent::Persistence::Environment environmentAt(const std::string& root) {
    Agent::Persistence::Environment environment;
    environment.root = root;
    environment.systemBus = "unix:path=/nonexistent/bus";
    environment.commands = noCommands();
    return environment;
}

inline void applied(const Agent::Persistence::FileEdits& edits) {
    Agent::Persistence::FileTransaction transaction;
    transaction.apply(edits);
    transaction.commit();
}

} // namespace Orv::Test

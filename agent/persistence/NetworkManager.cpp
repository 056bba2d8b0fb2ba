#include "agent/persistence/NetworkManager.h"

#include "agent/linux/Words.h"

#include <algorithm>
#include <stdexcept>

namespace Orv::Agent::Persistence {

namespace {

[[noreturn]] void refuse() {
    throw std::runtime_error("NetworkManager configures it, which is not supported yet");
}

} // namespace

FileEdits NetworkManager::plan(const InterfaceFacts& /*interface*/, const AdapterSettings& /*wanted*/) const {
    refuse();
}

bool NetworkManager::stopDhcp(const InterfaceFacts& /*interface*/) {
    refuse();
}

void NetworkManager::activate(const InterfaceFacts& /*interface*/, const AdapterSettings& /*wanted*/) {
    refuse();
}

void NetworkManager::startDhcp(const InterfaceFacts& /*interface*/) {
    refuse();
}

bool NetworkManager::knows(const InterfaceFacts& interface, const Environment& environment) {
    const std::string state =
        contentOf(environment.root + "/run/NetworkManager/devices/" + std::to_string(interface.index)).value_or("");
    const auto lines = Linux::linesOf(state);
    return std::any_of(lines.begin(), lines.end(),
                       [](std::string_view line) { return line.starts_with("connection-uuid="); });
}

} // namespace Orv::Agent::Persistence

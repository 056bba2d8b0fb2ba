#include "agent/persistence/Ifupdown.h"
#include "agent/persistence/Manager.h"
#include "agent/persistence/NetworkManager.h"
#include "agent/persistence/Networkd.h"
#include "agent/persistence/Unmanaged.h"

#include <filesystem>

namespace Orv::Agent::Persistence {

namespace {

bool hasIfupdown(const Environment& environment) {
    return std::filesystem::exists(environment.commands.ifup.front());
}

/** Who says something about the interface comes first; then who might be told about it. */
std::unique_ptr<Manager> detected(const InterfaceFacts& interface, const Environment& environment) {
    if (Ifupdown::knows(interface, environment)) {
        return std::make_unique<Ifupdown>(environment);
    }
    if (NetworkManager::knows(interface, environment)) {
        return std::make_unique<NetworkManager>();
    }
    if (Networkd::knows(interface, environment)) {
        return std::make_unique<Networkd>(environment);
    }
    if (hasIfupdown(environment)) {
        return std::make_unique<Ifupdown>(environment);
    }
    if (Networkd::runs(environment)) {
        return std::make_unique<Networkd>(environment);
    }
    return std::make_unique<Unmanaged>(environment);
}

} // namespace

std::unique_ptr<Manager> managerOf(const InterfaceFacts& interface, const Environment& environment) {
    switch (environment.choice) {
    case ManagerChoice::ifupdown:
        return std::make_unique<Ifupdown>(environment);
    case ManagerChoice::networkd:
        return std::make_unique<Networkd>(environment);
    case ManagerChoice::none:
        return std::make_unique<Unmanaged>(environment);
    default:
        return detected(interface, environment);
    }
}

} // namespace Orv::Agent::Persistence

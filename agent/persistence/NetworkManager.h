/**
 * @file
 * Interfaces that NetworkManager configures: seen, and not changed.
 */
#pragma once

#include "agent/persistence/Manager.h"

namespace Orv::Agent::Persistence {

/**
 * Changing one behind NetworkManager's back would last until it looks again, so everything is refused. Its place is
 * here: a plan would edit the profile of the active connection, and activate() would have it reapplied.
 */
class NetworkManager : public Manager {
  public:
    [[nodiscard]] std::string name() const override { return "NetworkManager"; }

    /** All throw. */
    [[nodiscard]] FileEdits plan(const InterfaceFacts& interface, const AdapterSettings& wanted) const override;
    bool stopDhcp(const InterfaceFacts& interface) override;
    void activate(const InterfaceFacts& interface, const AdapterSettings& wanted) override;
    void startDhcp(const InterfaceFacts& interface) override;

    /** Whether it has a connection active on the interface. */
    static bool knows(const InterfaceFacts& interface, const Environment& environment);
};

} // namespace Orv::Agent::Persistence

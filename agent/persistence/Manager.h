/**
 * @file
 * Who configures an interface when the host boots, and how it is told.
 */
#pragma once

#include "agent/change/AdapterSettings.h"
#include "agent/linux/AddressMode.h"
#include "agent/persistence/Environment.h"
#include "agent/persistence/FileEdit.h"

#include <memory>
#include <string>

namespace Orv::Agent::Persistence {

using Linux::InterfaceFacts;

/**
 * One network manager of the host, as it concerns one interface. Objects hold no state of the host: each operation
 * looks anew. Operations may be called from several threads for different interfaces; plan() and the applying of its
 * edits belong together under one lock, since interfaces share files. What fails throws std::runtime_error with the
 * reason; the text does not repeat the interface.
 *
 * The order of a change: plan, stopDhcp where the client must go, apply the files, the kernel, activate, startDhcp
 * where the client is wanted. To undo: put the files back, activate with what was in force, and startDhcp when
 * stopDhcp said that a client was running.
 */
class Manager {
  public:
    Manager() = default;
    virtual ~Manager() = default;
    Manager(const Manager&) = delete;
    Manager& operator=(const Manager&) = delete;

    /** For messages: "ifupdown", "systemd-networkd", "NetworkManager", "none". */
    [[nodiscard]] virtual std::string name() const = 0;

    /**
     * The edits that make the files say what is wanted. Only reads. No edits when the files say so already, or where
     * nothing is persistent. Throws when the configuration is of a form that cannot be edited safely.
     */
    [[nodiscard]] virtual FileEdits plan(const InterfaceFacts& interface, const AdapterSettings& wanted) const = 0;

    /**
     * Ends every DHCPv4 client of the interface without touching its addresses, and waits for its end. True when
     * there was one. A manager that has its client within itself does nothing here: activate() does it.
     */
    virtual bool stopDhcp(const InterfaceFacts& interface) = 0;

    /** Lets the manager take up files that have changed; `wanted` says what they say now. */
    virtual void activate(const InterfaceFacts& interface, const AdapterSettings& wanted) = 0;

    /**
     * Starts the host's DHCPv4 client for the interface, by the files as they are now, when it does not run already.
     * Returns when the client has a lease or goes on trying in the background. Other addresses stay.
     */
    virtual void startDhcp(const InterfaceFacts& interface) = 0;
};

/** The manager that is responsible for the interface, or the one that `environment.choice` names. */
std::unique_ptr<Manager> managerOf(const InterfaceFacts& interface, const Environment& environment);

} // namespace Orv::Agent::Persistence

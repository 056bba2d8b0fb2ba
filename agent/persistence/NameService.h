/**
 * @file
 * Who tells the host's resolver which servers to ask, and how.
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
 * One way to the resolver, as it concerns one interface. Threads and failures as for Manager. To undo: put the files
 * back, and apply() what was in force.
 */
class NameService {
  public:
    NameService() = default;
    virtual ~NameService() = default;
    NameService(const NameService&) = delete;
    NameService& operator=(const NameService&) = delete;

    /** For messages: "resolv.conf", "resolvconf", "systemd-resolved". */
    [[nodiscard]] virtual std::string name() const = 0;

    /** The edits of files that bring about what is wanted; only reads. */
    [[nodiscard]] virtual FileEdits plan(const NameSettings& wanted) const = 0;

    /** Tells the running service. `whole` is everything that shall hold: what is wanted over what is in force. */
    virtual void apply(const InterfaceFacts& interface, const NameSettings& whole) = 0;
};

/** systemd-resolved where it runs and resolv.conf leads to it, else resolvconf where installed, else resolv.conf. */
std::unique_ptr<NameService> nameServiceOf(const InterfaceFacts& interface, const Environment& environment);

} // namespace Orv::Agent::Persistence

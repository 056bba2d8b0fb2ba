/**
 * @file
 * Asking the kernel for changes.
 */
#pragma once

#include "agent/linux/NetlinkSocket.h"
#include "agent/write/KernelObject.h"

#include <cstdint>
#include <string>
#include <vector>

namespace Orv::Agent::Linux {

/** Changes of addresses and routes, in the order in which they are to be made. */
class ChangeBatch {
  public:
    /** Adds a request of type RTM_* with NLM_F_* flags; `what` names it in errors. */
    void add(std::uint16_t type, std::uint16_t flags, const KernelObject& object, std::string what);

    [[nodiscard]] bool empty() const { return _what.empty(); }

  private:
    friend class ChangeSocket;

    std::vector<std::uint8_t> _messages;
    std::vector<std::string> _what;
};

/** A change that the kernel has not made. */
struct Refusal {
    std::size_t place = 0; ///< in the batch
    int error = 0;         ///< errno
    std::string text;      ///< what the change was, and the kernel's own explanation where it has one
};

/** In the network namespace of the thread that made it. One thread at a time. Throws std::system_error. */
class ChangeSocket {
  public:
    ChangeSocket();

    /**
     * Has the changes made and returns those that were refused; the others are made. They go to the kernel in one
     * call, which it works off whole: a process that is killed leaves either none or all of them made.
     */
    std::vector<Refusal> apply(ChangeBatch batch);

  private:
    NetlinkSocket _socket;
    std::uint32_t _sequence = 0;
};

} // namespace Orv::Agent::Linux

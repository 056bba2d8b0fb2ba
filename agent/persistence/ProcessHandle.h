/**
 * @file
 * A process that is watched.
 */
#pragma once

#include "agent/config/Descriptor.h"

#include <chrono>

#include <sys/types.h>

namespace Orv::Agent::Persistence {

/** Stays with its process when the process's number goes to another (pidfd_open(2)). */
class ProcessHandle {
  public:
    /** Of a process that is gone already, a handle that says so. */
    explicit ProcessHandle(pid_t process);

    /** False when there was no such process. */
    explicit operator bool() const { return static_cast<bool>(_handle); }

    /** True as soon as the process has ended; false when it has not in time. */
    [[nodiscard]] bool awaitEnd(std::chrono::milliseconds patience) const;

    /** Sends a signal; nothing to a process that has ended. Throws std::system_error when it may not be sent. */
    void send(int signal) const;

  private:
    Descriptor _handle;
};

} // namespace Orv::Agent::Persistence

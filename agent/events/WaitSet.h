/**
 * @file
 * Waiting for several files through one.
 */
#pragma once

#include "agent/config/Descriptor.h"

namespace Orv::Agent {

/** An epoll(7) set. Failures are thrown as std::system_error. */
class WaitSet {
  public:
    WaitSet();

    /** Adds a descriptor, which leaves the set when it is closed; also while another thread polls the set. */
    void add(int descriptor);

    /** Readable as long as one of those in the set is. */
    [[nodiscard]] int descriptor() const { return _set.number(); }

  private:
    Descriptor _set;
};

} // namespace Orv::Agent

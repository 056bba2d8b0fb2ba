/**
 * @file
 * Whether a server is well, and why not.
 */
#pragma once

#include "host/server/StatusReport.h"

#include <chrono>
#include <mutex>
#include <string>

namespace marlo::server {

/** Any thread. */
class Health {
  public:
    /** The file that is in force, and why one that came later is not; empty: it is. */
    void configured(const std::string& file, const std::string& refusal);

    [[nodiscard]] std::string configuration() const;

    /** Adds the time since the start and the verdict on what the report says otherwise. */
    void complete(StatusReport& report, bool logIsFailing, std::size_t workers) const;

  private:
    const std::chrono::steady_clock::time_point _start = std::chrono::steady_clock::now();
    mutable std::mutex _mutex; ///< guards both below
    std::string _file;
    std::string _refusal;
};

} // namespace marlo::server

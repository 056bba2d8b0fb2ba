/**
 * @file
 * The indication service as a part of the server.
 */
#pragma once

#include "host/server/Configuration.h"
#include "host/server/StatusReport.h"

#include <chrono>
#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace marlo {
class ObjectManager;
}

namespace marlo::server {

/** Stopped, without patience, when it goes. */
class Indications {
  public:
    struct Options {
        std::string stateDirectory; ///< made where it is not there; the database is in it
        std::function<bool(const std::string& user)> mayRead;
        std::function<void(const std::string& line)> log; ///< any thread
    };

    /**
     * Restores what was subscribed to and serves it. Throws std::exception where the database cannot be used, by two
     * servers at once for instance. `manager` outlives this.
     */
    Indications(ObjectManager& manager, const IndicationOptions& configuration, const Options& options);
    ~Indications();
    Indications(const Indications&) = delete;
    Indications& operator=(const Indications&) = delete;

    /** Throws std::invalid_argument that says what is wrong with the file of authorities. */
    static void check(const IndicationOptions& configuration);

    /** Other users or authorities from now on; limits stay. */
    void configure(const IndicationOptions& configuration);

    /** Sends what waits for at most so long; the rest stays on disk. */
    void stop(std::chrono::milliseconds patience);

    [[nodiscard]] std::vector<DeliveryState> deliveries() const;

  private:
    struct State;
    std::unique_ptr<State> _state;
};

} // namespace marlo::server

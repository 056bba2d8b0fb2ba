/**
 * @file
 * Sends what waits for one destination.
 */
#pragma once

#include "host/delivery/Client.h"
#include "host/delivery/Ledger.h"
#include "host/delivery/Network.h"

#include <functional>
#include <memory>
#include <string>

namespace marlo::delivery {

/** One indication after the other, each until it has arrived. On the network's thread only. */
class Sender {
  public:
    using Policy = std::function<void(const std::string& subscription, OnFatalError policy)>;

    /** All outlive this. */
    Sender(Network& network, Ledger& ledger, const Options& options, Ledger::LaneId lane, Policy policy);

    /** Begins or begins anew, with another place to send to; a pause after failures ends. `tls` as of Client. */
    void setDestination(const Destination& destination, const TlsClient& tls);

    /** There may be something to send. */
    void wake();

  private:
    void send();
    void onOutcome(std::int64_t number, const std::string& problem);
    void pause(std::optional<std::chrono::milliseconds> atMost);

    Network& _network;
    Ledger& _ledger;
    const Options& _options;
    const Ledger::LaneId _lane;
    const Policy _policy;
    Timer _pause;
    std::shared_ptr<Client> _client;
    bool _isBusy = false; ///< something is on its way
    bool _isPausing = false;
    unsigned _failures = 0; ///< in a row
};

} // namespace marlo::delivery

/**
 * @file
 * Indications on their way to listeners: kept on disk from the post until the listener has answered.
 */
#pragma once

#include "host/model/Instance.h"

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <functional>
#include <memory>
#include <optional>
#include <span>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

namespace marlo::delivery {

/** Where indications go to. */
struct Destination {
    std::string key;           ///< whatever the caller tells its destinations apart by
    std::string url;           ///< http:// or https://, see Url.h
    bool isVerified = true;    ///< https: the certificate must be good and name the host of the URL
    std::string authorityFile; ///< https: PEM certificates of those who may vouch; empty: those of the system
    bool operator==(const Destination&) const = default;
};

/** OnFatalErrorPolicy of CIM_IndicationSubscription. */
enum class OnFatalError : std::uint16_t { ignore = 2, disable = 3, remove = 4 };

struct Subscription {
    std::string key;
    std::string destination; ///< key of one that has been set
    OnFatalError onFatalError = OnFatalError::ignore;
    std::chrono::seconds failureTrigger{0}; ///< FailureTriggerTimeInterval: how long all tries fail before the policy
    bool operator==(const Subscription&) const = default;
};

/** Not on disk, and not going to be delivered; the text says why. */
class NotKept : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

/** What one destination has seen since the start. */
struct Counters {
    std::string destination;
    std::string url;
    std::string sequenceContext;
    std::uint64_t queued = 0;      ///< waiting now, what was there at the start included
    std::uint64_t queuedBytes = 0; ///< of XML
    std::uint64_t sent = 0;        ///< answered by the listener
    std::uint64_t retried = 0;     ///< tries that failed and were, or will be, made again
    std::uint64_t dropped = 0;     ///< lost to a full queue, a disk that took nothing, or an unreadable record
    std::string lastError;         ///< empty: none yet
    std::optional<std::chrono::system_clock::time_point> lastErrorTime;
    std::optional<std::chrono::system_clock::time_point> failingSince; ///< nothing while tries succeed
    std::optional<std::chrono::system_clock::time_point> oldestQueued; ///< when what waits longest was posted
    std::chrono::microseconds latencyMedian{0};                        ///< post to answer; to within an eighth
    std::chrono::microseconds latency99{0};                            ///< 99th percentile
};

/** What one server may take, and how long it waits. */
struct Options {
    std::size_t queueLength = 100000;                        ///< of one destination; then the oldest is dropped
    std::size_t queueBytes = std::size_t{256} * 1024 * 1024; ///< of one destination, as XML
    std::size_t memoryBytes = std::size_t{1} * 1024 * 1024;  ///< of XML kept beside the disk, of all destinations
    std::size_t answerHeadBytes = std::size_t{16} * 1024;    ///< of a listener's answer
    std::size_t answerBodyBytes = std::size_t{64} * 1024;    ///< of a listener's answer
    std::chrono::milliseconds connectTime{10000};            ///< look-up of the name, connecting and TLS
    std::chrono::milliseconds exchangeTime{30000};           ///< from the first byte sent to the last one received
    std::chrono::milliseconds firstRetry{1000};              ///< doubled with each failure in a row,
    std::chrono::milliseconds lastRetry{60000};              ///< up to this; spread by a fifth both ways
    std::chrono::milliseconds deletionTime{250};             ///< after which answered ones leave the disk, together
    std::chrono::milliseconds shrinkTime{1000}; ///< after that, the file is made smaller if it is worth it
};

/**
 * Delivers to any number of destinations at once, to each one after the other in the order of the posts. All
 * operations may be called from any thread.
 *
 * Every indication gets SequenceContext and SequenceNumber (CIM_Indication): the context stands for one life of a
 * destination, the number counts from 0 what was posted for it, over restarts. A gap is what was lost; the same
 * number again is the same indication again, which happens when the answer to it was lost.
 */
class Delivery {
  public:
    /** Stands for one post. Posts become durable in their order. */
    using Ticket = std::uint64_t;
    /** Any thread; must not call back. */
    using Log = std::function<void(const std::string& line)>;
    /**
     * Told once that all tries for a subscription's destination have failed for as long as the subscription bears
     * (policies disable and remove; again only after a success in between). Called on a thread of its own, where
     * everything here may be called, and waiting holds up no delivery.
     */
    using PolicyHandler = std::function<void(const std::string& subscription, OnFatalError policy)>;

    /**
     * Opens the database and what it has of former posts. Throws store::Error; or std::runtime_error when another
     * process delivers from it.
     */
    Delivery(const std::filesystem::path& database, const Options& options, PolicyHandler onPolicy, Log log);
    ~Delivery(); ///< stops with no patience, and waits for a policy handler that runs
    Delivery(const Delivery&) = delete;
    Delivery& operator=(const Delivery&) = delete;

    /**
     * Makes a destination known, or changes it: its queue and its sequence go on. What is wrong with the URL or the
     * file of authorities is thrown as std::invalid_argument; durable when it returns, else store::Error.
     */
    void setDestination(const Destination& destination);
    /** Forgets it with its subscriptions and all that waits for it; should it come back, it is another life. */
    void removeDestination(const std::string& key);

    /** Makes a subscription known or changes it. Throws std::invalid_argument for a destination that is not known. */
    void setSubscription(const Subscription& subscription);
    /** Forgets it and what waits for it. */
    void removeSubscription(const std::string& key);

    /**
     * Queues an indication once for each of the subscriptions, those that are not known left out. Returns at once;
     * numbers and order are given here. Throws NotKept after stop().
     */
    Ticket post(std::span<const std::string> subscriptions, const Instance& indication);

    /**
     * Returns when the post is on disk: at once when a later one already is, so that whoever has several tickets
     * waits for each, beginning with any. All who wait at the same time share the cost. Throws NotKept when the disk
     * did not take it.
     */
    void wait(Ticket ticket);

    /**
     * Begins to send. Destinations and subscriptions that were not set before are forgotten with what waits for
     * them: whoever keeps the subscriptions sets them all first. Until then posts are kept, and nothing is sent.
     * Throws as setDestination() does.
     */
    void start();

    /**
     * Posts from now on are refused. What waits is sent for at most `patience`, then
     * connections are cut; what is left stays on disk for the next start. Once.
     */
    void stop(std::chrono::milliseconds patience);

    /** Of all destinations, by key. */
    [[nodiscard]] std::vector<Counters> counters() const;

  private:
    class State;
    std::unique_ptr<State> _state;
};

} // namespace marlo::delivery

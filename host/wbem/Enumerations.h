/**
 * @file
 * Enumerations that clients have opened and pull from (DSP0200: pulled enumeration operations).
 *
 * An enumeration is its result, held as plain values, and not a provider that waits in the middle of its answer: a
 * client that stays away holds memory, which is counted and bounded, but no thread, and no lock that a provider may
 * have taken. So a pull is never under way: what it is given is taken out at once, and enumerations neither change
 * nor fail after they were opened.
 */
#pragma once

#include "host/cimom/ClassChecks.h"
#include "host/wbem/Limits.h"

#include <atomic>
#include <condition_variable>
#include <cstdint>
#include <deque>
#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

namespace marlo::wbem {

/** CIM status codes of pulled enumerations (DSP0200) that CMPI does not name. */
constexpr auto invalidEnumerationContext = static_cast<CMPIrc>(21);
constexpr auto invalidOperationTimeout = static_cast<CMPIrc>(22);
constexpr auto continuationOnErrorNotSupported = static_cast<CMPIrc>(26);

/** What an enumeration gives, and so which operation pulls from it. */
enum class Pulled { instancesWithPath, paths, instances };

/** Whose enumeration it is; a pull that differs in any of these finds none. */
struct EnumerationOwner {
    std::string user;
    std::string nameSpace;
    Pulled pulled = Pulled::instancesWithPath;
};

class Enumerations {
  public:
    explicit Enumerations(const Limits& limits);
    ~Enumerations();
    Enumerations(const Enumerations&) = delete;
    Enumerations& operator=(const Enumerations&) = delete;

    class Held;

    /**
     * An enumeration to be filled. Throws RequestError (CMPI_RC_ERR_SERVER_LIMITS_EXCEEDED) where its user or all of
     * them have as many as they may.
     */
    [[nodiscard]] std::unique_ptr<Held> begin(const EnumerationOwner& owner, bool classOrigin);

    /** Keeps what is left to be pulled; returns its context, 128 random bits. */
    std::string keep(std::unique_ptr<Held> held, std::chrono::seconds timeout);

    struct Batch {
        std::vector<Instance> objects; ///< of paths only `path`
        bool classOrigin = false;
        bool last = false; ///< nothing is left, and the context is gone
    };

    /**
     * Takes up to `most` objects out. Throws RequestError (21) for a context that there is not, any more or for this
     * owner.
     */
    [[nodiscard]] Batch pull(const std::string& context, const EnumerationOwner& owner, std::size_t most);

    /**
     * The client has its answer: its next pull is awaited for as long as the timeout says. Until then, after `keep`
     * and after each `pull`, an enumeration does not expire, however slowly the client reads.
     */
    void await(const std::string& context);

    /** Forgets an enumeration, of whatever it is. Throws as `pull` does. */
    void close(const std::string& context, const EnumerationOwner& owner);

    /** The same, where there still is one. */
    void drop(const std::string& context);

    [[nodiscard]] std::size_t size() const; ///< open now

  private:
    using Clock = std::chrono::steady_clock;

    struct Open {
        std::unique_ptr<Held> held;
        std::chrono::seconds timeout{0};
        Clock::time_point deadline = Clock::time_point::max();
    };

    using Contexts = std::map<std::string, Open>;

    Contexts::iterator find(const std::string& context, const EnumerationOwner& owner);
    std::vector<Open> takeExpired(Clock::time_point now);
    void watch();

    const Limits _limits;
    mutable std::mutex _mutex;
    std::condition_variable _changed;
    Contexts _contexts;
    std::map<std::string, std::size_t> _users; ///< enumerations of each, those that are being filled included
    std::size_t _count = 0;                    ///< the same of all
    std::atomic<std::size_t> _bytes{0};
    bool _ended = false;
    std::thread _watch; ///< ends enumerations whose time has passed; runs from the first one on
};

/** The result of one enumeration; counted for as long as it lives. Used by one thread at a time. */
class Enumerations::Held {
  public:
    /** The enumeration has been counted. */
    Held(Enumerations& all, EnumerationOwner owner, bool classOrigin);
    ~Held();
    Held(const Held&) = delete;
    Held& operator=(const Held&) = delete;

    /** Throws RequestError (CMPI_RC_ERR_SERVER_LIMITS_EXCEEDED) where all results together become too large. */
    void add(Instance&& object);

    /** Takes the first objects out. */
    [[nodiscard]] Batch take(std::size_t most);

  private:
    friend class Enumerations;

    Enumerations& _all;
    EnumerationOwner _owner;
    bool _classOrigin;
    std::deque<Instance> _objects;
    std::size_t _bytes = 0;
};

} // namespace marlo::wbem

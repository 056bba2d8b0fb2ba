#include "host/cli/Watch.h"

#include "host/cli/Json.h"
#include "host/cli/WatchLine.h"
#include "host/server/Signals.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <chrono>
#include <csignal>
#include <cstdint>
#include <deque>
#include <initializer_list>
#include <mutex>
#include <optional>
#include <system_error>
#include <utility>

#include <poll.h>
#include <sys/eventfd.h>
#include <unistd.h>

namespace marlo::cli {

namespace {

using Clock = std::chrono::steady_clock;

/** A file descriptor that is closed when it goes; throws std::system_error when there was none to be had. */
class Descriptor {
  public:
    explicit Descriptor(int fd) : _fd(fd) {
        if (fd < 0) {
            throw std::system_error(errno, std::generic_category(), "cannot wait for indications");
        }
    }

    ~Descriptor() { ::close(_fd); }

    Descriptor(const Descriptor&) = delete;
    Descriptor& operator=(const Descriptor&) = delete;

    [[nodiscard]] int get() const { return _fd; }

  private:
    int _fd;
};

/** Indications between the threads that deliver them and the one that prints them. */
class Queue {
  public:
    void push(Instance&& indication) {
        {
            const std::lock_guard lock(_mutex);
            _waiting.push_back(std::move(indication));
        }
        const std::uint64_t one = 1;
        // Fails only where it has its highest count, and wakes then as well.
        [[maybe_unused]] const auto size = ::write(descriptor(), &one, sizeof one);
    }

    /** All that are waiting, in order. */
    std::deque<Instance> take() {
        std::uint64_t count = 0;
        [[maybe_unused]] const auto size = ::read(descriptor(), &count, sizeof count);
        const std::lock_guard lock(_mutex);
        return std::exchange(_waiting, {});
    }

    [[nodiscard]] int descriptor() const { return _wakeUp.get(); }

  private:
    Descriptor _wakeUp{::eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK)};
    std::mutex _mutex;
    std::deque<Instance> _waiting;
};

/** Ended, when it goes, with whatever was subscribed to. */
class Watcher {
  public:
    Watcher(ObjectManager& manager, const Options& options, Output& output)
        : _manager(manager), _options(options), _output(output) {}

    ~Watcher() { static_cast<void>(unsubscribe()); }

    Watcher(const Watcher&) = delete;
    Watcher& operator=(const Watcher&) = delete;

    Status subscribe(const std::string& filter) {
        SubscriptionId id = 0;
        Status status = _manager.subscribe(
            _options.nameSpace, filter, _options.watch.language,
            [this](Instance&& indication) { _queue.push(std::move(indication)); }, id);
        if (status.ok()) {
            _subscriptions.push_back(id);
        }
        return status;
    }

    /** Prints until it is over; true when as many as were asked for have come. */
    bool watch(const server::Signals& signals) {
        const auto end = Clock::now() + std::chrono::duration_cast<Clock::duration>(
                                            std::chrono::duration<double>(_options.watch.timeout.value_or(0)));
        while (!isComplete()) {
            // A reader of standard output that goes away is an error there, which is reported unasked.
            std::array<pollfd, 3> polled{
                {{signals.descriptor(), POLLIN, 0}, {_queue.descriptor(), POLLIN, 0}, {STDOUT_FILENO, 0, 0}}};
            const int ready = ::poll(polled.data(), polled.size(), millisecondsTo(end));
            print();
            const bool signalled = polled[0].revents != 0;
            if (signalled) {
                static_cast<void>(signals.take()); // lest it act when signals act again
            }
            if (polled[2].revents != 0) {
                throw OutputError(EPIPE);
            }
            if (ready == 0 || signalled) {
                break;
            }
        }
        return isComplete();
    }

    /** The first failure is answered; what is subscribed to ends all the same. */
    Status unsubscribe() {
        Status status;
        while (!_subscriptions.empty()) {
            const Status ended = _manager.unsubscribe(_subscriptions.back());
            _subscriptions.pop_back();
            if (status.ok()) {
                status = ended;
            }
        }
        return status;
    }

  private:
    [[nodiscard]] bool isComplete() const { return _options.watch.count && _printed >= *_options.watch.count; }

    /** For poll: -1 without a time-out. */
    [[nodiscard]] int millisecondsTo(Clock::time_point end) const {
        if (!_options.watch.timeout) {
            return -1;
        }
        const auto left = std::chrono::ceil<std::chrono::milliseconds>(end - Clock::now()).count();
        constexpr std::int64_t longest = 1'000'000'000;
        return static_cast<int>(std::clamp<std::int64_t>(left, 0, longest));
    }

    void print() {
        for (Instance& indication : _queue.take()) {
            if (isComplete()) {
                return;
            }
            orderBySchema(_manager.schema(), indication);
            _output.write((_options.json ? toJson(indication) : showIndication(_manager.schema(), indication)) +
                          "\n");
            ++_printed;
        }
        _output.finish();
    }

    ObjectManager& _manager;
    const Options& _options;
    Output& _output;
    Queue _queue;
    std::vector<SubscriptionId> _subscriptions;
    unsigned _printed = 0;
};

/** The filters that the options stand for; a class that derives from another one of them is in that one's. */
std::vector<std::string> filtersOf(const Schema& schema, const Options& options) {
    if (!options.watch.filter.empty()) {
        return {options.watch.filter};
    }
    const std::vector<std::string>& classes = options.watch.classes;
    std::vector<std::string> filters;
    for (std::size_t i = 0; i < classes.size(); ++i) {
        bool isContained = false;
        for (std::size_t j = 0; j < classes.size(); ++j) {
            const bool same = equalNames(classes[i], classes[j]);
            isContained = isContained || (same ? j < i : schema.isA(options.nameSpace, classes[i], classes[j]));
        }
        if (!isContained) {
            filters.push_back("SELECT * FROM " + classes[i]);
        }
    }
    return filters;
}

} // namespace

ExitCode runWatch(ObjectManager& manager, const Options& options, Output& output) {
    std::optional<server::Signals> signals(std::in_place, std::initializer_list<int>{SIGINT, SIGTERM});
    Watcher watcher(manager, options, output);
    const std::vector<std::string> filters = filtersOf(manager.schema(), options);
    for (const std::string& filter : filters) {
        Status status = watcher.subscribe(filter);
        if (!status.ok()) {
            status.message = "nothing can be watched with " + filter + ": " + status.message;
            return report(status);
        }
        static_cast<void>(report(status)); // failures that were logged and yet did not hinder it
    }
    complain("watching; interrupt to end");
    const bool complete = watcher.watch(*signals);
    signals.reset(); // from now on a second interrupt ends the process at once
    const ExitCode ended = report(watcher.unsubscribe());
    output.finish();
    return options.watch.count && !complete ? Failed : ended;
}

} // namespace marlo::cli

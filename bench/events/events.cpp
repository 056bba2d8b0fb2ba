/*
 * What an event costs on its way to a subscriber of the object manager.
 *
 *     bench_events latency ADAPTERS SAMPLES   from the kernel's notification to CBDeliverIndication returning
 *     bench_events throughput EVENTS          a burst of a described host
 *     bench_events memory EVENTS              resident memory after a tenth of the events, and after all of them
 *     bench_events idle SECONDS               how often a thread wakes while nothing happens
 */
#include "bench/events/Flips.h"
#include "bench/events/Subscriber.h"
#include "bench/support/DescribedHost.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include <unistd.h>

namespace marlo::bench {

namespace {

double microseconds(Clock::duration duration) {
    return std::chrono::duration<double, std::micro>(duration).count();
}

/** The share-th of sorted values. */
double quantile(const std::vector<double>& sorted, double share) {
    return sorted.at(static_cast<std::size_t>(share * static_cast<double>(sorted.size() - 1)));
}

/** The interface has no carrier: up and down are two ways of being offline, each an event. */
void latency(int adapters, int samples) {
    makeNamespace(adapters);
    Subscriber subscriber;
    Flips flips;
    flips.waitUntilQuiet();
    std::vector<double> taken;
    for (int i = 0; i < samples; ++i) {
        const std::size_t before = subscriber.count();
        const Clock::time_point notified = flips.flip(i % 2 == 0);
        taken.push_back(microseconds(subscriber.await(before + 1) - notified));
        ::usleep(5'000); // what the kernel has to say beside it is over by then
        if (subscriber.count() != before + 1) {
            throw std::runtime_error("more than one event of one change");
        }
    }
    std::sort(taken.begin(), taken.end());
    std::printf("latency %d adapters %d samples: median %.0f us, 99th percentile %.0f us\n", adapters, samples,
                quantile(taken, 0.5), quantile(taken, 0.99));
}

/** A described host whose agent can be told to play events. */
class PlayedHost {
  public:
    PlayedHost() : _control("/tmp/marlo-bench-control-" + std::to_string(::getpid())) {
        (void)::setenv("ORV_AGENT_CONTROL", _control.c_str(), 1);
    }

    ~PlayedHost() { ::unlink(_control.c_str()); }

    PlayedHost(const PlayedHost&) = delete;
    PlayedHost& operator=(const PlayedHost&) = delete;

    void burst(std::size_t events) const { std::ofstream(_control) << "burst eth0 " << events << std::endl; }

  private:
    std::string _control;
};

void throughput(std::size_t events) {
    const PlayedHost played;
    const DescribedHost host(4);
    Subscriber subscriber;
    const Clock::time_point start = Clock::now();
    played.burst(events);
    const double seconds = 1e-6 * microseconds(subscriber.await(events) - start);
    subscriber.expectAlternation();
    std::printf("throughput %zu events: %.0f a second, none lost, repeated or out of order\n", events,
                static_cast<double>(events) / seconds);
}

long residentKibibytes() {
    std::ifstream file("/proc/self/statm");
    long total = 0;
    long resident = 0;
    file >> total >> resident;
    return resident * (::sysconf(_SC_PAGESIZE) / 1024);
}

void memory(std::size_t events) {
    constexpr std::size_t chunk = 10'000; // what waits to be handed over takes memory, too
    const PlayedHost played;
    const DescribedHost host(4);
    Subscriber subscriber;
    long early = 0;
    for (std::size_t done = 0; done < events;) {
        played.burst(std::min(chunk, events - done));
        done += std::min(chunk, events - done);
        (void)subscriber.await(done);
        if (early == 0 && done >= events / 10) {
            early = residentKibibytes();
        }
    }
    subscriber.expectAlternation();
    std::printf("memory %zu events: %ld KiB after a tenth, %ld KiB after all\n", events, early, residentKibibytes());
}

/** Context switches of every thread but this one, so far. */
long switchesOfOthers() {
    long switches = 0;
    for (const auto& task : std::filesystem::directory_iterator("/proc/self/task")) {
        if (task.path().filename() == std::to_string(::getpid())) {
            continue;
        }
        std::ifstream file(task.path() / "status");
        for (std::string line; std::getline(file, line);) {
            if (line.find("ctxt_switches:") != std::string::npos) {
                switches += std::atol(line.c_str() + line.find(':') + 1);
            }
        }
    }
    return switches;
}

void idle(unsigned seconds) {
    makeNamespace(4);
    const Subscriber subscriber;
    {
        const Flips flips;
        flips.waitUntilQuiet();
    }
    const long before = switchesOfOthers();
    ::sleep(seconds);
    std::printf("idle %u seconds: %ld wake-ups\n", seconds, switchesOfOthers() - before);
}

void run(std::string_view what, const std::vector<int>& numbers) {
    if (what == "latency" && numbers.size() == 2) {
        latency(numbers[0], numbers[1]);
    } else if (what == "throughput" && numbers.size() == 1) {
        throughput(static_cast<std::size_t>(numbers[0]));
    } else if (what == "memory" && numbers.size() == 1) {
        memory(static_cast<std::size_t>(numbers[0]));
    } else if (what == "idle" && numbers.size() == 1) {
        idle(static_cast<unsigned>(numbers[0]));
    } else {
        throw std::runtime_error(
            "usage: latency ADAPTERS SAMPLES | throughput EVENTS | memory EVENTS | idle SECONDS");
    }
}

} // namespace

} // namespace marlo::bench

int main(int count, char** arguments) {
    try {
        std::vector<int> numbers;
        for (int i = 2; i < count; ++i) {
            numbers.push_back(std::max(1, std::atoi(arguments[i])));
        }
        marlo::bench::run(count > 1 ? arguments[1] : "", numbers);
        return EXIT_SUCCESS;
    } catch (const std::exception& error) {
        std::fprintf(stderr, "bench_events: %s\n", error.what());
        return EXIT_FAILURE;
    }
}

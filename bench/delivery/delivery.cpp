/*
 * What the durable delivery of indications costs. The database is made in the working directory and removed again.
 *
 *     bench_delivery disk SAMPLES         one write of a page that is overwritten, and synchronised, for comparison
 *     bench_delivery latency SAMPLES      from the post to the listener's socket, one at a time
 *     bench_delivery sustained COUNT      as fast as one thread posts and waits, until the last has come
 *     bench_delivery threads COUNT        the same with eight threads that post
 *     bench_delivery memory COUNT         resident memory that so many add whose listener is dead
 *     bench_delivery restart COUNT        from opening the database with so many to the first arrival
 */
#include "host/delivery/Delivery.h"

#include "bench/delivery/Sink.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <functional>
#include <map>
#include <string>
#include <string_view>
#include <thread>
#include <vector>

#include <fcntl.h>
#include <sys/wait.h>
#include <unistd.h>

namespace marlo::bench {
namespace {

using delivery::Delivery;

const std::vector<std::string> subscription{"a"};

/** A directory that is gone afterwards. */
class Site {
  public:
    Site() {
        std::string pattern = (std::filesystem::current_path() / "bench-delivery-XXXXXX").string();
        if (::mkdtemp(pattern.data()) == nullptr) {
            throw std::runtime_error("no directory " + pattern);
        }
        _directory = pattern;
    }

    ~Site() {
        std::error_code ignored;
        std::filesystem::remove_all(_directory, ignored);
    }

    Site(const Site&) = delete;
    Site& operator=(const Site&) = delete;

    [[nodiscard]] std::filesystem::path file() const { return _directory / "marlo.db"; }

  private:
    std::filesystem::path _directory;
};

/** As an adapter's alert has them. */
Instance alert() {
    Instance instance;
    instance.path = {"", "root/cimv2", "MARLO_NetworkAdapterOfflineIndication", {}};
    const auto text = [&instance](const char* name, std::string value) {
        instance.properties.push_back({name, Value::string(std::move(value))});
    };
    text("IndicationIdentifier", "marlo:eth0:20261121083000.000000+000");
    instance.properties.push_back({"IndicationTime", {CMPI_dateTime, DateTime{"20261121083000.000000+000"}}});
    text("Description", "The network adapter eth0 (Ethernet Controller, port 1) has lost its link");
    text("AlertingManagedElement", "//host.example.com/root/cimv2:MARLO_PhysicalNetworkAdapter.CreationClassName="
                                   "\"MARLO_PhysicalNetworkAdapter\",DeviceID=\"eth0\",SystemName=\"host\"");
    for (const char* name : {"AlertType", "PerceivedSeverity", "ProbableCause", "AlertingElementFormat"}) {
        instance.properties.push_back({name, Value::uint(CMPI_uint16, 2)});
    }
    for (const char* name : {"EventID", "SystemCreationClassName", "SystemName", "ProviderName", "OwningEntity"}) {
        text(name, "some text of ordinary length");
    }
    text("Message", "eth0: link down");
    return instance;
}

std::unique_ptr<Delivery> open(const Site& site, const std::string& url) {
    auto opened = std::make_unique<Delivery>(
        site.file(), delivery::Options(), [](const std::string& /*key*/, delivery::OnFatalError /*policy*/) {},
        [](const std::string& line) { std::fprintf(stderr, "%s\n", line.c_str()); });
    opened->setDestination({"a", url, true, {}});
    opened->setSubscription({"a", "a", delivery::OnFatalError::ignore, {}});
    opened->start();
    return opened;
}

double microseconds(Clock::duration duration) {
    return std::chrono::duration<double, std::micro>(duration).count();
}

/** The share-th of sorted values. */
double quantile(const std::vector<double>& sorted, double share) {
    return sorted.at(static_cast<std::size_t>(share * static_cast<double>(sorted.size() - 1)));
}

void disk(int samples) {
    const Site site;
    const http::Descriptor file(::open(site.file().c_str(), O_RDWR | O_CREAT | O_CLOEXEC, 0600));
    const std::string page(4096, 'x');
    std::vector<double> taken;
    for (int count = 0; count < samples; ++count) {
        const auto begin = Clock::now();
        if (::pwrite(file.get(), page.data(), page.size(), 0) < 0 || ::fdatasync(file.get()) != 0) {
            throw std::runtime_error("cannot write");
        }
        taken.push_back(microseconds(Clock::now() - begin));
    }
    std::sort(taken.begin(), taken.end());
    std::printf("disk: median %.0f us, 99th percentile %.0f us\n", quantile(taken, 0.5), quantile(taken, 0.99));
}

void latency(int samples) {
    const Site site;
    Sink sink;
    const auto delivery = open(site, sink.url());
    std::vector<double> arrived;
    std::vector<double> kept;
    for (int number = 0; number < samples; ++number) {
        const auto begin = Clock::now();
        delivery->wait(delivery->post(subscription, alert()));
        kept.push_back(microseconds(Clock::now() - begin));
        arrived.push_back(microseconds(sink.arrivalOf(number) - begin));
        ::usleep(2000);
    }
    std::sort(arrived.begin(), arrived.end());
    std::sort(kept.begin(), kept.end());
    std::printf("latency %d samples: median %.0f us, 99th percentile %.0f us; on disk median %.0f us\n", samples,
                quantile(arrived, 0.5), quantile(arrived, 0.99), quantile(kept, 0.5));
}

void sustained(int count, int posters) {
    const Site site;
    Sink sink;
    const auto delivery = open(site, sink.url());
    const Instance indication = alert();
    const auto begin = Clock::now();
    std::vector<std::thread> threads;
    for (int poster = 0; poster < posters; ++poster) {
        threads.emplace_back([&, share = count / posters] {
            for (int number = 0; number < share; ++number) {
                delivery->wait(delivery->post(subscription, indication));
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    const double posted = microseconds(Clock::now() - begin) / 1e6;
    const int last = count / posters * posters - 1;
    const double arrived = microseconds(sink.arrivalOf(last) - begin) / 1e6;
    std::printf("sustained %d by %d threads: %.0f a second to the listener, %.0f a second kept\n", last + 1, posters,
                (last + 1) / arrived, (last + 1) / posted);
}

long residentKiB() {
    std::ifstream status("/proc/self/status");
    for (std::string line; std::getline(status, line);) {
        if (line.starts_with("VmRSS:")) {
            return std::strtol(line.c_str() + 6, nullptr, 10);
        }
    }
    return 0;
}

/** Posts without a wait for each: what is measured is what stays. */
void fill(Delivery& delivery, int count) {
    const Instance indication = alert();
    Delivery::Ticket last = 0;
    for (int number = 0; number < count; ++number) {
        last = delivery.post(subscription, indication);
        if (number % 100 == 99) {
            delivery.wait(last);
        }
    }
    delivery.wait(last);
}

void memory(int count) {
    const Site site;
    const auto delivery = open(site, "http://127.0.0.1:1/");
    fill(*delivery, 10);
    const long before = residentKiB();
    fill(*delivery, count);
    const long added = residentKiB() - before;
    std::printf("memory: %d queued add %ld KiB, %.0f KiB for each 1000; %.1f MiB of XML\n", count, added,
                1000.0 * static_cast<double>(added) / count,
                static_cast<double>(delivery->counters().front().queuedBytes) / (1024 * 1024));
    delivery->stop(std::chrono::milliseconds(0));
}

/** Filled by another process, which leaves nothing in this one's memory. */
void restart(int count) {
    const Site site;
    if (const pid_t child = ::fork(); child == 0) {
        {
            const auto delivery = open(site, "http://127.0.0.1:1/");
            fill(*delivery, count);
        }
        ::_exit(0);
    } else {
        int status = 0;
        ::waitpid(child, &status, 0);
        if (status != 0) {
            throw std::runtime_error("nothing was queued");
        }
    }
    Sink sink;
    const auto begin = Clock::now();
    const auto delivery = open(site, sink.url());
    const double opened = microseconds(Clock::now() - begin) / 1000;
    const double first = microseconds(sink.arrivalOf(0) - begin) / 1000;
    const double all = microseconds(sink.arrivalOf(count - 1) - begin) / 1e6;
    std::printf(
        "restart with %d queued: first after %.0f ms, opened after %.0f ms; all after %.1f s, %.0f a second\n", count,
        first, opened, all, count / all);
}

} // namespace
} // namespace marlo::bench

int main(int count, char** arguments) {
    using namespace marlo::bench;
    const std::map<std::string_view, std::function<void(int)>> parts{
        {"disk", disk},
        {"latency", latency},
        {"sustained", [](int number) { sustained(number, 1); }},
        {"threads", [](int number) { sustained(number, 8); }},
        {"memory", memory},
        {"restart", restart}};
    const auto part = count > 1 ? parts.find(arguments[1]) : parts.end();
    if (part == parts.end()) {
        std::fprintf(stderr, "bench_delivery disk|latency|sustained|threads|memory|restart COUNT\n");
        return 2;
    }
    try {
        part->second(count > 2 ? std::atoi(arguments[2]) : 1000);
    } catch (const std::exception& error) {
        std::fprintf(stderr, "bench_delivery: %s\n", error.what());
        return 1;
    }
}

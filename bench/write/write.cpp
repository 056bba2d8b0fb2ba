/*
 * What changing an adapter costs: EnableStatic from the call of the method MI until it returns, when the kernel has
 * acknowledged and the file is written, beside `ip addr replace` and `ip route replace`; the same on hosts of several
 * sizes; and the memory of the process over many changes. Network, files and what else changes are those of
 * namespaces that each measurement makes for itself, so it needs root.
 *
 *     bench_write [--changes N] [--rounds N]
 */
#include "bench/provider/ProviderBench.h"
#include "bench/write/TimedSync.h"

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <exception>
#include <fstream>
#include <functional>
#include <memory>
#include <stdexcept>
#include <string>
#include <system_error>
#include <vector>

#include <fcntl.h>
#include <malloc.h>
#include <sched.h>
#include <spawn.h>
#include <sys/mount.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

namespace {

using namespace marlo;

constexpr const char* nameSpace = "root/tavis";
constexpr const char* className = "MARLO_NetworkAdapterConfiguration";

double now() {
    return std::chrono::duration<double, std::micro>(std::chrono::steady_clock::now().time_since_epoch()).count();
}

double median(std::vector<double> values) {
    std::nth_element(values.begin(), values.begin() + static_cast<std::ptrdiff_t>(values.size() / 2), values.end());
    return values[values.size() / 2];
}

void check(bool good, const char* what) {
    if (!good) {
        throw std::system_error(errno, std::generic_category(), what);
    }
}

/** Runs a program and waits for it. */
void run(const std::vector<std::string>& arguments) {
    std::vector<char*> pointers;
    for (const std::string& argument : arguments) {
        pointers.push_back(const_cast<char*>(argument.c_str()));
    }
    pointers.push_back(nullptr);
    pid_t child = 0;
    int status = 0;
    if (posix_spawnp(&child, pointers[0], nullptr, nullptr, pointers.data(), environ) != 0 ||
        waitpid(child, &status, 0) != child || status != 0) {
        throw std::runtime_error(arguments.front() + " failed");
    }
}

void shell(const std::string& command) {
    run({"/bin/sh", "-ec", command});
}

/** A directory on disk that is gone with the object. */
class Directory {
  public:
    Directory() { check(mkdtemp(_path.data()) != nullptr, "a directory"); }

    ~Directory() { shell("rm -rf " + _path); }

    Directory(const Directory&) = delete;
    Directory& operator=(const Directory&) = delete;

    [[nodiscard]] const std::string& path() const { return _path; }

  private:
    std::string _path = "/var/tmp/marlo-bench-XXXXXX";
};

/**
 * Moves this process into namespaces of its own, with so many interfaces, the first of which is `left0`, and with the
 * directory in the place of /etc/network, where the first eight are configured.
 */
void makeHost(int interfaces, const std::string& directory) {
    check(unshare(CLONE_NEWNET | CLONE_NEWNS) == 0, "namespaces, which need root");
    check(mount(nullptr, "/", nullptr, MS_REC | MS_PRIVATE, nullptr) == 0, "private mounts");
    shell("mount -t sysfs sysfs /sys; mkdir -p /etc/network; mount --bind " + directory + " /etc/network");
    std::ofstream batch(directory + "/batch");
    std::ofstream file(directory + "/interfaces");
    file << "# made for a measurement\nauto lo\niface lo inet loopback\n";
    for (int pair = 0; pair < interfaces / 2; ++pair) {
        const std::string net = "10." + std::to_string(pair / 256) + '.' + std::to_string(pair % 256);
        batch << "link add left" << pair << " type veth peer name right" << pair << "\nlink set left" << pair
              << " up\nlink set right" << pair << " up\naddr add " << net << ".10/24 dev left" << pair << '\n';
        if (pair < 8) {
            file << "\nauto left" << pair << "\niface left" << pair << " inet static\n    address " << net
                 << ".10/24\n";
        }
        if (pair == 0) {
            file << "    gateway " << net << ".1\n";
            batch << "route add default via " << net << ".1 dev left0\n";
        }
    }
    batch.close();
    file.close();
    shell("ip link set lo up; ip -batch " + directory + "/batch; rm " + directory + "/batch");
    // Duplicate address detection, which would change addresses under the measurement, takes up to two seconds.
    sleep(3);
}

/** One EnableStatic of left0 through the provider's method table. */
class EnableStatic {
  public:
    /** Throws when the method does not answer 0. */
    void operator()(const std::string& address) {
        const broker::Broker& broker = bench::sharedBroker();
        const broker::CallScope scope;
        bench::CountingSink sink;
        const broker::Result result(sink);
        const CMPIContext* context = broker.newContext();
        const CMPIObjectPath* path =
            broker.newObjectPath({"", nameSpace, className, {{"SettingID", Value::string("left0")}}});
        const CMPIArgs* in = broker.newArgs({{"IPAddress", list(address)}, {"SubnetMask", list("255.255.255.0")}});
        const CMPIStatus status = _methods->ft->invokeMethod(_methods, context, result.handle(), path, "EnableStatic",
                                                             in, broker.newArgs({}));
        if (status.rc != CMPI_RC_OK || sink.count != 1) {
            throw std::runtime_error("EnableStatic failed");
        }
    }

  private:
    static Value list(const std::string& text) { return {CMPI_stringA, Value::Array{Value::string(text)}}; }

    CMPIMethodMI* _methods = bench::configurationMethods();
};

std::string addressOf(int round) {
    return round % 2 == 0 ? "10.0.0.20" : "10.0.0.30";
}

/** Microseconds: medians of the wall clock, and the processor's time on average, the kernel's part included. */
struct Cost {
    double method = 0; ///< without `sync`
    double sync = 0;
    double programs = 0; ///< the two of ip
    double methodProcessor = 0;
    double programsProcessor = 0;
};

/** Of this process or of those that it has waited for. */
double processorTime(int who) {
    rusage usage{};
    getrusage(who, &usage);
    const auto microseconds = [](const timeval& time) {
        return 1e6 * static_cast<double>(time.tv_sec) + static_cast<double>(time.tv_usec);
    };
    return microseconds(usage.ru_utime) + microseconds(usage.ru_stime);
}

Cost measure(const std::string& directory, int interfaces, int rounds) {
    makeHost(interfaces, directory);
    EnableStatic enableStatic;
    enableStatic(addressOf(1));
    std::vector<double> method;
    std::vector<double> sync;
    std::vector<double> programs;
    double processor = 0;
    const double programsBefore = processorTime(RUSAGE_CHILDREN);
    for (int round = 0; round < rounds; ++round) {
        (void)bench::takeSyncTime();
        const double processorBefore = processorTime(RUSAGE_SELF);
        double start = now();
        enableStatic(addressOf(round));
        const double whole = now() - start;
        processor += processorTime(RUSAGE_SELF) - processorBefore;
        sync.push_back(bench::takeSyncTime());
        method.push_back(whole - sync.back());
        start = now();
        run({"ip", "addr", "replace", round % 2 == 0 ? "10.0.1.20/24" : "10.0.1.30/24", "dev", "left1"});
        run({"ip", "route", "replace", "default", "via", "10.0.1.1", "dev", "left1", "metric", "9"});
        programs.push_back(now() - start);
    }
    return {median(method), median(sync), median(programs), processor / rounds,
            (processorTime(RUSAGE_CHILDREN) - programsBefore) / rounds};
}

/** The memory of this process in KiB: all that is resident, and what is in use on the heap. */
struct Memory {
    long resident = 0;
    long heap = 0;
};

Memory memory() {
    std::ifstream file("/proc/self/statm");
    long size = 0;
    long resident = 0;
    file >> size >> resident;
    return {resident * sysconf(_SC_PAGESIZE) / 1024, static_cast<long>(mallinfo2().uordblks / 1024)};
}

void measureMemory(const std::string& directory, int changes) {
    makeHost(4, directory);
    // What is measured is memory; the disk would only make it last.
    shell("mount -t tmpfs tmpfs /mnt; cp /etc/network/interfaces /mnt/; mount --move /mnt /etc/network");
    EnableStatic enableStatic;
    const int steps = 10;
    std::printf("memory over %d alternating changes\n", changes);
    for (int step = 0; step <= steps; ++step) {
        const Memory used = memory();
        std::printf("  %8d changes %8ld KiB resident %8ld KiB of heap in use\n", changes / steps * step,
                    used.resident, used.heap);
        std::fflush(stdout);
        for (int change = 0; step < steps && change < changes / steps; ++change) {
            enableStatic(addressOf(change));
        }
    }
}

/**
 * Each measurement in a process of its own, because a process cannot go back to the namespaces that it came from. It
 * gets a directory on disk.
 */
void inChild(const std::function<void(const std::string& directory)>& work) {
    const Directory directory;
    std::fflush(stdout);
    const pid_t child = fork();
    if (child == 0) {
        try {
            work(directory.path());
            std::fflush(stdout);
            _exit(EXIT_SUCCESS);
        } catch (const std::exception& error) {
            std::fprintf(stderr, "bench_write: %s\n", error.what());
        }
        _exit(EXIT_FAILURE);
    }
    int status = 0;
    if (child < 0 || waitpid(child, &status, 0) != child || status != 0) {
        throw std::runtime_error("a measurement failed");
    }
}

int numberAfter(int count, char** arguments, const char* option, int otherwise) {
    for (int index = 1; index + 1 < count; ++index) {
        if (std::strcmp(arguments[index], option) == 0) {
            return std::max(10, std::atoi(arguments[index + 1]));
        }
    }
    return otherwise;
}

} // namespace

int main(int count, char** arguments) {
    try {
        const int rounds = numberAfter(count, arguments, "--rounds", 201);
        const int changes = numberAfter(count, arguments, "--changes", 100000);
        std::printf("EnableStatic, median of %d, in us\n", rounds);
        for (const int interfaces : {4, 64, 1000}) {
            inChild([&](const std::string& directory) {
                const Cost cost = measure(directory, interfaces, rounds);
                std::printf("  %8d interfaces %8.0f method %8.0f fsync apart %8.0f ip addr and route replace; "
                            "of CPU %8.0f method %8.0f ip\n",
                            interfaces, cost.method, cost.sync, cost.programs, cost.methodProcessor,
                            cost.programsProcessor);
            });
        }
        inChild([&](const std::string& directory) { measureMemory(directory, changes); });
    } catch (const std::exception& error) {
        std::fprintf(stderr, "bench_write: %s\n", error.what());
        return EXIT_FAILURE;
    }
    return EXIT_SUCCESS;
}

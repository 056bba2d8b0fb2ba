/*
 * What reading this host costs: a cold read of a namespace with many interfaces beside what `ip` takes to show the
 * same, and a snapshot when nothing has changed. Every measurement runs in a network namespace of its own, so it
 * needs root.
 *
 *     cold_read [--pairs N] [--runs N]
 */
#include "agent/linux/LinuxBackEnd.h"

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
#include <sched.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

namespace {

using Orv::Agent::BackEnd;
using Orv::Agent::Linux::makeLinuxBackEnd;

/** Milliseconds. */
struct Cost {
    double wall = 0;
    double processor = 0;
};

double milliseconds(const timeval& time) {
    return 1e3 * static_cast<double>(time.tv_sec) + 1e-3 * static_cast<double>(time.tv_usec);
}

double wallClock() {
    return std::chrono::duration<double, std::milli>(std::chrono::steady_clock::now().time_since_epoch()).count();
}

double processorClock() {
    rusage usage{};
    getrusage(RUSAGE_SELF, &usage);
    return milliseconds(usage.ru_utime) + milliseconds(usage.ru_stime);
}

/** What a child process costs from its start to its end, the kernel's work on its behalf included. */
Cost costOfChild(const std::function<void()>& work) {
    const double start = wallClock();
    const pid_t child = fork();
    if (child == 0) {
        work();
        _exit(EXIT_FAILURE);
    }
    int status = 0;
    rusage usage{};
    if (child < 0 || wait4(child, &status, 0, &usage) < 0 || status != 0) {
        throw std::runtime_error("a measured process failed");
    }
    return {wallClock() - start, milliseconds(usage.ru_utime) + milliseconds(usage.ru_stime)};
}

void execute(const std::vector<std::string>& arguments) {
    std::vector<char*> pointers;
    for (const std::string& argument : arguments) {
        pointers.push_back(const_cast<char*>(argument.c_str()));
    }
    pointers.push_back(nullptr);
    dup2(open("/dev/null", O_WRONLY | O_CLOEXEC), STDOUT_FILENO);
    execvp(pointers[0], pointers.data());
}

Cost costOfCommand(const std::vector<std::string>& arguments) {
    return costOfChild([&] { execute(arguments); });
}

double median(std::vector<double> values) {
    std::nth_element(values.begin(), values.begin() + static_cast<std::ptrdiff_t>(values.size() / 2), values.end());
    return values[values.size() / 2];
}

Cost medianCost(int runs, const std::function<Cost()>& measure) {
    std::vector<double> wall;
    std::vector<double> processor;
    for (int run = 0; run < runs; ++run) {
        const Cost cost = measure();
        wall.push_back(cost.wall);
        processor.push_back(cost.processor);
    }
    return {median(wall), median(processor)};
}

/** Moves this process into a new network namespace with so many pairs, each with addresses and up. */
void makeNamespace(int pairs) {
    if (unshare(CLONE_NEWNET) != 0) {
        throw std::system_error(errno, std::generic_category(), "a network namespace, which needs root");
    }
    std::string name = "/tmp/cold-read-XXXXXX";
    close(mkstemp(name.data()));
    {
        std::ofstream batch(name);
        for (int pair = 0; pair < pairs; ++pair) {
            const std::string left = "left" + std::to_string(pair);
            batch << "link add " << left << " type veth peer name right" << pair << "\naddr add 10." << pair / 256
                  << '.' << pair % 256 << ".1/24 dev " << left << "\nlink set " << left << " up\nlink set right"
                  << pair << " up\n";
        }
        batch << "link set lo up\n";
        if (pairs > 0) {
            batch << "route add default via 10.0.0.2 dev left0\n";
        }
    }
    costOfCommand({"ip", "-batch", name});
    unlink(name.c_str());
    // Duplicate address detection, which would change addresses under the measurement, takes up to two seconds.
    sleep(pairs > 0 ? 3 : 0);
}

/** A process that reads everything once and ends, like the ones that it is compared with. */
Cost costOfColdRead() {
    return costOfCommand({"/proc/self/exe", "--cold"});
}

void print(const char* what, const Cost& cost) {
    std::printf("  %-44s %8.1f ms CPU %8.1f ms wall\n", what, cost.processor, cost.wall);
}

void compareColdRead(int pairs, int runs) {
    makeNamespace(pairs);
    const Cost read = medianCost(runs, costOfColdRead);
    const Cost addresses = medianCost(runs, [] { return costOfCommand({"ip", "-j", "addr"}); });
    const Cost routes = medianCost(runs, [] { return costOfCommand({"ip", "-j", "route"}); });
    std::printf("cold read, %d pairs, whole processes, median of %d\n", pairs, runs);
    print("read into the tree", read);
    print("ip -j addr", addresses);
    print("ip -j route", routes);
    std::printf("  %-44s %8.2f of CPU %8.2f of wall\n", "ratio",
                read.processor / (addresses.processor + routes.processor),
                read.wall / (addresses.wall + routes.wall));
}

/** Until nothing has changed for two seconds: duplicate address detection goes on long after the set-up. */
void waitUntilQuiet(BackEnd& backEnd) {
    constexpr int looks = 20;
    for (int quiet = 0; quiet < looks; ++quiet) {
        const auto before = backEnd.snapshot();
        usleep(100'000);
        quiet = backEnd.snapshot() == before ? quiet : 0;
    }
}

void measureWarm(int nodes) {
    makeNamespace(nodes / 2);
    const std::unique_ptr<BackEnd> backEnd = makeLinuxBackEnd();
    backEnd->snapshot();
    waitUntilQuiet(*backEnd);
    constexpr int batches = 11;
    constexpr int snapshots = 1000;
    std::vector<double> batch;
    for (int run = 0; run < batches; ++run) {
        const double start = processorClock();
        for (int count = 0; count < snapshots; ++count) {
            backEnd->snapshot();
        }
        batch.push_back((processorClock() - start) * 1e3 / snapshots);
    }
    std::printf("  %8d adapters %8.2f us CPU\n", nodes, median(batch));
}

/** Each measurement in a process of its own, because a process cannot go back to the namespace that it came from. */
void inChild(const std::function<void()>& work) {
    std::fflush(stdout);
    costOfChild([&] {
        try {
            work();
            std::fflush(stdout);
            _exit(EXIT_SUCCESS);
        } catch (const std::exception& error) {
            std::fprintf(stderr, "cold_read: %s\n", error.what());
        }
    });
}

int numberAfter(int count, char** arguments, const char* option, int otherwise) {
    for (int index = 1; index + 1 < count; ++index) {
        if (std::strcmp(arguments[index], option) == 0) {
            return std::max(1, std::atoi(arguments[index + 1]));
        }
    }
    return otherwise;
}

} // namespace

int main(int count, char** arguments) {
    if (count == 2 && std::strcmp(arguments[1], "--cold") == 0) {
        const std::unique_ptr<BackEnd> backEnd = makeLinuxBackEnd();
        const bool read = !backEnd->snapshot()->nodes().empty();
        // An agent keeps its tree for as long as it lives: taking it down is no part of reading.
        _exit(read ? EXIT_SUCCESS : EXIT_FAILURE);
    }
    try {
        const int pairs = numberAfter(count, arguments, "--pairs", 1000);
        const int runs = numberAfter(count, arguments, "--runs", 15);
        inChild([&] { compareColdRead(pairs, runs); });
        std::printf("snapshot when nothing has changed, median of 11 times 1000\n");
        for (const int nodes : {4, 64, 1000, 10000}) {
            inChild([&] { measureWarm(nodes); });
        }
    } catch (const std::exception& error) {
        std::fprintf(stderr, "cold_read: %s\n", error.what());
        return EXIT_FAILURE;
    }
    return EXIT_SUCCESS;
}

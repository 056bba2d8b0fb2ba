// A process that uses the agent library as its arguments say, one after the other.
#include "agent/OrvAgentControl.h"
#include "instrumentation/Instrumentation.h"
#include "instrumentation/LumLog.h"

#include <atomic>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <exception>
#include <filesystem>
#include <fstream>
#include <string>
#include <thread>
#include <vector>

#include <sys/wait.h>
#include <unistd.h>

namespace {

using namespace Orv::NodeLexicon;
using LumLog::LumLogger;

int scan() {
    try {
        Orv::Instrumentation cursor;
        for (cursor.selectNode(NODE_NETWORK_ADAPTER); cursor; ++cursor) {
            std::string identity;
            cursor.getProperty(PROP_NODE_STRING, identity);
            std::printf("%s\n", identity.c_str());
        }
        return 0;
    } catch (const std::exception& failure) {
        std::printf("thrown: %s\n", failure.what());
        return 1;
    }
}

void observe() {
    OrvAgent_observeLog(
        6000,
        [](int level, const char* logger, const char* message, void*) {
            std::printf("observed: %d %s %s\n", level, logger, message);
        },
        nullptr);
}

void log(int level, const char* text) {
    LumLogger::logLevelMessage("log", "agent_probe.cpp", 1, "Hearth.Probe", level, nullptr, 0, 0, text);
}

/** Writes a status to the tree file and prints the event that comes of it. */
int watch(unsigned int status) {
    static std::atomic<unsigned int> seen;
    seen = 0;
    const auto callback = [](unsigned int code, Orv::DateTime, std::string path, const void*) {
        Orv::Instrumentation cursor;
        cursor.selectNode(path);
        unsigned int read = code;
        cursor.getProperty(PROP_STATUS, read);
        seen = read;
    };
    Orv::Instrumentation().startMonitoring(NODE_NETWORK_ADAPTER, callback, nullptr);
    const std::string tree = std::getenv("ORV_AGENT_TREE");
    std::ofstream(tree + ".next") << "[[adapter]]\nidentity = \"eth0\"\nstatus = " << status << '\n';
    std::filesystem::rename(tree + ".next", tree);
    for (int attempt = 0; attempt < 1000 && seen == 0; ++attempt) {
        std::this_thread::sleep_for(std::chrono::milliseconds(10));
    }
    std::printf("event: %u\n", seen.load());
    std::fflush(stdout);
    return seen == status ? 0 : 1;
}

/** Goes on in a forked process; in this one, ends with its result. */
void goOnForked() {
    const pid_t child = ::fork();
    if (child != 0) {
        int status = 0;
        ::waitpid(child, &status, 0);
        std::_Exit(WIFEXITED(status) ? WEXITSTATUS(status) : 99);
    }
}

} // namespace

int main(int argc, char** argv) {
    const std::vector<std::string> steps(argv + 1, argv + argc);
    int result = 0;
    for (std::size_t i = 0; i < steps.size(); ++i) {
        if (steps[i] == "scan") {
            result = scan();
        } else if (steps[i] == "observe") {
            observe();
        } else if (steps[i] == "log") {
            log(4000, "a line");
        } else if (steps[i] == "fail") {
            log(6000, "a failure");
        } else if (steps[i] == "trace") {
            LumLogger::traceLevelMessage("trace", "agent_probe.cpp", 1, "Hearth.Probe", 6000, nullptr, 0, 0,
                                         "a trace line");
        } else if (steps[i] == "watch" && i + 1 < steps.size()) {
            result = watch(static_cast<unsigned int>(std::stoul(steps[++i])));
        } else if (steps[i] == "fork") {
            goOnForked();
        } else if (steps[i] == "rename" && i + 2 < steps.size()) {
            std::filesystem::rename(steps[i + 1], steps[i + 2]);
            i += 2;
        } else {
            return 2;
        }
    }
    return result;
}

// A process that uses the agent library as its arguments say, one after the other.
#include "agent/OrvAgentControl.h"
#include "instrumentation/Instrumentation.h"
#include "instrumentation/LumLog.h"

#include <cstdio>
#include <exception>
#include <filesystem>
#include <string>
#include <vector>

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
        } else if (steps[i] == "rename" && i + 2 < steps.size()) {
            std::filesystem::rename(steps[i + 1], steps[i + 2]);
            i += 2;
        } else {
            return 2;
        }
    }
    return result;
}

/** How RestartNetwork opens its pipe: this program has a popen of its own, which the provider library finds first. */
#include "tests/provider/Scene.h"

#include <cstdio>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

std::vector<std::string> pipes; // NOLINT(cert-err58-cpp)
bool opens = true;
FILE* opened = nullptr;

} // namespace

extern "C" __attribute__((visibility("default"))) FILE* popen(const char* command, const char* type) {
    pipes.push_back("popen \"" + std::string(command) + "\" " + type);
    opened = opens ? std::tmpfile() : nullptr;
    return opened;
}

extern "C" __attribute__((visibility("default"))) int pclose(FILE* pipe) {
    pipes.emplace_back(pipe == opened ? "pclose" : "pclose of another");
    return std::fclose(pipe);
}

namespace {

using namespace provider_test;
using marlo::Value;
using scripted_agent::recorded;
using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;

class RestartCommand : public ReadBase, public testing::Test {
  protected:
    RestartCommand() { pipes.clear(); }

    ~RestartCommand() override { opens = true; }

    void expectZero(const Answer& answer) {
        EXPECT_EQ(answer.code, CMPI_RC_OK);
        EXPECT_THAT(answer.values, ElementsAre(Value::uint(CMPI_uint32, 0)));
        EXPECT_TRUE(answer.done);
        EXPECT_TRUE(hasExitMark());
    }
};

TEST_F(RestartCommand, HasABlankAtItsEndAndIsReadAndClosed) {
    expectZero(calls.invokeMethod(classPath(CONFIGURATION), "RestartNetwork"));
    EXPECT_THAT(pipes, ElementsAre("popen \"/etc/init.d/network restart \" r", "pclose"));
    EXPECT_THAT(recorded("log 6000"), IsEmpty());
    EXPECT_THAT(recorded("log 4000"), Not(Contains(HasSubstr("EXITING: executeRestartNetwork()"))));
}

TEST_F(RestartCommand, PipeThatCannotBeOpenedIsOnlyLogged) {
    opens = false;
    expectZero(calls.invokeMethod(classPath(CONFIGURATION), "restartnetwork"));
    EXPECT_THAT(pipes, ElementsAre("popen \"/etc/init.d/network restart \" r"));
    for (const char* sink : {"log", "trace"}) {
        EXPECT_THAT(normalised(recorded(std::string(sink) + " 6000")),
                    ElementsAre(line(sink, 6000, "Hearth.NetworkAdapterProvider", "NetworkAdapterObjectFactory",
                                     "executeRestartNetwork",
                                     "MESSAGE [File: NetworkAdapterObjectFactory, Line: N]: Failed to Restart "
                                     "Network")));
        EXPECT_THAT(recorded(std::string(sink) + " 4000"), Contains(HasSubstr("EXITING: executeRestartNetwork()")));
    }
}

TEST_F(RestartCommand, IsRunOnAHostWithoutAdaptersToo) {
    scripted_agent::script().nodes.clear();
    expectZero(calls.invokeMethod(classPath(CONFIGURATION), "RestartNetwork"));
    EXPECT_THAT(pipes, ElementsAre("popen \"/etc/init.d/network restart \" r", "pclose"));
}

} // namespace

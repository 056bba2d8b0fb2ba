/** What the object factory does of itself, before any broker is asked for anything. */
#include "factory/NetworkAdapterObjectFactory.h"
#include "tests/provider/Tree.h"

#include <stdexcept>
#include <type_traits>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using Orv::NetworkAdapterComposite::NetworkAdapterObjectFactory;
using provider_test::addFullAdapter;
using provider_test::line;
using provider_test::normalised;
using scripted_agent::clearRecord;
using scripted_agent::failAt;
using scripted_agent::recorded;
using testing::ElementsAre;
using testing::IsEmpty;

const std::string LOGGER = "Hearth.NetworkAdapterProvider";
const std::string UNIT = "NetworkAdapterObjectFactory";

class ObjectFactory : public testing::Test {
  protected:
    ObjectFactory() {
        scripted_agent::reset();
        for (const char* identity : {"eth0", "eth1", "eth2"}) {
            addFullAdapter(identity);
        }
    }

    static std::vector<std::string> own(const char* sink) {
        std::vector<std::string> lines = normalised(recorded(sink));
        std::erase_if(lines, [](const std::string& text) { return text.find(UNIT + ":N") == std::string::npos; });
        return lines;
    }

    static std::string entering(const char* sink) {
        return line(sink, 4000, LOGGER, UNIT, UNIT,
                    "ENTERING: NetworkAdapterObjectFactory() in NetworkAdapterObjectFactory [Line: N]");
    }

    static std::string exiting(const char* sink) {
        return line(sink, 4000, LOGGER, UNIT, UNIT,
                    "EXITING: NetworkAdapterObjectFactory() in NetworkAdapterObjectFactory [Line: N]");
    }

    static bool readTheTree() { return !recorded("cursor").empty(); }
};

TEST_F(ObjectFactory, IsMadePerRequestAndNeverCopied) {
    static_assert(!std::is_copy_constructible_v<NetworkAdapterObjectFactory>);
    static_assert(!std::is_copy_assignable_v<NetworkAdapterObjectFactory>);
    static_assert(!std::is_polymorphic_v<NetworkAdapterObjectFactory>);
    static_assert(!std::is_convertible_v<const char*, NetworkAdapterObjectFactory>);
}

TEST_F(ObjectFactory, CountsThreeConfiguredAdaptersAndLogsTheCountWhenAsked) {
    const NetworkAdapterObjectFactory factory("MARLO_NetworkAdapterConfiguration");
    clearRecord();
    EXPECT_EQ(factory.getNumberOfInstances(), 3U);
    for (const char* sink : {"log", "trace"}) {
        EXPECT_THAT(normalised(recorded(sink)),
                    ElementsAre(line(sink, 4000, LOGGER, UNIT, "getNumberOfInstances",
                                     "VARIABLE: 'numberOfInstances' has Value '3' at line N in "
                                     "NetworkAdapterObjectFactory")));
    }
}

TEST_F(ObjectFactory, ForThePhysicalClassReadsTheInventoryToo) {
    const NetworkAdapterObjectFactory factory("MARLO_PhysicalNetworkAdapter");
    EXPECT_TRUE(readTheTree());
    EXPECT_EQ(factory.getNumberOfInstances(), 3U);
}

TEST_F(ObjectFactory, ForTheLogicalClassDoesNotReadTheInventory) {
    const NetworkAdapterObjectFactory factory("MARLO_LogicalNetworkAdapter");
    EXPECT_FALSE(readTheTree());
}

TEST_F(ObjectFactory, ForAnUnknownClassDoesNotReadTheInventoryAndReportsNothing) {
    const NetworkAdapterObjectFactory factory("CIM_Unknown");
    EXPECT_FALSE(readTheTree());
    EXPECT_THAT(own("log"), ElementsAre(entering("log"), exiting("log")));
}

TEST_F(ObjectFactory, ComparesClassNamesAsTheAgentDoes) {
    const NetworkAdapterObjectFactory lower("marlo_networkadapterconfiguration");
    EXPECT_TRUE(readTheTree());
    clearRecord();
    scripted_agent::script().textEqual = [](const char*, const char*) { return false; };
    const NetworkAdapterObjectFactory refused("MARLO_NetworkAdapterConfiguration");
    EXPECT_FALSE(readTheTree());
    EXPECT_THAT(recorded("textEqual"),
                ElementsAre("textEqual(\"MARLO_NetworkAdapterConfiguration\", "
                            "\"MARLO_NetworkAdapterConfiguration\") = false",
                            "textEqual(\"MARLO_NetworkAdapterConfiguration\", \"MARLO_PhysicalNetworkAdapter\") = "
                            "false"));
}

TEST_F(ObjectFactory, LogsOneEnteringAndOneExitingLineAndNothingWhenItIsDestroyed) {
    {
        const NetworkAdapterObjectFactory factory("MARLO_NetworkAdapterConfiguration");
        for (const char* sink : {"log", "trace"}) {
            EXPECT_THAT(own(sink), ElementsAre(entering(sink), exiting(sink)));
        }
        clearRecord();
    }
    EXPECT_THAT(scripted_agent::record(), IsEmpty());
}

TEST_F(ObjectFactory, ReadsTheInventoryBetweenItsLines) {
    const NetworkAdapterObjectFactory factory("MARLO_NetworkAdapterConfiguration");
    const std::vector<std::string> lines = normalised(scripted_agent::record());
    const auto position = [&](const std::string& text) {
        return std::find(lines.begin(), lines.end(), text) - lines.begin();
    };
    EXPECT_LT(position(entering("trace")), position("cursor 1: Instrumentation()"));
    EXPECT_LT(position("cursor 1: ~Instrumentation()"), position(exiting("log")));
}

TEST_F(ObjectFactory, FailedInventoryLeavesTheLinesAsTheyAre) {
    failAt("getProperty(PROP_MAC_ADDRESS)", 2, [] { throw std::runtime_error("gone"); });
    testing::internal::CaptureStderr();
    const NetworkAdapterObjectFactory factory("MARLO_NetworkAdapterConfiguration");
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "gone\n");
    EXPECT_THAT(own("log"), ElementsAre(entering("log"), exiting("log")));
}

TEST_F(ObjectFactory, WhatIsNoStandardExceptionLeavesTheConstructor) {
    failAt("getProperty(PROP_MAC_ADDRESS)", 2, [] { throw 42; });
    EXPECT_THROW(NetworkAdapterObjectFactory("MARLO_NetworkAdapterConfiguration"), int);
    EXPECT_EQ(recorded("cursor 1: ~Instrumentation").size(), 1U);
}

} // namespace

/** What single classes add to the read operations that all of them share. */
#include "tests/provider/Scene.h"

#include <algorithm>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace Orv::NodeLexicon;
using namespace provider_test;
using marlo::ObjectPath;
using marlo::Value;
using marlo::test::Failure;
using scripted_agent::recorded;
using scripted_agent::script;
using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;
using testing::SizeIs;

class Configurations : public ReadBase, public testing::Test {};

class PhysicalAdapters : public ReadBase, public testing::Test {};

TEST_F(PhysicalAdapters, LogUnderTheSharedNameAndNotUnderOneOfTheirOwn) {
    calls.enumInstances(physicalProvider());
    EXPECT_THAT(recorded("log 4000 Hearth.NetworkAdapterProvider Trace:"), SizeIs(4));
    for (const std::string& text : recorded("")) {
        EXPECT_THAT(text, Not(HasSubstr("Hearth.PhysicalNetworkAdapterProvider")));
    }
}

TEST_F(PhysicalAdapters, FailureOfEnumInstancesNamesItsOwnEnumerationAndThatOfGetInstanceDoesNot) {
    const ObjectPath unknown = instancePath("MARLO_SomethingElse", {{"Key", "value"}});
    calls.enumInstances(physicalProvider(), unknown);
    EXPECT_THAT(recorded("log 6000"), Contains(HasSubstr("]: getAllPhysicalNetworkAdapterCMPIInstances Failed")));
    scripted_agent::clearRecord();
    calls.getInstance(physicalProvider(), unknown);
    EXPECT_THAT(recorded("log 6000"), Contains(HasSubstr("]: getAllNetworkAdapterCMPIInstances Failed")));
}

TEST_F(PhysicalAdapters, PlatformThatRefusesLeavesItsStatusInAnAnswerThatIsDone) {
    setup.platform.outcome = {CMPI_RC_ERR_INVALID_NAMESPACE, "no platform here"};
    for (const Subject& subject : {physicalProvider(), logicalProvider()}) {
        for (const Answer& answer : {calls.enumInstances(subject), calls.enumInstanceNames(subject),
                                     calls.getInstance(subject, pathOf(subject, "eth0"))}) {
            EXPECT_EQ(answer.code, CMPI_RC_ERR_INVALID_NAMESPACE);
            EXPECT_EQ(answer.message, "no platform here");
            EXPECT_TRUE(answer.done);
            EXPECT_TRUE(hasExitMark());
        }
    }
}

TEST_F(PhysicalAdapters, AreServedWithoutAnyConfiguredAdapter) {
    script().nodes.clear();
    EXPECT_THAT(calls.enumInstances(physicalProvider()).instances, SizeIs(3));
}

TEST_F(PhysicalAdapters, PropertyListChangesNothing) {
    const Answer all = calls.enumInstances(physicalProvider());
    EXPECT_EQ(calls.enumInstances(physicalProvider(), PropertyList({"Tag"})).instances, all.instances);
    EXPECT_EQ(calls.enumInstances(logicalProvider(), PropertyList({"Speed"})).instances,
              calls.enumInstances(logicalProvider()).instances);
}

TEST_F(Configurations, PropertyListDecidesWhatInstancesHave) {
    const Answer answer = calls.enumInstances(configurationProvider(), PropertyList({"SettingID", "IPEnabled"}));
    ASSERT_THAT(answer.instances, SizeIs(3));
    EXPECT_THAT(names(answer.instances[0]), ElementsAre("SettingID", "IPEnabled"));
}

TEST_F(Configurations, EnumInstanceNamesAsksForAllProperties) {
    for (const ObjectPath& path : calls.enumInstanceNames(configurationProvider()).paths) {
        EXPECT_THAT(path.keys, SizeIs(1));
    }
    EXPECT_EQ(count("instance.setProperty"), 3 * 12);
}

TEST_F(Configurations, ListWithoutTheKeyGivesGetInstanceNothingToRecogniseAnInstanceBy) {
    const ObjectPath path = pathOf(configurationProvider(), "eth1");
    EXPECT_THAT(calls.getInstance(configurationProvider(), path, PropertyList({"IPEnabled"})).instances, IsEmpty());
    EXPECT_THAT(calls.getInstance(configurationProvider(), path, PropertyList({"IPEnabled", "SettingID"})).instances,
                SizeIs(1));
}

TEST_F(Configurations, EnumInstancesHandsANullInstanceOverAsItStands) {
    setup.faulty.failAt("newInstance", 2, Failure::silently);
    const Answer answer = calls.enumInstances(configurationProvider());
    EXPECT_EQ(count("result.returnInstance"), 3);
    EXPECT_THAT(answer.instances, SizeIs(2));
    EXPECT_TRUE(answer.done);
}

TEST_F(Configurations, OtherOperationsSkipANullInstance) {
    setup.faulty.failAt("newInstance", 2, Failure::silently);
    EXPECT_THAT(calls.enumInstanceNames(configurationProvider()).paths, SizeIs(2));
    EXPECT_EQ(count("instance.getObjectPath"), 2);
    setup.faulty.failAt("newInstance", 2, Failure::silently);
    EXPECT_THAT(calls.getInstance(configurationProvider(), pathOf(configurationProvider(), "eth1")).instances,
                IsEmpty());
    EXPECT_EQ(count("instance.getObjectPath"), 2);
}

TEST_F(Configurations, ListThatCannotBeMadeIsTheAnswersStatusUnlessALaterCallOverwritesIt) {
    setup.faulty.failAt("newArray", 15, Failure::silently); // the last of five arrays of the last of three
    const Answer last = calls.enumInstances(configurationProvider());
    EXPECT_EQ(last.code, CMPI_RC_ERR_FAILED);
    EXPECT_EQ(last.message, "Create Array for Property DNSServerSearchOrder failed.");
    EXPECT_THAT(last.instances, SizeIs(3));
    EXPECT_TRUE(last.done);
    setup.faulty.failAt("newArray", 5, Failure::silently);
    EXPECT_EQ(calls.enumInstances(configurationProvider()).code, CMPI_RC_OK);
}

TEST_F(Configurations, TreeWithoutAdaptersIsAnEmptySuccess) {
    script().nodes.clear();
    const Answer answer = calls.enumInstances(configurationProvider());
    EXPECT_EQ(answer.code, CMPI_RC_OK);
    EXPECT_TRUE(answer.done);
    EXPECT_THAT(answer.instances, IsEmpty());
}

TEST_F(Configurations, AgentThatFailsHalfwayGivesWhatWasReadUntilThen) {
    scripted_agent::failAt("getProperty(PROP_DNS_DOMAIN)", 3, [] { throw std::runtime_error("the agent is gone"); });
    testing::internal::CaptureStderr();
    const Answer answer = calls.enumInstances(configurationProvider());
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "the agent is gone\n");
    EXPECT_EQ(answer.code, CMPI_RC_OK);
    EXPECT_THAT(answer.instances, SizeIs(2));
    EXPECT_TRUE(answer.done);
}

TEST_F(Configurations, InstancesAreCountedIn16Bits) {
    script().nodes.clear();
    script().recording = false;
    auto& nodes = script().nodes;
    nodes.push_back({.type = NODE_ABOVE, .path = "g", .description = "Chassis"});
    nodes.push_back({.type = NODE_ABOVE, .path = "d", .parent = "g"});
    for (int i = 0; i < 65537; ++i) {
        std::string identity = std::to_string(100000 + i);
        nodes.push_back({.parent = "d", .texts = {{PROP_NODE_STRING, identity}}});
    }
    ProviderCalls direct(setup, false);
    const PropertyList list({"SettingID"});
    const Answer answer = direct.enumInstances(configurationProvider(), PropertyList({"SettingID"}));
    ASSERT_THAT(answer.instances, SizeIs(1));
    EXPECT_EQ(get(answer.instances[0], "SettingID"), Value::string("100000"));
    const ObjectPath second = instancePath(CONFIGURATION, {{"SettingID", "100001"}});
    EXPECT_THAT(direct.getInstance(configurationProvider(), second, PropertyList({"SettingID"})).instances,
                IsEmpty());
    nodes.pop_back();
    EXPECT_THAT(direct.enumInstances(configurationProvider(), PropertyList({"SettingID"})).instances, IsEmpty());
}

} // namespace

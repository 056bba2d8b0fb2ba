/** GetInstance, EnumInstanceNames and EnumInstances of the three providers, through the library's factories. */
#include "tests/provider/Scene.h"

#include <algorithm>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace Orv::NodeLexicon;
using namespace provider_test;
using marlo::ObjectPath;
using marlo::Value;
using scripted_agent::recorded;
using scripted_agent::script;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

class ReadOperations : public ReadBase, public testing::TestWithParam<Subject> {};

TEST_P(ReadOperations, GetInstanceWithoutKeysIsRefusedAndStillDone) {
    const Answer answer = calls.getInstance(GetParam(), classPath(GetParam().className));
    EXPECT_EQ(answer.code, CMPI_RC_ERR_FAILED);
    EXPECT_EQ(answer.message, "At least one key should be passed");
    EXPECT_TRUE(answer.done);
    EXPECT_THAT(answer.instances, IsEmpty());
    EXPECT_TRUE(hasExitMark());
    EXPECT_THAT(recorded("textEqual"), IsEmpty()) << "no factory is made";
}

TEST_P(ReadOperations, GetInstanceByUnknownKeyIsAnEmptySuccess) {
    const Answer answer = calls.getInstance(GetParam(), pathOf(GetParam(), "eth9"));
    EXPECT_EQ(answer.code, CMPI_RC_OK);
    EXPECT_FALSE(answer.hasMessage);
    EXPECT_THAT(answer.instances, IsEmpty());
    EXPECT_TRUE(answer.done);
    EXPECT_TRUE(hasExitMark());
}

TEST_P(ReadOperations, GetInstanceReturnsTheOneOfThePath) {
    const Answer answer = calls.getInstance(GetParam(), pathOf(GetParam(), "eth1"));
    EXPECT_EQ(answer.code, CMPI_RC_OK);
    ASSERT_THAT(answer.instances, SizeIs(1));
    EXPECT_EQ(get(answer.instances[0], GetParam().keys.back()), Value::string("eth1"));
    EXPECT_TRUE(answer.done);
}

TEST_P(ReadOperations, GetInstanceReturnsTheFirstOfSeveralThatAreEqualAndLooksNoFurther) {
    script().isObjPathsEqual = [](const CMPIObjectPath*, const CMPIObjectPath*, bool) { return true; };
    const Answer answer = calls.getInstance(GetParam(), pathOf(GetParam(), "eth2"));
    ASSERT_THAT(answer.instances, SizeIs(1));
    EXPECT_EQ(get(answer.instances[0], GetParam().keys.back()), Value::string("eth0"));
    EXPECT_THAT(recorded("isObjPathsEqual"), SizeIs(1));
}

TEST_P(ReadOperations, GetInstanceComparesTheReferenceWithEachPathWithoutTheNamespace) {
    const CMPIObjectPath* first = nullptr;
    script().isObjPathsEqual = [&](const CMPIObjectPath* left, const CMPIObjectPath* right, bool) {
        EXPECT_NE(left, right);
        EXPECT_EQ(marlo::broker::Broker::toModel(*left), pathOf(GetParam(), "eth9"));
        first = first == nullptr ? left : first;
        EXPECT_EQ(left, first);
        return false;
    };
    calls.getInstance(GetParam(), pathOf(GetParam(), "eth9"));
    EXPECT_THAT(recorded("isObjPathsEqual"),
                ElementsAre("isObjPathsEqual(false) = false", "isObjPathsEqual(false) = false",
                            "isObjPathsEqual(false) = false"));
}

TEST_P(ReadOperations, GetInstanceOfAnotherNamespaceIsFoundThereAllTheSame) {
    // Whoever asks in a namespace gets paths of that namespace; which namespaces are served is not the provider's.
    ObjectPath path = pathOf(GetParam(), "eth1");
    path.nameSpace = "root/other";
    script().isObjPathsEqual = [](const CMPIObjectPath*, const CMPIObjectPath* right, bool) {
        return marlo::broker::Broker::toModel(*right).nameSpace == "root/other";
    };
    EXPECT_THAT(calls.getInstance(GetParam(), path).instances, SizeIs(1));
}

TEST_P(ReadOperations, EnumInstanceNamesGivesPathsInTheRequestsNamespaceOnThisSystem) {
    script().systemName = "adapter-host.example.net";
    const Answer answer = calls.enumInstanceNames(GetParam());
    EXPECT_EQ(answer.code, CMPI_RC_OK);
    EXPECT_TRUE(answer.done);
    ASSERT_THAT(answer.paths, SizeIs(3));
    for (const ObjectPath& path : answer.paths) {
        EXPECT_EQ(path.nameSpace, NAMESPACE);
        EXPECT_EQ(path.host, "adapter-host.example.net");
        EXPECT_EQ(path.className, GetParam().className);
    }
    EXPECT_THAT(answer.instances, IsEmpty());
}

TEST_P(ReadOperations, EnumInstanceNamesSetsNamespaceAndHostOfEveryPathItself) {
    // The instance is taken to another place behind the provider's back.
    setup.faulty.before = [&](const std::string& call) {
        if (call == "instance.getObjectPath") {
            scripted_agent::note("taking a path");
        }
        if (call.starts_with("objectPath.set") || call == "result.returnObjectPath") {
            scripted_agent::note(call);
        }
    };
    calls.enumInstanceNames(GetParam());
    std::vector<std::string> steps = scripted_agent::record();
    steps.erase(steps.begin(), std::find(steps.begin(), steps.end(), "taking a path"));
    ASSERT_GE(steps.size(), 5U);
    steps.resize(5);
    EXPECT_THAT(steps, ElementsAre("taking a path", "objectPath.setNameSpace root/tavis",
                                   "getSystemName() = \"host.example.org\"",
                                   "objectPath.setHostname host.example.org", "result.returnObjectPath"));
}

TEST_P(ReadOperations, EnumInstancesReturnsAllInTheFactorysOrder) {
    const Answer answer = calls.enumInstances(GetParam());
    EXPECT_EQ(answer.code, CMPI_RC_OK);
    EXPECT_TRUE(answer.done);
    EXPECT_TRUE(hasExitMark());
    ASSERT_THAT(answer.instances, SizeIs(3));
    for (std::size_t i = 0; i < 3; ++i) {
        EXPECT_EQ(get(answer.instances[i], GetParam().keys.back()), Value::string("eth" + std::to_string(i)));
    }
    EXPECT_THAT(answer.paths, IsEmpty());
}

TEST_P(ReadOperations, EveryCallMakesOneFullEnumerationAfresh) {
    calls.enumInstances(GetParam());
    for (const char* name : {"eth3", "eth4"}) {
        addFullAdapter(name);
        setup.platform.cards.push_back(card(name));
        setup.platform.ports.push_back(port(name));
    }
    EXPECT_THAT(calls.enumInstances(GetParam()).instances, SizeIs(5));
    setup.platform.enumerations.clear();
    scripted_agent::clearRecord();
    calls.getInstance(GetParam(), pathOf(GetParam(), "eth0"));
    const bool fromPlatform = GetParam().className != CONFIGURATION;
    const bool fromTree = GetParam().className != LOGICAL;
    EXPECT_THAT(setup.platform.enumerations, SizeIs(fromPlatform ? 1 : 0));
    EXPECT_THAT(recorded("cursor 1: selectNode"), SizeIs(fromTree ? 1 : 0));
}

TEST_P(ReadOperations, ReadOperationsAskWhatTheClassNameSays) {
    // One library serves object managers that spell class names as they like.
    std::string lower = GetParam().className;
    std::transform(lower.begin(), lower.end(), lower.begin(),
                   [](char c) { return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c; });
    const Answer answer = calls.enumInstances(GetParam(), classPath(lower));
    EXPECT_THAT(answer.instances, SizeIs(3));
    EXPECT_EQ(answer.instances.at(0).path.className, GetParam().className);
}

TEST_P(ReadOperations, ClassThatTheProviderDoesNotProduceFailsWithoutDoneAndWithoutExitMark) {
    const ObjectPath unknown = instancePath("MARLO_SomethingElse", {{"Key", "value"}});
    const std::vector<std::pair<std::string, std::function<Answer()>>> operations{
        {"_GetInstance", [&] { return calls.getInstance(GetParam(), unknown); }},
        {"_EnumInstanceNames", [&] { return calls.enumInstanceNames(GetParam(), unknown); }},
        {"_EnumInstances", [&] { return calls.enumInstances(GetParam(), unknown); }},
    };
    for (const auto& [name, operation] : operations) {
        scripted_agent::clearRecord();
        const Answer answer = operation();
        EXPECT_EQ(answer.code, CMPI_RC_OK) << "the status is as the enumeration left it";
        EXPECT_FALSE(answer.done);
        EXPECT_FALSE(hasExitMark());
        EXPECT_THAT(answer.instances, IsEmpty());
        EXPECT_THAT(answer.paths, IsEmpty());
        const bool ownText = GetParam().className == PHYSICAL && name == "_EnumInstances";
        const std::string text = "MESSAGE [File: " + GetParam().unit() + ", Line: N]: " +
                                 (ownText ? "getAllPhysicalNetworkAdapterCMPIInstances Failed"
                                          : "getAllNetworkAdapterCMPIInstances Failed");
        for (const char* sink : {"log", "trace"}) {
            EXPECT_EQ(normalised(recorded(sink)).back(),
                      line(sink, 6000, GetParam().logger, GetParam().unit(), GetParam().prefix + name, text));
        }
    }
}

TEST_P(ReadOperations, EnumInstanceNamesSkipsInstancesWithoutHandle) {
    loseHandleOfSecondInstance();
    EXPECT_THAT(calls.enumInstanceNames(GetParam()).paths, SizeIs(2));
    EXPECT_EQ(count("instance.getObjectPath"), 2);
}

TEST_P(ReadOperations, GetInstanceSkipsInstancesWithoutHandle) {
    loseHandleOfSecondInstance();
    script().isObjPathsEqual = [](const CMPIObjectPath*, const CMPIObjectPath*, bool) { return false; };
    calls.getInstance(GetParam(), pathOf(GetParam(), "eth1"));
    EXPECT_EQ(count("instance.getObjectPath"), 2);
}

TEST_P(ReadOperations, EnumInstancesDoesNotLookAtHandles) {
    loseHandleOfSecondInstance();
    EXPECT_THAT(calls.enumInstances(GetParam()).instances, SizeIs(2));
    EXPECT_EQ(count("result.returnInstance"), 3);
}

TEST_P(ReadOperations, WithoutAMemoryTableEverythingIsAnswered) {
    setup.faulty.changeable().mft = nullptr;
    setup.faulty.changeable().xft = nullptr;
    EXPECT_THAT(calls.enumInstances(GetParam()).instances, SizeIs(3));
    EXPECT_THAT(calls.enumInstanceNames(GetParam()).paths, SizeIs(3));
    EXPECT_THAT(calls.getInstance(GetParam(), pathOf(GetParam(), "eth1")).instances, SizeIs(1));
}

TEST_P(ReadOperations, LogUnderTheProvidersOwnName) {
    calls.enumInstances(GetParam());
    for (const std::string& text : recorded("log")) {
        if (text.find(" Trace:") != std::string::npos) {
            EXPECT_THAT(text, testing::StartsWith("log 4000 " + GetParam().logger + " Trace:"));
        }
    }
}

TEST_P(ReadOperations, EveryLineGoesToTheLogAndThenToTheTrace) {
    calls.enumInstances(GetParam());
    std::vector<std::string> lines = scripted_agent::record();
    std::erase_if(lines,
                  [](const std::string& text) { return !text.starts_with("log ") && !text.starts_with("trace "); });
    ASSERT_EQ(lines.size() % 2, 0U);
    for (std::size_t i = 0; i < lines.size(); i += 2) {
        EXPECT_EQ(lines[i].substr(0, 4), "log ");
        EXPECT_EQ("trace " + lines[i].substr(4), lines[i + 1]);
    }
}

TEST_P(ReadOperations, ExitMarkComesAfterDone) {
    setup.faulty.before = [](const std::string& call) {
        if (call == "result.returnDone") {
            scripted_agent::note("done");
        }
    };
    calls.enumInstances(GetParam());
    const std::vector<std::string> lines = scripted_agent::record();
    const auto done = std::find(lines.begin(), lines.end(), "done");
    const auto exit = std::find_if(lines.begin(), lines.end(), [](const std::string& text) {
        return text.find("markProviderExit") != std::string::npos;
    });
    ASSERT_NE(done, lines.end());
    EXPECT_LT(done, exit);
}

TEST_P(ReadOperations, CleanupMayBeFollowedByTheFactoriesAndCalls) {
    CMPIInstanceMI* mi = calls.instanceMI(GetParam());
    EXPECT_EQ(mi->ft->cleanup(mi, nullptr, 1).rc, CMPI_RC_OK);
    EXPECT_EQ(calls.instanceMI(GetParam()), mi);
    EXPECT_THAT(calls.enumInstances(GetParam()).instances, SizeIs(3));
}

INSTANTIATE_TEST_SUITE_P(EveryProvider, ReadOperations, testing::ValuesIn(allProviders()),
                         [](const auto& instance) { return instance.param.prefix; });

} // namespace

/** Counting subscriptions, starting and stopping the agent's monitoring, and the switch of delivery. */
#include "tests/provider/Indications.h"

namespace {

using namespace provider_test;
using namespace Orv::NetworkAdapterComposite;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

constexpr unsigned short ONLINE = 1;
constexpr unsigned short OFFLINE = 2;
constexpr unsigned short SWITCHOVER = 3;
constexpr unsigned short SWITCHBACK = 4;

const std::string START = "startMonitoring(NODE_NETWORK_ADAPTER, null)";
const std::string STOP = "stopMonitoring(NODE_NETWORK_ADAPTER, null)";

using Counts = std::array<int, 4>;

Counts counts() {
    return {OnlineSubscribeCount, OfflineSubscribeCount, SwitchoverSubscribeCount, SwitchbackSubscribeCount};
}

void setCounts(const Counts& counts) {
    OnlineSubscribeCount = counts[0];
    OfflineSubscribeCount = counts[1];
    SwitchoverSubscribeCount = counts[2];
    SwitchbackSubscribeCount = counts[3];
}

/** How often the agent was asked to start, or stop. */
std::size_t asked(const std::string& call) {
    const std::vector<std::string> calls = scripted_agent::recorded("cursor ");
    return static_cast<std::size_t>(
        std::count_if(calls.begin(), calls.end(), [&](const std::string& seen) { return seen.ends_with(call); }));
}

class Subscription : public Indications {};

TEST_F(Subscription, NothingIsCountedSavedOrEnabledAtLoad) {
    EXPECT_EQ(counts(), (Counts{0, 0, 0, 0}));
    EXPECT_EQ(_alertBroker, nullptr);
    EXPECT_EQ(_alertContext, nullptr);
    EXPECT_FALSE(_alertContextAvailable);
    EXPECT_FALSE(_enabledNetwork);
    EXPECT_EQ(ind_thread_id, nullptr);
    EXPECT_EQ(indicationNetworkData.nodeString, "");
    EXPECT_EQ(indicationNetworkData.eventTime.getYear(), 0);
    EXPECT_EQ(indicationNetworkData.userData, 0U);
    EXPECT_EQ(loggerNetworkIndication, "Hearth.NetworkAdapterProvider");
}

struct ClassId {
    const char* name;
    const char* className;
    unsigned short id;
};

class IndicationIds : public Indications, public testing::WithParamInterface<ClassId> {};

TEST_P(IndicationIds, AreFoundByTheExactName) {
    unsigned short id = 99;
    EXPECT_EQ(getNetworkIndicationId(GetParam().className, id), GetParam().id != 15);
    EXPECT_EQ(id, GetParam().id);
    EXPECT_THAT(log(),
                ElementsAre(entering("getNetworkIndicationId"),
                            variable("getNetworkIndicationId", "classname", GetParam().className),
                            variable("getNetworkIndicationId", "indicationClassId", std::to_string(GetParam().id))));
    EXPECT_THAT(scripted_agent::recorded("trace "), SizeIs(3));
}

INSTANTIATE_TEST_SUITE_P(All, IndicationIds,
                         testing::Values(ClassId{"Online", "MARLO_NetworkAdapterOnlineEvent", 1},
                                         ClassId{"Offline", "MARLO_NetworkAdapterOfflineEvent", 2},
                                         ClassId{"SwitchOver", "MARLO_NetworkAdapterSwitchOverEvent", 3},
                                         ClassId{"SwitchBack", "MARLO_NetworkAdapterSwitchBackEvent", 4},
                                         ClassId{"LowerCase", "marlo_networkadapteronlineevent", 15},
                                         ClassId{"OneLetterOfAnotherCase", "MARLO_NetworkAdapterSwitchoverEvent", 15},
                                         ClassId{"LongerThanAClass", "MARLO_NetworkAdapterOnlineEvents", 15},
                                         ClassId{"BeginningOfAClass", "MARLO_NetworkAdapterOnline", 15},
                                         ClassId{"BlankBehind", "MARLO_NetworkAdapterOfflineEvent ", 15},
                                         ClassId{"Empty", "", 15},
                                         ClassId{"AnotherClassOfOurs", "MARLO_NetworkAdapterConfiguration", 15}),
                         [](const auto& instance) { return instance.param.name; });

struct Counting {
    const char* name;
    Counts before;
    unsigned short id;
    Counts after;
    bool asksTheAgent;
};

class Activations : public Indications, public testing::WithParamInterface<Counting> {};

TEST_P(Activations, CountUpAndStartMonitoringWithTheFirstOfAPair) {
    setCounts(GetParam().before);
    subscribeforEvent(GetParam().id);
    EXPECT_EQ(counts(), GetParam().after);
    EXPECT_EQ(asked(START), GetParam().asksTheAgent ? 1U : 0U);
    EXPECT_THAT(log(), ElementsAre(entering("subscribeforEvent")));
}

INSTANTIATE_TEST_SUITE_P(
    All, Activations,
    testing::Values(Counting{"FirstOnline", {0, 0, 0, 0}, ONLINE, {1, 0, 0, 0}, true},
                    Counting{"SecondOnline", {1, 0, 0, 0}, ONLINE, {2, 0, 0, 0}, false},
                    Counting{"OnlineAfterOffline", {0, 1, 0, 0}, ONLINE, {1, 1, 0, 0}, false},
                    Counting{"OnlineAfterOfflineBelowZero", {0, -1, 0, 0}, ONLINE, {1, -1, 0, 0}, false},
                    Counting{"OnlineAfterSwitchOverAndBack", {0, 0, 1, 1}, ONLINE, {1, 0, 1, 1}, true},
                    Counting{"OnlineFromBelowZero", {-1, 0, 0, 0}, ONLINE, {0, 0, 0, 0}, false},
                    Counting{"FirstOffline", {0, 0, 0, 0}, OFFLINE, {0, 1, 0, 0}, true},
                    Counting{"SecondOffline", {0, 1, 0, 0}, OFFLINE, {0, 2, 0, 0}, false},
                    Counting{"OfflineAfterOnline", {1, 0, 0, 0}, OFFLINE, {1, 1, 0, 0}, false},
                    Counting{"OfflineAfterSwitchOverAndBack", {0, 0, 1, 1}, OFFLINE, {0, 1, 1, 1}, true},
                    Counting{"FirstSwitchOver", {0, 0, 0, 0}, SWITCHOVER, {0, 0, 1, 0}, true},
                    Counting{"SecondSwitchOver", {0, 0, 1, 0}, SWITCHOVER, {0, 0, 2, 0}, false},
                    Counting{"SwitchOverAfterSwitchBack", {0, 0, 0, 1}, SWITCHOVER, {0, 0, 1, 1}, false},
                    Counting{"SwitchOverAfterOnlineAndOffline", {1, 1, 0, 0}, SWITCHOVER, {1, 1, 1, 0}, true},
                    Counting{"FirstSwitchBack", {0, 0, 0, 0}, SWITCHBACK, {0, 0, 0, 1}, true},
                    Counting{"SecondSwitchBack", {0, 0, 0, 1}, SWITCHBACK, {0, 0, 0, 2}, false},
                    Counting{"SwitchBackAfterSwitchOver", {0, 0, 1, 0}, SWITCHBACK, {0, 0, 1, 1}, false},
                    Counting{"SwitchBackAfterOnlineAndOffline", {1, 1, 0, 0}, SWITCHBACK, {1, 1, 0, 1}, true},
                    Counting{"NoId", {0, 0, 0, 0}, 0, {0, 0, 0, 0}, false},
                    Counting{"FifthId", {0, 0, 0, 0}, 5, {0, 0, 0, 0}, false},
                    Counting{"NotAClass", {0, 0, 0, 0}, 15, {0, 0, 0, 0}, false}),
    [](const auto& instance) { return instance.param.name; });

TEST_F(Subscription, StartingUsesACursorOfItsOwnAndTheHandlerWithoutContext) {
    subscribeforEvent(ONLINE);
    EXPECT_THAT(agentCalls(),
                ElementsAre("cursor 1: Instrumentation()", "cursor 1: " + START, "cursor 1: ~Instrumentation()"));
    EXPECT_THAT(scripted_agent::monitorings(),
                ElementsAre(scripted_agent::Monitoring{Orv::NodeLexicon::NODE_NETWORK_ADAPTER, NetworkAdapterHandler,
                                                       nullptr}));
}

TEST_F(Subscription, OnlineAndThenSwitchOverStartMonitoringTwice) {
    subscribeforEvent(ONLINE);
    subscribeforEvent(SWITCHOVER);
    EXPECT_EQ(asked(START), 2U);
    ASSERT_THAT(scripted_agent::monitorings(), SizeIs(2));
    EXPECT_EQ(scripted_agent::monitorings()[0], scripted_agent::monitorings()[1]);
}

TEST_F(Subscription, AgentThatCannotMonitorCostsALineOfTheLogAndNoMore) {
    for (const char* call : {"Instrumentation()", "startMonitoring"}) {
        setCounts({0, 0, 0, 0});
        scripted_agent::clearRecord();
        scripted_agent::failAt(call, 1, [] { throw std::runtime_error("no agent"); });
        subscribeforEvent(ONLINE);
        EXPECT_EQ(OnlineSubscribeCount, 1);
        EXPECT_THAT(log(), ElementsAre(entering("subscribeforEvent"),
                                       message("subscribeforEvent", "Caught Exception", 6000)));
    }
}

class Deactivations : public Indications, public testing::WithParamInterface<Counting> {};

TEST_P(Deactivations, CountDownToOneAndNoFurther) {
    setCounts(GetParam().before);
    saveContext();
    UnsubscribeforEvent(GetParam().id);
    EXPECT_EQ(counts(), GetParam().after);
    EXPECT_EQ(asked(STOP), 0U);
    EXPECT_TRUE(_alertContextAvailable);
    EXPECT_THAT(log(), ElementsAre(entering("UnsubscribeforEvent")));
}

INSTANTIATE_TEST_SUITE_P(
    All, Deactivations,
    testing::Values(Counting{"OnlineOfOne", {1, 0, 0, 0}, ONLINE, {1, 0, 0, 0}, false},
                    Counting{"OnlineOfTwo", {2, 0, 0, 0}, ONLINE, {1, 0, 0, 0}, false},
                    Counting{"OnlineNeverActivated", {0, 0, 0, 0}, ONLINE, {-1, 0, 0, 0}, false},
                    Counting{"OfflineOfOne", {0, 1, 0, 0}, OFFLINE, {0, 1, 0, 0}, false},
                    Counting{"OfflineOfThree", {0, 3, 0, 0}, OFFLINE, {0, 2, 0, 0}, false},
                    Counting{"OfflineNeverActivated", {0, 0, 0, 0}, OFFLINE, {0, -1, 0, 0}, false},
                    Counting{"OfflineBelowZero", {0, -1, 0, 0}, OFFLINE, {0, -2, 0, 0}, false},
                    Counting{"SwitchOverOfOne", {0, 0, 1, 0}, SWITCHOVER, {0, 0, 1, 0}, false},
                    Counting{"SwitchOverNeverActivated", {0, 0, 0, 0}, SWITCHOVER, {0, 0, -1, 0}, false},
                    Counting{"SwitchBackOfOne", {0, 0, 0, 1}, SWITCHBACK, {0, 0, 0, 1}, false},
                    Counting{"SwitchBackOfTwo", {1, 1, 1, 2}, SWITCHBACK, {1, 1, 1, 1}, false},
                    Counting{"NotAClassWhileOneIsCounted", {0, 0, 0, 1}, 15, {0, 0, 0, 1}, false}),
    [](const auto& instance) { return instance.param.name; });

TEST_F(Subscription, UnknownIdWithNothingCountedForgetsTheContext) {
    saveContext();
    UnsubscribeforEvent(15);
    EXPECT_FALSE(_alertContextAvailable);
    EXPECT_EQ(_alertBroker, nullptr);
    EXPECT_EQ(_alertContext, nullptr);
    EXPECT_THAT(log(), ElementsAre(entering("UnsubscribeforEvent"), entering("clearIndicationContext")));
}

TEST_F(Subscription, SavingReplacesBrokerAndContext) {
    const CMPIBroker broker{};
    const CMPIContext context{};
    saveContext();
    saveIndicationContext(&broker, &context);
    EXPECT_EQ(_alertBroker, &broker);
    EXPECT_EQ(_alertContext, &context);
    EXPECT_TRUE(_alertContextAvailable);
    EXPECT_THAT(log(), ElementsAre(entering("saveIndicationContext")));
}

TEST_F(Subscription, NullContextIsSavedAsItIs) {
    saveIndicationContext(setup.real.handle(), nullptr);
    EXPECT_TRUE(_alertContextAvailable);
    EXPECT_EQ(_alertContext, nullptr);
}

TEST_F(Subscription, EnablingSwitchesDeliveryOnAndSaysSo) {
    setNetworkEnable();
    EXPECT_TRUE(_enabledNetwork);
    EXPECT_THAT(log(), ElementsAre(entering("setNetworkEnable"), variable("setNetworkEnable", "_enabledNetwork", "1"),
                                   exiting("setNetworkEnable")));
    EXPECT_THAT(agentCalls(), IsEmpty());
}

class Disabling : public Indications, public testing::WithParamInterface<Counting> {};

TEST_P(Disabling, SwitchesDeliveryOffAndStopsMonitoringForOneOnlineAndOneOffline) {
    setCounts(GetParam().before);
    _enabledNetwork = true;
    saveContext();
    disableNetworkIndication();
    EXPECT_FALSE(_enabledNetwork);
    EXPECT_TRUE(_alertContextAvailable);
    EXPECT_EQ(counts(), GetParam().after);
    EXPECT_EQ(asked(STOP), GetParam().asksTheAgent ? 1U : 0U);
    EXPECT_THAT(log(), ElementsAre(entering("disableNetworkIndication"), exiting("disableNetworkIndication")));
}

INSTANTIATE_TEST_SUITE_P(All, Disabling,
                         testing::Values(Counting{"OneAndOne", {1, 1, 0, 0}, 0, {0, 1, 0, 0}, true},
                                         Counting{"OneAndOneAmongOthers", {1, 1, 2, 3}, 0, {0, 1, 2, 3}, true},
                                         Counting{"TwoAndOne", {2, 1, 0, 0}, 0, {2, 1, 0, 0}, false},
                                         Counting{"OneAndTwo", {1, 2, 0, 0}, 0, {1, 2, 0, 0}, false},
                                         Counting{"OnlineAlone", {1, 0, 0, 0}, 0, {1, 0, 0, 0}, false},
                                         Counting{"OfflineAlone", {0, 1, 0, 0}, 0, {0, 1, 0, 0}, false},
                                         Counting{"SwitchOverAlone", {0, 0, 1, 0}, 0, {0, 0, 1, 0}, false},
                                         Counting{"SwitchOverAndBack", {0, 0, 1, 1}, 0, {0, 0, 1, 1}, false},
                                         Counting{"Nothing", {0, 0, 0, 0}, 0, {0, 0, 0, 0}, false}),
                         [](const auto& instance) { return instance.param.name; });

TEST_F(Subscription, StoppingUsesACursorOfItsOwnBetweenEntryAndExit) {
    subscribeforEvent(ONLINE);
    subscribeforEvent(OFFLINE);
    scripted_agent::clearRecord();
    disableNetworkIndication();
    EXPECT_THAT(steps(),
                ElementsAre(entering("disableNetworkIndication"), "cursor 1: Instrumentation()", "cursor 1: " + STOP,
                            "cursor 1: ~Instrumentation()", exiting("disableNetworkIndication")));
    EXPECT_THAT(scripted_agent::monitorings(), IsEmpty());
}

TEST_F(Subscription, AgentThatCannotStopCostsALineOfTheLogAndNoMore) {
    setCounts({1, 1, 0, 0});
    scripted_agent::failAt("stopMonitoring", 1, [] { throw std::runtime_error("no agent"); });
    disableNetworkIndication();
    EXPECT_EQ(OnlineSubscribeCount, 0);
    EXPECT_THAT(log(), ElementsAre(entering("disableNetworkIndication"),
                                   message("disableNetworkIndication", "Caught Exception", 6000),
                                   exiting("disableNetworkIndication")));
}

TEST_F(Subscription, AfterStoppingNeitherOnlineNorOfflineStartsMonitoringAgain) {
    subscribeforEvent(ONLINE);
    subscribeforEvent(OFFLINE);
    disableNetworkIndication();
    subscribeforEvent(ONLINE);
    subscribeforEvent(OFFLINE);
    EXPECT_EQ(asked(START), 1U);
    EXPECT_THAT(scripted_agent::monitorings(), IsEmpty());
}

} // namespace

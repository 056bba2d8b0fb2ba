/** The indication functions as an object manager calls them, through the factory's table, and what they leave behind.
 */
#include "tests/provider/Indications.h"

#include <functional>

extern "C" {
CMPIIndicationMI* NetworkAdapterProvider_Create_IndicationMI(const CMPIBroker*, const CMPIContext*, CMPIStatus*);
}

namespace {

using namespace provider_test;
using namespace Orv::NetworkAdapterComposite;
using marlo::test::Failure;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

const std::string ONLINE = "MARLO_NetworkAdapterOnlineEvent";
const std::string OFFLINE = "MARLO_NetworkAdapterOfflineEvent";
const std::string SWITCHOVER = "MARLO_NetworkAdapterSwitchOverEvent";
const std::string SWITCHBACK = "MARLO_NetworkAdapterSwitchBackEvent";

const std::string BANNER(78, '=');

std::string mark(const std::string& marker, const std::string& text) {
    return line("log", 4000, INDICATION_LOGGER, "Trace", marker, text);
}

std::vector<std::string> entryMark(const std::string& function) {
    return {mark("markProviderEntry", BANNER),
            mark("markProviderEntry", "ENTERING: " + function + "() in NetworkAdapterProvider [Line: N]")};
}

std::vector<std::string> exitMark(const std::string& function) {
    return {mark("markProviderExit", "EXITING: " + function + "() in NetworkAdapterProvider [Line: N]"),
            mark("markProviderExit", BANNER)};
}

/** The lines of a call that logs `inside` between its marks. */
std::vector<std::string> call(const std::string& function, const std::vector<std::string>& inside) {
    std::vector<std::string> lines = entryMark(function);
    lines.insert(lines.end(), inside.begin(), inside.end());
    const std::vector<std::string> exit = exitMark(function);
    lines.insert(lines.end(), exit.begin(), exit.end());
    return lines;
}

/** A line of the front end itself. */
std::string own(const std::string& function, const std::string& text, int level = 4000) {
    return line("log", level, INDICATION_LOGGER, "NetworkAdapterProvider", function, text);
}

/** What a function says that looks up the class it was called for. */
std::vector<std::string> lookUpBy(const std::string& function, const std::string& className, const std::string& id) {
    return {own(function, "VARIABLE: 'className' has Value '" + className + "' at line N in NetworkAdapterProvider"),
            entering("getNetworkIndicationId"), variable("getNetworkIndicationId", "classname", className),
            variable("getNetworkIndicationId", "indicationClassId", id)};
}

class IndicationMI : public Indications {
  protected:
    IndicationMI() : mi(NetworkAdapterProvider_Create_IndicationMI(setup.faulty.handle(), nullptr, nullptr)) {}

    using Function = std::function<CMPIStatus(const CMPIContext*, const CMPIObjectPath*)>;

    /** Calls a function as an object manager does. */
    Answer ask(const std::string& className, const Function& function) {
        return setup.call(classPath(className), [&](const CMPIContext* context, const CMPIResult*,
                                                    const CMPIObjectPath* path) { return function(context, path); });
    }

    /** The class of the path counts, so the other arguments name another. */
    Answer activate(const std::string& className, bool first = true) {
        return ask(className, [&](const CMPIContext* context, const CMPIObjectPath* path) {
            return mi->ft->activateFilter(mi, context, nullptr, "AnotherClass", path, first ? 1 : 0);
        });
    }

    Answer deactivate(const std::string& className, bool last = true) {
        return ask(className, [&](const CMPIContext* context, const CMPIObjectPath* path) {
            return mi->ft->deActivateFilter(mi, context, nullptr, "AnotherClass", path, last ? 1 : 0);
        });
    }

    CMPIStatus enable() { return mi->ft->enableIndications(mi, nullptr); }

    CMPIStatus disable() { return mi->ft->disableIndications(mi, nullptr); }

    static std::size_t starts() {
        const std::vector<std::string> calls = agentCalls();
        return static_cast<std::size_t>(std::count_if(calls.begin(), calls.end(), [](const std::string& text) {
            return text.find("startMonitoring") != std::string::npos;
        }));
    }

    CMPIIndicationMI* mi;
};

void expectOK(const CMPIStatus& status) {
    EXPECT_EQ(status.rc, CMPI_RC_OK);
    EXPECT_EQ(status.msg, nullptr);
}

TEST_F(IndicationMI, CleanupDoesNothingWithoutAWord) {
    activate(ONLINE);
    enable();
    scripted_agent::clearRecord();
    for (const CMPIBoolean terminating : {CMPIBoolean{0}, CMPIBoolean{1}}) {
        expectOK(mi->ft->cleanup(mi, nullptr, terminating));
    }
    EXPECT_THAT(scripted_agent::record(), IsEmpty());
    EXPECT_TRUE(_enabledNetwork);
    EXPECT_TRUE(_alertContextAvailable);
    EXPECT_EQ(OnlineSubscribeCount, 1);
    EXPECT_THAT(scripted_agent::monitorings(), SizeIs(1));
}

TEST_F(IndicationMI, AnyFilterIsAuthorizedForAnybody) {
    expectOK(mi->ft->authorizeFilter(mi, nullptr, nullptr, "NoClass", nullptr, "nobody"));
    EXPECT_EQ(log(), call("NetworkAdapter_AuthorizeFilter", {}));
    EXPECT_THAT(setup.faulty.calls(), IsEmpty());
}

TEST_F(IndicationMI, MustPollAnswersOK) {
    expectOK(mi->ft->mustPoll(mi, nullptr, nullptr, nullptr, nullptr));
    EXPECT_EQ(log(), call("NetworkAdapter_MustPoll", {}));
}

TEST_F(IndicationMI, ActivationSavesBrokerAndPreparedContextAndStartsMonitoring) {
    noteBrokerCalls();
    const Answer answer = activate(ONLINE);
    EXPECT_EQ(answer.code, CMPI_RC_OK);
    EXPECT_FALSE(answer.hasMessage);
    const std::string self = "NetworkAdapter_ActivateFilter";
    std::vector<std::string> inside{"broker: objectPath.getClassName", "broker: string.getCharPtr"};
    const std::vector<std::string> lookingUp = lookUpBy(self, ONLINE, "1");
    inside.insert(inside.end(), lookingUp.begin(), lookingUp.end());
    inside.insert(inside.end(),
                  {"broker: prepareAttachThread", entering("saveIndicationContext"), entering("subscribeforEvent"),
                   "cursor 1: Instrumentation()", "cursor 1: startMonitoring(NODE_NETWORK_ADAPTER, null)",
                   "cursor 1: ~Instrumentation()"});
    EXPECT_EQ(steps(), call(self, inside));
    EXPECT_EQ(_alertBroker, setup.faulty.handle());
    EXPECT_NE(_alertContext, nullptr);
    EXPECT_TRUE(_alertContextAvailable);
    EXPECT_FALSE(_enabledNetwork);
}

TEST_F(IndicationMI, EveryLineGoesToTheLogAndThenToTheTrace) {
    activate(ONLINE);
    deactivate("NoClass");
    enable();
    disable();
    std::vector<std::string> lines = scripted_agent::record();
    std::erase_if(lines,
                  [](const std::string& text) { return !text.starts_with("log ") && !text.starts_with("trace "); });
    ASSERT_GT(lines.size(), 50U);
    for (std::size_t i = 0; i + 1 < lines.size(); i += 2) {
        EXPECT_EQ("trace " + lines[i].substr(4), lines[i + 1]);
    }
}

TEST_F(IndicationMI, EveryClassCountsUnderItsOwnId) {
    activate(OFFLINE);
    activate(SWITCHBACK);
    activate(SWITCHBACK);
    activate(SWITCHOVER);
    EXPECT_EQ(OnlineSubscribeCount, 0);
    EXPECT_EQ(OfflineSubscribeCount, 1);
    EXPECT_EQ(SwitchoverSubscribeCount, 1);
    EXPECT_EQ(SwitchbackSubscribeCount, 2);
}

TEST_F(IndicationMI, FlagsOfFirstAndLastAreNotLookedAt) {
    activate(ONLINE, false);
    EXPECT_EQ(OnlineSubscribeCount, 1);
    EXPECT_EQ(starts(), 1U);
    activate(ONLINE, true);
    EXPECT_EQ(OnlineSubscribeCount, 2);
    EXPECT_EQ(starts(), 1U);
    deactivate(ONLINE, true);
    EXPECT_EQ(OnlineSubscribeCount, 1);
    EXPECT_THAT(scripted_agent::monitorings(), SizeIs(1));
}

TEST_F(IndicationMI, SecondActivationReplacesTheContextAndStartsNothing) {
    activate(ONLINE);
    const CMPIContext* first = _alertContext;
    activate(ONLINE);
    EXPECT_EQ(OnlineSubscribeCount, 2);
    EXPECT_EQ(starts(), 1U);
    EXPECT_NE(_alertContext, first);
}

TEST_F(IndicationMI, SecondActivationThroughAnotherBrokerReplacesIt) {
    activate(ONLINE);
    NetworkAdapterProvider_Create_IndicationMI(setup.real.handle(), nullptr, nullptr);
    activate(ONLINE);
    EXPECT_EQ(_alertBroker, setup.real.handle());
}

TEST_F(IndicationMI, OnlineAndThenSwitchOverStartMonitoringTwice) {
    activate(ONLINE);
    activate(SWITCHOVER);
    EXPECT_EQ(starts(), 2U);
}

TEST_F(IndicationMI, ContextThatCannotBePreparedIsSavedAsItIs) {
    setup.faulty.failAt("prepareAttachThread", 1, Failure::silently);
    EXPECT_EQ(activate(ONLINE).code, CMPI_RC_OK);
    EXPECT_EQ(_alertContext, nullptr);
    EXPECT_TRUE(_alertContextAvailable);
    EXPECT_EQ(OnlineSubscribeCount, 1);
}

TEST_F(IndicationMI, AgentThatCannotMonitorDoesNotFailTheActivation) {
    scripted_agent::failAt("startMonitoring", 1, [] { throw std::runtime_error("no agent"); });
    EXPECT_EQ(activate(ONLINE).code, CMPI_RC_OK);
    EXPECT_EQ(OnlineSubscribeCount, 1);
    EXPECT_TRUE(_alertContextAvailable);
}

class UnknownClasses : public IndicationMI, public testing::WithParamInterface<const char*> {
  protected:
    /** The lines of a function that knows the class not, which it says with this word at the end. */
    static std::vector<std::string> refusing(const std::string& function, const std::string& lastWord) {
        std::vector<std::string> inside = lookUpBy(function, GetParam(), "15");
        inside.push_back(own(function,
                             "MESSAGE [File: NetworkAdapterProvider, Line: N]: "
                             "The Given Class does not support " +
                                 lastWord,
                             6000));
        return call(function, inside);
    }
};

TEST_P(UnknownClasses, CannotBeActivatedAndChangeNothing) {
    const Answer answer = activate(GetParam());
    EXPECT_EQ(answer.code, CMPI_RC_ERR_NOT_SUPPORTED);
    EXPECT_FALSE(answer.hasMessage);
    EXPECT_FALSE(_alertContextAvailable);
    EXPECT_EQ(_alertBroker, nullptr);
    EXPECT_EQ(OnlineSubscribeCount, 0);
    EXPECT_THAT(agentCalls(), IsEmpty());
    EXPECT_THAT(brokerCalls(), IsEmpty());
    EXPECT_EQ(log(), refusing("NetworkAdapter_ActivateFilter", "indication"));
}

TEST_P(UnknownClasses, CannotBeDeactivatedWhichIsSaidWithACapitalLetter) {
    activate(ONLINE);
    scripted_agent::clearRecord();
    const Answer answer = deactivate(GetParam());
    EXPECT_EQ(answer.code, CMPI_RC_ERR_NOT_SUPPORTED);
    EXPECT_FALSE(answer.hasMessage);
    EXPECT_EQ(OnlineSubscribeCount, 1);
    EXPECT_TRUE(_alertContextAvailable);
    EXPECT_EQ(log(), refusing("NetworkAdapter_DeActivateFilter", "Indication"));
}

INSTANTIATE_TEST_SUITE_P(All, UnknownClasses,
                         testing::Values("marlo_networkadapteronlineevent", "MARLO_NetworkAdapterSwitchoverEvent",
                                         "MARLO_NetworkAdapterConfiguration", "CIM_AlertIndication", "X"),
                         [](const auto& instance) { return "Class" + std::to_string(instance.index); });

TEST_F(IndicationMI, DeactivationCountsDownAndKeepsTheContext) {
    activate(ONLINE);
    enable();
    scripted_agent::clearRecord();
    EXPECT_EQ(deactivate(ONLINE).code, CMPI_RC_OK);
    EXPECT_EQ(OnlineSubscribeCount, 1) << "it went to 0 and back";
    EXPECT_TRUE(_alertContextAvailable);
    EXPECT_TRUE(_enabledNetwork);
    EXPECT_THAT(agentCalls(), IsEmpty());
    const std::string self = "NetworkAdapter_DeActivateFilter";
    std::vector<std::string> inside = lookUpBy(self, ONLINE, "1");
    inside.push_back(entering("UnsubscribeforEvent"));
    EXPECT_EQ(log(), call(self, inside));
}

TEST_F(IndicationMI, DeactivatingWhatWasNeverActivatedGoesBelowZero) {
    deactivate(OFFLINE);
    EXPECT_EQ(OfflineSubscribeCount, -1);
}

TEST_F(IndicationMI, EnablingAndDisablingAreMarkedAndAnswerOK) {
    expectOK(enable());
    EXPECT_EQ(log(), call("NetworkAdapter_EnableIndications",
                          {entering("setNetworkEnable"), variable("setNetworkEnable", "_enabledNetwork", "1"),
                           exiting("setNetworkEnable")}));
    EXPECT_TRUE(_enabledNetwork);
    scripted_agent::clearRecord();
    expectOK(disable());
    EXPECT_EQ(log(), call("NetworkAdapter_DisableIndications",
                          {entering("disableNetworkIndication"), exiting("disableNetworkIndication")}));
    EXPECT_FALSE(_enabledNetwork);
}

TEST_F(IndicationMI, DisablingStopsMonitoringForOneOnlineAndOneOffline) {
    activate(ONLINE);
    activate(OFFLINE);
    disable();
    EXPECT_EQ(OnlineSubscribeCount, 0);
    EXPECT_EQ(OfflineSubscribeCount, 1);
    EXPECT_THAT(scripted_agent::monitorings(), IsEmpty());
}

TEST_F(IndicationMI, EventsThatNobodyStoppedAreDroppedAfterDisabling) {
    AlertThreads threads(setup.faulty.changeable());
    addEventNode("event", 32);
    activate(SWITCHOVER);
    enable();
    scripted_agent::fire({{0, EVENT_TIME, "event"}});
    EXPECT_THAT(setup.platform.delivered(), SizeIs(1));
    disable();
    EXPECT_THAT(scripted_agent::monitorings(), SizeIs(1));
    scripted_agent::fire({{0, EVENT_TIME, "event"}});
    EXPECT_THAT(setup.platform.delivered(), SizeIs(1));
}

TEST_F(IndicationMI, WithoutActivationNothingIsMonitoredOrDelivered) {
    AlertThreads threads(setup.faulty.changeable());
    addEventNode("event", 1);
    enable();
    scripted_agent::fire({{0, EVENT_TIME, "event"}});
    EXPECT_THAT(setup.platform.delivered(), IsEmpty());
}

TEST_F(IndicationMI, EveryKindOfEventIsDeliveredWhicheverClassWasActivated) {
    AlertThreads threads(setup.faulty.changeable());
    activate(SWITCHBACK);
    enable();
    for (const unsigned int status : {1U, 5U, 12U, 32U, 33U, 34U}) {
        const std::string path = "event " + std::to_string(status);
        addEventNode(path, status);
        scripted_agent::fire({{0, EVENT_TIME, path}, {1, EVENT_TIME, path}});
    }
    std::vector<std::string> classes;
    for (const auto& [nameSpace, instance] : setup.platform.delivered()) {
        classes.push_back(instance.path.className);
    }
    EXPECT_THAT(classes, ElementsAre(ONLINE, OFFLINE, OFFLINE, SWITCHOVER, SWITCHBACK));
}

TEST_F(IndicationMI, ClassNameThatTheBrokerDoesNotGiveIsNoClass) {
    for (const char* slot : {"objectPath.getClassName", "string.getCharPtr"}) {
        for (const Failure failure : {Failure::withStatus, Failure::silently}) {
            setup.faulty.failAt(slot, 1, failure);
            EXPECT_EQ(activate(ONLINE).code, CMPI_RC_ERR_NOT_SUPPORTED);
            setup.faulty.failAt(slot, 1, failure);
            EXPECT_EQ(deactivate(ONLINE).code, CMPI_RC_ERR_NOT_SUPPORTED);
        }
    }
    EXPECT_EQ(OnlineSubscribeCount, 0);
}

/** A class name whose reading leaves a code of its own in the status. */
struct StatusBroker {
    static inline CMPIStringFT strings{};
    static inline CMPIObjectPathFT paths{};
    static inline CMPIString name{nullptr, &strings};

    StatusBroker() {
        strings.getCharPtr = [](const CMPIString*, CMPIStatus* status) -> const char* {
            status->rc = CMPI_RC_ERR_ACCESS_DENIED;
            return "MARLO_NetworkAdapterOnlineEvent";
        };
        paths.getClassName = [](const CMPIObjectPath*, CMPIStatus* status) {
            status->rc = CMPI_RC_ERR_INVALID_CLASS;
            return &name;
        };
    }
};

TEST_F(IndicationMI, CodeOfReadingTheClassNameIsWhatTheCallAnswers) {
    const StatusBroker names;
    const CMPIObjectPath path{nullptr, &StatusBroker::paths};
    const CMPIContext* context = setup.real.newContext();
    EXPECT_EQ(mi->ft->activateFilter(mi, context, nullptr, nullptr, &path, 1).rc, CMPI_RC_ERR_ACCESS_DENIED);
    EXPECT_EQ(OnlineSubscribeCount, 1);
    EXPECT_EQ(mi->ft->deActivateFilter(mi, context, nullptr, nullptr, &path, 1).rc, CMPI_RC_ERR_ACCESS_DENIED);
}

} // namespace

/** What the thread of an event makes of a node, and how it delivers. */
#include "tests/provider/Indications.h"

namespace {

using namespace provider_test;
using namespace Orv::NetworkAdapterComposite;
using marlo::test::Failure;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::Not;
using testing::SizeIs;

const std::string PROCESS = "processNetworkIndication";
const std::string PROPERTIES = "getNetworkProperties";

const std::string CALLING = message(PROCESS, "processNetworkIndication : Calling CB Deliver Indication ");
const std::string DONE = message(PROCESS, "processNetworkIndication : CB Deliver Indication done");

/** Reading what a node says. */
class Properties : public Indications {
  protected:
    bool read(const std::string& path = "event") {
        return getNetworkProperties(path, className, word, description, name);
    }

    std::string className = "class before";
    std::string word = "word before";
    std::string description = "description before";
    std::string name = "name before";
};

struct Status {
    unsigned int status;
    const char* word;
    const char* className; ///< null when it means no indication
    const char* shown;
};

class Statuses : public Properties, public testing::WithParamInterface<Status> {};

TEST_P(Statuses, MeanAnEventOrNone) {
    addEventNode("event", GetParam().status);
    EXPECT_EQ(read(), GetParam().className != nullptr);
    EXPECT_EQ(word, GetParam().word);
    EXPECT_EQ(className, GetParam().className != nullptr ? GetParam().className : "class before");
    EXPECT_EQ(description, "Adapter eth0");
    EXPECT_EQ(name, "eth0");
    std::vector<std::string> expected{entering(PROPERTIES), variable(PROPERTIES, "name", "eth0"),
                                      variable(PROPERTIES, "newStatus", GetParam().shown)};
    if (GetParam().className == nullptr) {
        expected.push_back(message(PROPERTIES, "Status is Failed", 6000));
    }
    expected.push_back(exiting(PROPERTIES));
    EXPECT_EQ(log(), expected);
}

INSTANTIATE_TEST_SUITE_P(All, Statuses,
                         testing::Values(Status{1, "Online", "MARLO_NetworkAdapterOnlineEvent", "1"},
                                         Status{5, "Offline", "MARLO_NetworkAdapterOfflineEvent", "5"},
                                         Status{12, "Offline", "MARLO_NetworkAdapterOfflineEvent", "12"},
                                         Status{32, "SwitchOver", "MARLO_NetworkAdapterSwitchOverEvent", "32"},
                                         Status{33, "SwitchBack", "MARLO_NetworkAdapterSwitchBackEvent", "33"},
                                         Status{0, "Failed", nullptr, "0"}, Status{2, "Failed", nullptr, "2"},
                                         Status{4, "Failed", nullptr, "4"}, Status{6, "Failed", nullptr, "6"},
                                         Status{11, "Failed", nullptr, "11"}, Status{13, "Failed", nullptr, "13"},
                                         Status{31, "Failed", nullptr, "31"}, Status{34, "Failed", nullptr, "34"},
                                         Status{65537, "Failed", nullptr, "65537"},
                                         Status{4294967295U, "Failed", nullptr, "-1"}),
                         [](const auto& instance) { return std::to_string(instance.param.status); });

TEST_F(Properties, NodeThatIsNotThereLeavesEverythingAloneAndIsNoReasonNotToSend) {
    EXPECT_TRUE(read("nowhere"));
    EXPECT_EQ(className, "class before");
    EXPECT_EQ(word, "word before");
    EXPECT_EQ(description, "description before");
    EXPECT_EQ(name, "name before");
    EXPECT_THAT(steps(),
                ElementsAre(entering(PROPERTIES), "cursor 1: Instrumentation()", "cursor 1: selectNode(\"nowhere\")",
                            "cursor 1: bool = false", exiting(PROPERTIES), "cursor 1: ~Instrumentation()"));
}

TEST_F(Properties, NodeWithoutStatusCountsAsStatusZero) {
    addEventNode("event", 1).numbers.clear();
    EXPECT_FALSE(read());
    EXPECT_EQ(word, "Failed");
}

TEST_F(Properties, NodeWithoutIdentityKeepsTheNameThatTheCallerHad) {
    addEventNode("event", 1).texts.clear();
    EXPECT_TRUE(read());
    EXPECT_EQ(name, "name before");
}

TEST_F(Properties, ExceptionOfTheAgentSendsNothing) {
    for (const char* call : {"Instrumentation()", "selectNode", "bool", "getProperty(PROP_STATUS)",
                             "getNodeDescription", "getProperty(PROP_NODE_STRING)"}) {
        SCOPED_TRACE(call);
        scripted_agent::reset();
        addEventNode("event", 1);
        scripted_agent::failAt(call, 1, [] { throw std::runtime_error("the agent is gone"); });
        EXPECT_FALSE(read());
        EXPECT_THAT(log(), ElementsAre(entering(PROPERTIES), message(PROPERTIES, "Caught Exception", 6000)));
        if (std::string(call) != "Instrumentation()") {
            EXPECT_THAT(agentCalls(), Contains("cursor 1: ~Instrumentation()"));
        }
    }
}

TEST_F(Properties, AnythingElseThatTheAgentThrowsPassesThrough) {
    addEventNode("event", 1);
    scripted_agent::failAt("selectNode", 1, [] { throw 42; });
    EXPECT_THROW(read(), int);
}

/** What a thread does with its event. */
class Processing : public Indications {
  protected:
    Processing() {
        addEventNode("event", 33);
        saveContext();
    }

    static void process(const std::string& path = "event") {
        processNetworkIndication(Orv::DateTime(EVENT_TIME), path);
    }
};

TEST_F(Processing, StatusWithoutMeaningUsesNoBroker) {
    scripted_agent::script().nodes.front().numbers[Orv::NodeLexicon::PROP_STATUS] = 34;
    process();
    EXPECT_THAT(setup.faulty.calls(), IsEmpty());
    EXPECT_EQ(log().back(), exiting(PROCESS));
}

TEST_F(Processing, WithoutSavedContextNothingIsSentOrSaid) {
    _alertContextAvailable = false;
    process();
    EXPECT_THAT(setup.faulty.calls(), IsEmpty());
    EXPECT_THAT(log(), ElementsAre(entering(PROCESS), entering(PROPERTIES), variable(PROPERTIES, "name", "eth0"),
                                   variable(PROPERTIES, "newStatus", "33"), exiting(PROPERTIES), exiting(PROCESS)));
}

TEST_F(Processing, ThreadThatCannotAttachSendsSaysAndDetachesNothing) {
    setup.faulty.failAt("attachThread", 1, Failure::withStatus);
    process();
    EXPECT_THAT(brokerCalls(), ElementsAre("prepareAttachThread", "attachThread"));
    EXPECT_EQ(log().back(), exiting(PROCESS));
    EXPECT_THAT(log(), SizeIs(6));
}

TEST_F(Processing, ContextThatCannotBePreparedIsAttachedAllTheSame) {
    setup.faulty.failAt("prepareAttachThread", 1, Failure::silently);
    process();
    EXPECT_THAT(brokerCalls(), ElementsAre("prepareAttachThread", "attachThread"));
}

TEST_F(Processing, InstanceThatIsNotBuiltIsNotDeliveredAndTheThreadDetached) {
    setup.faulty.failAt("newInstance", 1, Failure::silently);
    process();
    EXPECT_EQ(brokerCalls().back(), "detachThread");
    EXPECT_THAT(brokerCalls(), Not(Contains("deliverIndication root/tavis")));
    EXPECT_THAT(log(), Not(Contains(CALLING)));
    EXPECT_THAT(log(), Not(Contains(DONE)));
}

TEST_F(Processing, InstanceWithoutHandleIsNotDelivered) {
    static CMPIBrokerEncFT table;
    static CMPIInstance* (*real)(const CMPIBroker*, const CMPIObjectPath*, CMPIStatus*);
    table = *setup.faulty.handle()->eft;
    real = table.newInstance;
    table.newInstance = [](const CMPIBroker* broker, const CMPIObjectPath* path, CMPIStatus* status) {
        CMPIInstance* instance = real(broker, path, status);
        instance->hdl = nullptr;
        return instance;
    };
    setup.faulty.changeable().eft = &table;
    process();
    EXPECT_THAT(brokerCalls(), Not(Contains("deliverIndication root/tavis")));
    EXPECT_EQ(brokerCalls().back(), "detachThread");
}

TEST_F(Processing, IndicationIsDeliveredInItsNamespace) {
    process();
    const auto delivered = setup.platform.delivered();
    ASSERT_THAT(delivered, SizeIs(1));
    EXPECT_EQ(delivered[0].first, "root/tavis");
    EXPECT_EQ(delivered[0].second.path.className, "MARLO_NetworkAdapterSwitchBackEvent");
    EXPECT_THAT(setup.brokerLog, IsEmpty());
}

TEST_F(Processing, DeliveryThatFailsIsToldToTheBrokersTraceAndIsDone) {
    setup.platform.deliveryOutcome.code = CMPI_RC_ERR_FAILED;
    noteBrokerCalls();
    process();
    std::vector<std::string> found = steps();
    found.erase(found.begin(), std::find(found.begin(), found.end(), CALLING));
    EXPECT_THAT(found, ElementsAre(CALLING, "broker: deliverIndication root/tavis",
                                   "broker: newString Could not send the Indication",
                                   "broker: trace NetworkAdapterProvider Could not send the Indication", DONE,
                                   "broker: detachThread", exiting(PROCESS)));
    ASSERT_THAT(setup.brokerLog, SizeIs(1));
    EXPECT_TRUE(setup.brokerLog[0].trace);
    EXPECT_EQ(setup.brokerLog[0].level, CMPI_LEV_INFO);
    EXPECT_EQ(setup.brokerLog[0].component, "NetworkAdapterProvider");
    EXPECT_EQ(setup.brokerLog[0].text, "Could not send the Indication");
}

TEST_F(Processing, EventWithoutNodeIsProcessedWithEmptyTexts) {
    noteBrokerCalls();
    process("nowhere");
    EXPECT_THAT(steps(), Contains("broker: newObjectPath root/tavis "));
    EXPECT_EQ(brokerCalls().back(), "detachThread");
}

TEST_F(Processing, ManyEventsLeaveNoContextBehind) {
    // AddressSanitizer tells of a context that is prepared and never given back.
    for (int i = 0; i < 1000; ++i) {
        process();
    }
    EXPECT_THAT(setup.platform.delivered(), SizeIs(1000));
}

} // namespace

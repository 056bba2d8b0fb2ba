/** The agent's callback and the thread that it starts, each step of them with its lines of the log. */
#include "tests/provider/Indications.h"

#include <optional>

namespace {

using namespace provider_test;
using namespace Orv::NetworkAdapterComposite;
using marlo::test::Failure;
using Mode = AlertThreads::Mode;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

const std::string HANDLER = "NetworkAdapterHandler";
const std::string THREAD = "NetworkAlertThread";
const std::string PROCESS = "processNetworkIndication";
const std::string PROPERTIES = "getNetworkProperties";

const std::string CALLING = message(PROCESS, "processNetworkIndication : Calling CB Deliver Indication ");
const std::string DONE = message(PROCESS, "processNetworkIndication : CB Deliver Indication done");

class Handler : public Indications {
  protected:
    /** Ready to deliver, with one adapter that has just gone offline. */
    void arm(Mode mode = Mode::inTurn) {
        saveContext();
        _enabledNetwork = true;
        addEventNode("event 1", 12);
        threads.emplace(setup.faulty.changeable(), mode);
    }

    static void call(const std::string& path = "event 1", unsigned int code = 0) {
        NetworkAdapterHandler(code, Orv::DateTime(EVENT_TIME), path, nullptr);
    }

    static std::vector<std::string> entryOf(const std::string& code, const std::string& enabled) {
        return {entering(HANDLER), variable(HANDLER, "indicationClass", code),
                variable(HANDLER, "_enabledNetwork", enabled)};
    }

    std::optional<AlertThreads> threads;
};

struct Dropped {
    const char* name;
    bool enabled;
    unsigned int code;
    const char* shown;
};

class DroppedEvents : public Handler, public testing::WithParamInterface<Dropped> {};

TEST_P(DroppedEvents, AreTracedAndNothingElse) {
    arm();
    _enabledNetwork = GetParam().enabled;
    call("event 1", GetParam().code);
    std::vector<std::string> expected = entryOf(GetParam().shown, GetParam().enabled ? "1" : "0");
    expected.push_back(exiting(HANDLER));
    EXPECT_EQ(log(), expected);
    EXPECT_THAT(setup.faulty.calls(), IsEmpty());
    EXPECT_EQ(indicationNetworkData.nodeString, "");
    EXPECT_EQ(ind_thread_id, nullptr);
}

INSTANTIATE_TEST_SUITE_P(All, DroppedEvents,
                         testing::Values(Dropped{"Disabled", false, 0, "0"}, Dropped{"OtherCode", true, 1, "1"},
                                         Dropped{"OtherCodeWhileDisabled", false, 2, "2"},
                                         Dropped{"LargestCode", true, 4294967295U, "-1"}),
                         [](const auto& instance) { return instance.param.name; });

TEST_F(Handler, KeepsTheEventInTheRecord) {
    arm(Mode::held);
    indicationNetworkData.userData = 7;
    call();
    EXPECT_EQ(indicationNetworkData.nodeString, "event 1");
    EXPECT_EQ(indicationNetworkData.eventTime.getYear(), 2009);
    EXPECT_EQ(indicationNetworkData.eventTime.getMillisecond(), 250);
    EXPECT_EQ(indicationNetworkData.eventTime.getOffset(), 1);
    EXPECT_EQ(indicationNetworkData.userData, 0U);
}

TEST_F(Handler, StartsADetachedThreadWithoutArgumentWhileAttached) {
    arm(Mode::held);
    call();
    EXPECT_THAT(brokerCalls(), ElementsAre("prepareAttachThread", "attachThread", "newThread", "detachThread"));
    const auto starts = threads->starts();
    ASSERT_THAT(starts, SizeIs(1));
    EXPECT_EQ(starts[0].function, NetworkAlertThread);
    EXPECT_EQ(starts[0].argument, nullptr);
    EXPECT_EQ(starts[0].detached, 1);
    EXPECT_NE(ind_thread_id, nullptr);
    std::vector<std::string> expected = entryOf("0", "1");
    expected.push_back(exiting(HANDLER));
    EXPECT_EQ(log(), expected);
}

/** Contexts as the broker's thread slots see them. */
struct ContextSpy {
    static inline const CMPIContext* preparedFrom = nullptr;
    static inline CMPIContext* prepared = nullptr;
    static inline std::vector<const CMPIContext*> used;
    static inline CMPIBrokerFT real{};
    CMPIBrokerFT table;

    explicit ContextSpy(CMPIBroker& broker) : table(*broker.bft) {
        real = *broker.bft;
        used.clear();
        table.prepareAttachThread = [](const CMPIBroker* self, const CMPIContext* context) {
            preparedFrom = context;
            return prepared = real.prepareAttachThread(self, context);
        };
        table.attachThread = [](const CMPIBroker* self, const CMPIContext* context) {
            used.push_back(context);
            return real.attachThread(self, context);
        };
        table.deliverIndication = [](const CMPIBroker* self, const CMPIContext* context, const char* nameSpace,
                                     const CMPIInstance* instance) {
            used.push_back(context);
            return real.deliverIndication(self, context, nameSpace, instance);
        };
        table.detachThread = [](const CMPIBroker* self, const CMPIContext* context) {
            used.push_back(context);
            return real.detachThread(self, context);
        };
        broker.bft = &table;
    }
};

TEST_F(Handler, AttachesAContextOfItsOwnPreparedFromTheSavedOne) {
    arm(Mode::held);
    const ContextSpy spy(setup.faulty.changeable());
    call();
    EXPECT_EQ(ContextSpy::preparedFrom, _alertContext);
    EXPECT_NE(ContextSpy::prepared, _alertContext);
    EXPECT_THAT(ContextSpy::used, ElementsAre(ContextSpy::prepared, ContextSpy::prepared));
    threads->release();
    threads->waitForAll();
    EXPECT_EQ(ContextSpy::preparedFrom, _alertContext);
    ASSERT_THAT(ContextSpy::used, SizeIs(5));
    EXPECT_EQ(ContextSpy::used[2], ContextSpy::prepared) << "attached";
    EXPECT_EQ(ContextSpy::used[3], ContextSpy::prepared) << "delivered with";
    EXPECT_EQ(ContextSpy::used[4], ContextSpy::prepared) << "detached";
}

TEST_F(Handler, ThreadThatCannotBeCreatedLosesTheEventAfterDetaching) {
    arm();
    noteBrokerCalls();
    ind_thread_id = &setup;
    setup.faulty.failAt("newThread", 1, Failure::silently);
    call();
    EXPECT_EQ(ind_thread_id, nullptr);
    std::vector<std::string> expected = entryOf("0", "1");
    expected.insert(expected.end(), {"broker: prepareAttachThread", "broker: attachThread", "broker: detachThread",
                                     message(HANDLER, "Error creating thread", 6000), exiting(HANDLER)});
    EXPECT_EQ(steps(), expected);
    EXPECT_THAT(setup.platform.delivered(), IsEmpty());
    call();
    EXPECT_THAT(setup.platform.delivered(), SizeIs(1)) << "the next event is none the worse";
}

TEST_F(Handler, DoesNotLookAtWhatAttachingAndDetachingSay) {
    for (const char* slot : {"attachThread", "detachThread"}) {
        resetIndicationGlobals();
        arm(Mode::held);
        setup.faulty.failAt(slot, 1, Failure::withStatus);
        scripted_agent::clearRecord();
        call();
        EXPECT_THAT(brokerCalls(), ElementsAre("prepareAttachThread", "attachThread", "newThread", "detachThread"));
        EXPECT_THAT(log(), SizeIs(4));
        threads.reset();
    }
}

TEST_F(Handler, HandsAContextOnThatCouldNotBePrepared) {
    arm(Mode::held);
    setup.faulty.failAt("prepareAttachThread", 1, Failure::silently);
    call();
    EXPECT_THAT(brokerCalls(), ElementsAre("prepareAttachThread", "attachThread", "newThread", "detachThread"));
}

TEST_F(Handler, LaterEventReplacesOneThatIsNotReadYet) {
    arm(Mode::held);
    addEventNode("event 2", 1, "eth1");
    call("event 1");
    call("event 2");
    threads->release();
    threads->waitForAll();
    const auto delivered = setup.platform.delivered();
    ASSERT_THAT(delivered, SizeIs(2));
    for (const auto& [nameSpace, instance] : delivered) {
        EXPECT_EQ(instance.path.className, "MARLO_NetworkAdapterOnlineEvent");
        EXPECT_EQ(get(instance, "IndicationIdentifier"), marlo::Value::string("NetworkPort:Adapter eth1Online"));
    }
}

TEST_F(Handler, ThreadOfOneEventRunsFromEntryToExit) {
    arm();
    noteBrokerCalls();
    call();
    std::vector<std::string> found = steps();
    std::erase_if(found, [](const std::string& step) {
        return step.find(" createNetworkAdapterIndicationInstance | ") != std::string::npos ||
               step.find(" convertCIMDateTime | ") != std::string::npos || step.starts_with("broker: new") ||
               step.starts_with("broker: instance.") || step.starts_with("broker: objectPath.") ||
               step.starts_with("broker: string.") || step.starts_with("Locale") || step.starts_with("Resource") ||
               step.starts_with("make_string") || step.starts_with("Product");
    });
    std::vector<std::string> expected = entryOf("0", "1");
    expected.insert(expected.end(), {"broker: prepareAttachThread",
                                     "broker: attachThread",
                                     entering(THREAD),
                                     entering(PROCESS),
                                     entering(PROPERTIES),
                                     "cursor 1: Instrumentation()",
                                     "cursor 1: selectNode(\"event 1\")",
                                     "cursor 1: bool = true",
                                     "cursor 1: getProperty(PROP_STATUS) = 12",
                                     "cursor 1: getNodeDescription() = \"Adapter eth0\"",
                                     "cursor 1: getProperty(PROP_NODE_STRING) = \"eth0\"",
                                     variable(PROPERTIES, "name", "eth0"),
                                     variable(PROPERTIES, "newStatus", "12"),
                                     exiting(PROPERTIES),
                                     "cursor 1: ~Instrumentation()",
                                     "broker: prepareAttachThread",
                                     "broker: attachThread",
                                     CALLING,
                                     "broker: deliverIndication root/tavis",
                                     DONE,
                                     "broker: detachThread",
                                     exiting(PROCESS),
                                     exiting(THREAD),
                                     "broker: detachThread",
                                     exiting(HANDLER)});
    EXPECT_EQ(found, expected);
    EXPECT_EQ(threads->result(), nullptr);
}

TEST_F(Handler, EveryLineGoesToTheLogAndThenToTheTrace) {
    arm();
    call();
    std::vector<std::string> lines = scripted_agent::record();
    std::erase_if(lines,
                  [](const std::string& text) { return !text.starts_with("log ") && !text.starts_with("trace "); });
    ASSERT_GT(lines.size(), 20U);
    for (std::size_t i = 0; i + 1 < lines.size(); i += 2) {
        EXPECT_EQ("trace " + lines[i].substr(4), lines[i + 1]);
    }
    EXPECT_EQ(lines.size() % 2, 0U);
}

TEST_F(Handler, ThreadDoesNotLookAtItsArgument) {
    arm();
    indicationNetworkData.nodeString = "event 1";
    int anything = 0;
    EXPECT_EQ(NetworkAlertThread(&anything), nullptr);
    EXPECT_THAT(setup.platform.delivered(), SizeIs(1));
}

} // namespace

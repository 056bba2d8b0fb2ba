/** From the agent's event to the delivery: bursts, and every call of the broker failing in turn.
 */
#include "tests/provider/IndicationInterface.h"
#include "tests/provider/Indications.h"

#include <set>

extern "C" {
CMPIIndicationMI* NetworkAdapterProvider_Create_IndicationMI(const CMPIBroker*, const CMPIContext*, CMPIStatus*);
}

namespace {

using namespace provider_test;
using marlo::test::Failure;
using scripted_agent::Event;
using testing::Contains;
using testing::IsEmpty;
using testing::Not;
using testing::SizeIs;

class EventNodes : public Indications {
  protected:
    /** An event whose path selects a node of its own. */
    static Event event(std::size_t number, unsigned int status) {
        const std::string text = std::to_string(number);
        scripted_agent::Node node{.path = "event " + text, .description = "eth" + text};
        node.texts[Orv::NodeLexicon::PROP_NODE_STRING] = "eth" + text;
        node.numbers[Orv::NodeLexicon::PROP_STATUS] = status;
        scripted_agent::script().nodes.push_back(node);
        return {0, {2026, 11, 21, 4, 15, 0, 0, 0}, node.path};
    }

    static std::string identifierOf(const marlo::Instance& instance) {
        return std::get<std::string>(get(instance, "IndicationIdentifier").data);
    }
};

TEST_F(EventNodes, BurstIsDeliveredWholeByAnAgentThatWaitsForEachEventToBePickedUp) {
    scripted_agent::script().recording = false;
    constexpr std::size_t COUNT = 10'000;
    std::vector<Event> events;
    std::set<std::string> expected;
    for (std::size_t i = 0; i < COUNT; ++i) {
        events.push_back(event(i, i % 2 == 0 ? 12 : 1));
        expected.insert("NetworkPort:eth" + std::to_string(i) + (i % 2 == 0 ? "Offline" : "Online"));
    }
    IndicationInterface provider(NetworkAdapterProvider_Create_IndicationMI, setup, *setup.real.handle(),
                                 AlertThreads::Mode::atOnce);
    provider.activateAll();
    provider.enable();
    scripted_agent::fire(events, scripted_agent::PickUp::awaited);
    provider.threads().waitForAll();
    const auto delivered = setup.platform.delivered();
    EXPECT_THAT(delivered, SizeIs(COUNT));
    std::set<std::string> seen;
    for (const auto& [nameSpace, instance] : delivered) {
        seen.insert(identifierOf(instance));
    }
    EXPECT_EQ(seen, expected);
}

TEST_F(EventNodes, MonitoringThatWasStartedTwiceDeliversOnce) {
    IndicationInterface provider(NetworkAdapterProvider_Create_IndicationMI, setup, *setup.real.handle(),
                                 AlertThreads::Mode::inTurn);
    provider.activate(INDICATION_CLASSES[0]);
    provider.activate(INDICATION_CLASSES[2]);
    ASSERT_THAT(scripted_agent::monitorings(), SizeIs(2));
    provider.enable();
    scripted_agent::fire({event(0, 1)});
    EXPECT_THAT(setup.platform.delivered(), SizeIs(1));
}

/** One event through a broker that fails. */
class EventFaults : public EventNodes {
  protected:
    EventFaults()
        : provider(NetworkAdapterProvider_Create_IndicationMI, setup, *setup.faulty.handle(),
                   AlertThreads::Mode::inTurn),
          one(event(0, 5)) {
        provider.activate(INDICATION_CLASSES[1]);
        provider.enable();
        setup.faulty.forgetCalls();
        fire();
        counts = setup.faulty.counts();
    }

    void fire() {
        scripted_agent::clearRecord();
        scripted_agent::fire({one});
    }

    static bool nothingLeftOpen() {
        const auto count = [](std::string_view text) {
            const std::vector<std::string> lines = scripted_agent::record();
            return std::count_if(lines.begin(), lines.end(),
                                 [&](const std::string& line) { return line.ends_with(text); });
        };
        return count(": Instrumentation()") == count(": ~Instrumentation()") &&
               scripted_agent::recorded("buffer()").size() == scripted_agent::recorded("~buffer()").size();
    }

    IndicationInterface provider;
    Event one;
    std::map<std::string, int> counts;
};

TEST_F(EventFaults, NthCallOfEverySlotFailsAndTheNextEventIsDelivered) {
    ASSERT_THAT(counts, SizeIs(16));
    EXPECT_THAT(setup.platform.delivered(), SizeIs(1));
    for (const auto& [slot, count] : counts) {
        for (int nth = 1; nth <= count; ++nth) {
            for (const Failure failure : {Failure::withStatus, Failure::silently}) {
                SCOPED_TRACE(slot + " " + std::to_string(nth));
                const std::size_t before = setup.platform.delivered().size();
                setup.faulty.failAt(slot, nth, failure);
                fire();
                EXPECT_TRUE(nothingLeftOpen());
                EXPECT_LE(setup.platform.delivered().size(), before + 1);
                setup.faulty.failNothing();
                const std::size_t since = setup.platform.delivered().size();
                fire();
                EXPECT_THAT(setup.platform.delivered(), SizeIs(since + 1));
            }
        }
    }
}

TEST_F(EventFaults, WhatASlotThrowsOnTheEventsThreadEndsThatThreadAlone) {
    // What the callback calls itself is thrown at the agent; the first call of each slot below is the thread's.
    for (const char* slot : {"newObjectPath", "newInstance", "instance.setProperty", "deliverIndication"}) {
        SCOPED_TRACE(slot);
        const std::size_t before = setup.platform.delivered().size();
        setup.faulty.failAt(slot, 1, Failure::throwing);
        testing::internal::CaptureStderr();
        fire();
        provider.threads().waitForAll();
        (void)testing::internal::GetCapturedStderr();
        EXPECT_TRUE(nothingLeftOpen());
        setup.faulty.failNothing();
        fire();
        EXPECT_THAT(setup.platform.delivered(), SizeIs(before + 1));
    }
}

TEST_F(EventFaults, ThreadsThatCannotBeHadLoseTheirEventsOnly) {
    setup.faulty.failAt("newThread", 0, Failure::silently);
    for (int i = 0; i < 3; ++i) {
        fire();
    }
    EXPECT_THAT(setup.platform.delivered(), SizeIs(1));
    EXPECT_THAT(normalised(scripted_agent::recorded("log 6000")),
                testing::ElementsAre(line("log", 6000, "Hearth.NetworkAdapterProvider", "NetworkIndication",
                                          "NetworkAdapterHandler",
                                          "MESSAGE [File: NetworkIndication, Line: N]: Error creating thread")));
    setup.faulty.failNothing();
    fire();
    EXPECT_THAT(setup.platform.delivered(), SizeIs(2));
}

TEST_F(EventFaults, StandardExceptionOfTheAgentLosesItsEventOnly) {
    for (const char* call : {"Instrumentation()", "selectNode", "getProperty", "getNodeDescription", "make_string",
                             "ResourceString", "Product::getUid"}) {
        SCOPED_TRACE(call);
        const std::size_t before = setup.platform.delivered().size();
        scripted_agent::failAt(call, 1, [] { throw std::runtime_error("the agent is gone"); });
        fire();
        EXPECT_TRUE(nothingLeftOpen());
        EXPECT_THAT(setup.platform.delivered(), SizeIs(before));
        EXPECT_THAT(normalised(scripted_agent::recorded("log 6000")), SizeIs(1));
        scripted_agent::script().before = nullptr;
        fire();
        EXPECT_THAT(setup.platform.delivered(), SizeIs(before + 1));
    }
}

} // namespace

/** Events while object managers activate, deactivate, enable and disable on several threads. */
#include "tests/provider/IndicationInterface.h"
#include "tests/provider/ProviderLibrary.h"
#include "tests/provider/Tree.h"

#include <atomic>
#include <thread>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace provider_test;

TEST(IndicationConcurrency, EventsMayComeWhileSubscriptionsChange) {
    scripted_agent::reset();
    scripted_agent::script().recording = false;
    // Paths that a std::string keeps within itself: the record is one for all threads, and an agent that does not
    // wait for events to be picked up writes it while they read.
    for (const unsigned int status : {1U, 5U, 12U, 32U, 33U, 34U}) {
        scripted_agent::Node node{.path = "e" + std::to_string(status), .description = "eth0"};
        node.texts[Orv::NodeLexicon::PROP_NODE_STRING] = "eth0";
        node.numbers[Orv::NodeLexicon::PROP_STATUS] = status;
        scripted_agent::script().nodes.push_back(node);
    }
    BrokerSetup setup;
    IndicationInterface provider(symbol<IndicationFactory>("NetworkAdapterProvider_Create_IndicationMI"), setup,
                                 *setup.real.handle(), AlertThreads::Mode::atOnce);
    for (int i = 0; i < 50; ++i) {
        provider.activateAll(); // far from one of each, with which disabling would end monitoring for good
    }
    provider.enable();
    std::atomic<bool> stop = false;
    std::vector<std::thread> threads;
    for (std::size_t number = 0; number < 3; ++number) {
        threads.emplace_back([&, number] {
            for (std::size_t i = number; !stop; ++i) {
                const std::string& className = INDICATION_CLASSES.at(i % INDICATION_CLASSES.size());
                EXPECT_EQ(provider.activate(className), CMPI_RC_OK);
                EXPECT_EQ(provider.deactivate(className), CMPI_RC_OK);
                provider.enable();
                if (i % 16 == 0) {
                    provider.disable();
                    provider.enable();
                }
            }
        });
    }
    std::vector<scripted_agent::Event> events;
    for (int i = 0; i < 500; ++i) {
        for (const char* path : {"e1", "e5", "e12", "e32", "e33", "e34", "nowhere"}) {
            events.push_back({i % 5 == 4 ? 1U : 0U, {2026, 11, 21, 4, 15, 0, 0, 0}, path});
        }
        if (events.size() > 100) {
            scripted_agent::fire(events);
            provider.threads().waitForAll();
            events.clear();
        }
    }
    stop = true;
    for (std::thread& thread : threads) {
        thread.join();
    }
    // Which events are delivered depends on who was first; whatever is delivered is whole.
    const auto delivered = setup.platform.delivered();
    EXPECT_THAT(delivered, testing::Not(testing::IsEmpty()));
    for (const auto& [nameSpace, instance] : delivered) {
        EXPECT_EQ(nameSpace, NAMESPACE);
        EXPECT_THAT(instance.properties, testing::SizeIs(18));
    }
}

} // namespace

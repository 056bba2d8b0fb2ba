/** What happens to real interfaces, in a namespace of the test's own, as a subscriber is told of it. */
#include "tests/provider/WholeChain.h"
#include "tests/support/Namespace.h"

#include <cstdlib>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace provider_test;
using Orv::Test::Namespace;
using testing::UnorderedElementsAre;

/** Adapter and event of each, such as "eth0 MARLO_NetworkAdapterOnlineEvent". */
std::vector<std::string> taken(WholeChain& chain, std::size_t count) {
    std::vector<std::string> events;
    for (const marlo::Instance& indication : chain.take(count)) {
        const std::string element = textOf(indication, "AlertingManagedElement");
        const std::size_t tag = element.find("Tag=\"") + 5;
        events.push_back(element.substr(tag, element.find('"', tag) - tag) + ' ' + indication.path.className);
    }
    return events;
}

/** Ends when the interface is up: the kernel announces a carrier some time after the command that brings it. */
void awaitUp(const Namespace& space, const std::string& interface) {
    space.shell("timeout 10 sh -c 'until ip -o link show " + interface +
                " | grep -q \"state UP\"; do sleep 0.01; done'");
}

const std::string ONLINE = " MARLO_NetworkAdapterOnlineEvent";
const std::string OFFLINE = " MARLO_NetworkAdapterOfflineEvent";

TEST(WholeChainOnTheKernel, CarrierAdministrationAndDeletionReachTheSubscriber) {
    REQUIRE_NAMESPACES();
    (void)::setenv("ORV_AGENT_BACKEND", "linux", 1);
    const Namespace space;
    space.ip("link add eth0 type veth peer name far0");
    space.ip("link set eth0 up");
    space.ip("link set far0 up");
    awaitUp(space, "eth0");
    awaitUp(space, "far0");
    std::unique_ptr<WholeChain> chain;
    space.run([&] { chain = std::make_unique<WholeChain>(); });
    EXPECT_THAT(taken(*chain, 0), testing::IsEmpty());
    space.ip("link set far0 down"); // the cable is pulled at the far end
    EXPECT_THAT(taken(*chain, 2), UnorderedElementsAre("far0" + OFFLINE, "eth0" + OFFLINE));
    space.ip("link set far0 up");
    // It is up before it has a carrier, and the kernel says so.
    EXPECT_THAT(taken(*chain, 3), UnorderedElementsAre("far0" + OFFLINE, "far0" + ONLINE, "eth0" + ONLINE));
    space.ip("link del eth0"); // and its peer with it
    EXPECT_THAT(taken(*chain, 2), UnorderedElementsAre("far0" + OFFLINE, "eth0" + OFFLINE));
    space.run([&] { chain.reset(); });
}

} // namespace

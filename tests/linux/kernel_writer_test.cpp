#include "agent/write/KernelWriter.h"
#include "tests/linux/KernelTables.h"
#include "tests/support/Namespace.h"

#include <memory>
#include <system_error>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <linux/capability.h>
#include <net/if.h>
#include <sys/syscall.h>
#include <unistd.h>

namespace Orv::Agent::Linux {
namespace {

using namespace Orv::Test;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

std::optional<Ipv4Prefixed> prefixed(const std::string& text) {
    const std::size_t slash = text.find('/');
    return Ipv4Prefixed{Ipv4Address::parse(text.substr(0, slash)).value(),
                        static_cast<std::uint8_t>(std::stoi(text.substr(slash + 1)))};
}

Ipv4Settings fixedAt(const std::string& address, const std::string& gateway = "") {
    return {AddressMode::fixed, prefixed(address), Ipv4Address::parse(gateway)};
}

/** Takes from the calling thread what it takes to change the network. */
void dropNetworkPrivilege() {
    __user_cap_header_struct header{_LINUX_CAPABILITY_VERSION_3, 0};
    __user_cap_data_struct data[2]{};
    ASSERT_EQ(syscall(SYS_capget, &header, data), 0);
    data[0].effective &= ~(1U << CAP_NET_ADMIN);
    ASSERT_EQ(syscall(SYS_capset, &header, data), 0);
}

class KernelWriterTest : public testing::Test {
  protected:
    void SetUp() override {
        REQUIRE_NAMESPACES();
        space = std::make_unique<Namespace>();
        space->ip("link add left type veth peer name right");
        space->ip("link set left up");
        space->ip("link set right up");
        space->run([this] {
            writer = std::make_unique<KernelWriter>();
            index = static_cast<int>(if_nametoindex("left"));
        });
    }

    void promoteSecondaries(bool on) const {
        space->shell(std::string("for i in all left; do echo ") + (on ? "1" : "0") +
                     " > /proc/sys/net/ipv4/conf/$i/promote_secondaries; done");
    }

    /** On the test's own thread, which is in another namespace. */
    void write(const Ipv4Settings& wanted, LiveIpv4::Leases leases = LiveIpv4::Leases::stay) const {
        writer->write(writer->read(index), wanted, leases);
    }

    void addAddresses(std::initializer_list<const char*> addresses) const {
        for (const char* address : addresses) {
            space->ip(std::string("addr add ") + address + " dev left");
        }
    }

    [[nodiscard]] Lines addresses() const { return addressLines(*space, "left"); }

    [[nodiscard]] Lines routes() const { return routeLines(*space, "left"); }

    std::unique_ptr<Namespace> space;
    std::unique_ptr<KernelWriter> writer;
    int index = 0;
};

/** With either setting of promote_secondaries the outcome is the same. */
class KernelWriterSecondariesTest : public KernelWriterTest, public testing::WithParamInterface<bool> {
  protected:
    void SetUp() override {
        KernelWriterTest::SetUp();
        if (space) {
            promoteSecondaries(GetParam());
        }
    }
};

TEST_F(KernelWriterTest, givesAnAddressToAnInterfaceThatHasNone) {
    write(fixedAt("192.0.2.10/24", "192.0.2.1"));
    EXPECT_THAT(addresses(), ElementsAre("192.0.2.10/24 brd 192.0.2.255"));
    EXPECT_THAT(routes(), ElementsAre("default via 192.0.2.1"));
}

TEST_F(KernelWriterTest, leavesEverythingWhereNothingIsToChange) {
    addAddresses({"192.0.2.10/24 brd +", "192.0.2.11/24"});
    space->ip("route add default via 192.0.2.1 dev left metric 7");
    const InterfaceTables before = writer->read(index);
    write(fixedAt("192.0.2.10/24", "192.0.2.1"));
    EXPECT_EQ(writer->read(index), before);
}

TEST_P(KernelWriterSecondariesTest, exchangesTheAddressWithinItsNetwork) {
    addAddresses({"192.0.2.10/24 brd +", "192.0.2.11/24 label left:1",
                  "192.0.2.12/24 valid_lft 3600 preferred_lft 1800", "198.51.100.1/24 brd +"});
    write(fixedAt("192.0.2.99/24"));
    EXPECT_THAT(addresses(), ElementsAre("192.0.2.99/24 brd 192.0.2.255", "198.51.100.1/24 brd 198.51.100.255",
                                         "192.0.2.11/24 secondary label left:1", "192.0.2.12/24 secondary dynamic"));
    EXPECT_THAT(space->ip("addr show dev left"), HasSubstr("preferred_lft 1800sec"));
}

TEST_P(KernelWriterSecondariesTest, exchangesTheAddressForOneOfAnotherNetwork) {
    addAddresses({"192.0.2.10/24 brd +", "192.0.2.11/24", "192.0.2.12/24"});
    write(fixedAt("203.0.113.5/28"));
    EXPECT_THAT(addresses(),
                ElementsAre("203.0.113.5/28 brd 203.0.113.15", "192.0.2.11/24", "192.0.2.12/24 secondary"));
}

TEST_P(KernelWriterSecondariesTest, makesASecondaryAddressTheFirst) {
    addAddresses({"192.0.2.10/24 brd +", "192.0.2.11/24", "192.0.2.12/24"});
    write(fixedAt("192.0.2.12/24"));
    EXPECT_THAT(addresses(), ElementsAre("192.0.2.12/24 brd 192.0.2.255", "192.0.2.11/24 secondary"));
}

TEST_P(KernelWriterSecondariesTest, removesTheAddressAndNoOther) {
    addAddresses({"192.0.2.10/24 brd +", "192.0.2.11/24", "198.51.100.1/24", "169.254.1.1/16 scope link"});
    write({AddressMode::leased, std::nullopt, std::nullopt});
    EXPECT_THAT(addresses(),
                testing::UnorderedElementsAre("192.0.2.11/24", "198.51.100.1/24", "169.254.1.1/16 link"));
}

INSTANTIATE_TEST_SUITE_P(Promoting, KernelWriterSecondariesTest, testing::Bool());

TEST_F(KernelWriterTest, putsTheNewAddressBeforeOthersThatWereThere) {
    addAddresses({"192.0.2.10/24", "198.51.100.1/24", "198.51.100.2/24", "169.254.1.1/16 scope link"});
    write(fixedAt("203.0.113.5/24"));
    const InterfaceTables tables = writer->read(index);
    EXPECT_EQ(tables.addresses.at(reportedAddress(tables).value()).local(),
              prefixed("203.0.113.5/24")->address.number);
    EXPECT_THAT(addresses(), testing::UnorderedElementsAre("203.0.113.5/24 brd 203.0.113.255", "198.51.100.1/24",
                                                           "198.51.100.2/24 secondary", "169.254.1.1/16 link"));
}

TEST_F(KernelWriterTest, changesTheMaskAlone) {
    addAddresses({"192.0.2.10/24 brd +"});
    space->ip("route add 10.0.0.0/8 via 192.0.2.9 dev left");
    write(fixedAt("192.0.2.10/28"));
    EXPECT_THAT(addresses(), ElementsAre("192.0.2.10/28 brd 192.0.2.15"));
    EXPECT_THAT(routes(), ElementsAre("10.0.0.0/8 via 192.0.2.9"));
    write(fixedAt("192.0.2.10/32"));
    EXPECT_THAT(addresses(), ElementsAre("192.0.2.10/32"));
}

TEST_F(KernelWriterTest, keepsAPointToPointAddressBesideTheNewOne) {
    addAddresses({"192.0.2.10/24", "198.51.100.1 peer 198.51.100.2/32"});
    write(fixedAt("192.0.2.20/24"));
    EXPECT_THAT(addresses(), ElementsAre("192.0.2.20/24 brd 192.0.2.255", "198.51.100.1/32 peer 198.51.100.2"));
}

TEST_F(KernelWriterTest, hasALeasedAddressStayForGoodInPlace) {
    addAddresses({"192.0.2.10/24 brd + valid_lft 3600 preferred_lft 3600"});
    space->ip("route add default via 192.0.2.1 dev left");
    write(fixedAt("192.0.2.10/24", "192.0.2.1"));
    EXPECT_THAT(addresses(), ElementsAre("192.0.2.10/24 brd 192.0.2.255"));
    EXPECT_THAT(routes(), ElementsAre("default via 192.0.2.1"));
}

TEST_F(KernelWriterTest, putsBackTheRoutesThatGoWithTheAddress) {
    addAddresses({"192.0.2.10/24"});
    space->ip("route add default via 192.0.2.1 dev left src 192.0.2.10 metric 50 mtu 1400");
    space->ip("route add 10.0.0.0/8 via 192.0.2.2 dev left proto static");
    space->ip("route add 10.1.0.0/16 dev left src 192.0.2.10 table 100");
    space->ip("route add blackhole 10.9.0.0/16");
    write(fixedAt("192.0.2.20/24", "192.0.2.1"));
    EXPECT_THAT(routes(), ElementsAre("10.0.0.0/8 via 192.0.2.2 proto static", "10.1.0.0/16 src 192.0.2.20 table 100",
                                      "default via 192.0.2.1 src 192.0.2.20 metric 50 mtu 1400"));
    EXPECT_THAT(space->ip("route"), HasSubstr("blackhole 10.9.0.0/16"));
}

TEST_F(KernelWriterTest, putsBackARouteWhoseGatewayIsOutOfReachNow) {
    addAddresses({"192.0.2.10/24"});
    space->ip("route add 10.0.0.0/8 via 192.0.2.2 dev left src 192.0.2.10");
    write(fixedAt("198.51.100.10/24"));
    EXPECT_THAT(routes(), ElementsAre("10.0.0.0/8 via 192.0.2.2 src 198.51.100.10"));
}

TEST_F(KernelWriterTest, neverLosesTheDefaultRouteWhileItExchangesTheAddress) {
    addAddresses({"192.0.2.10/24"});
    space->ip("route add default via 192.0.2.1 dev left");
    space->shell("mount -t tmpfs tmpfs /mnt; { ip monitor route > /mnt/routes 2> /dev/null & echo $! > /mnt/pid; }; "
                 "sleep 0.2");
    write(fixedAt("192.0.2.20/24", "192.0.2.1"));
    space->ip("route add 10.99.0.0/16 dev left");
    const std::string seen =
        space->shell("until grep -q 10.99 /mnt/routes; do sleep 0.05; done; kill $(cat /mnt/pid); cat /mnt/routes");
    EXPECT_THAT(seen, HasSubstr("10.99.0.0/16"));
    EXPECT_THAT(seen, testing::Not(HasSubstr("default")));
    EXPECT_THAT(routes(), ElementsAre("10.99.0.0/16", "default via 192.0.2.1"));
}

TEST_F(KernelWriterTest, exchangesTheGatewayAndKeepsTheRestOfItsRoute) {
    addAddresses({"192.0.2.10/24"});
    space->ip("route add default via 192.0.2.1 dev left metric 50 mtu 1400 proto static");
    space->ip("route add default via 192.0.2.2 dev left metric 90");
    space->ip("route add default via 192.0.2.3 dev left table 100");
    write(fixedAt("192.0.2.10/24", "192.0.2.7"));
    EXPECT_THAT(routes(), ElementsAre("default via 192.0.2.2 metric 90", "default via 192.0.2.3 table 100",
                                      "default via 192.0.2.7 metric 50 proto static mtu 1400"));
}

TEST_F(KernelWriterTest, leavesTheDefaultRouteOfAnotherInterfaceOfTheSameMetric) {
    addAddresses({"192.0.2.10/24"});
    space->ip("addr add 198.51.100.10/24 dev right");
    space->ip("route add default via 198.51.100.1 dev right");
    write(fixedAt("192.0.2.10/24", "192.0.2.1"));
    EXPECT_THAT(routes(), ElementsAre("default via 192.0.2.1"));
    EXPECT_THAT(routeLines(*space, "right"), ElementsAre("default via 198.51.100.1"));
    write(fixedAt("192.0.2.10/24", "192.0.2.2"));
    EXPECT_THAT(routes(), ElementsAre("default via 192.0.2.2"));
    EXPECT_THAT(routeLines(*space, "right"), ElementsAre("default via 198.51.100.1"));
    write(fixedAt("192.0.2.10/24"));
    EXPECT_THAT(routes(), IsEmpty());
    EXPECT_THAT(routeLines(*space, "right"), ElementsAre("default via 198.51.100.1"));
}

TEST_F(KernelWriterTest, exchangesTheOwnGatewayOfARouteThroughSeveralInterfaces) {
    addAddresses({"192.0.2.10/24"});
    space->ip("addr add 198.51.100.10/24 dev right");
    space->ip("route add default nexthop via 198.51.100.1 dev right nexthop via 192.0.2.1 dev left");
    write(fixedAt("192.0.2.10/24", "192.0.2.7"));
    EXPECT_THAT(routes(), ElementsAre("default [right via 198.51.100.1] [left via 192.0.2.7]"));
}

TEST_F(KernelWriterTest, givesAGatewayToADefaultRouteThatHasNone) {
    addAddresses({"192.0.2.10/24"});
    space->ip("route add default dev left metric 5");
    write(fixedAt("192.0.2.10/24", "192.0.2.1"));
    EXPECT_THAT(routes(), ElementsAre("default via 192.0.2.1 metric 5"));
}

TEST_F(KernelWriterTest, doesNotTouchIpv6) {
    addIpv6(*space, "left", "2001:db8::1");
    space->ip("-6 route add default via 2001:db8::ff dev left");
    addAddresses({"192.0.2.10/24"});
    const std::string addressesBefore = ipv6Addresses(*space, "left");
    const std::string routesBefore = space->ip("-j -6 route show table all dev left");
    write(fixedAt("192.0.2.20/24", "192.0.2.1"));
    write({AddressMode::leased, std::nullopt, std::nullopt});
    EXPECT_EQ(ipv6Addresses(*space, "left"), addressesBefore);
    EXPECT_EQ(space->ip("-j -6 route show table all dev left"), routesBefore);
}

TEST_F(KernelWriterTest, restoresWhatWasThereBefore) {
    addAddresses({"192.0.2.10/24 brd +", "192.0.2.11/24 label left:1", "198.51.100.1 peer 198.51.100.2/32"});
    space->ip("route add default via 192.0.2.1 dev left src 192.0.2.11 metric 50");
    space->ip("route add 10.0.0.0/8 via 192.0.2.2 dev left");
    const InterfaceTables before = writer->read(index);
    for (const Ipv4Settings& wanted :
         {fixedAt("192.0.2.99/24", "192.0.2.9"), fixedAt("203.0.113.5/24", "203.0.113.1"), fixedAt("192.0.2.11/24"),
          Ipv4Settings{AddressMode::leased, std::nullopt, std::nullopt}}) {
        writer->write(before, wanted, LiveIpv4::Leases::stay);
        EXPECT_NE(writer->read(index), before);
        writer->restore(before);
        EXPECT_EQ(writer->read(index), before);
    }
}

TEST_F(KernelWriterTest, putsBackWhatAClientTookAway) {
    addAddresses({"192.0.2.10/24", "192.0.2.11/24"});
    space->ip("route add 10.0.0.0/8 via 192.0.2.2 dev left");
    const InterfaceTables before = writer->read(index);
    space->ip("addr flush dev left");
    writer->welcomeLease(before);
    EXPECT_THAT(addresses(), ElementsAre("192.0.2.10/24", "192.0.2.11/24 secondary"));
    EXPECT_THAT(routes(), ElementsAre("10.0.0.0/8 via 192.0.2.2"));
}

TEST_F(KernelWriterTest, hasALeaseStandForTheInterface) {
    addAddresses({"192.0.2.10/24", "203.0.113.1/24"});
    space->ip("route add 10.0.0.0/8 via 203.0.113.2 dev left src 203.0.113.1");
    const InterfaceTables before = writer->read(index);
    addAddresses({"192.0.2.50/24 brd + valid_lft 3600 preferred_lft 3600"});
    space->ip("route add default via 192.0.2.1 dev left");
    writer->welcomeLease(before);
    EXPECT_THAT(addresses(),
                ElementsAre("192.0.2.50/24 brd 192.0.2.255 dynamic", "203.0.113.1/24", "192.0.2.10/24 secondary"));
    EXPECT_THAT(routes(), ElementsAre("10.0.0.0/8 via 203.0.113.2 src 203.0.113.1", "default via 192.0.2.1"));
}

TEST_F(KernelWriterTest, leavesNoOtherLeaseWhereOneIsMadeToLast) {
    addAddresses({"192.0.2.10/24", "203.0.113.1/24", "192.0.2.50/24 valid_lft 3600 preferred_lft 3600"});
    write(fixedAt("192.0.2.10/24"), LiveIpv4::Leases::leave);
    EXPECT_THAT(addresses(), ElementsAre("192.0.2.10/24 brd 192.0.2.255", "203.0.113.1/24"));
}

/** The text and number of the failure of `work`. */
template <typename Work>
std::pair<int, std::string> failureOf(const Work& work) {
    try {
        work();
    } catch (const std::system_error& error) {
        return {error.code().value(), error.what()};
    }
    return {};
}

TEST_F(KernelWriterTest, saysWhatTheKernelRefusesAndWhy) {
    addAddresses({"192.0.2.10/24"});
    const InterfaceTables before = writer->read(index);
    space->ip("link set left down");
    const auto [error, text] = failureOf([&] { write(fixedAt("192.0.2.20/24", "192.0.2.1")); });
    EXPECT_EQ(error, ENETDOWN);
    EXPECT_THAT(text, HasSubstr("setting the gateway 192.0.2.1"));
    EXPECT_THAT(text, HasSubstr("Nexthop device is not up"));
    writer->restore(before);
    EXPECT_THAT(addresses(), ElementsAre("192.0.2.10/24"));
}

TEST_F(KernelWriterTest, saysThatTheInterfaceIsGone) {
    addAddresses({"192.0.2.10/24"});
    const InterfaceTables before = writer->read(index);
    space->ip("link del left");
    EXPECT_EQ(failureOf([&] { writer->write(before, fixedAt("192.0.2.20/24"), LiveIpv4::Leases::stay); }).first,
              ENODEV);
    EXPECT_EQ(failureOf([&] { (void)writer->read(index); }).first, ENODEV);
}

TEST_F(KernelWriterTest, changesNothingWithoutThePrivilege) {
    addAddresses({"192.0.2.10/24", "192.0.2.11/24"});
    const InterfaceTables before = writer->read(index);
    space->run([&] {
        dropNetworkPrivilege();
        EXPECT_EQ(failureOf([&] {
                      writer->write(before, fixedAt("192.0.2.20/24", "192.0.2.1"), LiveIpv4::Leases::stay);
                  }).first,
                  EPERM);
        writer->restore(before);
    });
    EXPECT_EQ(writer->read(index), before);
}

} // namespace
} // namespace Orv::Agent::Linux

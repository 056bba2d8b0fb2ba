#include "tests/linux/WriteFixture.h"

#include <nlohmann/json.hpp>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace Orv::Agent::Linux {
namespace {

using namespace Orv::Test;
using testing::AllOf;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::MatchesRegex;
using testing::Not;
using Json = nlohmann::json;

/** From the command line through object manager, provider and agent to the kernel, and back. */
class MarloWriteTest : public WriteFixture {
  protected:
    std::string marlo(const std::string& arguments) const {
        return space->shell(std::string(MARLO_EXECUTABLE) + " " + arguments);
    }

    /** What it prints and logs when it fails. */
    [[nodiscard]] std::string failureOfMarlo(const std::string& arguments) const {
        return space->shell("! " + std::string(MARLO_EXECUTABLE) + " " + arguments);
    }

    /** The adapter's instance of the configuration class. */
    [[nodiscard]] Json instance() const {
        const Json all = Json::parse(marlo("enum MARLO_NetworkAdapterConfiguration --json"));
        EXPECT_EQ(all.size(), 1U) << all.dump();
        return all.at(0);
    }
};

TEST_F(MarloWriteTest, goesToDhcpAndBackThroughTheObjectManager) {
    startServer();
    marlo("dhcp left");
    EXPECT_THAT(addresses(), ElementsAre(MatchesRegex("198\\.51\\.100\\.[56][0-9]/24 brd 198.51.100.255 dynamic")));
    EXPECT_THAT(clients(), HasSubstr("dhclient"));
    EXPECT_THAT(instance().dump(), AllOf(HasSubstr("\"DHCPEnabled\":true"), HasSubstr("\"198.51.100.1\"")));
    marlo("static left 203.0.113.5/25 --gateway 203.0.113.1");
    EXPECT_THAT(addresses(), ElementsAre("203.0.113.5/25 brd 203.0.113.127"));
    EXPECT_THAT(routes(), ElementsAre("default via 203.0.113.1"));
    EXPECT_THAT(clients(), IsEmpty());
    const Json properties = instance()["properties"];
    EXPECT_EQ(properties["DHCPEnabled"], false);
    EXPECT_EQ(properties["IPAddress"].at(0), "203.0.113.5");
    EXPECT_EQ(properties["IPSubnet"], Json::array({"255.255.255.128"}));
    EXPECT_EQ(properties["DefaultIPGateway"], Json::array({"203.0.113.1"}));
    marlo("dhcp left");
    EXPECT_THAT(addresses(), ElementsAre(HasSubstr("dynamic")));
    EXPECT_THAT(interfaces(), AllOf(HasSubstr("iface left inet dhcp"), Not(HasSubstr("203.0.113"))));
}

TEST_F(MarloWriteTest, changesEveryPropertyThatCanBeChanged) {
    marlo("set left IPv4Address=192.0.2.40 SubnetMask=255.255.255.128 DefaultIPGateway=192.0.2.2 "
          "DNSDomain=example.net");
    marlo("dns left --server 192.0.2.99,192.0.2.98 --search example.org,example.com");
    EXPECT_THAT(addresses(), ElementsAre("192.0.2.40/25 brd 192.0.2.127"));
    EXPECT_THAT(routes(), ElementsAre("default via 192.0.2.2"));
    EXPECT_THAT(read("/etc/resolv.conf"), AllOf(HasSubstr("# by hand"), HasSubstr("nameserver 192.0.2.99\n"),
                                                HasSubstr("search example.org example.com")));
    const Lines live = addresses();
    boot();
    EXPECT_EQ(addresses(), live);
    EXPECT_THAT(routes(), ElementsAre("default via 192.0.2.2"));
}

TEST_F(MarloWriteTest, showsWhyAChangeIsRefused) {
    EXPECT_THAT(failureOfMarlo("gateway left 198.51.100.1"), AllOf(HasSubstr("left"), HasSubstr("198.51.100.1")));
    EXPECT_THAT(failureOfMarlo("static left 192.0.2.255/24"), HasSubstr("192.0.2.255"));
    EXPECT_THAT(addresses(), ElementsAre("192.0.2.10/24 brd 192.0.2.255"));
    EXPECT_THAT(routes(), ElementsAre("default via 192.0.2.1"));
}

} // namespace
} // namespace Orv::Agent::Linux

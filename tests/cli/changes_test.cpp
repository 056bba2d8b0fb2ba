/** The commands that change adapters, on a described host: what they write, what they print, how they fail. */
#include "tests/cli/Marlo.h"
#include "tests/support/Namespace.h"

#include <fstream>
#include <sstream>

#include <gmock/gmock.h>
#include <sys/mount.h>
#include <sys/stat.h>

namespace marlo::test {
namespace {

using nlohmann::ordered_json;
using testing::ElementsAre;
using testing::EndsWith;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;
using testing::StartsWith;

class MarloChanges : public MarloTest {
  protected:
    [[nodiscard]] std::string treeText() const {
        std::ifstream stream(tree());
        std::ostringstream text;
        text << stream.rdbuf();
        return text.str();
    }

    /** The properties of an adapter as they are read by another marlo. */
    [[nodiscard]] ordered_json read(const std::string& adapter) const {
        return marloJson({"get", "MARLO_NetworkAdapterConfiguration.SettingID=\"" + adapter + "\""})[0]["properties"];
    }

    /** A change with --json, which prints one object. */
    [[nodiscard]] ordered_json changeJson(std::vector<std::string> arguments) const {
        arguments.emplace_back("--json");
        const Outcome outcome = marlo(arguments);
        EXPECT_EQ(outcome.exitCode, 0) << outcome.err;
        EXPECT_EQ(outcome.err, "");
        return ordered_json::parse(outcome.out);
    }

    /** Nothing is printed, nothing is changed, the reason is said. */
    void expectRefusal(const std::vector<std::string>& arguments, int exitCode, const std::string& message) const {
        const std::string before = treeText();
        const Outcome outcome = marlo(arguments);
        EXPECT_EQ(outcome.exitCode, exitCode) << arguments.front();
        EXPECT_THAT(outcome.err, HasSubstr("marlo: " + message)) << arguments.front();
        EXPECT_EQ(outcome.out, "") << arguments.front();
        EXPECT_EQ(treeText(), before) << arguments.front();
    }
};

TEST_F(MarloChanges, StaticSetsAddressMaskAndGatewayAndShowsBeforeAndAfter) {
    const Outcome outcome = marlo({"static", "eth0", "192.0.2.20/25", "--gateway", "192.0.2.1"});
    EXPECT_EQ(outcome.exitCode, 0);
    EXPECT_EQ(outcome.err, "");
    EXPECT_EQ(outcome.out, "ADAPTER  PROPERTY          BEFORE         AFTER\n"
                           "eth0     IPAddress         198.51.100.23  192.0.2.20\n"
                           "eth0     IPSubnet          255.255.254.0  255.255.255.128\n"
                           "eth0     DHCPEnabled       yes            no\n"
                           "eth0     DefaultIPGateway  198.51.100.1   192.0.2.1\n");
    EXPECT_EQ(read("eth0")["IPAddress"], ordered_json::array({"192.0.2.20"}));
    EXPECT_EQ(read("eth0")["IPSubnet"], ordered_json::array({"255.255.255.128"}));
}

TEST_F(MarloChanges, StaticTakesAMaskInThePlaceOfAPrefixLengthAndKeepsTheOneInForceWithoutEither) {
    EXPECT_EQ(marlo({"static", "eth1", "192.0.2.30", "--mask", "255.255.0.0"}).exitCode, 0);
    EXPECT_EQ(read("eth1")["IPSubnet"], ordered_json::array({"255.255.0.0"}));
    EXPECT_EQ(marlo({"static", "eth1", "192.0.2.31"}).exitCode, 0);
    EXPECT_EQ(read("eth1")["IPAddress"], ordered_json::array({"192.0.2.31"}));
    EXPECT_EQ(read("eth1")["IPSubnet"], ordered_json::array({"255.255.0.0"}));
}

TEST_F(MarloChanges, DhcpAndBack) {
    const Outcome outcome = marlo({"dhcp", "eth1"});
    EXPECT_EQ(outcome.exitCode, 0) << outcome.err;
    EXPECT_THAT(outcome.out, HasSubstr("eth1     DHCPEnabled  no               yes\n"));
    EXPECT_EQ(read("eth1")["DHCPEnabled"], true);
    EXPECT_EQ(marlo({"static", "eth1", "203.0.113.7/25"}).exitCode, 0);
    EXPECT_EQ(read("eth1")["DHCPEnabled"], false);
}

TEST_F(MarloChanges, GatewayIsSet) {
    const Outcome outcome = marlo({"gateway", "bond0", "192.0.2.2"});
    EXPECT_EQ(outcome.exitCode, 0) << outcome.err;
    EXPECT_EQ(outcome.out, "ADAPTER  PROPERTY          BEFORE     AFTER\n"
                           "bond0    DefaultIPGateway  192.0.2.1  192.0.2.2\n");
}

TEST_F(MarloChanges, NameServersAndSuffixesAreTheFirstAdaptersAndTheDomainTheNamedOnes) {
    const Outcome outcome = marlo({"dns", "eth0", "--server", "192.0.2.54,192.0.2.55", "--server", "192.0.2.56",
                                   "--search", "example.net", "--domain", "example.com"});
    EXPECT_EQ(outcome.exitCode, 0) << outcome.err;
    EXPECT_EQ(outcome.out, "ADAPTER  PROPERTY                    BEFORE            AFTER\n"
                           "bond0    DNSDomainSuffixSearchOrder  lab.example.org   example.net\n"
                           "                                     example.org\n"
                           "bond0    DNSServerSearchOrder        192.0.2.53        192.0.2.54\n"
                           "                                     2001:db8:0:2::53  192.0.2.55\n"
                           "                                                       192.0.2.56\n"
                           "eth0     DNSDomain                   -                 example.com\n");
}

TEST_F(MarloChanges, SetWritesProperties) {
    const Outcome outcome = marlo({"set", "bond0", "ipv4address=192.0.2.11", "SubnetMask=255.255.255.128",
                                   "DefaultIPGateway=192.0.2.3,192.0.2.4", "DNSDomain=example.com"});
    EXPECT_EQ(outcome.exitCode, 0) << outcome.err;
    EXPECT_EQ(outcome.err, "");
    EXPECT_THAT(outcome.out, StartsWith("ADAPTER  PROPERTY"));
    EXPECT_EQ(read("bond0")["IPAddress"][0], "192.0.2.11");
    EXPECT_EQ(read("bond0")["IPSubnet"], ordered_json::array({"255.255.255.128"}));
    EXPECT_EQ(read("bond0")["DefaultIPGateway"], ordered_json::array({"192.0.2.3"}));
    EXPECT_EQ(read("bond0")["DNSDomain"], "example.com");
}

TEST_F(MarloChanges, SetOfAnAddressAloneSucceeds) {
    // The provider answers the status of its last reading, of a domain that this change does not have.
    const Outcome outcome = marlo({"set", "eth1", "IPv4Address=203.0.113.8"});
    EXPECT_EQ(outcome.exitCode, 0) << outcome.err;
    EXPECT_THAT(outcome.out, HasSubstr("203.0.113.7  203.0.113.8\n"));
}

TEST_F(MarloChanges, InvokeCallsAMethodAndShowsItsResult) {
    const Outcome outcome = marlo({"invoke", "eth1", "enablestatic", "IPAddress=203.0.113.9",
                                   "IPAddress=203.0.113.10", "SubnetMask=255.255.255.128,255.0.0.0"});
    EXPECT_EQ(outcome.exitCode, 0) << outcome.err;
    EXPECT_EQ(outcome.out, "enablestatic = 0\n"
                           "ADAPTER  PROPERTY   BEFORE       AFTER\n"
                           "eth1     IPAddress  203.0.113.7  203.0.113.9\n");
}

TEST_F(MarloChanges, AreJsonOfCallsAndChanges) {
    const ordered_json json = changeJson({"static", "eth1", "203.0.113.9/25", "--gateway", "203.0.113.1"});
    EXPECT_EQ(json["calls"], ordered_json::parse(R"([{"call": "EnableStatic", "returned": 0, "out": {}},
                                                     {"call": "SetGateways", "returned": 0, "out": {}}])"));
    EXPECT_EQ(json["changes"],
              ordered_json::parse(R"([{"adapter": "eth1", "property": "IPAddress", "before": ["203.0.113.7"],
                                       "after": ["203.0.113.9"]},
                                      {"adapter": "eth1", "property": "DefaultIPGateway", "before": null,
                                       "after": ["203.0.113.1"]}])"));
    EXPECT_EQ(changeJson({"set", "eth1", "DNSDomain=example.com"})["calls"],
              ordered_json::parse(R"([{"call": "ModifyInstance"}])"));
}

TEST_F(MarloChanges, SayWhenNothingHasChanged) {
    const Outcome outcome = marlo({"gateway", "bond0", "192.0.2.1"});
    EXPECT_EQ(outcome.exitCode, 0);
    EXPECT_EQ(outcome.out, "");
    EXPECT_EQ(outcome.err, "marlo: nothing has changed\n");
    EXPECT_EQ(changeJson({"gateway", "bond0", "192.0.2.1"})["changes"], ordered_json::array());
}

TEST_F(MarloChanges, RefuseAnAdapterThatIsNotThereAndNameThoseThatAre) {
    for (const std::vector<std::string>& arguments : {std::vector<std::string>{"dhcp", "eth9"},
                                                      {"static", "eth9", "192.0.2.9/24"},
                                                      {"gateway", "eth9", "192.0.2.1"},
                                                      {"dns", "eth9", "--domain", "example.com"},
                                                      {"set", "eth9", "DNSDomain=example.com"},
                                                      {"invoke", "eth9", "SetDNSDomain", "DNSDomain=example.com"}}) {
        expectRefusal(arguments, 1, "there is no network adapter \"eth9\"; there are bond0, eth0, eth1, eth2\n");
    }
    const std::string empty = write("empty.toml", "");
    EXPECT_EQ(marlo({"dhcp", "eth0", "--tree", empty}).err,
              "marlo: there is no network adapter \"eth0\"; there are none\n");
}

TEST_F(MarloChanges, FailWithTheReasonThatTheAgentLogged) {
    const Outcome outcome = marlo({"gateway", "bond0", "203.0.113.200"});
    EXPECT_EQ(outcome.exitCode, 1);
    EXPECT_EQ(outcome.out, "");
    EXPECT_THAT(outcome.err, StartsWith("marlo: bond0: DefaultIPGateway cannot be set to \"203.0.113.200\": "));
    EXPECT_THAT(outcome.err, HasSubstr("]: Caught Exception\n"));
    EXPECT_THAT(outcome.err, EndsWith("marlo: SetGateways failed: CIM_ERR_FAILED (1)\n"));
}

TEST_F(MarloChanges, ModificationThatFailsIsAFailureThoughTheProviderAnswersNoError) {
    const Outcome outcome = marlo({"set", "bond0", "DefaultIPGateway=203.0.113.200"});
    EXPECT_EQ(outcome.exitCode, 1);
    EXPECT_THAT(outcome.err, HasSubstr("marlo: bond0: DefaultIPGateway cannot be set to \"203.0.113.200\": "));
    EXPECT_THAT(outcome.err, EndsWith("marlo: ModifyInstance failed: CIM_ERR_FAILED (1)\n"));
    EXPECT_EQ(read("bond0")["DefaultIPGateway"], ordered_json::array({"192.0.2.1"}));
}

TEST_F(MarloChanges, EndAtTheFirstStepThatFailsAndShowWhatHasChangedUntilThen) {
    const Outcome outcome = marlo({"static", "eth1", "203.0.113.9/25", "--gateway", "192.0.2.1", "--json"});
    EXPECT_EQ(outcome.exitCode, 1);
    const ordered_json json = ordered_json::parse(outcome.out);
    ASSERT_EQ(json["calls"].size(), 2U);
    EXPECT_EQ(json["calls"][1]["call"], "SetGateways");
    EXPECT_EQ(json["calls"][1]["error"]["code"], 1);
    EXPECT_EQ(json["calls"][1]["error"]["name"], "CIM_ERR_FAILED");
    EXPECT_THAT(json["calls"][1]["error"]["message"], HasSubstr("DefaultIPGateway cannot be set"));
    EXPECT_THAT(json["calls"][1]["reported"][0], HasSubstr("DefaultIPGateway cannot be set"));
    ASSERT_EQ(json["changes"].size(), 1U);
    EXPECT_EQ(json["changes"][0]["property"], "IPAddress");
    const Outcome dns = marlo({"dns", "eth0", "--server", "nonsense", "--domain", "example.com"});
    EXPECT_EQ(dns.exitCode, 1);
    EXPECT_FALSE(read("eth0").contains("DNSDomain")) << "the domain is not set after the servers have failed";
}

TEST_F(MarloChanges, RefuseWhatTheSchemaDoesNotHaveWithItsStatus) {
    expectRefusal({"invoke", "eth0", "Explode"}, 1, "Explode failed: CIM_ERR_METHOD_NOT_FOUND (17): ");
    expectRefusal({"invoke", "eth0", "EnableStatic", "Address=192.0.2.1"}, 1,
                  "EnableStatic failed: CIM_ERR_INVALID_PARAMETER (4): EnableStatic takes no parameter 'Address'");
    expectRefusal({"set", "eth0", "Colour=blue"}, 1, "ModifyInstance failed: CIM_ERR_NO_SUCH_PROPERTY (12): ");
    expectRefusal({"set", "eth0", "MACAddress=02:00:00:00:00:01"}, 1,
                  "ModifyInstance failed: CIM_ERR_INVALID_PARAMETER (4): "
                  "MARLO_NetworkAdapterConfiguration.MACAddress cannot be changed");
    expectRefusal({"set", "eth0", "SettingID=eth1"}, 1, "ModifyInstance failed: CIM_ERR_INVALID_PARAMETER (4): ");
    expectRefusal({"dhcp", "eth0", "-n", "root/nothing"}, 1, "CIM_ERR_INVALID_NAMESPACE (3): ");
}

TEST_F(MarloChanges, RefuseACommandLineThatIsWrongBeforeAnythingIsChanged) {
    expectRefusal({"static", "eth0", "192.0.2.300/24"}, 2, "no IPv4 address: \"192.0.2.300\"");
    expectRefusal({"static", "eth0", "192.0.2.20/33"}, 2, "a prefix length is 1 to 32, not \"33\"");
    expectRefusal({"static", "eth0", "192.0.2.20/24x"}, 2, "a prefix length is 1 to 32, not \"24x\"");
    expectRefusal({"static", "eth0", "192.0.2.20/0"}, 2, "a prefix length is 1 to 32, not \"0\"");
    expectRefusal({"static", "eth0", "192.0.2.20/24", "--mask", "255.0.0.0"}, 2,
                  "both a prefix length and --mask are given");
    expectRefusal({"static", "eth0", "192.0.2.20/24", "--gateway", "x"}, 2, "no IPv4 address: \"x\"");
    expectRefusal({"dns", "eth0"}, 2, "one of --server, --search and --domain is required");
    expectRefusal({"dns", "eth0", "--server", ""}, 2, "--server is empty");
    expectRefusal({"set", "eth0"}, 2, "NAME=VALUE is required");
    expectRefusal({"set", "eth0", "DNSDomain"}, 2, "expected NAME=VALUE, found \"DNSDomain\"");
    expectRefusal({"set", "eth0", "=x"}, 2, "expected NAME=VALUE, found \"=x\"");
    expectRefusal({"set", "eth0", "DNSDomain=a", "dnsdomain=b"}, 2, "dnsdomain is given twice, and is no array");
    expectRefusal({"invoke", "eth0"}, 2, "METHOD is required");
    expectRefusal({"dhcp"}, 2, "ADAPTER is required");
    expectRefusal({"dhcp", ""}, 2, "ADAPTER is empty");
}

TEST_F(MarloChanges, RestartIsRefusedForAHostThatIsOnlyDescribed) {
    const std::string message =
        "RestartNetwork restarts the networking of this host, not of the one that a tree file";
    expectRefusal({"restart"}, 2, message);
    expectRefusal({"invoke", "eth0", "restartnetwork"}, 2, message);
    const Outcome outcome = runProgram({MARLO_EXECUTABLE, "restart", "--tree", tree()});
    EXPECT_EQ(outcome.exitCode, 2);
    EXPECT_THAT(outcome.err, HasSubstr(message));
}

TEST_F(MarloChanges, RestartRunsTheHostsScriptAndShowsItsAnswer) {
    REQUIRE_NAMESPACES();
    const std::string configuration = write("agent.toml", "back_end = \"file\"\ntree_file = \"" + tree() + "\"\n");
    const Orv::Test::Namespace space;
    Outcome outcome;
    std::string trail;
    space.run([&] {
        ASSERT_EQ(mount("tmpfs", "/etc/init.d", "tmpfs", 0, "mode=755"), 0);
        std::ofstream("/etc/init.d/network") << "#!/bin/sh\necho $* >/etc/init.d/trail\n";
        chmod("/etc/init.d/network", 0755);
        outcome = runProgram({MARLO_EXECUTABLE, "restart", "--agent-config", configuration});
        std::ifstream("/etc/init.d/trail") >> trail;
    });
    EXPECT_EQ(outcome.exitCode, 0) << outcome.err;
    EXPECT_EQ(outcome.out, "RestartNetwork = 0\n");
    EXPECT_EQ(outcome.err, "marlo: nothing has changed\n");
    EXPECT_EQ(trail, "restart");
}

TEST_F(MarloChanges, AdapterThatCannotBeReadIsNotChanged) {
    const std::string wrong = write("wrong.toml", "[[adapter]]\nidentity = 5\n");
    const Outcome outcome = marlo({"dhcp", "eth0", "--tree", wrong});
    EXPECT_EQ(outcome.exitCode, 1);
    EXPECT_THAT(outcome.err, HasSubstr("wrong.toml"));
}

TEST_F(MarloChanges, HelpTellsWhoseNameServiceItIs) {
    EXPECT_THAT(marlo({"dns", "--help"}).out, HasSubstr("set on its first adapter"));
    EXPECT_THAT(marlo({"restart", "--help"}).out, HasSubstr("Nobody is told how that"));
}

} // namespace
} // namespace marlo::test

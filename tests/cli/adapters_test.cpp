#include "tests/cli/Marlo.h"

#include <gmock/gmock.h>

namespace marlo::test {
namespace {

using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;

class MarloAdapters : public MarloTest {};

TEST_F(MarloAdapters, AreOneTable) {
    const Outcome outcome = marlo({"adapters"});
    EXPECT_EQ(outcome.exitCode, 0);
    EXPECT_EQ(outcome.err, "");
    EXPECT_EQ(
        outcome.out,
        "NAME   STATUS     MAC                ADDRESSES         MASK             GATEWAY       DHCP  DNS\n"
        "bond0  OK         02:00:5e:10:00:01  192.0.2.10        255.255.255.0    192.0.2.1     no    192.0.2.53\n"
        "                                     2001:db8:0:2::10                                       "
        "2001:db8:0:2::53\n"
        "eth0   OK         02:00:5e:10:00:02  198.51.100.23     255.255.254.0    198.51.100.1  yes   "
        "198.51.100.2\n"
        "eth1   Lost Comm  02:00:5e:10:00:03  203.0.113.7       255.255.255.128  -             no    -\n"
        "eth2   Stopped    02:00:5e:10:00:04  -                 -                -             no    -\n");
}

TEST_F(MarloAdapters, TakeTheirOptionsBeforeTheCommandToo) {
    const std::string other = write("other.toml", "[[adapter]]\nidentity = \"only0\"\n");
    EXPECT_THAT(marlo({"--tree", other, "adapters"}).out, HasSubstr("only0"));
    EXPECT_THAT(marlo({"adapters", "--tree", other}).out, HasSubstr("only0"));
}

TEST_F(MarloAdapters, FindATreeFileFromTheDirectoryTheyAreAskedIn) {
    write("here.toml", "[[adapter]]\nidentity = \"here0\"\n");
    EXPECT_THAT(marlo({"adapters", "--tree", "here.toml"}).out, HasSubstr("here0"));
}

TEST_F(MarloAdapters, HaveTheColumnsThatAreAskedFor) {
    const Outcome outcome = marlo({"adapters", "-p", "settingid,STATUS", "--property", "DNSDomain"});
    EXPECT_EQ(outcome.exitCode, 0);
    EXPECT_EQ(outcome.out, "NAME   STATUS     DNSDomain\n"
                           "bond0  OK         lab.example.org\n"
                           "eth0   OK         -\n"
                           "eth1   Lost Comm  -\n"
                           "eth2   Stopped    -\n");
}

TEST_F(MarloAdapters, AreJsonWithTheStatusBesideTheConfiguration) {
    const auto json = marloJson({"adapters"});
    ASSERT_EQ(json.size(), 4U);
    EXPECT_EQ(json[0]["path"], "root/tavis:MARLO_NetworkAdapterConfiguration.SettingID=\"bond0\"");
    EXPECT_EQ(json[0]["class"], "MARLO_NetworkAdapterConfiguration");
    EXPECT_EQ(json[0]["properties"]["Status"], "OK");
    EXPECT_EQ(json[0]["properties"]["IPAddress"], nlohmann::ordered_json::array({"192.0.2.10", "2001:db8:0:2::10"}));
    EXPECT_EQ(json[2]["properties"]["Status"], "Lost Comm");
    EXPECT_EQ(json[1]["properties"]["DHCPEnabled"], true);
}

TEST_F(MarloAdapters, AreJsonOfThePropertiesThatAreAskedFor) {
    const auto json = marloJson({"adapters", "-p", "Status"});
    ASSERT_EQ(json.size(), 4U);
    EXPECT_EQ(json[0]["properties"], (nlohmann::ordered_json{{"Status", "OK"}}));
}

TEST_F(MarloAdapters, AreJsonWithNULLForWhatIsAskedForAndTheyLack) {
    const auto json = marloJson({"adapters", "-p", "SettingID,dnsdomain,IPSubnet"});
    EXPECT_EQ(json[0]["properties"].dump(),
              R"({"SettingID":"bond0","IPSubnet":["255.255.255.0"],"DNSDomain":"lab.example.org"})");
    EXPECT_EQ(json[1]["properties"]["DNSDomain"], nullptr);
    EXPECT_TRUE(json[1]["properties"].contains("DNSDomain"));
}

TEST_F(MarloAdapters, TellWhetherTheyTakePartInIpWhereTheyHaveNoPort) {
    const std::string other = write("other.toml", "[[adapter]]\nidentity = \"up0\"\nip_support = 1\n"
                                                  "[[adapter]]\nidentity = \"down0\"\nip_support = 0\n"
                                                  "[[card]]\nname = \"c\"\n");
    const auto json = marloJson({"adapters", "-p", "SettingID,Status,IPEnabled", "--tree", other});
    ASSERT_EQ(json.size(), 2U);
    for (const auto& adapter : json) {
        const bool enabled = adapter["properties"]["IPEnabled"];
        EXPECT_EQ(adapter["properties"]["Status"], enabled ? "IP enabled" : "IP disabled");
    }
}

TEST_F(MarloAdapters, SayThatThereAreNone) {
    const std::string empty = write("empty.toml", "");
    const Outcome outcome = marlo({"adapters", "--tree", empty});
    EXPECT_EQ(outcome.exitCode, 0);
    EXPECT_EQ(outcome.out, "");
    EXPECT_EQ(outcome.err, "marlo: no network adapters\n");
    EXPECT_THAT(marloJson({"adapters", "--tree", empty}), IsEmpty());
}

TEST_F(MarloAdapters, AlignWideCharacters) {
    const std::string wide =
        write("wide.toml", "[[adapter]]\nidentity = \"網卡0\"\nmac_address = \"02:00:5e:10:00:01\"\n"
                           "[[adapter]]\nidentity = \"\xC3\xA4th0\"\n");
    const Outcome outcome = marlo({"adapters", "--tree", wide, "-p", "SettingID,DHCPEnabled"});
    EXPECT_EQ(outcome.exitCode, 0) << outcome.err;
    EXPECT_THAT(outcome.out, HasSubstr("\xC3\xA4th0   "));
    EXPECT_THAT(outcome.out, HasSubstr("網卡0  "));
}

TEST_F(MarloAdapters, AreNotColouredOutsideATerminal) {
    EXPECT_THAT(marlo({"adapters"}).out, Not(HasSubstr("\x1b")));
}

TEST_F(MarloAdapters, FitIntoTheTerminalWithColours) {
    // script(1) gives the program a terminal; its size is set by the shell that it runs.
    const Outcome outcome =
        runProgram({"script", "-qec", std::string("stty cols 76 && ") + MARLO_EXECUTABLE + " adapters", "/dev/null"},
                   {"ORV_AGENT_TREE=" + tree(), "TERM=xterm", "NO_COLOR="}, "", directory());
    ASSERT_EQ(outcome.exitCode, 0) << outcome.out << outcome.err;
    EXPECT_THAT(outcome.out, HasSubstr("\x1b[32mOK\x1b[0m"));
    std::size_t width = 0;
    bool inEscape = false;
    for (const char c : outcome.out) {
        width = c == '\n' || c == '\r' ? 0 : width + (inEscape || c == '\x1b' ? 0 : 1);
        inEscape = inEscape ? c != 'm' : c == '\x1b';
        EXPECT_LE(width, 76U);
    }
    const Outcome plain =
        runProgram({"script", "-qec", std::string("NO_COLOR=1 ") + MARLO_EXECUTABLE + " adapters", "/dev/null"},
                   {"ORV_AGENT_TREE=" + tree(), "TERM=xterm"}, "", directory());
    EXPECT_THAT(plain.out, Not(HasSubstr("\x1b")));
}

} // namespace
} // namespace marlo::test

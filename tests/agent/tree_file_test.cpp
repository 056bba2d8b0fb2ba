#include "agent/file/TreeFile.h"
#include "tests/agent/TemporaryFile.h"

#include <set>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace Orv::NodeLexicon;
using Orv::Agent::Node;
using Orv::Agent::parseTreeDescription;
using Orv::Agent::PropertyMap;
using Orv::Agent::readTreeFile;
using Orv::Agent::Tree;
using Orv::Test::messageOf;
using Orv::Test::TemporaryFile;
using testing::ElementsAre;
using testing::IsEmpty;

std::shared_ptr<const Tree> parse(const std::string& text) {
    return parseTreeDescription(text, "lab.toml").tree;
}

const Node& adapter(const Tree& tree, std::size_t index = 0) {
    return *tree.nodesOfType(NODE_NETWORK_ADAPTER).at(index);
}

const Node& parentOf(const Tree& tree, const Node& node) {
    const auto parent = tree.find(node.parentPath);
    if (parent == nullptr) {
        throw std::runtime_error("no parent: " + node.path);
    }
    return *parent;
}

std::string grandparent(const Tree& tree, std::size_t index) {
    return parentOf(tree, parentOf(tree, adapter(tree, index))).description;
}

TEST(TreeFile, OfNothingIsAHostWithoutAdapters) {
    const auto tree = parse("");
    ASSERT_EQ(tree->nodes().size(), 1U);
    EXPECT_EQ(tree->nodes()[0]->description, "Host");
    EXPECT_EQ(tree->nodes()[0]->parentPath, "");
    EXPECT_THAT(tree->nodesOfType(NODE_NETWORK_ADAPTER), IsEmpty());
}

TEST(TreeFile, DescribesEveryProperty) {
    const auto tree = parse(R"(
[[adapter]]
identity = "eth0"
description = "Uplink"
status = 1
dhcp = 3
ip_support = 2
ipv4_address = "192.0.2.1"
ipv4_subnet_mask = "255.255.255.0"
ipv6_address = "2001:db8::1"
default_gateway = "192.0.2.254"
dns_servers = ["192.0.2.53", "192.0.2.52"]
dns_suffixes = ["b.example", "a.example"]
dns_hostname = "lab"
dns_domain = "example.org"
mac_address = "02:00:00:00:00:01"
)");
    const PropertyMap expected{
        {PROP_NODE_STRING, std::string("eth0")},
        {PROP_STATUS, 1U},
        {PROP_DHCP_ENABLED, 3U},
        {PROP_IP_SUPPORT, 2U},
        {PROP_IPV4_ADDRESS, std::string("192.0.2.1")},
        {PROP_IPV4_SUBNET_MASK, std::string("255.255.255.0")},
        {PROP_IPV6_ADDRESS, std::string("2001:db8::1")},
        {PROP_DEFAULT_GATEWAY, std::string("192.0.2.254")},
        {PROP_DNS_SERVERS, std::vector<std::string>{"192.0.2.53", "192.0.2.52"}},
        {PROP_DNS_SUFFIXES, std::vector<std::string>{"b.example", "a.example"}},
        {PROP_DNS_HOSTNAME, std::string("lab")},
        {PROP_DNS_DOMAIN, std::string("example.org")},
        {PROP_MAC_ADDRESS, std::string("02:00:00:00:00:01")},
    };
    EXPECT_EQ(adapter(*tree).properties, expected);
    EXPECT_EQ(adapter(*tree).description, "Uplink");
}

TEST(TreeFile, LeavesOutWhatTheAdapterLeavesOut) {
    const auto tree = parse("[[adapter]]\n");
    EXPECT_THAT(adapter(*tree).properties, IsEmpty());
    EXPECT_EQ(adapter(*tree).description, "");
    EXPECT_EQ(grandparent(*tree, 0), "Chassis");
}

TEST(TreeFile, KeepsOddNumbers) {
    const auto tree = parse("[[adapter]]\nstatus = 65537\ndhcp = 0\n[[adapter]]\nstatus = 4294967295\n");
    EXPECT_EQ(adapter(*tree).properties, (PropertyMap{{PROP_STATUS, 65537U}, {PROP_DHCP_ENABLED, 0U}}));
    EXPECT_EQ(adapter(*tree, 1).properties, (PropertyMap{{PROP_STATUS, 4294967295U}}));
}

TEST(TreeFile, KeepsAnIdentityWithSpaces) {
    const auto tree = parse("[[adapter]]\nidentity = \" Local Area 1 \"\n");
    EXPECT_EQ(adapter(*tree).properties, (PropertyMap{{PROP_NODE_STRING, std::string(" Local Area 1 ")}}));
}

TEST(TreeFile, KeepsEmptyTextsAndLists) {
    const auto tree = parse("[[adapter]]\nipv4_address = \"\"\ndns_servers = []\n");
    EXPECT_EQ(adapter(*tree).properties,
              (PropertyMap{{PROP_IPV4_ADDRESS, std::string()}, {PROP_DNS_SERVERS, std::vector<std::string>()}}));
}

TEST(TreeFile, ReportsAdaptersInTheOrderOfTheFile) {
    const auto tree = parse("[[adapter]]\nidentity = \"eth2\"\n[[adapter]]\nidentity = \"eth10\"\n"
                            "[[adapter]]\nidentity = \"eth1\"\n");
    EXPECT_EQ(adapter(*tree, 0).description, "eth2");
    EXPECT_EQ(adapter(*tree, 1).description, "eth10");
    EXPECT_EQ(adapter(*tree, 2).description, "eth1");
}

TEST(TreeFile, GivesEveryNodeAPathOfItsOwn) {
    const auto tree = parse("[[adapter]]\nidentity = \"eth0\"\n[[adapter]]\nidentity = \"eth0\"\n"
                            "[[adapter]]\n[[adapter]]\n[[adapter]]\nidentity = \"eth0#2\"\n"
                            "[[adapter]]\nidentity = \"eth0\"\n[[adapter]]\nidentity = \"\"\n");
    ASSERT_EQ(tree->nodesOfType(NODE_NETWORK_ADAPTER).size(), 7U);
    std::set<std::string> paths;
    for (const auto& node : tree->nodes()) {
        EXPECT_TRUE(paths.insert(node->path).second) << node->path;
    }
}

TEST(TreeFile, PutsAdaptersBelowDevicesBelowChassisBelowTheHost) {
    const auto tree = parse("[host]\ndescription = \"lab\"\n"
                            "[[adapter]]\nidentity = \"eth0\"\ndevice = \"Card\"\nchassis = \"Box\"\n");
    const Node& device = parentOf(*tree, adapter(*tree));
    const Node& chassis = parentOf(*tree, device);
    const Node& host = parentOf(*tree, chassis);
    EXPECT_EQ(device.description, "Card");
    EXPECT_EQ(chassis.description, "Box");
    EXPECT_EQ(host.description, "lab");
    EXPECT_EQ(host.parentPath, "");
    EXPECT_FALSE(device.type || chassis.type || host.type);
}

TEST(TreeFile, TellsTheManagementControllerByItsExactName) {
    const auto tree = parse("[[adapter]]\nchassis = \"BMC\"\n[[adapter]]\nchassis = \"bmc\"\n[[adapter]]\n");
    EXPECT_EQ(grandparent(*tree, 0), "BMC");
    EXPECT_EQ(grandparent(*tree, 1), "bmc");
    EXPECT_EQ(grandparent(*tree, 2), "Chassis");
}

TEST(TreeFile, SharesADeviceWithinAChassisOnly) {
    const auto tree = parse("[[adapter]]\ndevice = \"Card\"\n[[adapter]]\ndevice = \"Card\"\n"
                            "[[adapter]]\ndevice = \"Card\"\nchassis = \"Other\"\n[[adapter]]\n[[adapter]]\n");
    EXPECT_EQ(adapter(*tree, 0).parentPath, adapter(*tree, 1).parentPath);
    EXPECT_NE(adapter(*tree, 0).parentPath, adapter(*tree, 2).parentPath);
    EXPECT_EQ(grandparent(*tree, 2), "Other");
    EXPECT_NE(adapter(*tree, 3).parentPath, adapter(*tree, 4).parentPath);
}

TEST(TreeFile, CleansItsTexts) {
    const auto tree = parse("[[adapter]]\nidentity = \"eth\\u0007 0\\u007F\"\ndescription = \"a\\nb\\u0085c\"\n"
                            "device = \"d\\te\"\ndns_suffixes = [\"x\\u0000y\"]\n");
    EXPECT_EQ(adapter(*tree).properties, (PropertyMap{{PROP_NODE_STRING, std::string("eth  0 ")},
                                                      {PROP_DNS_SUFFIXES, std::vector<std::string>{"x y"}}}));
    EXPECT_EQ(adapter(*tree).description, "a b c");
    EXPECT_EQ(parentOf(*tree, adapter(*tree)).description, "d e");
}

struct Refused {
    const char* what;
    const char* content;
    const char* message;
};

class RefusedTreeFile : public testing::TestWithParam<Refused> {};

TEST_P(RefusedTreeFile, NamesFileLineKeyAndReason) {
    EXPECT_EQ(messageOf([] { parse(GetParam().content); }), GetParam().message);
}

INSTANTIATE_TEST_SUITE_P(
    Files, RefusedTreeFile,
    testing::Values(
        Refused{"UnknownKeyOfAnAdapter", "[[adapter]]\nidentity = \"a\"\ncolour = 3\n",
                "lab.toml:3: adapter.colour: unknown key"},
        Refused{"FirstOfTwoUnknownKeys", "[[adapter]]\nzebra = 1\nape = 2\n",
                "lab.toml:2: adapter.zebra: unknown key"},
        Refused{"KeyInAnotherCase", "[[adapter]]\nStatus = 1\n", "lab.toml:2: adapter.Status: unknown key"},
        Refused{"UnknownTable", "[[adapters]]\n", "lab.toml:1: adapters: unknown key"},
        Refused{"UnknownKeyAtTheTop", "# lab\nidentity = \"eth0\"\n", "lab.toml:2: identity: unknown key"},
        Refused{"UnknownKeyOfTheHost", "[host]\nname = \"x\"\n", "lab.toml:2: host.name: unknown key"},
        Refused{"UnknownKeyOfAPort", "[[port]]\nipv4_address = \"x\"\n",
                "lab.toml:2: port.ipv4_address: unknown key"},
        Refused{"UnknownKeyOfACard", "[[card]]\nname = \"x\"\nmac_address = \"x\"\n",
                "lab.toml:3: card.mac_address: unknown key"},
        Refused{"StatusOfAnotherType", "[[adapter]]\nstatus = \"up\"\n",
                "lab.toml:2: adapter.status: expected an integer from 0 to 4294967295, found a string"},
        Refused{
            "StatusWithAFraction", "[[adapter]]\nstatus = 1.0\n",
            "lab.toml:2: adapter.status: expected an integer from 0 to 4294967295, found a floating-point number"},
        Refused{"NegativeStatus", "[[adapter]]\nstatus = -1\n",
                "lab.toml:2: adapter.status: expected an integer from 0 to 4294967295, found -1"},
        Refused{"StatusPastTheHighest", "[[adapter]]\nstatus = 4294967296\n",
                "lab.toml:2: adapter.status: expected an integer from 0 to 4294967295, found 4294967296"},
        Refused{"DhcpAsATruth", "[[adapter]]\ndhcp = true\n",
                "lab.toml:2: adapter.dhcp: expected an integer from 0 to 4294967295, found a boolean"},
        Refused{"AddressOfAnotherType", "[[adapter]]\n\nipv4_address = 192\n",
                "lab.toml:3: adapter.ipv4_address: expected a string, found an integer"},
        Refused{"AddressesAsAList", "[[adapter]]\nipv6_address = [\"a\"]\n",
                "lab.toml:2: adapter.ipv6_address: expected a string, found a list"},
        Refused{"DateForAText", "[[adapter]]\ndns_domain = 2026-01-01\n",
                "lab.toml:2: adapter.dns_domain: expected a string, found a date or time"},
        Refused{"ServersAsAText", "[[adapter]]\ndns_servers = \"a\"\n",
                "lab.toml:2: adapter.dns_servers: expected a list of strings, found a string"},
        Refused{"ServerOfAnotherType", "[[adapter]]\ndns_servers = [\n\"a\",\n1,\n]\n",
                "lab.toml:4: adapter.dns_servers: expected a list of strings, found an integer"},
        Refused{"AdapterAsATable", "[adapter]\nidentity = \"a\"\n",
                "lab.toml:1: adapter: expected [[adapter]] tables, found a table"},
        Refused{"AdapterAsAListOfTexts", "adapter = [\"eth0\"]\n",
                "lab.toml:1: adapter: expected [[adapter]] tables, found a string"},
        Refused{"HostAsAText", "host = \"lab\"\n", "lab.toml:1: host: expected a table, found a string"},
        Refused{"SpeedOfAnotherType", "[[port]]\nspeed = \"1G\"\n",
                "lab.toml:2: port.speed: expected an integer from 0 to 9223372036854775807, found a string"},
        Refused{"PortNumberPastTheHighest", "[[port]]\nport_number = 65536\n",
                "lab.toml:2: port.port_number: expected an integer from 0 to 65535, found 65536"},
        Refused{"DuplexAsANumber", "[[port]]\nfull_duplex = 1\n",
                "lab.toml:2: port.full_duplex: expected true or false, found an integer"},
        Refused{"PortOnACardThatIsNot", "[[card]]\nname = \"eth0\"\n[[port]]\nidentity = \"eth0\"\ncard = \"eth1\"\n",
                "lab.toml:5: port.card: no card is named \"eth1\""},
        Refused{"CardWithoutAName", "\n[[card]]\nstatus = \"OK\"\n", "lab.toml:2: card.name: a card needs a name"},
        Refused{"FaultInTheLastOfMany", "[[adapter]]\n[[adapter]]\n[[adapter]]\nstatus = \"x\"\n",
                "lab.toml:4: adapter.status: expected an integer from 0 to 4294967295, found a string"}),
    [](const auto& testCase) { return testCase.param.what; });

struct NotToml {
    const char* what;
    std::string content;
    int line;
};

class TreeFileThatIsNotToml : public testing::TestWithParam<NotToml> {};

TEST_P(TreeFileThatIsNotToml, IsRefusedWithTheLine) {
    const std::string message = messageOf([] { parse(GetParam().content); });
    const std::string start = "lab.toml:" + std::to_string(GetParam().line) + ": ";
    EXPECT_THAT(message, testing::StartsWith(start));
    EXPECT_GT(message.size(), start.size() + 10) << "there is a reason after the line";
}

INSTANTIATE_TEST_SUITE_P(Files, TreeFileThatIsNotToml,
                         testing::Values(NotToml{"NoValue", "[[adapter]]\nidentity =\n", 2},
                                         NotToml{"OpenString", "[[adapter]]\nidentity = \"eth0\n", 2},
                                         NotToml{"OpenBracket", "\n\n[[adapter\n", 3},
                                         NotToml{"KeyTwice", "[[adapter]]\nstatus = 1\nstatus = 5\n", 3},
                                         NotToml{"BadByte", "[[adapter]]\nidentity = \"a\xFF\"\n", 2},
                                         NotToml{"ControlByte", "[[adapter]]\nidentity = \"a\x01\"\n", 2},
                                         NotToml{"NumberPast64Bits", "[[adapter]]\nstatus = 18446744073709551616\n",
                                                 2},
                                         NotToml{"NotTextAtAll", std::string("\x7F\x45\x4C\x46\x02\x01", 6), 1}),
                         [](const auto& testCase) { return testCase.param.what; });

TEST(TreeFile, ThatIsMissingIsRefusedWithTheCause) {
    EXPECT_EQ(messageOf([] { readTreeFile("/nowhere/lab.toml"); }),
              "/nowhere/lab.toml: cannot be read: No such file or directory");
}

TEST(TreeFile, ThatIsADirectoryIsRefusedWithTheCause) {
    EXPECT_EQ(messageOf([] { readTreeFile("/tmp"); }), "/tmp: cannot be read: Is a directory");
}

TEST(TreeFile, ThatIsADeviceIsRefusedAtOnce) {
    EXPECT_EQ(messageOf([] { readTreeFile("/dev/zero"); }), "/dev/zero: cannot be read: Invalid argument");
}

TEST(TreeFile, IsReadWhole) {
    const TemporaryFile file("lab.toml", "[[adapter]]\nidentity = \"eth0\"\n");
    EXPECT_EQ(adapter(*readTreeFile(file.path()).tree).description, "eth0");
    file.write("[[adapter]]\nidentity = 5\n");
    EXPECT_EQ(messageOf([&] { readTreeFile(file.path()); }),
              file.path() + ":2: adapter.identity: expected a string, found an integer");
}

TEST(TreeFile, OfTheExamplesIsGood) {
    const auto tree = readTreeFile(MARLO_SOURCE_DIR "/docs/examples/lab.toml").tree;
    ASSERT_EQ(tree->nodesOfType(NODE_NETWORK_ADAPTER).size(), 5U);
    EXPECT_EQ(grandparent(*tree, 4), "BMC");
}

TEST(TreeFile, InItsReferenceIsGood) {
    const std::string reference = TemporaryFile::readFrom(MARLO_SOURCE_DIR "/docs/tree-file.md");
    const std::string heading = "## A full example\n\n```toml\n";
    const std::size_t start = reference.find(heading);
    ASSERT_NE(start, std::string::npos);
    const std::size_t text = start + heading.size();
    const auto description =
        parseTreeDescription(reference.substr(text, reference.find("```", text) - text), "example");
    EXPECT_EQ(description.tree->nodesOfType(NODE_NETWORK_ADAPTER).size(), 2U);
    EXPECT_EQ(description.hardware.ports.size(), 2U);
}

TEST(TreeFile, HoldsTenThousandAdapters) {
    std::string text;
    for (int i = 0; i < 10000; ++i) {
        text += "[[adapter]]\nidentity = \"eth" + std::to_string(i) + "\"\nstatus = " + std::to_string(i) + "\n";
    }
    const auto tree = parse(text);
    ASSERT_EQ(tree->nodesOfType(NODE_NETWORK_ADAPTER).size(), 10000U);
    EXPECT_EQ(tree->nodesOfType(NODE_NETWORK_PORT).size(), 10000U);
    EXPECT_EQ(adapter(*tree, 9999).properties,
              (PropertyMap{{PROP_NODE_STRING, std::string("eth9999")}, {PROP_STATUS, 9999U}}));
    EXPECT_EQ(grandparent(*tree, 5000), "Chassis");
}

TEST(TreeFile, HoldsTenThousandAdaptersWithoutIdentity) {
    std::string text;
    for (int i = 0; i < 10000; ++i) {
        text += "[[adapter]]\n";
    }
    EXPECT_EQ(parse(text)->nodesOfType(NODE_NETWORK_ADAPTER).size(), 10000U);
}

} // namespace

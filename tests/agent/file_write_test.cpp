#include "agent/change/ChangeError.h"
#include "agent/file/DescriptionEditor.h"
#include "agent/file/FileBackEnd.h"
#include "tests/agent/TemporaryFile.h"

#include <atomic>
#include <filesystem>
#include <thread>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

namespace {

using namespace Orv::NodeLexicon;
using Orv::Agent::BackEnd;
using Orv::Agent::ChangeError;
using Orv::Agent::editAdapter;
using Orv::Agent::makeFileBackEnd;
using Orv::Agent::Node;
using Orv::Agent::PropertyValue;
using Orv::Test::messageOf;
using Orv::Test::TemporaryFile;
using testing::HasSubstr;
using testing::StartsWith;

constexpr const char* commented = R"(# a lab
[host]
description = "lab" # not a real one

[[adapter]] # the uplink
  identity = "eth0" # named by hand
  dhcp = 3
  ipv4_address = "192.0.2.10"   # agreed with the neighbours
  ipv4_subnet_mask = "255.255.255.0"
  default_gateway = "192.0.2.1"
  dns_servers = [
    "192.0.2.53", # the first
    "192.0.2.54"
  ]

# the other one
[[adapter]]
identity = "eth1"
dhcp = 1
)";

struct FileWriteTest : testing::Test {
    void set(const std::string& adapter, Properties property, const PropertyValue& value) {
        backEnd->setProperty("a:" + adapter, property, value);
    }

    std::string failure(const std::string& adapter, Properties property, const PropertyValue& value) {
        return messageOf([&] { set(adapter, property, value); });
    }

    std::string text(const std::string& adapter, Properties property) {
        const auto node = backEnd->snapshot()->find("a:" + adapter);
        const auto found = node->properties.find(property);
        return found == node->properties.end() ? "absent" : std::get<std::string>(found->second);
    }

    /** The commented description with one piece of it replaced. */
    static std::string with(const std::string& before, const std::string& after) {
        std::string result = commented;
        result.replace(result.find(before), before.size(), after);
        return result;
    }

    TemporaryFile file{"lab.toml", commented};
    std::unique_ptr<BackEnd> backEnd = makeFileBackEnd(file.path());
};

TEST_F(FileWriteTest, ChangesTheValueAloneAndShowsItAtOnce) {
    set("eth0", PROP_IPV4_ADDRESS, std::string("192.0.2.77"));
    EXPECT_EQ(file.read(), with("\"192.0.2.10\"", "\"192.0.2.77\""));
    EXPECT_EQ(text("eth0", PROP_IPV4_ADDRESS), "192.0.2.77");
}

TEST_F(FileWriteTest, ReplacesAListOfSeveralLinesAndKeepsTheRest) {
    set("eth0", PROP_DNS_SERVERS, std::vector<std::string>{"2001:db8::53"});
    EXPECT_EQ(file.read(), with("[\n    \"192.0.2.53\", # the first\n    \"192.0.2.54\"\n  ]", "[\"2001:db8::53\"]"));
}

TEST_F(FileWriteTest, AddsAKeyBehindTheLastOfItsTable) {
    set("eth0", PROP_DNS_DOMAIN, std::string("example.org"));
    EXPECT_EQ(file.read(), with("  ]\n", "  ]\n  dns_domain = \"example.org\"\n"));
}

TEST_F(FileWriteTest, RemovesTheStaticConfigurationForDhcpButNoComment) {
    set("eth0", PROP_DHCP_ENABLED, 1U);
    std::string expected = with("dhcp = 3\n  ipv4_address = \"192.0.2.10\"   #", "dhcp = 1\n  #");
    const std::string gone = "  ipv4_subnet_mask = \"255.255.255.0\"\n  default_gateway = \"192.0.2.1\"\n";
    expected.erase(expected.find(gone), gone.size());
    EXPECT_EQ(file.read(), expected);
    EXPECT_EQ(text("eth0", PROP_IPV4_ADDRESS), "absent");
    EXPECT_EQ(text("eth0", PROP_DEFAULT_GATEWAY), "absent");
}

TEST_F(FileWriteTest, TakesMaskAndAddressInEitherRole) {
    set("eth1", PROP_DHCP_ENABLED, 3U);
    set("eth1", PROP_IPV4_ADDRESS, std::string("255.255.254.0"));
    EXPECT_EQ(text("eth1", PROP_IPV4_ADDRESS), "absent");
    set("eth1", PROP_IPV4_SUBNET_MASK, std::string("198.51.100.7"));
    EXPECT_EQ(text("eth1", PROP_IPV4_ADDRESS), "198.51.100.7");
    EXPECT_EQ(text("eth1", PROP_IPV4_SUBNET_MASK), "255.255.254.0");
}

TEST_F(FileWriteTest, KeepsTheMaskOfOneAdapterFromTheAddressOfAnother) {
    set("eth1", PROP_DHCP_ENABLED, 3U);
    set("eth1", PROP_IPV4_SUBNET_MASK, std::string("255.0.0.0"));
    set("eth0", PROP_IPV4_ADDRESS, std::string("192.0.2.77"));
    EXPECT_EQ(text("eth0", PROP_IPV4_SUBNET_MASK), "255.255.255.0");
    set("eth1", PROP_IPV4_ADDRESS, std::string("198.51.100.7"));
    EXPECT_EQ(text("eth1", PROP_IPV4_SUBNET_MASK), "255.0.0.0");
}

TEST_F(FileWriteTest, RemovesAListThatIsToBeEmpty) {
    set("eth0", PROP_DNS_SERVERS, std::vector<std::string>{});
    EXPECT_THAT(file.read(), testing::Not(HasSubstr("dns_servers")));
}

TEST_F(FileWriteTest, LeavesAFileAloneThatSaysSoAlready) {
    const auto inode = [&] {
        struct stat status {};

        ::stat(file.path().c_str(), &status);
        return status.st_ino;
    };
    const auto before = inode();
    set("eth0", PROP_IPV4_ADDRESS, std::string("192.0.2.10"));
    set("eth0", PROP_DHCP_ENABLED, 3U);
    EXPECT_EQ(inode(), before);
    set("eth0", PROP_IPV4_ADDRESS, std::string("192.0.2.11"));
    EXPECT_NE(inode(), before);
}

TEST_F(FileWriteTest, RefusesByTheRulesAndTouchesNothing) {
    EXPECT_EQ(
        failure("eth0", PROP_IPV4_ADDRESS, std::string("192.0.2.255")),
        "eth0: IPv4Address cannot be set to \"192.0.2.255\": 192.0.2.255/24 is the network's broadcast address: "
        "its host part is all ones");
    EXPECT_THAT(failure("eth1", PROP_IPV4_ADDRESS, std::string("192.0.2.25")), HasSubstr("by DHCP"));
    EXPECT_THAT(failure("eth0", PROP_DEFAULT_GATEWAY, std::string("10.0.0.1")), HasSubstr("not reached"));
    EXPECT_THAT(failure("eth0", PROP_IPV4_ADDRESS, 7U), StartsWith("eth0: IPv4Address cannot be set to 7: "));
    EXPECT_THAT(failure("eth9", PROP_DHCP_ENABLED, 3U), HasSubstr("there is no such adapter"));
    EXPECT_EQ(file.read(), commented);
}

TEST_F(FileWriteTest, KeepsModeAndLink) {
    std::filesystem::permissions(file.path(), std::filesystem::perms(0640));
    const auto link = file.directory() / "link.toml";
    std::filesystem::create_symlink("lab.toml", link);
    makeFileBackEnd(link.string())->setProperty("a:eth0", PROP_DNS_DOMAIN, std::string("example.org"));
    EXPECT_TRUE(std::filesystem::is_symlink(link));
    EXPECT_EQ(text("eth0", PROP_DNS_DOMAIN), "example.org");
    EXPECT_EQ(std::filesystem::status(file.path()).permissions(), std::filesystem::perms(0640));
}

TEST_F(FileWriteTest, LeavesNothingBesideTheFile) {
    set("eth0", PROP_IPV4_ADDRESS, std::string("192.0.2.77"));
    EXPECT_EQ(std::distance(std::filesystem::directory_iterator(file.directory()), {}), 1);
}

TEST_F(FileWriteTest, NamesTheAdapterWhenTheFileCannotBeReplaced) {
    if (::geteuid() == 0) {
        // Root may write everywhere but where nothing can be.
        std::filesystem::remove(file.path());
        std::filesystem::create_symlink("/proc/self/no/such", file.path());
        EXPECT_NE(failure("eth0", PROP_DNS_DOMAIN, std::string("example.org")), "nothing was thrown");
        return;
    }
    std::filesystem::permissions(file.directory(), std::filesystem::perms(0500));
    EXPECT_THAT(failure("eth0", PROP_DNS_DOMAIN, std::string("example.org")),
                StartsWith("eth0: DNSDomain cannot be set to \"example.org\": "));
    std::filesystem::permissions(file.directory(), std::filesystem::perms(0700));
    EXPECT_EQ(file.read(), commented);
}

TEST_F(FileWriteTest, ChangesTheSecondOfTwoAdaptersOfOneName) {
    file.write("[[adapter]]\nidentity = \"x\"\n[[adapter]]\nidentity = \"x\"\n");
    backEnd->setProperty(backEnd->snapshot()->nodesOfType(NODE_NETWORK_ADAPTER).at(1)->path, PROP_DNS_DOMAIN,
                         std::string("example.org"));
    EXPECT_EQ(file.read(), "[[adapter]]\nidentity = \"x\"\n[[adapter]]\nidentity = \"x\"\n"
                           "dns_domain = \"example.org\"\n");
}

TEST_F(FileWriteTest, LetsReadersSeeWholeStatesOnlyWhileTwoWrite) {
    set("eth1", PROP_DHCP_ENABLED, 3U);
    std::atomic<bool> isDone{false};
    std::atomic<int> wrong{0};
    std::thread reader([&] {
        while (!isDone) {
            wrong += backEnd->snapshot()->nodesOfType(NODE_NETWORK_ADAPTER).size() == 2 ? 0 : 1;
        }
    });
    std::vector<std::thread> writers;
    for (const char* adapter : {"eth0", "eth1"}) {
        writers.emplace_back([&, adapter] {
            for (int i = 1; i < 40; ++i) {
                set(adapter, PROP_IPV4_ADDRESS, "192.0.2." + std::to_string(i));
            }
        });
    }
    for (auto& writer : writers) {
        writer.join();
    }
    isDone = true;
    reader.join();
    EXPECT_EQ(wrong, 0);
    EXPECT_EQ(text("eth0", PROP_IPV4_ADDRESS), "192.0.2.39");
    EXPECT_EQ(text("eth1", PROP_IPV4_ADDRESS), "192.0.2.39");
}

struct EditCase {
    const char* before;
    std::optional<std::string> domain;
    const char* after;
};

TEST(DescriptionEditor, EditsEveryFormInWhichATableIsWritten) {
    const EditCase cases[] = {
        {"[[adapter]]", "x", "[[adapter]]\ndns_domain = \"x\"\n"},
        {"[[adapter]]\n", "x", "[[adapter]]\ndns_domain = \"x\"\n"},
        {"[[adapter]]\n[[adapter]]\n", "x", "[[adapter]]\ndns_domain = \"x\"\n[[adapter]]\n"},
        {"[[adapter]]\r\ndhcp = 1\r\n", "x", "[[adapter]]\r\ndhcp = 1\r\ndns_domain = \"x\"\r\n"},
        {"[[adapter]]\n\tdhcp = 1", "x", "[[adapter]]\n\tdhcp = 1\n\tdns_domain = \"x\"\n"},
        {"[[adapter]]\n\"dns_domain\"='y'\n", "x", "[[adapter]]\n\"dns_domain\"=\"x\"\n"},
        {"[[adapter]]\ndns_domain = \"\"\"\ny\n\"\"\" # c\n", "x", "[[adapter]]\ndns_domain = \"x\" # c\n"},
        {"[[adapter]]\nidentity = \"\u00e9\u4e2d\"\ndns_domain = \"\u00e9\" # \u00e9\n", "x",
         "[[adapter]]\nidentity = \"\u00e9\u4e2d\"\ndns_domain = \"x\" # \u00e9\n"},
        {"\xEF\xBB\xBF[[adapter]]\ndns_domain = 'y'\n", "x", "\xEF\xBB\xBF[[adapter]]\ndns_domain = \"x\"\n"},
        {"\xEF\xBB\xBF[[adapter]]\n", "x", "\xEF\xBB\xBF[[adapter]]\ndns_domain = \"x\"\n"},
        {"adapter = [{dhcp = 1}, {}]", "x", "adapter = [{ dhcp = 1, dns_domain = \"x\" }, {}]"},
        {"adapter = [{}] # c\n", "x", "adapter = [{ dns_domain = \"x\" }] # c\n"},
        {"adapter = [{dns_domain = 'y', dhcp=1}]", "x", "adapter = [{ dns_domain = \"x\", dhcp = 1 }]"},
        {"adapter = [{dns_domain = 'y', dhcp=1}]", std::nullopt, "adapter = [{ dhcp = 1 }]"},
        {"adapter = [{dns_domain = 'y'}]", std::nullopt, "adapter = [{}]"},
        {"[[adapter]]\ndns_domain = 'y'\ndhcp = 1\n", std::nullopt, "[[adapter]]\ndhcp = 1\n"},
        {"[[adapter]]\n  dns_domain = 'y' # c\n", std::nullopt, "[[adapter]]\n  # c\n"},
        {"[[adapter]]\ndns_domain = 'y'", std::nullopt, "[[adapter]]\n"},
        {"[[adapter]]\ndhcp = 1\n", std::nullopt, "[[adapter]]\ndhcp = 1\n"},
    };
    for (const auto& [before, domain, after] : cases) {
        const auto value = domain ? std::optional(Orv::Agent::tomlText(*domain)) : std::nullopt;
        EXPECT_EQ(editAdapter(before, "lab.toml", 0, {{"dns_domain", value}}), after) << before;
    }
}

TEST(DescriptionEditor, EscapesWhatEndsAText) {
    EXPECT_EQ(Orv::Agent::tomlText("a\"b\\c\n\x7F\u00e9"), "\"a\\\"b\\\\c\\u000A\\u007F\u00e9\"");
    EXPECT_EQ(Orv::Agent::tomlList({"a", "b"}), "[\"a\", \"b\"]");
    EXPECT_EQ(Orv::Agent::tomlList({}), "[]");
}

TEST(DescriptionEditor, SaysWhichAdapterIsMissing) {
    EXPECT_EQ(messageOf([] { editAdapter("[[adapter]]\n", "lab.toml", 1, {}); }),
              "lab.toml: there is no adapter number 2");
    EXPECT_THAT(messageOf([] { editAdapter("[[adapter", "lab.toml", 0, {}); }), StartsWith("lab.toml:1: "));
}

} // namespace

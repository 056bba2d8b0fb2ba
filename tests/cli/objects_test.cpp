#include "tests/cli/Marlo.h"

#include <cstdint>
#include <limits>

#include <gmock/gmock.h>

namespace marlo::test {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

constexpr const char* Configuration = "MARLO_NetworkAdapterConfiguration";
constexpr const char* EthPath = R"(MARLO_NetworkAdapterConfiguration.SettingID="eth0")";

std::vector<std::string> namesOf(const nlohmann::ordered_json& object) {
    std::vector<std::string> names;
    for (const auto& entry : object.items()) {
        names.push_back(entry.key());
    }
    return names;
}

class MarloObjects : public MarloTest {};

TEST_F(MarloObjects, AreShownAsParagraphs) {
    const Outcome outcome = marlo({"enum", Configuration, "-p", "SettingID,IPAddress,DHCPEnabled"});
    EXPECT_EQ(outcome.exitCode, 0);
    EXPECT_EQ(outcome.err, "");
    EXPECT_THAT(outcome.out, testing::StartsWith("root/tavis:MARLO_NetworkAdapterConfiguration.SettingID=\"bond0\"\n"
                                                 "  SettingID   = \"bond0\"\n"
                                                 "  IPAddress   = {\"192.0.2.10\", \"2001:db8:0:2::10\"}\n"
                                                 "  DHCPEnabled = FALSE\n"
                                                 "\n"
                                                 "root/tavis:"));
}

TEST_F(MarloObjects, AreJsonWithPathClassAndProperties) {
    const auto json = marloJson({"enum", Configuration});
    ASSERT_EQ(json.size(), 4U);
    for (const auto& instance : json) {
        EXPECT_THAT(namesOf(instance), ElementsAre("path", "class", "properties"));
        EXPECT_EQ(instance["class"], Configuration);
    }
    EXPECT_EQ(json[1]["path"], std::string("root/tavis:") + EthPath);
    EXPECT_EQ(json[1]["properties"]["SettingID"], "eth0");
    EXPECT_EQ(json[1]["properties"]["DHCPEnabled"], true);
    EXPECT_EQ(json[1]["properties"]["DefaultIPGateway"], nlohmann::ordered_json::array({"198.51.100.1"}));
}

TEST_F(MarloObjects, HaveTheOrderOfTheirClass) {
    const auto json = marloJson({"get", R"(MARLO_NetworkAdapterConfiguration.SettingID="bond0")"});
    ASSERT_EQ(json.size(), 1U);
    std::vector<std::string> names = namesOf(json[0]["properties"]);
    std::erase_if(names, [](const std::string& name) { return name == "Caption" || name == "ElementName"; });
    EXPECT_THAT(names, ElementsAre("Description", "SettingID", "IPAddress", "IPSubnet", "DNSHostName", "DNSDomain",
                                   "MACAddress", "DHCPEnabled", "IPEnabled", "DNSDomainSuffixSearchOrder",
                                   "DefaultIPGateway", "DNSServerSearchOrder"));
}

TEST_F(MarloObjects, HaveOnlyThePropertiesThatAreAskedFor) {
    const auto json = marloJson({"enum", Configuration, "-p", "MACAddress", "-p", "DNSHostName,IPSubnet"});
    EXPECT_THAT(namesOf(json[0]["properties"]), ElementsAre("IPSubnet", "DNSHostName", "MACAddress"));
    EXPECT_EQ(json[0]["path"], "root/tavis:MARLO_NetworkAdapterConfiguration.SettingID=\"bond0\"");
}

TEST_F(MarloObjects, ShowWhatIsAskedForAndMissingAsNULL) {
    EXPECT_THAT(marlo({"get", EthPath, "-p", "dnsdomain,SettingID"}).out,
                testing::EndsWith("\n  SettingID = \"eth0\"\n  DNSDomain = NULL\n"));
    const auto json = marloJson({"enum", Configuration, "-p", "DNSDomain"});
    EXPECT_EQ(json[0]["properties"], (nlohmann::ordered_json{{"DNSDomain", "lab.example.org"}}));
    EXPECT_EQ(json[1]["properties"], (nlohmann::ordered_json{{"DNSDomain", nullptr}}));
}

TEST_F(MarloObjects, LackWhatOnlyADerivedClassHas) {
    const auto json = marloJson({"enum", "CIM_ManagedElement", "-p", "DNSDomain,Caption"});
    bool ofOtherClass = false;
    for (const auto& instance : json) {
        const bool isConfiguration = instance["class"] == Configuration;
        EXPECT_EQ(instance["properties"].contains("DNSDomain"), isConfiguration);
        EXPECT_TRUE(instance["properties"].contains("Caption"));
        ofOtherClass = ofOtherClass || !isConfiguration;
    }
    EXPECT_TRUE(ofOtherClass);
}

TEST_F(MarloObjects, TakePropertyNamesInAnyCase) {
    const auto json = marloJson({"get", EthPath, "-p", "macaddress"});
    ASSERT_EQ(json.size(), 1U);
    EXPECT_EQ(json[0]["properties"], (nlohmann::ordered_json{{"MACAddress", "02:00:5e:10:00:02"}}));
}

TEST_F(MarloObjects, OfTheOtherClassesAreServed) {
    EXPECT_EQ(marloJson({"enum", "MARLO_PhysicalNetworkAdapter"}).size(), 2U);
    const auto ports = marloJson({"enum", "MARLO_LogicalNetworkAdapter"});
    ASSERT_EQ(ports.size(), 4U);
    EXPECT_EQ(ports[0]["properties"]["SystemCreationClassName"], "MARLO_ComputerSystem");
    EXPECT_EQ(marloJson({"enum", "TAVIS_NetworkPort", "-n", "root/quarn"}).size(), 4U);
    EXPECT_EQ(marloJson({"enum", "TAVIS_NetworkCard", "--namespace", "root/quarn"}).size(), 2U);
}

TEST_F(MarloObjects, OfSubclassesAreFoundThroughTheirSuperclass) {
    EXPECT_EQ(marloJson({"names", "CIM_NetworkPort"}).size(), 4U);
    EXPECT_EQ(marloJson({"names", "CIM_ManagedElement"}).size(), 10U);
}

TEST_F(MarloObjects, AreNamedOneOnALine) {
    const Outcome outcome = marlo({"names", Configuration});
    EXPECT_EQ(outcome.exitCode, 0);
    EXPECT_EQ(outcome.out, "root/tavis:MARLO_NetworkAdapterConfiguration.SettingID=\"bond0\"\n"
                           "root/tavis:MARLO_NetworkAdapterConfiguration.SettingID=\"eth0\"\n"
                           "root/tavis:MARLO_NetworkAdapterConfiguration.SettingID=\"eth1\"\n"
                           "root/tavis:MARLO_NetworkAdapterConfiguration.SettingID=\"eth2\"\n");
}

TEST_F(MarloObjects, AreNamedInJsonWithTheirKeys) {
    const auto json = marloJson({"names", Configuration});
    ASSERT_EQ(json.size(), 4U);
    EXPECT_THAT(namesOf(json[0]), ElementsAre("path", "class", "keys"));
    EXPECT_EQ(json[0]["keys"], (nlohmann::ordered_json{{"SettingID", "bond0"}}));
}

TEST_F(MarloObjects, AreFoundAgainUnderEachNameThatIsPrinted) {
    for (const char* name :
         {"MARLO_NetworkAdapterConfiguration", "MARLO_LogicalNetworkAdapter", "MARLO_PhysicalNetworkAdapter"}) {
        for (const auto& entry : marloJson({"names", name})) {
            const auto found = marloJson({"get", entry["path"]});
            ASSERT_EQ(found.size(), 1U);
            EXPECT_EQ(found[0]["path"], entry["path"]);
        }
    }
}

TEST_F(MarloObjects, AreFoundInTheNamespaceOfTheirPath) {
    const auto json = marloJson({"get", std::string("root/tavis:") + EthPath, "-n", "root/quarn"});
    ASSERT_EQ(json.size(), 1U);
}

class MarloFixture : public FixtureTest {};

TEST_F(MarloObjects, OfTheObjectManagerItselfAreInTheInteropNamespace) {
    const auto json = marloJson({"enum", "-n", "interop", "CIM_Namespace", "-p", "Name"});
    ASSERT_EQ(json.size(), 3U);
    EXPECT_EQ(json[2]["properties"]["Name"], "root/interop");
    const std::string path = json[2]["path"];
    EXPECT_THAT(path, testing::StartsWith("root/interop:CIM_Namespace."));
    EXPECT_EQ(marloJson({"get", path}).size(), 1U);
    EXPECT_EQ(marlo({"enum", "-n", "/interop/", "CIM_Namespace", "-p", "Nothing"}).exitCode, 2);
    EXPECT_THAT(marlo({"classes", "-n", "interop", "--names"}).out, HasSubstr("CIM_ObjectManager\n"));
}

TEST_F(MarloFixture, ValuesKeepTheirTypesInJson) {
    const auto json = marloJson(onFixture({"enum", "TEST_Typed"}));
    ASSERT_EQ(json.size(), 1U);
    const auto& properties = json[0]["properties"];
    EXPECT_EQ(json[0]["path"], R"(root/test:TEST_Typed.Id="one \"quoted\" \\ key")");
    EXPECT_EQ(properties["Unsigned64"], std::numeric_limits<std::uint64_t>::max());
    EXPECT_TRUE(properties["Unsigned64"].is_number_unsigned());
    EXPECT_EQ(properties["Signed64"], std::numeric_limits<std::int64_t>::min());
    EXPECT_EQ(properties["Unsigned8"], 255);
    EXPECT_EQ(properties["Real"], 1.5);
    EXPECT_EQ(properties["Truth"], true);
    EXPECT_EQ(properties["Character"], "\xE2\x82\xAC");
    EXPECT_EQ(properties["When"], "20250102030405.000000+060");
    EXPECT_EQ(properties["Text"], "tab\there\nand \x1b[31mred\x1b[0m");
    EXPECT_EQ(properties["Texts"], nlohmann::ordered_json::array({"first, with a comma", nullptr, "\xC3\xA4"}));
    ASSERT_TRUE(properties.contains("Nothing"));
    EXPECT_TRUE(properties["Nothing"].is_null());
    EXPECT_THAT(properties["Other"].get<std::string>(), HasSubstr(R"(TEST_Typed.Id="one \"quoted\" \\ key")"));
    EXPECT_THAT(namesOf(properties), ElementsAre("Id", "Text", "Nothing", "Texts", "Unsigned8", "Unsigned64",
                                                 "Signed64", "Real", "Truth", "Character", "When", "Other"));
}

TEST_F(MarloFixture, ValuesAreReadableAndCannotSteerTheTerminal) {
    const Outcome outcome = marlo(onFixture({"enum", "TEST_Typed"}));
    EXPECT_EQ(outcome.exitCode, 0);
    EXPECT_THAT(outcome.out, HasSubstr("  Text       = \"tab\\there\\nand \\x001B[31mred\\x001B[0m\"\n"));
    EXPECT_THAT(outcome.out, HasSubstr("  Nothing    = NULL\n"));
    EXPECT_THAT(outcome.out, HasSubstr("  Texts      = {\"first, with a comma\", NULL, \"\xC3\xA4\"}\n"));
    EXPECT_THAT(outcome.out, HasSubstr("  Unsigned64 = 18446744073709551615\n"));
    EXPECT_THAT(outcome.out, HasSubstr("  Character  = '\xE2\x82\xAC'\n"));
    EXPECT_THAT(outcome.out, HasSubstr("  When       = \"20250102030405.000000+060\"\n"));
}

TEST_F(MarloFixture, NothingIsSaidToBeNothing) {
    const Outcome outcome = marlo(onFixture({"enum", "TEST_Empty"}));
    EXPECT_EQ(outcome.exitCode, 0);
    EXPECT_EQ(outcome.out, "");
    EXPECT_EQ(outcome.err, "marlo: no instances of TEST_Empty in root/test\n");
    EXPECT_EQ(marlo(onFixture({"names", "TEST_Empty"})).err, "marlo: no instances of TEST_Empty in root/test\n");
    EXPECT_THAT(marloJson(onFixture({"enum", "TEST_Empty"})), IsEmpty());
}

TEST_F(MarloFixture, WhatCameBeforeAFailureIsStillJson) {
    auto arguments = onFixture({"enum", "TEST_Partial", "--json"});
    const Outcome outcome = marlo(arguments);
    EXPECT_EQ(outcome.exitCode, 1);
    EXPECT_EQ(outcome.err, "marlo: CIM_ERR_FAILED (1): broke off\n");
    const auto json = nlohmann::json::parse(outcome.out, nullptr, false);
    ASSERT_TRUE(json.is_array()) << outcome.out;
    EXPECT_EQ(json.size(), 1U);
}

TEST_F(MarloObjects, OfTheSchemaAreTheClasses) {
    const Outcome outcome = marlo({"classes", "--names"});
    EXPECT_EQ(outcome.exitCode, 0);
    EXPECT_THAT(outcome.out, HasSubstr("MARLO_NetworkAdapterConfiguration\n"));
    EXPECT_THAT(outcome.out, HasSubstr("CIM_ManagedElement\n"));
    EXPECT_THAT(marlo({"classes"}).out, HasSubstr("SUPERCLASS"));
    EXPECT_THAT(marlo({"classes", "-n", "root/quarn"}).out, HasSubstr("TAVIS_NetworkCard"));
    const auto json = marloJson({"classes"});
    EXPECT_EQ(json[0]["class"], "CIM_ManagedElement");
    EXPECT_EQ(json[0]["superclass"], nullptr);
    EXPECT_EQ(json[0]["abstract"], true);
}

} // namespace
} // namespace marlo::test

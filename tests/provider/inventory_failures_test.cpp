/**
 * The scan of the tree over a record that refuses what it is told to refuse: this file defines the record's members
 * in place of the provider's own.
 */
#include "tests/provider/InventoryRun.h"
#include "tests/provider/Tree.h"

#include <ostream>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

/** The setter that refuses, and every setter that was called, with a number's value. */
std::string refusing;               // NOLINT(cert-err58-cpp)
std::vector<std::string> setterLog; // NOLINT(cert-err58-cpp)

bool called(const std::string& setter) {
    setterLog.push_back(setter);
    return setter != refusing;
}

bool called(const std::string& setter, unsigned short value) {
    setterLog.push_back(setter + " " + std::to_string(value));
    return setter != refusing;
}

} // namespace

namespace Orv::NetworkAdapterComposite {

// clang-format off
bool NetworkAdapterConfiguration::setSettingID(std::string) { return called("setSettingID"); }
bool NetworkAdapterConfiguration::setStatus(std::string) { return called("setStatus"); }
bool NetworkAdapterConfiguration::setDescription(std::string) { return called("setDescription"); }
bool NetworkAdapterConfiguration::setIPv4Address(std::string) { return called("setIPv4Address"); }
bool NetworkAdapterConfiguration::setIPv6Address(std::string) { return called("setIPv6Address"); }
bool NetworkAdapterConfiguration::setIPv4SubnetMask(std::string) { return called("setIPv4SubnetMask"); }
bool NetworkAdapterConfiguration::setDNSHostname(std::string) { return called("setDNSHostname"); }
bool NetworkAdapterConfiguration::setDNSDomainName(std::string) { return called("setDNSDomainName"); }
bool NetworkAdapterConfiguration::setMACAddress(std::string) { return called("setMACAddress"); }
bool NetworkAdapterConfiguration::setDefaultIPGateway(std::string) { return called("setDefaultIPGateway"); }
bool NetworkAdapterConfiguration::setDnsServerSearchOrder(std::vector<std::string>) { return called("setDnsServerSearchOrder"); }
bool NetworkAdapterConfiguration::setDNSSuffixesToAppend(std::vector<std::string>) { return called("setDNSSuffixesToAppend"); }
bool NetworkAdapterConfiguration::setIPEnabled(unsigned short value) { return called("setIPEnabled", value); }
bool NetworkAdapterConfiguration::setDHCPEnabled(unsigned short value) { return called("setDHCPEnabled", value); }
bool NetworkAdapterConfiguration::setIPSupport(unsigned short value) { return called("setIPSupport", value); }
std::string getNicStatus(unsigned int code, std::string) { return std::to_string(code); }

// clang-format on

} // namespace Orv::NetworkAdapterComposite

namespace {

using namespace Orv::NodeLexicon;
using Orv::NetworkAdapterComposite::getNetworkAdapterConfigurationInstances;
using Orv::NetworkAdapterComposite::NetworkAdapterConfigurationMap;
using provider_test::addFullAdapter;
using provider_test::InventoryRun;
using provider_test::line;
using provider_test::normalised;
using scripted_agent::recorded;
using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::Not;

struct Refusal {
    const char* setter;
    const char* message;

    friend std::ostream& operator<<(std::ostream& stream, const Refusal& refusal) { return stream << refusal.setter; }
};

class RefusingRecord : public InventoryRun, public testing::TestWithParam<Refusal> {
  protected:
    RefusingRecord() {
        setterLog.clear();
        refusing = GetParam().setter;
        addFullAdapter("eth0");
        addFullAdapter("eth1");
    }
};

using FatalRefusal = RefusingRecord;

TEST_P(FatalRefusal, EndsTheWholeScanWithItsMessageOnStandardError) {
    EXPECT_EQ(run(), 1);
    EXPECT_EQ(errors, std::string(GetParam().message) + "\n");
    EXPECT_TRUE(map.empty());
    EXPECT_THAT(setterLog.back(), testing::StartsWith(GetParam().setter));
    EXPECT_THAT(recorded("cursor 1: ++"), ElementsAre());
    EXPECT_THAT(recorded("log"), Not(Contains(HasSubstr("Failed"))));
}

INSTANTIATE_TEST_SUITE_P(EverySetter, FatalRefusal,
                         testing::Values(Refusal{"setStatus", "Failed while setting Status."},
                                         Refusal{"setSettingID", "Failed while setting SettingID."},
                                         Refusal{"setDescription", "Failed while setting Description."},
                                         Refusal{"setDefaultIPGateway", "Failed while setting DefaultIPGateway."},
                                         Refusal{"setDnsServerSearchOrder",
                                                 "Failed while setting Dns Server Search Order."},
                                         Refusal{"setIPv4Address", "Failed while setting IPv4 Address."},
                                         Refusal{"setIPv6Address", "Failed while setting IPv6 Address."},
                                         Refusal{"setIPv4SubnetMask", "Failed while setting IPv4 Subnet Mask."},
                                         Refusal{"setIPSupport", "Failed while setting IPSupport."},
                                         Refusal{"setDHCPEnabled", "Failed while setting IPSupport."},
                                         Refusal{"setIPEnabled", "Failed while setting IPSupport."}));

using HarmlessRefusal = RefusingRecord;

TEST_P(HarmlessRefusal, IsLoggedAtTheOrdinaryLevelAndTheRecordIsStored) {
    EXPECT_EQ(run(), 0);
    EXPECT_EQ(errors, "");
    EXPECT_EQ(map.size(), 2U);
    const std::string text =
        std::string("MESSAGE [File: NetworkAdapterConfiguration, Line: N]: ") + GetParam().message;
    for (const char* sink : {"log", "trace"}) {
        const std::string expected = line(sink, 4000, "Hearth.NetworkAdapterProvider", "NetworkAdapterConfiguration",
                                          "getNetworkAdapterConfigurationInstances", text);
        EXPECT_THAT(normalised(recorded(sink)), Contains(expected).Times(2));
    }
}

INSTANTIATE_TEST_SUITE_P(EverySetter, HarmlessRefusal,
                         testing::Values(Refusal{"setDNSHostname", "Failed while setting IP Host Name."},
                                         Refusal{"setDNSDomainName", "Failed while setting Domain Name."},
                                         Refusal{"setDNSSuffixesToAppend",
                                                 "Failed while setting DNSSuffixesToAppend"},
                                         Refusal{"setMACAddress", "Failed while setting MACAddress"}));

TEST(AcceptingRecord, SettersAreCalledInTheirOrderWithNumbersCutTo16Bits) {
    scripted_agent::reset();
    setterLog.clear();
    refusing.clear();
    auto& node = addFullAdapter("eth0");
    node.numbers[PROP_IP_SUPPORT] = 65536 + 7;
    node.numbers[PROP_DHCP_ENABLED] = 65536 + 8;
    node.numbers[PROP_STATUS] = 65536 + 9;
    NetworkAdapterConfigurationMap map;
    EXPECT_EQ(getNetworkAdapterConfigurationInstances(map), 0);
    EXPECT_THAT(setterLog,
                ElementsAre("setStatus", "setSettingID", "setDescription", "setDefaultIPGateway",
                            "setDnsServerSearchOrder", "setIPv4Address", "setIPv6Address", "setIPv4SubnetMask",
                            "setIPSupport 7", "setDHCPEnabled 8", "setIPEnabled 9", "setDNSHostname",
                            "setDNSDomainName", "setDNSSuffixesToAppend", "setMACAddress"));
}

TEST(AcceptingRecord, AbsentPropertiesCallNoSetter) {
    scripted_agent::reset();
    setterLog.clear();
    refusing.clear();
    provider_test::addBareAdapter();
    NetworkAdapterConfigurationMap map;
    EXPECT_EQ(getNetworkAdapterConfigurationInstances(map), 0);
    EXPECT_THAT(setterLog, ElementsAre("setDescription"));
}

} // namespace

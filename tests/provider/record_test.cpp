#include "configuration/NetworkAdapterConfiguration.h"
#include "tests/support/scripted_agent/ScriptedAgent.h"

#include <type_traits>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using Orv::NetworkAdapterComposite::getNicStatus;
using Orv::NetworkAdapterComposite::NetworkAdapterConfiguration;
using testing::ElementsAre;
using testing::IsEmpty;

class Record : public testing::Test {
  protected:
    Record() { scripted_agent::reset(); }

    NetworkAdapterConfiguration record;
};

NetworkAdapterConfiguration full() {
    NetworkAdapterConfiguration record;
    record.setSettingID("eth0");
    record.setIPv4Address("192.0.2.1");
    record.setIPv6Address("2001:db8::1");
    record.setIPv4SubnetMask("255.255.255.0");
    record.setDNSHostname("host");
    record.setDNSDomainName("example.org");
    record.setDescription("x");
    record.setMACAddress("00:00:5e:00:53:01");
    record.setStatus("OK");
    record.setDefaultIPGateway("192.0.2.254");
    record.setDnsServerSearchOrder({"192.0.2.53", "192.0.2.54"});
    record.setDNSSuffixesToAppend({"a.example", "b.example"});
    record.setIPEnabled(1);
    record.setDHCPEnabled(1);
    return record;
}

void expectFull(const NetworkAdapterConfiguration& record) {
    EXPECT_EQ(record.getSettingID(), "eth0");
    EXPECT_EQ(record.getIPv4Address(), "192.0.2.1");
    EXPECT_EQ(record.getIPv6Address(), "2001:db8::1");
    EXPECT_EQ(record.getIPv4SubnetMask(), "255.255.255.0");
    EXPECT_EQ(record.getDNSHostname(), "host");
    EXPECT_EQ(record.getDNSDomainName(), "example.org");
    EXPECT_EQ(record.getDescription(), "Ethernet");
    EXPECT_EQ(record.getMACAddress(), "00:00:5e:00:53:01");
    EXPECT_EQ(record.getStatus(), "OK");
    EXPECT_THAT(record.getDefaultIPGateway(), ElementsAre("192.0.2.254"));
    EXPECT_THAT(record.getDnsServerSearchOrder(), ElementsAre("192.0.2.53", "192.0.2.54"));
    EXPECT_THAT(record.getDNSSuffixesToAppend(), ElementsAre("a.example", "b.example"));
    EXPECT_TRUE(record.getIPEnabled());
    EXPECT_TRUE(record.getDHCPEnabled());
}

TEST_F(Record, StartsEmptyAndFalse) {
    EXPECT_EQ(record.getSettingID(), "");
    EXPECT_EQ(record.getIPv4Address(), "");
    EXPECT_EQ(record.getIPv6Address(), "");
    EXPECT_EQ(record.getIPv4SubnetMask(), "");
    EXPECT_EQ(record.getDNSHostname(), "");
    EXPECT_EQ(record.getDNSDomainName(), "");
    EXPECT_EQ(record.getDescription(), "");
    EXPECT_EQ(record.getMACAddress(), "");
    EXPECT_EQ(record.getStatus(), "");
    EXPECT_THAT(record.getDefaultIPGateway(), IsEmpty());
    EXPECT_THAT(record.getDnsServerSearchOrder(), IsEmpty());
    EXPECT_THAT(record.getDNSSuffixesToAppend(), IsEmpty());
    EXPECT_FALSE(record.getIPEnabled());
    EXPECT_FALSE(record.getDHCPEnabled());
}

TEST_F(Record, IsAPlainValue) {
    static_assert(!std::is_polymorphic_v<NetworkAdapterConfiguration>);
    static_assert(std::is_copy_constructible_v<NetworkAdapterConfiguration>);
    static_assert(std::is_copy_assignable_v<NetworkAdapterConfiguration>);
    expectFull(full());
}

TEST_F(Record, CopyEqualsItsSourceFieldByField) {
    const NetworkAdapterConfiguration source = full();
    const NetworkAdapterConfiguration copy(source);
    expectFull(copy);
    NetworkAdapterConfiguration assigned;
    assigned = source;
    expectFull(assigned);
}

TEST_F(Record, CopyHasListsOfItsOwn) {
    record = full();
    NetworkAdapterConfiguration copy = record;
    copy.setDefaultIPGateway("192.0.2.253");
    copy.setDnsServerSearchOrder({"192.0.2.55"});
    copy.setDNSSuffixesToAppend({"c.example"});
    expectFull(record);
}

TEST_F(Record, DescriptionIsEthernetWhateverIsSet) {
    EXPECT_TRUE(record.setDescription("Wireless"));
    EXPECT_EQ(record.getDescription(), "Ethernet");
    NetworkAdapterConfiguration other;
    EXPECT_TRUE(other.setDescription(""));
    EXPECT_EQ(other.getDescription(), "Ethernet");
}

TEST_F(Record, SettingIDLosesItsSpaces) {
    EXPECT_TRUE(record.setSettingID("  eth 0 "));
    EXPECT_EQ(record.getSettingID(), "eth0");
}

TEST_F(Record, SettingIDOfSpacesOnlyIsRefusedAndEmpty) {
    record.setSettingID("eth0");
    EXPECT_FALSE(record.setSettingID("   "));
    EXPECT_EQ(record.getSettingID(), "");
    EXPECT_FALSE(record.setSettingID(""));
}

TEST_F(Record, SettingIDAndStatusHoldExactlyWhatTheAgentStrips) {
    scripted_agent::script().stripSpaces = [](const std::string& text) { return "<" + text + ">"; };
    record.setSettingID("a b");
    record.setStatus("Lost Comm");
    EXPECT_EQ(record.getSettingID(), "<a b>");
    EXPECT_EQ(record.getStatus(), "<Lost Comm>");
    EXPECT_THAT(scripted_agent::record(),
                ElementsAre("stripSpaces(\"a b\") = \"<a b>\"", "stripSpaces(\"Lost Comm\") = \"<Lost Comm>\""));
}

TEST_F(Record, StatusLosesItsSpacesAndIsRefusedWhenNothingIsLeft) {
    EXPECT_TRUE(record.setStatus("Lost Comm"));
    EXPECT_EQ(record.getStatus(), "LostComm");
    EXPECT_FALSE(record.setStatus(" "));
    EXPECT_EQ(record.getStatus(), "");
}

TEST_F(Record, OtherTextsAreStoredUnchangedAndAccepted) {
    EXPECT_TRUE(record.setIPv4Address(" 1 "));
    EXPECT_TRUE(record.setIPv6Address(" 2 "));
    EXPECT_TRUE(record.setIPv4SubnetMask(" 3 "));
    EXPECT_TRUE(record.setDNSHostname(" 4 "));
    EXPECT_TRUE(record.setDNSDomainName(" 5 "));
    EXPECT_TRUE(record.setMACAddress(" 6 "));
    EXPECT_EQ(record.getIPv4Address(), " 1 ");
    EXPECT_EQ(record.getIPv6Address(), " 2 ");
    EXPECT_EQ(record.getIPv4SubnetMask(), " 3 ");
    EXPECT_EQ(record.getDNSHostname(), " 4 ");
    EXPECT_EQ(record.getDNSDomainName(), " 5 ");
    EXPECT_EQ(record.getMACAddress(), " 6 ");
    EXPECT_THAT(scripted_agent::record(), IsEmpty());
}

TEST_F(Record, EmptyTextsAreAccepted) {
    EXPECT_TRUE(record.setIPv4Address(""));
    EXPECT_TRUE(record.setIPv6Address(""));
    EXPECT_TRUE(record.setIPv4SubnetMask(""));
    EXPECT_TRUE(record.setDNSHostname(""));
    EXPECT_TRUE(record.setDNSDomainName(""));
    EXPECT_TRUE(record.setMACAddress(""));
    EXPECT_TRUE(record.setDefaultIPGateway(""));
    EXPECT_TRUE(record.setDnsServerSearchOrder({}));
    EXPECT_TRUE(record.setDNSSuffixesToAppend({}));
}

TEST_F(Record, ListSettersAppendInOrder) {
    EXPECT_TRUE(record.setDnsServerSearchOrder({"1"}));
    EXPECT_TRUE(record.setDnsServerSearchOrder({"2"}));
    EXPECT_THAT(record.getDnsServerSearchOrder(), ElementsAre("1", "2"));
    EXPECT_TRUE(record.setDNSSuffixesToAppend({"b", "a"}));
    EXPECT_TRUE(record.setDNSSuffixesToAppend({"a"}));
    EXPECT_THAT(record.getDNSSuffixesToAppend(), ElementsAre("b", "a", "a"));
    EXPECT_TRUE(record.setDefaultIPGateway("1"));
    EXPECT_TRUE(record.setDefaultIPGateway("2"));
    EXPECT_THAT(record.getDefaultIPGateway(), ElementsAre("1", "2"));
}

TEST_F(Record, FlagsAreTrueForOneOnly) {
    EXPECT_TRUE(record.setDHCPEnabled(1));
    EXPECT_TRUE(record.setIPEnabled(1));
    EXPECT_TRUE(record.getDHCPEnabled());
    EXPECT_TRUE(record.getIPEnabled());
    for (const unsigned short value : std::initializer_list<unsigned short>{3, 0, 2, 256, 65535}) {
        record.setDHCPEnabled(1);
        record.setIPEnabled(1);
        EXPECT_TRUE(record.setDHCPEnabled(value));
        EXPECT_TRUE(record.setIPEnabled(value));
        EXPECT_FALSE(record.getDHCPEnabled()) << value;
        EXPECT_FALSE(record.getIPEnabled()) << value;
    }
}

TEST_F(Record, IPSupportIsAcceptedAndForgotten) {
    record = full();
    EXPECT_TRUE(record.setIPSupport(0));
    EXPECT_TRUE(record.setIPSupport(65535));
    expectFull(record);
}

TEST(NicStatus, CodesHaveTheirTexts) {
    EXPECT_EQ(getNicStatus(1, ""), "OK");
    EXPECT_EQ(getNicStatus(5, ""), "Stopped");
    EXPECT_EQ(getNicStatus(12, ""), "Lost Comm");
    EXPECT_EQ(getNicStatus(0, ""), "Lost Comm");
    EXPECT_EQ(getNicStatus(2, "before"), "Lost Comm");
}

TEST(NicStatus, ComparesAll32Bits) {
    EXPECT_EQ(getNicStatus(65537, ""), "Lost Comm");
    EXPECT_EQ(getNicStatus(65541, ""), "Lost Comm");
    EXPECT_EQ(getNicStatus(4294967295U, ""), "Lost Comm");
}

} // namespace

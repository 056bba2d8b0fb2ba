/** What the object factory makes of the adapters' records. */
#include "tests/provider/FactoryInstances.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace Orv::NodeLexicon;
using namespace provider_test;
using marlo::Instance;
using marlo::Value;
using marlo::test::Failure;
using Orv::NetworkAdapterComposite::NetworkAdapterConfiguration;
using Orv::NetworkAdapterComposite::NetworkAdapterObjectFactory;
using scripted_agent::recorded;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

TEST_F(FactoryInstances, ConfigurationHasItsPropertiesInTheirOrder) {
    addFullAdapter("eth0").numbers[PROP_DHCP_ENABLED] = 1;
    const Built built = configuration();
    EXPECT_EQ(built.result, 0);
    ASSERT_THAT(built.instances, SizeIs(1));
    const Instance& instance = built.instances[0];
    EXPECT_THAT(names(instance),
                ElementsAre("SettingID", "Description", "IPAddress", "IPSubnet", "DNSHostName", "DNSDomain",
                            "MACAddress", "DHCPEnabled", "IPEnabled", "DNSDomainSuffixSearchOrder",
                            "DefaultIPGateway", "DNSServerSearchOrder"));
    EXPECT_EQ(get(instance, "SettingID"), Value::string("eth0"));
    EXPECT_EQ(get(instance, "Description"), Value::string("Ethernet"));
    EXPECT_EQ(get(instance, "IPAddress"), strings({"192.0.2.10", "2001:db8::10"}));
    EXPECT_EQ(get(instance, "IPSubnet"), strings({"255.255.255.0"}));
    EXPECT_EQ(get(instance, "DNSHostName"), Value::string("host"));
    EXPECT_EQ(get(instance, "DNSDomain"), Value::string("example.org"));
    EXPECT_EQ(get(instance, "MACAddress"), Value::string("00:00:5e:00:53:01"));
    EXPECT_EQ(get(instance, "DHCPEnabled"), Value::boolean(true));
    EXPECT_EQ(get(instance, "IPEnabled"), Value::boolean(true));
    EXPECT_EQ(get(instance, "DNSDomainSuffixSearchOrder"), strings({"example.org", "example.net"}));
    EXPECT_EQ(get(instance, "DefaultIPGateway"), strings({"192.0.2.1"}));
    EXPECT_EQ(get(instance, "DNSServerSearchOrder"), strings({"192.0.2.53", "192.0.2.54"}));
}

TEST_F(FactoryInstances, RecordWithoutAnythingHasWhatIsSetEvenWhenEmpty) {
    addBareAdapter();
    const Built built = configuration();
    ASSERT_THAT(built.instances, SizeIs(1));
    const Instance& instance = built.instances[0];
    EXPECT_THAT(names(instance), ElementsAre("SettingID", "Description", "IPSubnet", "DHCPEnabled", "IPEnabled"));
    EXPECT_EQ(get(instance, "SettingID"), Value::string(""));
    EXPECT_EQ(get(instance, "DHCPEnabled"), Value::boolean(false));
    EXPECT_EQ(get(instance, "IPEnabled"), Value::boolean(false));
}

TEST_F(FactoryInstances, ListOfOnePropertySetsThatOneOnly) {
    addFullAdapter("eth0");
    const Built built = configuration(PropertyList({"IPAddress"}));
    ASSERT_THAT(built.instances, SizeIs(1));
    EXPECT_THAT(names(built.instances[0]), ElementsAre("IPAddress"));
}

TEST_F(FactoryInstances, EveryPropertyCanBeAskedForAlone) {
    addFullAdapter("eth0");
    for (const std::string& name : names(configuration().instances.at(0))) {
        const Built built = configuration(PropertyList({name.c_str()}));
        EXPECT_THAT(names(built.instances.at(0)), ElementsAre(name));
    }
}

TEST_F(FactoryInstances, WithoutAListTheFlagDecidesBetweenAllAndNone) {
    addFullAdapter("eth0");
    EXPECT_THAT(names(configuration({}, false).instances.at(0)), SizeIs(12));
    EXPECT_THAT(names(configuration({}, true).instances.at(0)), IsEmpty());
}

TEST_F(FactoryInstances, FlagChangesNothingWhereThereIsAList) {
    addFullAdapter("eth0");
    EXPECT_THAT(names(configuration(PropertyList({"SettingID"}), true).instances.at(0)), ElementsAre("SettingID"));
}

TEST_F(FactoryInstances, EmptyListSetsNothing) {
    addFullAdapter("eth0");
    EXPECT_THAT(names(configuration(PropertyList(std::vector<const char*>{})).instances.at(0)), IsEmpty());
}

TEST_F(FactoryInstances, ListedNamesAreComparedExactlyAndUnknownAndRepeatedOnesDoNotMatter) {
    addFullAdapter("eth0");
    EXPECT_THAT(names(configuration(PropertyList({"settingid", "MACAddress", "MACAddress", "Nothing", "IPEnabled"}))
                          .instances.at(0)),
                ElementsAre("MACAddress", "IPEnabled"));
}

TEST_F(FactoryInstances, OneAddressMakesAnArrayOfOne) {
    addAdapter("v4").texts[PROP_IPV4_ADDRESS] = "192.0.2.1";
    addAdapter("v6").texts[PROP_IPV6_ADDRESS] = "2001:db8::1";
    const Built built = configuration();
    EXPECT_EQ(get(built.instances.at(0), "IPAddress"), strings({"192.0.2.1"}));
    EXPECT_EQ(get(built.instances.at(1), "IPAddress"), strings({"2001:db8::1"}));
}

TEST_F(FactoryInstances, NoAddressLeavesIPAddressAbsent) {
    addAdapter("eth0");
    EXPECT_THAT(names(configuration().instances.at(0)), testing::Not(Contains("IPAddress")));
    EXPECT_THAT(calls("newArray"), ElementsAre("newArray 1")); // the subnet's
}

TEST_F(FactoryInstances, EmptyListsLeaveTheirPropertiesAbsent) {
    auto& node = addFullAdapter("eth0");
    node.lists[PROP_DNS_SERVERS].clear();
    node.lists[PROP_DNS_SUFFIXES].clear();
    node.texts.erase(PROP_DEFAULT_GATEWAY);
    const std::vector<std::string> present = names(configuration().instances.at(0));
    EXPECT_THAT(present, testing::Not(Contains("DNSServerSearchOrder")));
    EXPECT_THAT(present, testing::Not(Contains("DNSDomainSuffixSearchOrder")));
    EXPECT_THAT(present, testing::Not(Contains("DefaultIPGateway")));
}

TEST_F(FactoryInstances, EmptyTextsLeaveTheThreePlainNamesAbsent) {
    auto& node = addFullAdapter("eth0");
    node.texts[PROP_DNS_HOSTNAME] = "";
    node.texts[PROP_DNS_DOMAIN] = "";
    node.texts[PROP_MAC_ADDRESS] = "";
    const std::vector<std::string> present = names(configuration().instances.at(0));
    EXPECT_THAT(present, testing::IsSupersetOf({"SettingID", "Description"}));
    EXPECT_THAT(present, testing::Not(Contains("DNSHostName")));
    EXPECT_THAT(present, testing::Not(Contains("DNSDomain")));
    EXPECT_THAT(present, testing::Not(Contains("MACAddress")));
}

TEST_F(FactoryInstances, EmptySubnetMaskIsAnArrayOfOneUnsetElement) {
    addFullAdapter("eth0").texts[PROP_IPV4_SUBNET_MASK] = "";
    EXPECT_EQ(get(configuration().instances.at(0), "IPSubnet"),
              (Value{CMPI_stringA, Value::Array{Value::null(CMPI_string)}}));
}

TEST_F(FactoryInstances, DhcpFlagIsReported) {
    addAdapter("dhcp").numbers[PROP_DHCP_ENABLED] = 1;
    addAdapter("static").numbers[PROP_DHCP_ENABLED] = 3;
    const Built built = configuration();
    EXPECT_EQ(get(built.instances.at(0), "DHCPEnabled"), Value::boolean(true));
    EXPECT_EQ(get(built.instances.at(1), "DHCPEnabled"), Value::boolean(false));
}

TEST_F(FactoryInstances, EmptyMapIsASuccessWithoutInstances) {
    const Built built = configuration();
    EXPECT_EQ(built.result, 0);
    EXPECT_THAT(built.instances, IsEmpty());
    EXPECT_THAT(recorded("log 4000"), SizeIs(2));
}

TEST_F(FactoryInstances, ConfigurationsComeInByteOrderOfTheirKeys) {
    for (const char* identity : {"eth2", "eth10", "eth1"}) {
        addAdapter(identity);
    }
    EXPECT_THAT(texts(configuration().instances, "SettingID"), ElementsAre("eth1", "eth10", "eth2"));
}

TEST_F(FactoryInstances, WrongConfigurationClassIsToldToTheBrokersTraceAndNotToTheLog) {
    enumerate(&NetworkAdapterObjectFactory::getAllNetworkAdapterCMPIInstances, LOGICAL);
    ASSERT_THAT(setup.brokerLog, SizeIs(1));
    EXPECT_TRUE(setup.brokerLog[0].trace);
    EXPECT_EQ(setup.brokerLog[0].level, 2);
    EXPECT_EQ(setup.brokerLog[0].component, "NetworkAdapterProvider");
    EXPECT_EQ(setup.brokerLog[0].text, "***No instance found***");
    EXPECT_THAT(recorded("log"), SizeIs(1)); // entering, and no exiting
}

TEST_F(FactoryInstances, RecordWhoseInstanceCannotBeMadeIsANullElement) {
    addAdapter("eth0");
    addAdapter("eth1");
    addAdapter("eth2");
    for (const char* slot : {"newInstance", "newObjectPath"}) {
        setup.faulty.failAt(slot, 2, Failure::silently);
        const Built built = configuration();
        EXPECT_EQ(built.result, 0);
        ASSERT_THAT(built.instances, SizeIs(3));
        EXPECT_EQ(built.instances[1].path.className, NO_INSTANCE);
        EXPECT_EQ(get(built.instances[2], "SettingID"), Value::string("eth2"));
    }
}

TEST_F(FactoryInstances, PathWithoutHandleCountsAsNone) {
    addAdapter("eth0");
    CMPIBrokerEncFT table = *setup.faulty.handle()->eft;
    table.newObjectPath = [](const CMPIBroker*, const char*, const char*, CMPIStatus*) {
        static CMPIObjectPath hollow{nullptr, nullptr};
        return &hollow;
    };
    setup.faulty.changeable().eft = &table;
    EXPECT_EQ(configuration().instances.at(0).path.className, NO_INSTANCE);
}

struct ListCase {
    int array; ///< which newArray of the record: 1 IPAddress, 2 IPSubnet, 3 suffixes, 4 gateways, 5 servers
    const char* message;
    std::vector<std::string> missing;
};

class MissingListArray : public FactoryInstances, public testing::WithParamInterface<ListCase> {};

TEST_P(MissingListArray, EndsTheInstanceWithAMessageAndGoesOnWithTheNextRecord) {
    addFullAdapter("eth0");
    addFullAdapter("eth1");
    const std::vector<std::string> all = names(configuration().instances.at(0));
    for (const Failure failure : {Failure::withStatus, Failure::silently}) {
        setup.faulty.failAt("newArray", GetParam().array, failure);
        const Built built = configuration();
        EXPECT_EQ(built.result, 0);
        ASSERT_THAT(built.instances, SizeIs(2));
        std::vector<std::string> expected = all;
        for (const std::string& name : GetParam().missing) {
            std::erase(expected, name);
        }
        EXPECT_EQ(names(built.instances[0]), expected);
        EXPECT_EQ(names(built.instances[1]), all);
        EXPECT_THAT(calls("newString"), Contains(std::string("newString ") + GetParam().message).Times(1));
        const std::string text =
            std::string("MESSAGE [File: NetworkAdapterObjectFactory, Line: N]: ") + GetParam().message;
        for (const char* sink : {"log", "trace"}) {
            EXPECT_THAT(normalised(recorded(std::string(sink) + " 6000")),
                        ElementsAre(line(sink, 6000, "Hearth.NetworkAdapterProvider", "NetworkAdapterObjectFactory",
                                         "makeNetworkAdapterConfigurationInstance", text)));
        }
        // Two records and their enumeration enter; the record that was cut short does not exit.
        std::vector<std::string> exits = recorded("log 4000");
        std::erase_if(exits, [](const std::string& l) { return l.find("| EXITING: make") == std::string::npos; });
        EXPECT_THAT(exits, SizeIs(1));
    }
}

INSTANTIATE_TEST_SUITE_P(
    EveryList, MissingListArray,
    testing::Values(ListCase{3,
                             "Create Array for Property DNSSuffixesToAppend failed.",
                             {"DNSDomainSuffixSearchOrder", "DefaultIPGateway", "DNSServerSearchOrder"}},
                    ListCase{4,
                             "Create Array for Property DefaultIPGateway failed.",
                             {"DefaultIPGateway", "DNSServerSearchOrder"}},
                    ListCase{5, "Create Array for Property DNSServerSearchOrder failed.", {"DNSServerSearchOrder"}}));

TEST_F(FactoryInstances, MissingListArrayOfTheLastRecordLeavesItsFailureInTheStatus) {
    addFullAdapter("eth0");
    setup.faulty.failAt("newArray", 5, Failure::silently);
    EXPECT_EQ(configuration().status.rc, CMPI_RC_ERR_FAILED);
}

TEST_F(FactoryInstances, MissingArrayLeavesIPAddressOrIPSubnetOutSilently) {
    addFullAdapter("eth0");
    const std::vector<std::string> all = names(configuration().instances.at(0));
    for (const auto& [nth, name] : {std::pair(1, "IPAddress"), std::pair(2, "IPSubnet")}) {
        setup.faulty.failAt("newArray", nth, Failure::withStatus);
        std::vector<std::string> expected = all;
        std::erase(expected, name);
        EXPECT_EQ(names(configuration().instances.at(0)), expected);
        EXPECT_THAT(recorded("log 6000"), IsEmpty());
    }
}

TEST_F(FactoryInstances, IPv6AddressTakesTheFirstPlaceWhenTheIPv4AddressCannotBeMade) {
    addFullAdapter("eth0");
    setup.faulty.failAt("newString", 1, Failure::withStatus);
    EXPECT_EQ(get(configuration().instances.at(0), "IPAddress"),
              (Value{CMPI_stringA, Value::Array{Value::string("2001:db8::10"), Value::null(CMPI_string)}}));
    EXPECT_THAT(normalised(recorded("log 4000")),
                Contains(testing::HasSubstr("VARIABLE: 'index' has Value '0' at line N")));
}

TEST_F(FactoryInstances, IPv6AddressThatCannotBeMadeLeavesItsPlaceUnset) {
    addFullAdapter("eth0");
    setup.faulty.failAt("newString", 2, Failure::withStatus);
    EXPECT_EQ(get(configuration().instances.at(0), "IPAddress"),
              (Value{CMPI_stringA, Value::Array{Value::string("192.0.2.10"), Value::null(CMPI_string)}}));
    EXPECT_THAT(recorded("log 4000"), testing::Not(Contains(testing::HasSubstr(" Setting IP Address Array set "))));
    EXPECT_THAT(recorded("log 4000"), Contains(testing::EndsWith("]:  IP Address Array set ")));
}

TEST_F(FactoryInstances, MaskThatCannotBeMadeIsAnUnsetElement) {
    addFullAdapter("eth0");
    setup.faulty.failAt("newString", 3, Failure::withStatus);
    EXPECT_EQ(get(configuration().instances.at(0), "IPSubnet"),
              (Value{CMPI_stringA, Value::Array{Value::null(CMPI_string)}}));
}

TEST_F(FactoryInstances, ListElementThatCannotBeMadeIsLeftUnsetAndTheOthersFollow) {
    addFullAdapter("eth0");
    setup.faulty.failAt("newString", 7, Failure::withStatus); // two addresses, mask, two suffixes, gateway, server
    EXPECT_EQ(get(configuration().instances.at(0), "DNSServerSearchOrder"),
              (Value{CMPI_stringA, Value::Array{Value::null(CMPI_string), Value::string("192.0.2.54")}}));
}

TEST_F(FactoryInstances, StatusOfStoringAnElementIsKeptForAddressAndMaskOnly) {
    addFullAdapter("eth0");
    const PropertyList address({"IPAddress"});
    setup.faulty.failAt("array.setElementAt", 1, Failure::withStatus);
    EXPECT_EQ(configuration(PropertyList({"IPSubnet"})).status.rc, CMPI_RC_ERR_FAILED);
    setup.faulty.failAt("array.setElementAt", 2, Failure::withStatus); // the IPv6 address
    EXPECT_EQ(configuration(PropertyList({"IPAddress"})).status.rc, CMPI_RC_OK);
    setup.faulty.failAt("array.setElementAt", 1, Failure::withStatus);
    EXPECT_EQ(configuration(PropertyList({"DNSServerSearchOrder"})).status.rc, CMPI_RC_OK);
    setup.faulty.failAt("array.setElementAt", 1, Failure::withStatus); // the IPv4 address, then the IPv6 string is OK
    EXPECT_EQ(configuration(PropertyList({"IPAddress"})).status.rc, CMPI_RC_OK);
}

TEST_F(FactoryInstances, StatusesOfSettingPropertiesAreNotTested) {
    addFullAdapter("eth0");
    setup.faulty.failAt("instance.setProperty", 0, Failure::withStatus);
    const Built built = configuration();
    EXPECT_EQ(built.result, 0);
    EXPECT_EQ(built.status.rc, CMPI_RC_OK);
    EXPECT_THAT(calls("instance.setProperty"), SizeIs(12));
}

TEST_F(FactoryInstances, ListsLongerThan16BitsWrap) {
    auto& servers = addAdapter("eth0").lists[PROP_DNS_SERVERS];
    servers.assign(65537, "192.0.2.53");
    servers[0] = "192.0.2.1";
    EXPECT_EQ(get(configuration(PropertyList({"DNSServerSearchOrder"})).instances.at(0), "DNSServerSearchOrder"),
              strings({"192.0.2.1"}));
    EXPECT_THAT(calls("newArray"), ElementsAre("newArray 1"));
}

TEST_F(FactoryInstances, MakeOperationsWorkWithoutAStatus) {
    addFullAdapter("eth0");
    NetworkAdapterConfiguration record;
    record.setSettingID("eth0");
    record.setDnsServerSearchOrder({"192.0.2.53"});
    record.setIPv4Address("192.0.2.1");
    setup.call(classPath(CONFIGURATION), [&](const CMPIContext*, const CMPIResult*, const CMPIObjectPath* reference) {
        NetworkAdapterObjectFactory factory(CONFIGURATION.c_str());
        const CMPIInstance* made = factory.makeNetworkAdapterConfigurationInstance(setup.faulty.handle(), reference,
                                                                                   record, nullptr, false, nullptr);
        EXPECT_EQ(get(model(made), "DNSServerSearchOrder"), strings({"192.0.2.53"}));
        setup.faulty.failAt("newArray", 3, Failure::silently);
        EXPECT_NE(factory.makeNetworkAdapterConfigurationInstance(setup.faulty.handle(), reference, record, nullptr,
                                                                  false, nullptr),
                  nullptr);
        return CMPIStatus{CMPI_RC_OK, nullptr};
    });
}

} // namespace

/** The instances that the object factory builds, with the object manager's own broker under it. */
#include "factory/NetworkAdapterObjectFactory.h"
#include "tests/provider/Broker.h"
#include "tests/provider/Tree.h"

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
using scripted_agent::clearRecord;
using scripted_agent::recorded;
using scripted_agent::script;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

/** Null instances are shown by a class name of their own. */
const std::string NO_INSTANCE = "(null)";

class FactoryInstances : public testing::Test {
  protected:
    FactoryInstances() { scripted_agent::reset(); }

    using GetAll = int (NetworkAdapterObjectFactory::*)(const CMPIBroker*, const CMPIContext*, const CMPIObjectPath*,
                                                        const char*, const char**, bool, std::vector<CMPIInstance*>&,
                                                        CMPIStatus*);

    struct Built {
        int result = -1;
        CMPIStatus status{};
        std::vector<Instance> instances;
    };

    /** Enumerates `className` with a factory of that class, `times` times into one vector. */
    Built enumerate(GetAll getAll, const std::string& className, PropertyList properties = {}, bool flag = false,
                    int times = 1, CMPIStatus status = {CMPI_RC_OK, nullptr}) {
        Built built;
        built.status = status;
        setup.call(classPath(className), [&](const CMPIContext* context, const CMPIResult*,
                                             const CMPIObjectPath* reference) {
            NetworkAdapterObjectFactory factory(className.c_str());
            clearRecord();
            std::vector<CMPIInstance*> instances;
            for (int i = 0; i < times; ++i) {
                built.result = (factory.*getAll)(setup.faulty.handle(), context, reference, className.c_str(),
                                                 properties.get(), flag, instances, &built.status);
            }
            for (const CMPIInstance* instance : instances) {
                built.instances.push_back(model(instance));
            }
            built.status.msg = nullptr;
            return built.status;
        });
        return built;
    }

    Built physical(PropertyList properties = {}) {
        return enumerate(&NetworkAdapterObjectFactory::getAllPhysicalNetworkAdapterCMPIInstances, PHYSICAL,
                         std::move(properties));
    }

    Built logical(PropertyList properties = {}) {
        return enumerate(&NetworkAdapterObjectFactory::getAllLogicalNetworkAdapterCMPIInstances, LOGICAL,
                         std::move(properties));
    }

    Built configuration(PropertyList properties = {}, bool flag = false) {
        return enumerate(&NetworkAdapterObjectFactory::getAllNetworkAdapterCMPIInstances, CONFIGURATION,
                         std::move(properties), flag);
    }

    static Instance model(const CMPIInstance* instance) {
        if (instance == nullptr) {
            Instance none;
            none.path.className = NO_INSTANCE;
            return none;
        }
        return marlo::broker::Broker::toModel(*instance);
    }

    std::vector<std::string> calls(const std::string& slot) const {
        std::vector<std::string> found = setup.faulty.calls();
        std::erase_if(found, [&](const std::string& call) { return !call.starts_with(slot); });
        return found;
    }

    BrokerSetup setup;
};

// Physical adapters

TEST_F(FactoryInstances, PhysicalAdapterHasExactlyItsPropertiesInTheirOrder) {
    setup.platform.cards = {card("eth0")};
    const Built built = physical();
    EXPECT_EQ(built.result, 0);
    ASSERT_THAT(built.instances, SizeIs(1));
    const Instance& instance = built.instances[0];
    EXPECT_THAT(names(instance), ElementsAre("CreationClassName", "Status", "ElementName", "Description", "Name",
                                             "SerialNumber", "PackageType", "Tag"));
    EXPECT_EQ(get(instance, "CreationClassName"), Value::string(PHYSICAL));
    EXPECT_EQ(get(instance, "Status"), Value::string("Status text"));
    EXPECT_EQ(get(instance, "ElementName"), Value::string("ElementName text"));
    EXPECT_EQ(get(instance, "Description"), Value::string("Description text"));
    EXPECT_EQ(get(instance, "Name"), Value::string("eth0"));
    EXPECT_EQ(get(instance, "SerialNumber"), Value::string("SerialNumber text"));
    EXPECT_EQ(get(instance, "PackageType"), Value::uint(CMPI_uint16, 9));
    EXPECT_EQ(get(instance, "Tag"), Value::string("eth0"));
}

TEST_F(FactoryInstances, PhysicalAdapterSetsItsClassTwiceAndCopiesBetween) {
    setup.platform.cards = {card("eth0")};
    physical();
    EXPECT_THAT(calls("instance.setProperty"),
                ElementsAre("instance.setProperty CreationClassName", "instance.setProperty CreationClassName",
                            "instance.setProperty Status", "instance.setProperty ElementName",
                            "instance.setProperty Description", "instance.setProperty Name",
                            "instance.setProperty SerialNumber", "instance.setProperty PackageType",
                            "instance.setProperty Tag"));
    EXPECT_THAT(recorded("mapProperty"),
                ElementsAre("mapProperty(\"Status\", 8)", "mapProperty(\"ElementName\", 8)",
                            "mapProperty(\"Description\", 8)", "mapProperty(\"Name\", 8)",
                            "mapProperty(\"SerialNumber\", 8)", "mapProperty(\"PackageType\", 1)"));
}

TEST_F(FactoryInstances, PathHasTheRequestsNamespaceTheSystemsNameAndNoKeys) {
    setup.platform.cards = {card("eth0")};
    setup.platform.ports = {port("0")};
    addFullAdapter("eth0");
    for (const Built& built : {physical(), logical(), configuration()}) {
        ASSERT_THAT(built.instances, SizeIs(1));
        const marlo::ObjectPath& path = built.instances[0].path;
        EXPECT_EQ(path.nameSpace, NAMESPACE);
        EXPECT_EQ(path.host, "host.example.org");
        EXPECT_THAT(calls("objectPath.addKey"), IsEmpty());
    }
    EXPECT_EQ(physical().instances[0].path.className, PHYSICAL);
    EXPECT_EQ(logical().instances[0].path.className, LOGICAL);
    EXPECT_EQ(configuration().instances[0].path.className, CONFIGURATION);
}

TEST_F(FactoryInstances, PathIsMadeInTheNamespaceAndGivenItAgain) {
    addFullAdapter("eth0");
    configuration();
    EXPECT_THAT(calls("newObjectPath"), ElementsAre("newObjectPath root/tavis MARLO_NetworkAdapterConfiguration"));
    EXPECT_THAT(calls("objectPath.set"),
                ElementsAre("objectPath.setNameSpace root/tavis", "objectPath.setHostname host.example.org"));
}

TEST_F(FactoryInstances, CardsAreAskedForInThePlatformsNamespaceWithoutAPropertyList) {
    physical(PropertyList({"Tag"}));
    EXPECT_THAT(setup.platform.enumerations, ElementsAre(std::pair("root/quarn:TAVIS_NetworkCard", false)));
}

TEST_F(FactoryInstances, PortsAreAskedForInThePlatformsNamespaceWithoutAPropertyList) {
    logical(PropertyList({"DeviceID"}));
    EXPECT_THAT(setup.platform.enumerations, ElementsAre(std::pair("root/quarn:TAVIS_NetworkPort", false)));
}

std::vector<std::string> texts(const std::vector<Instance>& instances, const std::string& property) {
    std::vector<std::string> found;
    for (const Instance& instance : instances) {
        const Value value = get(instance, property);
        found.push_back(value.isNull() ? "NULL" : std::get<std::string>(value.data));
    }
    return found;
}

TEST_F(FactoryInstances, ServiceProcessorsCardIsAbsentAndItsLookalikesArePresent) {
    setup.platform.cards = {card("eth1"), card("NIC1"), card("nic1"), card("NIC10"), card("NIC1 "), card("eth0")};
    EXPECT_THAT(texts(physical().instances, "Tag"), ElementsAre("eth1", "nic1", "NIC10", "NIC1 ", "eth0"));
}

TEST_F(FactoryInstances, CardWithoutNameHasAnEmptyTagAndTheNameThatTheAgentMakesOfIt) {
    Instance nameless = card("x");
    set(nameless, "Name", Value::null(CMPI_string));
    setup.platform.cards = {nameless};
    const Built built = physical();
    ASSERT_THAT(built.instances, SizeIs(1));
    EXPECT_EQ(get(built.instances[0], "Tag"), Value::string(""));
    EXPECT_EQ(get(built.instances[0], "Name"), Value::null(CMPI_string));
    EXPECT_THAT(normalised(recorded("log 4000")), testing::Not(Contains(testing::HasSubstr("nicName"))));
}

TEST_F(FactoryInstances, CardWhoseNameIsAKeyIsReadLikeAnyOther) {
    setup.platform.cards = {card("NIC1"), card("eth0")};
    setup.faulty.alter = [](const std::string& slot, CMPIData& data) {
        if (slot == "instance.getProperty") {
            data.state = static_cast<CMPIValueState>(data.state | CMPI_keyValue);
        }
    };
    EXPECT_THAT(texts(physical().instances, "Tag"), ElementsAre("eth0"));
}

TEST_F(FactoryInstances, NamelessCardOfAnOlderBrokerThatAddsItsOwnFlagIsNullToo) {
    setup.platform.cards = {card("NIC1")};
    setup.faulty.alter = [](const std::string& slot, CMPIData& data) {
        if (slot == "instance.getProperty") {
            data = {CMPI_null, CMPI_nullValue | CMPI_notFound, {}};
        }
    };
    EXPECT_THAT(texts(physical().instances, "Tag"), ElementsAre(""));
}

TEST_F(FactoryInstances, CardWhoseNameIsNoTextIsNotTakenForOne) {
    Instance odd = card("x");
    set(odd, "Name", Value::uint(CMPI_uint32, 1));
    setup.platform.cards = {odd};
    EXPECT_THAT(texts(physical().instances, "Tag"), ElementsAre(""));
}

TEST_F(FactoryInstances, WrongClassMakesTheOtherEnumerationsReturnOneAndLeaveTheVectorAlone) {
    setup.platform.cards = {card("eth0")};
    setup.platform.ports = {port("0")};
    addFullAdapter("eth0");
    const Built asPhysical =
        enumerate(&NetworkAdapterObjectFactory::getAllPhysicalNetworkAdapterCMPIInstances, LOGICAL);
    EXPECT_EQ(asPhysical.result, 1);
    EXPECT_THAT(asPhysical.instances, IsEmpty());
    const Built asLogical =
        enumerate(&NetworkAdapterObjectFactory::getAllLogicalNetworkAdapterCMPIInstances, PHYSICAL);
    EXPECT_EQ(asLogical.result, 1);
    EXPECT_THAT(asLogical.instances, IsEmpty());
    const Built asConfiguration =
        enumerate(&NetworkAdapterObjectFactory::getAllNetworkAdapterCMPIInstances, PHYSICAL);
    EXPECT_EQ(asConfiguration.result, 1);
    EXPECT_THAT(asConfiguration.instances, IsEmpty());
    EXPECT_THAT(setup.platform.enumerations, IsEmpty());
}

TEST_F(FactoryInstances, NoCardsAndNoPortsAreASuccessWithoutInstances) {
    EXPECT_EQ(physical().result, 0);
    EXPECT_THAT(physical().instances, IsEmpty());
    EXPECT_EQ(logical().result, 0);
    EXPECT_THAT(logical().instances, IsEmpty());
}

TEST_F(FactoryInstances, PropertyListChangesNothingInPhysicalAdapters) {
    setup.platform.cards = {card("eth0")};
    const Built all = physical();
    const Built listed = physical(PropertyList({"Tag"}));
    EXPECT_EQ(listed.instances, all.instances);
    EXPECT_THAT(names(listed.instances[0]), SizeIs(8));
    EXPECT_EQ(physical(PropertyList(std::vector<const char*>{})).instances, all.instances);
}

TEST_F(FactoryInstances, PropertyListWithAndWithoutDuplicatesChangesNothingInLogicalAdapters) {
    setup.platform.ports = {port("0")};
    const Built all = logical();
    EXPECT_EQ(logical(PropertyList({"DeviceID"})).instances, all.instances);
    EXPECT_EQ(logical(PropertyList({"DeviceID", "DeviceID", "Speed"})).instances, all.instances);
    EXPECT_EQ(logical(PropertyList(std::vector<const char*>{})).instances, all.instances);
    EXPECT_THAT(names(all.instances[0]), SizeIs(18));
}

TEST_F(FactoryInstances, CallingTwiceWithOneVectorAppendsTheCardsTwice) {
    setup.platform.cards = {card("eth0"), card("eth1")};
    const Built built =
        enumerate(&NetworkAdapterObjectFactory::getAllPhysicalNetworkAdapterCMPIInstances, PHYSICAL, {}, false, 2);
    EXPECT_THAT(texts(built.instances, "Tag"), ElementsAre("eth0", "eth1", "eth0", "eth1"));
}

TEST_F(FactoryInstances, CallingTwiceWithOneVectorAppendsPortsAndRecordsTwice) {
    setup.platform.ports = {port("0")};
    addFullAdapter("eth0");
    EXPECT_THAT(
        enumerate(&NetworkAdapterObjectFactory::getAllLogicalNetworkAdapterCMPIInstances, LOGICAL, {}, false, 2)
            .instances,
        SizeIs(2));
    EXPECT_THAT(
        enumerate(&NetworkAdapterObjectFactory::getAllNetworkAdapterCMPIInstances, CONFIGURATION, {}, false, 2)
            .instances,
        SizeIs(2));
}

TEST_F(FactoryInstances, RefusedEnumerationIsASuccessThatKeepsTheBrokersStatus) {
    setup.platform.cards = {card("eth0")};
    setup.platform.ports = {port("0")};
    setup.platform.outcome = {CMPI_RC_ERR_INVALID_NAMESPACE, "no such namespace"};
    for (const Built& built : {physical(), logical()}) {
        EXPECT_EQ(built.result, 0);
        EXPECT_EQ(built.status.rc, CMPI_RC_ERR_INVALID_NAMESPACE);
        EXPECT_THAT(built.instances, IsEmpty());
    }
    EXPECT_THAT(recorded("log 6000"), IsEmpty());
    EXPECT_THAT(recorded("log"), SizeIs(2)); // entering and exiting
}

TEST_F(FactoryInstances, InstanceThatCannotBeMadeIsSkippedAmongCardsAndPorts) {
    setup.platform.cards = {card("eth0"), card("eth1"), card("eth2")};
    setup.platform.ports = {port("0"), port("1"), port("2")};
    for (const char* slot : {"newInstance", "newObjectPath"}) {
        // The first path is the one that the platform is asked for.
        setup.faulty.failAt(slot, slot == std::string("newInstance") ? 2 : 3, Failure::silently);
        EXPECT_THAT(texts(physical().instances, "Tag"), ElementsAre("eth0", "eth2")) << slot;
        setup.faulty.failAt(slot, slot == std::string("newInstance") ? 2 : 3, Failure::silently);
        EXPECT_THAT(texts(logical().instances, "DeviceID"), ElementsAre("0", "2")) << slot;
    }
}

TEST_F(FactoryInstances, ErrorsWithinTheLoopAreNotTested) {
    setup.platform.cards = {card("eth0"), card("eth1")};
    for (const char* slot : {"instance.getProperty", "instance.setProperty", "objectPath.setHostname"}) {
        setup.faulty.failAt(slot, 1, Failure::withStatus);
        const Built built = physical();
        EXPECT_EQ(built.result, 0) << slot;
        EXPECT_THAT(built.instances, SizeIs(2)) << slot;
    }
}

TEST_F(FactoryInstances, EnumerationThatPromisesMoreThanItHasIsEnded) {
    setup.platform.cards = {card("eth0"), card("eth1")};
    setup.faulty.failAt("enumeration.getNext", 2, Failure::withStatus);
    const Built built = physical();
    EXPECT_EQ(built.result, 0);
    EXPECT_EQ(built.status.rc, CMPI_RC_ERR_FAILED);
    EXPECT_THAT(texts(built.instances, "Tag"), ElementsAre("eth0"));
}

// Logical adapters

TEST_F(FactoryInstances, LogicalAdapterHasExactlyItsPropertiesInTheirOrder) {
    setup.platform.ports = {port("port 0")};
    const Built built = logical();
    EXPECT_EQ(built.result, 0);
    ASSERT_THAT(built.instances, SizeIs(1));
    const Instance& instance = built.instances[0];
    EXPECT_THAT(names(instance), ElementsAre("CreationClassName", "SystemCreationClassName", "Status", "SystemName",
                                             "DeviceID", "ElementName", "Caption", "Description", "Name", "Speed",
                                             "MaxSpeed", "RequestedSpeed", "PortType", "PortNumber",
                                             "PermanentAddress", "FullDuplex", "AutoSense", "LinkTechnology"));
    EXPECT_EQ(get(instance, "CreationClassName"), Value::string(LOGICAL));
    EXPECT_EQ(get(instance, "SystemCreationClassName"), Value::string("MARLO_ComputerSystem"));
    EXPECT_EQ(get(instance, "SystemName"), Value::string("SystemName text"));
    EXPECT_EQ(get(instance, "DeviceID"), Value::string("port 0"));
    EXPECT_EQ(get(instance, "Caption"), Value::string("Caption text"));
    EXPECT_EQ(get(instance, "Speed"), Value::uint(CMPI_uint64, 10'000'000'000));
    EXPECT_EQ(get(instance, "MaxSpeed"), Value::uint(CMPI_uint64, 25'000'000'000));
    EXPECT_EQ(get(instance, "RequestedSpeed"), Value::uint(CMPI_uint64, 10'000'000'001));
    EXPECT_EQ(get(instance, "PortType"), Value::uint(CMPI_uint16, 53));
    EXPECT_EQ(get(instance, "PortNumber"), Value::uint(CMPI_uint16, 4));
    EXPECT_EQ(get(instance, "PermanentAddress"), Value::string("PermanentAddress text"));
    EXPECT_EQ(get(instance, "FullDuplex"), Value::boolean(true));
    EXPECT_EQ(get(instance, "AutoSense"), Value::boolean(false));
    EXPECT_EQ(get(instance, "LinkTechnology"), Value::uint(CMPI_uint16, 2));
}

TEST_F(FactoryInstances, LogicalAdapterIsMadeBareAndCopiedByType) {
    setup.platform.ports = {port("0")};
    logical();
    EXPECT_EQ(calls("instance.setProperty").front(), "instance.setProperty CreationClassName");
    EXPECT_EQ(calls("instance.setProperty")[1], "instance.setProperty SystemCreationClassName");
    EXPECT_THAT(recorded("mapProperty"),
                ElementsAre("mapProperty(\"Status\", 8)", "mapProperty(\"SystemName\", 8)",
                            "mapProperty(\"DeviceID\", 8)", "mapProperty(\"ElementName\", 8)",
                            "mapProperty(\"Caption\", 8)", "mapProperty(\"Description\", 8)",
                            "mapProperty(\"Name\", 8)", "mapProperty(\"Speed\", 3)", "mapProperty(\"MaxSpeed\", 3)",
                            "mapProperty(\"RequestedSpeed\", 3)", "mapProperty(\"PortType\", 1)",
                            "mapProperty(\"PortNumber\", 1)", "mapProperty(\"PermanentAddress\", 8)",
                            "mapProperty(\"FullDuplex\", 7)", "mapProperty(\"AutoSense\", 7)",
                            "mapProperty(\"LinkTechnology\", 1)"));
}

TEST_F(FactoryInstances, ServiceProcessorsPortsNeverAppearAndAllOthersReportOurComputerSystem) {
    setup.platform.ports = {port("0", "TAVIS_SPComputerSystem"), port("1", "tavis_spcomputersystem"),
                            port("2", "TAVIS_SPComputerSystem2"), port("3", "MARLO_ComputerSystem")};
    const Built built = logical();
    EXPECT_THAT(texts(built.instances, "DeviceID"), ElementsAre("1", "2", "3"));
    for (const std::string& className : texts(built.instances, "SystemCreationClassName")) {
        EXPECT_EQ(className, "MARLO_ComputerSystem");
    }
}

TEST_F(FactoryInstances, PortWithoutSystemClassIsPublished) {
    Instance orphan = port("0");
    set(orphan, "SystemCreationClassName", Value::null(CMPI_string));
    setup.platform.ports = {orphan};
    EXPECT_THAT(texts(logical().instances, "SystemCreationClassName"), ElementsAre("MARLO_ComputerSystem"));
}

// Configurations

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

TEST_F(FactoryInstances, MakeOperationsGiveWhatTheEnumerationsFill) {
    setup.call(classPath(PHYSICAL), [&](const CMPIContext*, const CMPIResult*, const CMPIObjectPath* reference) {
        NetworkAdapterObjectFactory factory(LOGICAL.c_str());
        CMPIStatus status = {CMPI_RC_OK, nullptr};
        PropertyList none(std::vector<const char*>{});
        const CMPIInstance* physical = factory.makePhysicalNetworkAdapterCMPIInstance(
            setup.faulty.handle(), reference, none.get(), true, &status);
        EXPECT_THAT(names(model(physical)), ElementsAre("CreationClassName"));
        const CMPIInstance* logical =
            factory.makeLogicalNetworkAdapterInstance(setup.faulty.handle(), reference, none.get(), true, &status);
        EXPECT_THAT(names(model(logical)), IsEmpty());
        return status;
    });
}

} // namespace

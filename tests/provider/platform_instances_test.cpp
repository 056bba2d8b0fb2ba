/** What the object factory makes of the platform's cards and ports. */
#include "tests/provider/FactoryInstances.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace Orv::NodeLexicon;
using namespace provider_test;
using marlo::Instance;
using marlo::Value;
using marlo::test::Failure;
using Orv::NetworkAdapterComposite::NetworkAdapterObjectFactory;
using scripted_agent::recorded;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

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

#include "host/schema/Schema.h"

#include <map>
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace marlo::test {
namespace {

using testing::ElementsAre;

/** The MOF that is installed. */
class ShippedSchema : public testing::Test {
  protected:
    static void SetUpTestSuite() { schema() = Schema::readDirectory(MARLO_SHIPPED_SCHEMA); }

    static Schema& schema() {
        static Schema shipped;
        return shipped;
    }

    static const Class& find(const std::string& nameSpace, const std::string& name) {
        const Class* const found = schema().findClass(nameSpace, name);
        if (found == nullptr) {
            throw std::runtime_error(name + " is not in " + nameSpace);
        }
        return *found;
    }

    static std::map<std::string, CMPIType> typesOf(const Class& of) {
        std::map<std::string, CMPIType> types;
        for (const Property& property : of.properties) {
            types[property.name] = property.type;
        }
        return types;
    }

    static std::vector<std::string> keysOf(const Class& of) {
        std::vector<std::string> names;
        for (const Property* key : of.keys()) {
            names.push_back(key->name);
        }
        return names;
    }

    static void expectTypes(const Class& of, const std::map<std::string, CMPIType>& expected) {
        const auto types = typesOf(of);
        for (const auto& [name, type] : expected) {
            const auto found = types.find(name);
            ASSERT_NE(found, types.end()) << of.name << "." << name;
            EXPECT_EQ(found->second, type) << of.name << "." << name;
        }
    }
};

const std::map<std::string, CMPIType> CardTypes = {
    {"CreationClassName", CMPI_string}, {"Status", CMPI_string}, {"ElementName", CMPI_string},
    {"Description", CMPI_string},       {"Name", CMPI_string},   {"SerialNumber", CMPI_string},
    {"PackageType", CMPI_uint16},       {"Tag", CMPI_string}};

const std::map<std::string, CMPIType> PortTypes = {{"CreationClassName", CMPI_string},
                                                   {"SystemCreationClassName", CMPI_string},
                                                   {"Status", CMPI_string},
                                                   {"SystemName", CMPI_string},
                                                   {"DeviceID", CMPI_string},
                                                   {"ElementName", CMPI_string},
                                                   {"Caption", CMPI_string},
                                                   {"Description", CMPI_string},
                                                   {"Name", CMPI_string},
                                                   {"Speed", CMPI_uint64},
                                                   {"MaxSpeed", CMPI_uint64},
                                                   {"RequestedSpeed", CMPI_uint64},
                                                   {"PortType", CMPI_uint16},
                                                   {"PortNumber", CMPI_uint16},
                                                   {"PermanentAddress", CMPI_string},
                                                   {"FullDuplex", CMPI_boolean},
                                                   {"AutoSense", CMPI_boolean},
                                                   {"LinkTechnology", CMPI_uint16}};

const std::map<std::string, CMPIType> EventTypes = {{"IndicationIdentifier", CMPI_string},
                                                    {"EventID", CMPI_string},
                                                    {"IndicationTime", CMPI_dateTime},
                                                    {"EventTime", CMPI_dateTime},
                                                    {"AlertingManagedElement", CMPI_string},
                                                    {"CorrelatedIndications", CMPI_stringA},
                                                    {"PerceivedSeverity", CMPI_uint16},
                                                    {"Description", CMPI_string},
                                                    {"Message", CMPI_string},
                                                    {"MessageID", CMPI_string},
                                                    {"AlertingElementFormat", CMPI_uint16},
                                                    {"AlertType", CMPI_uint16},
                                                    {"ProbableCause", CMPI_uint16},
                                                    {"SystemCreationClassName", CMPI_string},
                                                    {"SystemName", CMPI_string},
                                                    {"SequenceContext", CMPI_string},
                                                    {"SequenceNumber", CMPI_sint64},
                                                    {"UniqueSystemID", CMPI_string},
                                                    {"OwningEntity", CMPI_string},
                                                    {"ProviderName", CMPI_string}};

TEST_F(ShippedSchema, HasItsThreeNamespaces) {
    EXPECT_THAT(schema().nameSpaces(), ElementsAre("root/tavis", "root/quarn", "root/interop"));
}

TEST_F(ShippedSchema, GivesThePhysicalAdapterItsPropertiesAndKeys) {
    const Class& adapter = find("root/tavis", "MARLO_PhysicalNetworkAdapter");
    expectTypes(adapter, CardTypes);
    EXPECT_THAT(keysOf(adapter), ElementsAre("Tag", "CreationClassName"));
    EXPECT_TRUE(schema().isA("root/tavis", adapter.name, "CIM_PhysicalPackage"));
}

TEST_F(ShippedSchema, GivesTheLogicalAdapterItsPropertiesAndKeys) {
    const Class& adapter = find("root/tavis", "MARLO_LogicalNetworkAdapter");
    expectTypes(adapter, PortTypes);
    EXPECT_EQ(adapter.properties.size(), PortTypes.size());
    EXPECT_THAT(keysOf(adapter),
                ElementsAre("SystemCreationClassName", "SystemName", "CreationClassName", "DeviceID"));
    EXPECT_TRUE(schema().isA("root/tavis", adapter.name, "CIM_NetworkPort"));
}

TEST_F(ShippedSchema, GivesTheConfigurationItsPropertiesAndKey) {
    const Class& configuration = find("root/tavis", "MARLO_NetworkAdapterConfiguration");
    expectTypes(configuration, {{"SettingID", CMPI_string},
                                {"Description", CMPI_string},
                                {"IPAddress", CMPI_stringA},
                                {"IPSubnet", CMPI_stringA},
                                {"DNSHostName", CMPI_string},
                                {"DNSDomain", CMPI_string},
                                {"MACAddress", CMPI_string},
                                {"DHCPEnabled", CMPI_boolean},
                                {"IPEnabled", CMPI_boolean},
                                {"DNSDomainSuffixSearchOrder", CMPI_stringA},
                                {"DefaultIPGateway", CMPI_stringA},
                                {"DNSServerSearchOrder", CMPI_stringA}});
    EXPECT_THAT(keysOf(configuration), ElementsAre("SettingID"));
    EXPECT_TRUE(schema().isA("root/tavis", configuration.name, "CIM_ManagedElement"));
}

TEST_F(ShippedSchema, GivesThePlatformsClassesWhatIsReadOfThem) {
    const Class& card = find("root/quarn", "TAVIS_NetworkCard");
    expectTypes(card, CardTypes);
    EXPECT_THAT(keysOf(card), ElementsAre("Tag", "CreationClassName"));
    const Class& port = find("root/quarn", "TAVIS_NetworkPort");
    expectTypes(port, PortTypes);
    EXPECT_THAT(keysOf(port), ElementsAre("SystemCreationClassName", "SystemName", "CreationClassName", "DeviceID"));
}

TEST_F(ShippedSchema, GivesTheIndicationsWhatTheProviderSetsOfThem) {
    for (const char* name : {"MARLO_NetworkAdapterOnlineEvent", "MARLO_NetworkAdapterOfflineEvent",
                             "MARLO_NetworkAdapterSwitchOverEvent", "MARLO_NetworkAdapterSwitchBackEvent"}) {
        const Class& event = find("root/tavis", name);
        expectTypes(event, EventTypes);
        EXPECT_EQ(event.properties.size(), EventTypes.size()) << name;
        EXPECT_TRUE(event.isIndication) << name;
        EXPECT_FALSE(event.isAbstract) << name;
        EXPECT_TRUE(schema().isA("root/tavis", name, "CIM_AlertIndication")) << name;
        EXPECT_TRUE(schema().isA("root/tavis", name, "CIM_ProcessIndication")) << name;
        EXPECT_TRUE(event.keys().empty()) << name;
    }
    EXPECT_EQ(schema().findClass("root/quarn", "MARLO_NetworkAdapterOnlineEvent"), nullptr);
}

TEST_F(ShippedSchema, KeepsTheNamespacesApart) {
    EXPECT_EQ(schema().findClass("root/quarn", "MARLO_PhysicalNetworkAdapter"), nullptr);
    EXPECT_EQ(schema().findClass("root/tavis", "TAVIS_NetworkCard"), nullptr);
    EXPECT_EQ(schema().findClass("root/tavis", "CIM_Namespace"), nullptr);
}

const std::vector<std::string> KeysInASystem = {"SystemCreationClassName", "SystemName", "CreationClassName", "Name"};

TEST_F(ShippedSchema, GivesTheInteropNamespaceWhatClientsLookFor) {
    const std::string nameSpace = "root/interop";
    EXPECT_THAT(keysOf(find(nameSpace, "CIM_Namespace")),
                ElementsAre("SystemCreationClassName", "SystemName", "ObjectManagerCreationClassName",
                            "ObjectManagerName", "CreationClassName", "Name"));
    EXPECT_THAT(keysOf(find(nameSpace, "CIM_ObjectManager")), testing::UnorderedElementsAreArray(KeysInASystem));
    EXPECT_THAT(keysOf(find(nameSpace, "CIM_RegisteredProfile")), ElementsAre("InstanceID"));
    EXPECT_TRUE(schema().isA(nameSpace, "CIM_ObjectManager", "CIM_Service"));
    expectTypes(find(nameSpace, "CIM_Namespace"),
                {{"ClassInfo", CMPI_uint16}, {"DescriptionOfClassInfo", CMPI_string}});
    expectTypes(find(nameSpace, "CIM_RegisteredProfile"), {{"RegisteredOrganization", CMPI_uint16},
                                                           {"RegisteredName", CMPI_string},
                                                           {"RegisteredVersion", CMPI_string},
                                                           {"AdvertiseTypes", CMPI_uint16A}});
    EXPECT_TRUE(find(nameSpace, "CIM_NamespaceInManager").isAssociation);
    EXPECT_TRUE(find(nameSpace, "CIM_ElementConformsToProfile").isAssociation);
}

TEST_F(ShippedSchema, GivesTheInteropNamespaceWhatASubscriptionIsMadeOf) {
    const std::string nameSpace = "root/interop";
    for (const char* name :
         {"CIM_IndicationFilter", "CIM_ListenerDestinationCIMXML", "CIM_IndicationHandlerCIMXML"}) {
        EXPECT_THAT(keysOf(find(nameSpace, name)), testing::ElementsAreArray(KeysInASystem)) << name;
    }
    EXPECT_TRUE(schema().isA(nameSpace, "CIM_IndicationHandlerCIMXML", "CIM_ListenerDestination"));
    expectTypes(find(nameSpace, "CIM_ListenerDestinationCIMXML"),
                {{"Destination", CMPI_string}, {"PersistenceType", CMPI_uint16}, {"Protocol", CMPI_uint16}});
    expectTypes(find(nameSpace, "CIM_IndicationFilter"), {{"Query", CMPI_string},
                                                          {"QueryLanguage", CMPI_string},
                                                          {"SourceNamespace", CMPI_string},
                                                          {"SourceNamespaces", CMPI_stringA},
                                                          {"IndividualSubscriptionSupported", CMPI_boolean}});
    const Class& subscription = find(nameSpace, "CIM_IndicationSubscription");
    EXPECT_THAT(keysOf(subscription), ElementsAre("Filter", "Handler"));
    EXPECT_EQ(subscription.findProperty("Filter")->referenceClass, "CIM_IndicationFilter");
    expectTypes(subscription, {{"OnFatalErrorPolicy", CMPI_uint16},
                               {"FailureTriggerTimeInterval", CMPI_uint64},
                               {"SubscriptionState", CMPI_uint16},
                               {"RepeatNotificationPolicy", CMPI_uint16},
                               {"TimeOfLastStateChange", CMPI_dateTime},
                               {"SubscriptionDuration", CMPI_uint64}});
    expectTypes(find(nameSpace, "CIM_IndicationService"), {{"DeliveryRetryAttempts", CMPI_uint16},
                                                           {"DeliveryRetryInterval", CMPI_uint32},
                                                           {"SubscriptionRemovalAction", CMPI_uint16},
                                                           {"SubscriptionRemovalTimeInterval", CMPI_uint32}});
}

TEST_F(ShippedSchema, DerivesEverythingFromTheStandardsRootsAndServesNoAbstractClass) {
    for (const std::string& nameSpace : schema().nameSpaces()) {
        for (const Class* each : schema().classes(nameSpace)) {
            const char* const root = each->isIndication ? "CIM_Indication" : "CIM_ManagedElement";
            EXPECT_NE(schema().isA(nameSpace, each->name, root), each->isAssociation) << each->name;
            const bool isOurs = !each->name.starts_with("CIM_");
            EXPECT_FALSE(isOurs && each->isAbstract) << each->name;
            EXPECT_FALSE(isOurs && each->keys().empty() != each->isIndication) << each->name;
        }
    }
}

TEST_F(ShippedSchema, DescribesEveryClassAndProperty) {
    for (const std::string& nameSpace : schema().nameSpaces()) {
        for (const Class* each : schema().classes(nameSpace)) {
            EXPECT_NE(findQualifier(each->qualifiers, "Description"), nullptr) << each->name;
            EXPECT_NE(findQualifier(each->qualifiers, "Version"), nullptr) << each->name;
            for (const Property& property : each->properties) {
                const Qualifier* const description = findQualifier(property.qualifiers, "Description");
                ASSERT_NE(description, nullptr) << each->name << "." << property.name;
                EXPECT_FALSE(description->value.isNull()) << each->name << "." << property.name;
            }
        }
    }
}

TEST_F(ShippedSchema, PairsEveryValueWithItsMeaning) {
    for (const std::string& nameSpace : schema().nameSpaces()) {
        for (const Class* each : schema().classes(nameSpace)) {
            for (const Property& property : each->properties) {
                const Qualifier* const map = findQualifier(property.qualifiers, "ValueMap");
                const Qualifier* const values = findQualifier(property.qualifiers, "Values");
                if (map != nullptr && values != nullptr) {
                    EXPECT_EQ(std::get<Value::Array>(map->value.data).size(),
                              std::get<Value::Array>(values->value.data).size())
                        << each->name << "." << property.name;
                }
            }
        }
    }
}

} // namespace
} // namespace marlo::test

/** @file Filters, destinations and subscriptions as clients make, find, change and remove them. */
#include "host/cimom/Interop.h"
#include "tests/subscriptions/Site.h"

#include <algorithm>

namespace marlo::test {
namespace {

using subscriptions::numberOf;
using subscriptions::textOf;
using subscriptions::textsOf;
using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::SizeIs;
using testing::UnorderedElementsAre;

class ObjectsTest : public SubscribingTest {
  protected:
    static std::string keysOf(const std::string& className, const std::string& name) {
        return "root/interop:" + className + ".SystemCreationClassName=\"CIM_ComputerSystem\",SystemName=\"" +
               systemName() + "\",CreationClassName=\"" + className + "\",Name=\"" + name + "\"";
    }

    std::vector<std::string> referenceNames(const ObjectPath& path) {
        std::vector<std::string> found;
        const Status status =
            manager->referenceNames(path, {"CIM_IndicationSubscription", "", "", ""},
                                    [&found](ObjectPath&& each) { found.push_back(each.toString()); });
        EXPECT_TRUE(status.ok()) << status.message;
        return found;
    }

    std::vector<std::string> associatorNames(const ObjectPath& path, const std::string& association) {
        std::vector<std::string> found;
        const Status status = manager->associatorNames(
            path, {association, "", "", ""}, [&found](ObjectPath&& each) { found.push_back(each.toString()); });
        EXPECT_TRUE(status.ok()) << status.message;
        return found;
    }
};

TEST_F(ObjectsTest, HaveTheirKeysFilledIn) {
    const ObjectPath named = makeFilter("mine");
    EXPECT_EQ(named.toString(), keysOf("CIM_IndicationFilter", "mine"));
    const ObjectPath unnamed =
        make("CIM_IndicationFilter", {text("Query", "SELECT * FROM Test_Alert"), text("QueryLanguage", "WQL"),
                                      text("SourceNamespace", "root/test")});
    EXPECT_FALSE(textOf(get(unnamed), "Name").empty());
    EXPECT_THAT(names("CIM_IndicationFilter"), Contains(named.toString()));
    EXPECT_THAT(names("CIM_IndicationFilter"), Contains(unnamed.toString()));
}

TEST_F(ObjectsTest, KeepTheSystemThatAClientSays) {
    const ObjectPath made = make("CIM_ListenerDestinationCIMXML", {text("SystemName", "elsewhere"), text("Name", "x"),
                                                                   text("Destination", "http://h/")});
    EXPECT_EQ(textOf(get(made), "SystemName"), "elsewhere");
}

TEST_F(ObjectsTest, HaveTheirDefaults) {
    const Instance destination = get(makeDestination());
    EXPECT_EQ(numberOf(destination, "PersistenceType"), 2U);
    EXPECT_EQ(numberOf(destination, "Protocol"), 2U);
    const Instance filter = get(makeFilter());
    EXPECT_EQ(numberOf(filter, "IndividualSubscriptionSupported"), 1U);
    const Instance subscription = get(subscribe(filter.path, destination.path));
    EXPECT_EQ(numberOf(subscription, "OnFatalErrorPolicy"), 2U);
    EXPECT_EQ(numberOf(subscription, "RepeatNotificationPolicy"), 2U);
    EXPECT_EQ(stateOf(subscription), 2U);
    EXPECT_NE(findName(subscription.properties, "TimeOfLastStateChange"), nullptr);
    EXPECT_NE(findName(subscription.properties, "SubscriptionStartTime"), nullptr);
}

TEST_F(ObjectsTest, GiveTheSourceOfAFilterInBothWays) {
    const Instance single = get(makeFilter());
    EXPECT_EQ(textOf(single, "SourceNamespace"), "root/test");
    EXPECT_THAT(textsOf(single, "SourceNamespaces"), ElementsAre("root/test"));
    const Instance several = get(make(
        "CIM_IndicationFilter", {text("Query", "SELECT * FROM CIM_Indication"),
                                 text("QueryLanguage", "DMTF:CQL"),
                                 {"SourceNamespaces", subscriptions::textArray({"/ROOT/Test/", "root/tavis"})}}));
    EXPECT_THAT(textsOf(several, "SourceNamespaces"), ElementsAre("root/tavis", "root/test"));
    EXPECT_EQ(textOf(several, "SourceNamespace"), "");
}

TEST_F(ObjectsTest, CompareEqualToEnumeratedPathsHoweverTheyWereReferredTo) {
    const std::string filter = makeFilter().toString();
    const std::string destination = makeDestination().toString();
    const std::string withoutNameSpace = filter.substr(filter.find(':') + 1);
    for (const std::string& written :
         {"127.0.0.1/" + filter, "//some.host/" + filter, withoutNameSpace, "interop:" + withoutNameSpace, filter}) {
        const ObjectPath made =
            make("CIM_IndicationSubscription", {text("Filter", written), text("Handler", "10.1.2.3/" + destination)});
        const Instance subscription = get(made);
        EXPECT_EQ(subscriptions::referenceOf(subscription, "Filter")->toString(), filter) << written;
        EXPECT_EQ(subscriptions::referenceOf(subscription, "Handler")->toString(), destination);
        EXPECT_THAT(names("CIM_IndicationSubscription"), ElementsAre(made.toString()));
        EXPECT_TRUE(manager->deleteInstance(made).ok());
    }
}

TEST_F(ObjectsTest, AreFoundByReferencesWhoseClassNameHasTheNameSpace) {
    const ObjectPath made = subscribe(makeFilter(), makeDestination());
    ObjectPath written{"", "root/interop", "CIM_IndicationSubscription", {}};
    for (const NamedValue& key : made.keys) {
        ObjectPath end = *std::get<std::shared_ptr<const ObjectPath>>(key.value.data);
        end.className = "127.0.0.1/" + end.nameSpace + ":" + end.className;
        end.nameSpace.clear();
        written.keys.push_back(reference(key.name, end));
    }
    EXPECT_EQ(get(written).path, made);
    EXPECT_TRUE(manager->deleteInstance(written).ok());
}

TEST_F(ObjectsTest, AreThereOnce) {
    const ObjectPath filter = makeFilter();
    EXPECT_EQ(tryToMake("CIM_IndicationFilter", {text("Name", "filter"), text("Query", "SELECT * FROM Test_Alert"),
                                                 text("QueryLanguage", "WQL")})
                  .code,
              CMPI_RC_ERR_ALREADY_EXISTS);
    const ObjectPath destination = makeDestination();
    subscribe(filter, destination);
    EXPECT_EQ(
        tryToMake("CIM_IndicationSubscription", {reference("Filter", filter), reference("Handler", destination)})
            .code,
        CMPI_RC_ERR_ALREADY_EXISTS);
}

TEST_F(ObjectsTest, AreFoundByWhatRefersToThem) {
    const ObjectPath filter = makeFilter();
    const ObjectPath destination = makeDestination();
    const ObjectPath subscription = subscribe(filter, destination);
    EXPECT_THAT(referenceNames(filter), ElementsAre(subscription.toString()));
    EXPECT_THAT(referenceNames(destination), ElementsAre(subscription.toString()));
    EXPECT_THAT(associatorNames(filter, "CIM_IndicationSubscription"), ElementsAre(destination.toString()));
}

TEST_F(ObjectsTest, CannotBeRemovedWhileTheyAreReferredTo) {
    const ObjectPath filter = makeFilter();
    const ObjectPath destination = makeDestination();
    const ObjectPath subscription = subscribe(filter, destination);
    for (const ObjectPath& each : {filter, destination}) {
        const Status status = manager->deleteInstance(each);
        EXPECT_EQ(status.code, CMPI_RC_ERR_FAILED);
        EXPECT_THAT(status.message, HasSubstr(subscription.toString()));
    }
    EXPECT_TRUE(manager->deleteInstance(subscription).ok());
    EXPECT_TRUE(manager->deleteInstance(filter).ok());
    EXPECT_TRUE(manager->deleteInstance(destination).ok());
    EXPECT_EQ(manager->deleteInstance(filter).code, CMPI_RC_ERR_NOT_FOUND);
    EXPECT_EQ(codeOfGet(destination), CMPI_RC_ERR_NOT_FOUND);
    EXPECT_THAT(ScriptedDelivery::latest().destinations, IsEmpty());
    EXPECT_THAT(ScriptedDelivery::latest().subscriptions, IsEmpty());
}

struct Refusal {
    const char* name;
    const char* className;
    std::vector<NamedValue> properties;
    CMPIrc code;
    const char* reason;
};

class RefusalsTest : public ObjectsTest, public testing::WithParamInterface<Refusal> {};

TEST_P(RefusalsTest, SayTheReason) {
    const auto before = names(GetParam().className);
    const Status status = tryToMake(GetParam().className, GetParam().properties);
    EXPECT_EQ(status.code, GetParam().code) << status.message;
    EXPECT_THAT(status.message, HasSubstr(GetParam().reason));
    EXPECT_EQ(names(GetParam().className), before);
}

std::vector<NamedValue> filterOf(const std::string& query, const std::string& language, const std::string& source) {
    return {{"Query", Value::string(query)},
            {"QueryLanguage", Value::string(language)},
            {"SourceNamespace", Value::string(source)}};
}

std::vector<NamedValue> destinationOf(const std::string& url, const std::string& property = "", unsigned value = 0) {
    std::vector<NamedValue> properties{{"Destination", Value::string(url)}};
    if (!property.empty()) {
        properties.push_back({property, Value::uint(CMPI_uint16, value)});
    }
    return properties;
}

std::vector<NamedValue> subscriptionOf(const std::string& filter) {
    return {{"Filter", Value::string(filter)},
            {"Handler", Value::string("CIM_ListenerDestinationCIMXML.SystemCreationClassName=\"a\",SystemName=\"b\","
                                      "CreationClassName=\"CIM_ListenerDestinationCIMXML\",Name=\"d\"")}};
}

constexpr const char* filters = "CIM_IndicationFilter";
constexpr const char* destinations = "CIM_ListenerDestinationCIMXML";

INSTANTIATE_TEST_SUITE_P(
    Creations, RefusalsTest,
    testing::Values(
        Refusal{"no_query", filters, filterOf("", "WQL", "root/test"), CMPI_RC_ERR_INVALID_PARAMETER, "needs Query"},
        Refusal{"no_language", filters, filterOf("SELECT * FROM Test_Alert", "", "root/test"),
                CMPI_RC_ERR_INVALID_PARAMETER, "QueryLanguage"},
        Refusal{"no_statement", filters, filterOf("SELECT FROM", "WQL", "root/test"), CMPI_RC_ERR_INVALID_QUERY,
                "column"},
        Refusal{"unknown_language", filters, filterOf("SELECT * FROM Test_Alert", "DMTF:FQL", "root/test"),
                CMPI_RC_ERR_QUERY_LANGUAGE_NOT_SUPPORTED, "DMTF:FQL"},
        Refusal{"unknown_namespace", filters, filterOf("SELECT * FROM Test_Alert", "WQL", "root/nowhere"),
                CMPI_RC_ERR_INVALID_NAMESPACE, "root/nowhere"},
        Refusal{"unknown_class", filters, filterOf("SELECT * FROM Test_Nothing", "WQL", "root/test"),
                CMPI_RC_ERR_INVALID_CLASS, "Test_Nothing"},
        Refusal{"unknown_property", filters,
                filterOf("SELECT * FROM Test_Alert WHERE Nothing = 1", "WQL", "root/test"), CMPI_RC_ERR_INVALID_QUERY,
                "Nothing"},
        Refusal{"no_indication", filters, filterOf("SELECT * FROM Test_Thing", "WQL", "root/test"),
                CMPI_RC_ERR_INVALID_CLASS, "not a class of indications"},
        Refusal{"source_left_out", filters, filterOf("SELECT * FROM Test_Alert", "WQL", ""),
                CMPI_RC_ERR_INVALID_CLASS, "names no SourceNamespaces"},
        Refusal{"long_texts",
                filters,
                {{"Query", Value::string("SELECT * FROM Test_Alert")},
                 {"QueryLanguage", Value::string("WQL")},
                 {"SourceNamespace", Value::string("root/test")},
                 {"Description", Value::string(std::string(65536, 'x'))}},
                CMPI_RC_ERR_INVALID_PARAMETER,
                "65536 bytes"},
        Refusal{"long_name",
                destinations,
                {{"Destination", Value::string("http://h/")}, {"Name", Value::string(std::string(257, 'x'))}},
                CMPI_RC_ERR_INVALID_PARAMETER,
                "256 bytes"},
        Refusal{"another_class_name",
                destinations,
                {{"Destination", Value::string("http://h/")}, {"CreationClassName", Value::string("CIM_Other")}},
                CMPI_RC_ERR_INVALID_PARAMETER,
                "CreationClassName"},
        Refusal{"no_destination", destinations, {}, CMPI_RC_ERR_INVALID_PARAMETER, "Destination"},
        Refusal{"no_url", destinations, destinationOf("listener"), CMPI_RC_ERR_INVALID_PARAMETER, "Destination"},
        Refusal{"no_http", destinations, destinationOf("ftp://h/"), CMPI_RC_ERR_INVALID_PARAMETER, "Destination"},
        Refusal{"other_protocol", destinations, destinationOf("http://h/", "Protocol", 4),
                CMPI_RC_ERR_INVALID_PARAMETER, "CIM-XML"},
        Refusal{"other_persistence", destinations, destinationOf("http://h/", "PersistenceType", 4),
                CMPI_RC_ERR_INVALID_PARAMETER, "PersistenceType"},
        Refusal{
            "no_such_filter", "CIM_IndicationSubscription",
            subscriptionOf("CIM_IndicationFilter.SystemCreationClassName=\"a\",SystemName=\"b\",CreationClassName="
                           "\"CIM_IndicationFilter\",Name=\"f\""),
            CMPI_RC_ERR_INVALID_PARAMETER, "there is no filter"}),
    [](const auto& each) { return std::string(each.param.name); });

TEST_F(ObjectsTest, RefuseWhatASubscriptionCannotBe) {
    const ObjectPath filter = makeFilter();
    const ObjectPath destination = makeDestination();
    for (const auto& [property, value] :
         std::vector<std::pair<std::string, unsigned>>{{"OnFatalErrorPolicy", 1},
                                                       {"OnFatalErrorPolicy", 5},
                                                       {"RepeatNotificationPolicy", 3},
                                                       {"SubscriptionState", 3},
                                                       {"SubscriptionDuration", 0}}) {
        const Status status =
            tryToMake("CIM_IndicationSubscription",
                      {reference("Filter", filter), reference("Handler", destination), number(property, value)});
        EXPECT_EQ(status.code, CMPI_RC_ERR_INVALID_PARAMETER) << property;
        EXPECT_THAT(status.message, HasSubstr(property));
    }
    Status status = tryToMake(
        "CIM_IndicationSubscription",
        {reference("Filter", filter), text("Handler", "CIM_ListenerDestinationCIMXML.SystemCreationClassName="
                                                      "\"a\",SystemName=\"b\",CreationClassName=\"c\",Name="
                                                      "\"d\"")});
    EXPECT_EQ(status.code, CMPI_RC_ERR_INVALID_PARAMETER);
    EXPECT_THAT(status.message, HasSubstr("there is no destination"));
    EXPECT_THAT(names("CIM_IndicationSubscription"), IsEmpty());
    EXPECT_THAT(ScriptedDelivery::latest().subscriptions, IsEmpty());
}

TEST_F(ObjectsTest, IncludeAFilterForEachEventOfTheAdaptersThatNobodyChanges) {
    std::vector<ObjectPath> fixed;
    for (const char* name : {"marlo:adapter-online", "marlo:adapter-offline", "marlo:adapter-switch-over",
                             "marlo:adapter-switch-back"}) {
        fixed.push_back(parse(keysOf("CIM_IndicationFilter", name)));
    }
    EXPECT_THAT(names("CIM_IndicationFilter"), SizeIs(4));
    for (const ObjectPath& each : fixed) {
        EXPECT_THAT(textOf(get(each), "Query"), HasSubstr("SELECT * FROM MARLO_NetworkAdapter"));
        EXPECT_EQ(manager->deleteInstance(each).code, CMPI_RC_ERR_NOT_SUPPORTED);
        EXPECT_EQ(set(each, text("Query", "SELECT * FROM CIM_Indication")).code, CMPI_RC_ERR_NOT_SUPPORTED);
    }
    subscribe(fixed[0], makeDestination());
    reopen();
    EXPECT_THAT(names("CIM_IndicationFilter"), SizeIs(4));
    EXPECT_THAT(names("CIM_IndicationSubscription"), SizeIs(1));
}

TEST_F(ObjectsTest, HaveAnOlderNameForDestinations) {
    const ObjectPath older =
        make("CIM_IndicationHandlerCIMXML", {text("Name", "old"), text("Destination", "http://h/")});
    EXPECT_EQ(older.toString(), keysOf("CIM_IndicationHandlerCIMXML", "old"));
    EXPECT_THAT(names("CIM_ListenerDestinationCIMXML"), IsEmpty());
    EXPECT_THAT(names("CIM_ListenerDestination"), ElementsAre(older.toString()));
    const ObjectPath subscription = subscribe(makeFilter(), older);
    EXPECT_THAT(referenceNames(older), ElementsAre(subscription.toString()));
}

TEST_F(ObjectsTest, AreThereAgainAfterARestart) {
    const ObjectPath filter = makeFilter();
    const ObjectPath destination = makeDestination();
    const ObjectPath subscription = subscribe(
        filter, destination,
        {number("FailureTriggerTimeInterval", ~std::uint64_t{0}), text("SubscriptionInfo", "mine: \"\xC3\xA4\"")});
    const std::vector<Instance> before{get(filter), get(destination), get(subscription)};
    reopen();
    const auto sorted = [](Instance instance) {
        std::sort(instance.properties.begin(), instance.properties.end(),
                  [](const NamedValue& left, const NamedValue& right) { return left.name < right.name; });
        instance.properties.erase(std::remove_if(instance.properties.begin(), instance.properties.end(),
                                                 [](const NamedValue& each) { return each.value.isNull(); }),
                                  instance.properties.end());
        return instance;
    };
    for (const Instance& each : before) {
        EXPECT_EQ(sorted(get(each.path)), sorted(each)) << each.path.toString();
    }
    EXPECT_TRUE(manager->deleteInstance(subscription).ok());
    reopen();
    EXPECT_EQ(codeOfGet(subscription), CMPI_RC_ERR_NOT_FOUND);
}

TEST_F(ObjectsTest, GoWithARestartWhereTheyAreTransient) {
    const ObjectPath filter = makeFilter();
    const ObjectPath lasting = makeDestination("lasting");
    const ObjectPath passing =
        make("CIM_ListenerDestinationCIMXML",
             {text("Name", "passing"), text("Destination", "http://h/"), number("PersistenceType", 3)});
    const ObjectPath kept = subscribe(filter, lasting);
    subscribe(filter, passing);
    reopen();
    EXPECT_THAT(names("CIM_ListenerDestination"), ElementsAre(lasting.toString()));
    EXPECT_THAT(names("CIM_IndicationSubscription"), ElementsAre(kept.toString()));
    EXPECT_EQ(codeOfGet(filter), CMPI_RC_OK);
}

TEST_F(ObjectsTest, NeverGetANumberThatAnotherHad) {
    makeDestination("first");
    const std::string former = ScriptedDelivery::latest().destinations.begin()->first;
    EXPECT_TRUE(manager->deleteInstance(parse(names("CIM_ListenerDestination").front())).ok());
    reopen();
    makeDestination("first");
    EXPECT_NE(ScriptedDelivery::latest().destinations.begin()->first, former);
}

TEST_F(ObjectsTest, ShowTheServiceWithWhatItManages) {
    const auto services = names("CIM_IndicationService");
    ASSERT_THAT(services, SizeIs(1));
    const Instance found = get(parse(services[0]));
    EXPECT_EQ(numberOf(found, "FilterCreationEnabled"), 1U);
    const auto capabilities = associatorNames(found.path, "CIM_ElementCapabilities");
    ASSERT_THAT(capabilities, SizeIs(1));
    EXPECT_EQ(numberOf(get(parse(capabilities[0])), "SubscriptionsPersisted"), 1U);
    const ObjectPath destination = makeDestination();
    const auto managed = associatorNames(found.path, "CIM_ServiceAffectsElement");
    EXPECT_THAT(managed, SizeIs(5));
    EXPECT_THAT(managed, Contains(destination.toString()));
    EXPECT_THAT(names("CIM_RegisteredProfile"), Contains(HasSubstr("DSP1054")));
}

TEST_F(ObjectsTest, HaveCountersOfEachDestination) {
    const ObjectPath destination = makeDestination();
    const ObjectPath other = makeDestination("other", "http://127.0.0.1:5991/");
    subscribe(makeFilter(), destination);
    EXPECT_EQ(deliver("root/test", "Test_Alert", 1, ""), CMPI_RC_OK);
    const auto found = associatorNames(destination, "CIM_ElementStatisticalData");
    ASSERT_THAT(found, SizeIs(1));
    const Instance statistics = get(parse(found[0]));
    EXPECT_EQ(textOf(statistics, "ElementName"), "listener");
    EXPECT_EQ(textOf(statistics, "Destination"), "http://127.0.0.1:5990/sink");
    EXPECT_EQ(numberOf(statistics, "Sent"), 1U);
    const auto ofOther = associatorNames(other, "CIM_ElementStatisticalData");
    ASSERT_THAT(ofOther, SizeIs(1));
    EXPECT_EQ(numberOf(get(parse(ofOther[0])), "Sent"), 0U);
    std::vector<std::string> named;
    for (const delivery::Counters& each : service->counters()) {
        named.push_back(each.destination);
    }
    EXPECT_THAT(named, UnorderedElementsAre("listener", "other"));
}

} // namespace
} // namespace marlo::test

/** ModifyInstance of the configuration class through the library's instance table. */
#include "tests/provider/Changes.h"

#include <stdexcept>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace Orv::NodeLexicon;
using namespace provider_test;
using marlo::Instance;
using marlo::Value;
using marlo::test::Failure;
using scripted_agent::failAt;
using scripted_agent::recorded;
using scripted_agent::script;
using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;
using testing::SizeIs;

class ModifyInstance : public ChangeBase, public testing::Test {
  protected:
    ~ModifyInstance() override {
        EXPECT_THAT(recorded("log"), Not(Contains(HasSubstr("markProviderExit")))) << "there is no exit mark, ever";
    }

    /** An instance with all that can be changed. */
    static Instance whole() {
        Instance instance;
        instance.path = eth("eth1");
        set(instance, "IPv4Address", strings({"192.0.2.20"}));
        set(instance, "SubnetMask", strings({"255.255.255.128"}));
        set(instance, "DefaultIPGateway", strings({"192.0.2.2"}));
        set(instance, "DNSDomain", Value::string("example.net"));
        return instance;
    }

    static Instance with(const std::string& name, Value value) {
        Instance instance;
        instance.path = eth("eth1");
        set(instance, name, std::move(value));
        set(instance, "DNSDomain", Value::null(CMPI_string));
        return instance;
    }

    Answer modify(const Instance& instance, const std::string& settingId = "eth1") {
        return modifyAt(eth(settingId), instance);
    }

    Answer modifyAt(const marlo::ObjectPath& path, const Instance& instance, PropertyList properties = {}) {
        scripted_agent::clearRecord();
        setup.faulty.forgetCalls();
        return calls.modifyInstance(path, instance, std::move(properties));
    }

    static std::string factoryVariable(const std::string& name, const std::string& value) {
        return "VARIABLE: '" + name + "' has Value '" + value + "' at line N in NetworkAdapterObjectFactory";
    }

    static void expectSuccess(const Answer& answer) {
        EXPECT_EQ(answer.code, CMPI_RC_OK);
        EXPECT_FALSE(answer.hasMessage);
        EXPECT_TRUE(answer.done);
        EXPECT_THAT(texts(6000), IsEmpty());
    }
};

TEST_F(ModifyInstance, WritesTheFourValuesInTheirOrder) {
    expectSuccess(modify(whole()));
    EXPECT_THAT(writes(), ElementsAre("setProperty(PROP_IPV4_ADDRESS, \"192.0.2.20\")",
                                      "setProperty(PROP_IPV4_SUBNET_MASK, \"255.255.255.128\")",
                                      "setProperty(PROP_DEFAULT_GATEWAY, \"192.0.2.2\")",
                                      "setProperty(PROP_DNS_DOMAIN, \"example.net\")"));
    EXPECT_EQ(script().nodes[5].texts[PROP_IPV4_ADDRESS], "192.0.2.20");
    EXPECT_EQ(script().nodes[5].numbers[PROP_DHCP_ENABLED], 3U);
}

TEST_F(ModifyInstance, AsksTheBrokerForEachThingInOrder) {
    modify(whole());
    EXPECT_THAT(
        setup.faulty.calls(),
        ElementsAre("objectPath.getKeyCount", "objectPath.getClassName", "string.getCharPtr", "objectPath.toString",
                    "string.getCharPtr", "instance.getObjectPath", "objectPath.toString", "string.getCharPtr",
                    "instance.getObjectPath", "objectPath.toString", "string.getCharPtr",
                    "objectPath.getKey SettingID", "string.getCharPtr", "instance.getProperty IPv4Address",
                    "array.getSize", "array.getElementAt 0", "string.getCharPtr", "instance.getProperty SubnetMask",
                    "array.getSize", "array.getElementAt 0", "string.getCharPtr",
                    "instance.getProperty DefaultIPGateway", "array.getSize", "array.getElementAt 0",
                    "string.getCharPtr", "instance.getProperty DNSDomain", "string.getCharPtr", "result.returnDone"));
}

TEST_F(ModifyInstance, OnlyTheFirstElementsCount) {
    Instance instance = whole();
    set(instance, "IPv4Address", strings({"192.0.2.21", "192.0.2.22"}));
    expectSuccess(modify(instance));
    EXPECT_THAT(writes()[0], "setProperty(PROP_IPV4_ADDRESS, \"192.0.2.21\")");
    EXPECT_THAT(setup.faulty.calls(), Not(Contains("array.getElementAt 1")));
}

TEST_F(ModifyInstance, EachValueIsWrittenByItself) {
    expectSuccess(modify(with("IPv4Address", strings({"192.0.2.21"}))));
    EXPECT_THAT(writes(), ElementsAre("setProperty(PROP_IPV4_ADDRESS, \"192.0.2.21\")"));
    expectSuccess(modify(with("SubnetMask", strings({"255.0.0.0"}))));
    EXPECT_THAT(writes(), ElementsAre("setProperty(PROP_IPV4_SUBNET_MASK, \"255.0.0.0\")"));
    expectSuccess(modify(with("DefaultIPGateway", strings({"192.0.2.3"}))));
    EXPECT_THAT(writes(), ElementsAre("setProperty(PROP_DEFAULT_GATEWAY, \"192.0.2.3\")"));
}

TEST_F(ModifyInstance, ValuesThatAreNULLEmptyOrNoArraysAreNotWritten) {
    for (const Value& value : {Value::null(CMPI_stringA), strings({}), strings({""}), Value::string("192.0.2.21"),
                               Value{CMPI_stringA, Value::Array{Value::null(CMPI_string)}},
                               Value{CMPI_uint16A, Value::Array{Value::uint(CMPI_uint16, 7)}}}) {
        Instance instance = with("IPv4Address", value);
        set(instance, "SubnetMask", value);
        set(instance, "DefaultIPGateway", value);
        expectSuccess(modify(instance));
        EXPECT_THAT(writes(), IsEmpty());
        EXPECT_THAT(texts(4000), Contains(HasSubstr("Instrumentation node found ")));
        EXPECT_THAT(texts(4000), Contains(factoryVariable("ipAddr", "")));
        EXPECT_THAT(texts(4000), Contains(factoryVariable("ipSubnetMask", "")));
        EXPECT_THAT(texts(4000), Contains(factoryVariable("ipGateway", "")));
        EXPECT_THAT(texts(4000), Not(Contains(HasSubstr("ipDomainName"))));
    }
}

TEST_F(ModifyInstance, OtherPropertiesAndThePropertyListChangeNothing) {
    Instance instance = whole();
    set(instance, "IPAddress", strings({"192.0.2.99"}));
    set(instance, "MACAddress", Value::string("02:00:00:00:00:01"));
    expectSuccess(modifyAt(eth("eth1"), instance, PropertyList({"DNSDomain"})));
    EXPECT_THAT(writes(), SizeIs(4)) << "the list restricts nothing";
}

TEST_F(ModifyInstance, InstanceWithoutADomainSucceedsAndAnswersTheErrorOfItsReading) {
    Instance instance;
    instance.path = eth("eth1");
    set(instance, "IPv4Address", strings({"192.0.2.21"}));
    const Answer answer = modify(instance);
    EXPECT_EQ(answer.code, CMPI_RC_ERR_NO_SUCH_PROPERTY);
    EXPECT_FALSE(answer.hasMessage);
    EXPECT_TRUE(answer.done);
    EXPECT_THAT(writes(), ElementsAre("setProperty(PROP_IPV4_ADDRESS, \"192.0.2.21\")"));
    EXPECT_THAT(texts(6000), IsEmpty());
}

TEST_F(ModifyInstance, DomainThatIsThereTakesBackTheErrorsOfEarlierReadings) {
    Instance instance;
    instance.path = eth("eth1");
    set(instance, "DNSDomain", Value::string("example.net"));
    expectSuccess(modify(instance));
    EXPECT_THAT(writes(), ElementsAre("setProperty(PROP_DNS_DOMAIN, \"example.net\")"));
}

TEST_F(ModifyInstance, UnknownAdapterIsASuccessThatWritesNothing) {
    expectSuccess(modify(whole(), "eth9"));
    EXPECT_THAT(writes(), IsEmpty());
}

TEST_F(ModifyInstance, AdapterWhoseIdentityHasSpacesIsNotFoundAndThatIsASuccess) {
    addFullAdapter(" eth5 ");
    expectSuccess(modify(whole(), "eth5"));
    EXPECT_THAT(writes(), IsEmpty());
}

TEST_F(ModifyInstance, PathWithoutKeysEndsAtOnceInSuccess) {
    expectSuccess(modifyAt(classPath(CONFIGURATION), whole()));
    EXPECT_THAT(setup.faulty.calls(), ElementsAre("objectPath.getKeyCount", "result.returnDone"));
    EXPECT_THAT(texts(4000), SizeIs(2)) << "the entry mark alone";
    EXPECT_THAT(recorded("textEqual"), IsEmpty()) << "no factory is made";
}

TEST_F(ModifyInstance, StatusOfTheKeyCountIsTheAnswerForAPathWithoutKeys) {
    setup.faulty.failAt("objectPath.getKeyCount", 1, Failure::withStatus);
    const Answer answer = calls.modifyInstance(eth("eth1"), whole());
    EXPECT_EQ(answer.code, CMPI_RC_ERR_FAILED);
    EXPECT_TRUE(answer.done);
    EXPECT_THAT(writes(), IsEmpty());
}

/** Calls the table with an instance that is none. */
Answer modifyWith(BrokerSetup& setup, const CMPIInstance* instance) {
    CMPIInstanceMI* mi = createInstanceMI("NetworkAdapterProvider", setup.faulty.handle());
    return setup.call(instancePath(CONFIGURATION, {{"SettingID", "eth1"}}),
                      [&](const CMPIContext* context, const CMPIResult* result, const CMPIObjectPath* path) {
                          return mi->ft->modifyInstance(mi, context, result, path, instance, nullptr);
                      });
}

TEST_F(ModifyInstance, InstanceThatIsNULLFailsWithAMessageThatIsMadeAndNotReturned) {
    const CMPIInstance withoutHandle{nullptr, nullptr};
    for (const CMPIInstance* instance : {static_cast<const CMPIInstance*>(nullptr), &withoutHandle}) {
        scripted_agent::clearRecord();
        setup.faulty.forgetCalls();
        const Answer answer = modifyWith(setup, instance);
        EXPECT_EQ(answer.code, CMPI_RC_ERR_FAILED);
        EXPECT_FALSE(answer.hasMessage);
        EXPECT_TRUE(answer.done);
        EXPECT_THAT(setup.faulty.calls(),
                    ElementsAre("objectPath.getKeyCount", "objectPath.getClassName", "string.getCharPtr",
                                "newString Modify instance Passed is NULL", "result.returnDone"));
        EXPECT_THAT(texts(6000),
                    ElementsAre("MESSAGE [File: NetworkAdapterProvider, Line: N]: Modify instance Passed "
                                "is NULL"));
        EXPECT_THAT(recorded("textEqual"), Not(IsEmpty())) << "the factory is made before";
        EXPECT_THAT(writes(), IsEmpty());
    }
}

TEST_F(ModifyInstance, WithoutBrokerAnInstanceThatIsNULLFailsAllTheSame) {
    const Answer answer =
        setup.call(eth("eth1"), [](const CMPIContext* context, const CMPIResult* result, const CMPIObjectPath* path) {
            CMPIInstanceMI* mi = createInstanceMI("NetworkAdapterProvider", nullptr);
            return mi->ft->modifyInstance(mi, context, result, path, nullptr, nullptr);
        });
    EXPECT_EQ(answer.code, CMPI_RC_ERR_FAILED);
    EXPECT_FALSE(answer.hasMessage);
    EXPECT_TRUE(answer.done);
}

TEST_F(ModifyInstance, HostWithoutAdaptersFailsWithTheStatusOfTheLastReadingAndWithoutAnEnd) {
    script().nodes.clear();
    Answer answer = modify(whole());
    EXPECT_EQ(answer.code, CMPI_RC_OK) << "the domain could be read";
    EXPECT_FALSE(answer.done);
    EXPECT_THAT(texts(6000), ElementsAre("MESSAGE [File: NetworkAdapterObjectFactory, Line: N]:  Network Adapter "
                                         "Configuration Failed "));
    Instance withoutDomain;
    withoutDomain.path = eth("eth1");
    answer = modify(withoutDomain);
    EXPECT_EQ(answer.code, CMPI_RC_ERR_NO_SUCH_PROPERTY);
    EXPECT_FALSE(answer.done);
}

TEST_F(ModifyInstance, WriteThatFailsIsLoggedTwiceAndNotEnded) {
    failAt("setProperty(PROP_DEFAULT_GATEWAY", 1, [] { throw std::runtime_error("refused"); });
    const Answer answer = modify(whole());
    EXPECT_EQ(answer.code, CMPI_RC_OK);
    EXPECT_FALSE(answer.hasMessage);
    EXPECT_FALSE(answer.done);
    EXPECT_THAT(texts(6000), ElementsAre("MESSAGE [File: NetworkAdapterConfiguration, Line: N]: Caught Exception : ",
                                         "MESSAGE [File: NetworkAdapterObjectFactory, Line: N]:  Network Adapter "
                                         "Configuration Failed "));
    EXPECT_EQ(script().nodes[5].texts[PROP_IPV4_ADDRESS], "192.0.2.20") << "what was written before stays";
    EXPECT_THAT(texts(4000), Not(Contains(HasSubstr("EXITING: modifyNetworkAdapterCMPIInstance()"))))
        << "no exit either";
}

TEST_F(ModifyInstance, SuccessEndsWithTheFactorysExit) {
    modify(whole());
    EXPECT_EQ(texts(4000).back(),
              "EXITING: modifyNetworkAdapterCMPIInstance() in NetworkAdapterObjectFactory [Line: N]");
}

TEST_F(ModifyInstance, ClassOfThePathDecidesOnlyWhetherAnInventoryIsRead) {
    marlo::ObjectPath path = eth("eth1");
    path.className = "MARLO_Other";
    expectSuccess(modifyAt(path, whole()));
    EXPECT_THAT(writes(), SizeIs(4));
    EXPECT_THAT(texts(4000), Not(Contains(HasSubstr("getNetworkAdapterConfigurationInstances"))));
}

TEST_F(ModifyInstance, PathOfTheRequestCountsAndNotTheInstances) {
    Instance instance = whole();
    instance.path = eth("eth0");
    expectSuccess(modify(instance, "eth2"));
    EXPECT_EQ(script().nodes[8].texts[PROP_DNS_DOMAIN], "example.net");
    EXPECT_EQ(script().nodes[2].texts[PROP_DNS_DOMAIN], "example.org");
    EXPECT_THAT(texts(4000), Contains(HasSubstr("'objstring' has Value 'root/tavis:MARLO_NetworkAdapterConfiguration."
                                                "SettingID=\"eth2\"'")));
    EXPECT_THAT(texts(4000), Contains(HasSubstr("'modifyobjstring' has Value 'root/tavis:"
                                                "MARLO_NetworkAdapterConfiguration.SettingID=\"eth0\"'"))
                                 .Times(2));
}

} // namespace

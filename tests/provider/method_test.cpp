/** InvokeMethod through the library's method table: the dispatch, the handlers behind it, and what they answer. */
#include "tests/provider/Changes.h"

#include <algorithm>
#include <stdexcept>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace Orv::NodeLexicon;
using namespace provider_test;
using marlo::NamedValue;
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
using Arguments = std::vector<NamedValue>;

const std::string CHANGE_FAILED = "Failed to Execute DHCP Changes";

class Methods : public ChangeBase, public testing::Test {
  protected:
    Answer invoke(const std::string& method, const Arguments& arguments = {}) {
        return invokeOn(eth("eth1"), method, arguments);
    }

    Answer invokeOn(const marlo::ObjectPath& path, const std::string& method, const Arguments& arguments = {}) {
        scripted_agent::clearRecord();
        setup.faulty.forgetCalls();
        Answer answer = calls.invokeMethod(path, method, arguments);
        EXPECT_THAT(calls.outArguments, IsEmpty()) << "no method has results but its own";
        return answer;
    }

    static std::vector<std::string> failures() {
        std::vector<std::string> found = texts(6000);
        for (std::string& text : found) {
            text = text.substr(text.find("]: ") + 3);
        }
        return found;
    }

    void expectSuccess(const Answer& answer) {
        EXPECT_EQ(answer.code, CMPI_RC_OK);
        EXPECT_FALSE(answer.hasMessage);
        EXPECT_THAT(answer.values, ElementsAre(Value::uint(CMPI_uint32, 0)));
        EXPECT_TRUE(answer.done);
        EXPECT_TRUE(hasExitMark());
        EXPECT_THAT(failures(), IsEmpty());
    }

    /** No result, no end, no exit mark, and a status that is no error; these failures in the log, in order. */
    void expectSilentFailure(const Answer& answer, const std::vector<std::string>& logged) {
        EXPECT_EQ(answer.code, CMPI_RC_OK);
        EXPECT_FALSE(answer.hasMessage);
        EXPECT_THAT(answer.values, IsEmpty());
        EXPECT_FALSE(answer.done);
        EXPECT_FALSE(hasExitMark());
        EXPECT_EQ(failures(), logged);
    }

    static Arguments staticArguments() {
        return {{"IPAddress", strings({"192.0.2.20"})}, {"SubnetMask", strings({"255.255.255.128"})}};
    }
};

TEST_F(Methods, EnableDHCPWritesTheModeOfTheAdapterOfThePath) {
    expectSuccess(invoke("EnableDHCP"));
    EXPECT_THAT(writes(), ElementsAre("setProperty(PROP_DHCP_ENABLED, 1)"));
    EXPECT_EQ(script().nodes[5].numbers[PROP_DHCP_ENABLED], 1U);
    EXPECT_EQ(script().nodes[2].numbers[PROP_DHCP_ENABLED], 3U);
}

TEST_F(Methods, EnableStaticHandsOverTheMaskBeforeTheAddress) {
    expectSuccess(invoke("EnableStatic", staticArguments()));
    EXPECT_THAT(writes(), ElementsAre("setProperty(PROP_DHCP_ENABLED, 3)",
                                      "setProperty(PROP_IPV4_ADDRESS, \"255.255.255.128\")",
                                      "setProperty(PROP_IPV4_SUBNET_MASK, \"192.0.2.20\")"));
    EXPECT_THAT(texts(4000),
                Contains("VARIABLE: 'ipAddr' has Value '192.0.2.20' at line N in NetworkAdapterObjectFactory"));
    EXPECT_THAT(texts(4000), Contains("VARIABLE: 'subnet_mask' has Value '255.255.255.128' at line N in "
                                      "NetworkAdapterObjectFactory"));
}

TEST_F(Methods, EnableStaticAsksTheBrokerForEachThingOnceAndInOrder) {
    invoke("EnableStatic", staticArguments());
    EXPECT_THAT(setup.faulty.calls(),
                ElementsAre("objectPath.getClassName", "string.getCharPtr", "objectPath.toString",
                            "string.getCharPtr", "objectPath.getKey SettingID", "string.getCharPtr",
                            "args.getArgCount", "args.getArg IPAddress", "array.getElementAt 0", "string.getCharPtr",
                            "args.getArg SubnetMask", "array.getElementAt 0", "string.getCharPtr",
                            "result.returnData", "result.returnDone"));
}

TEST_F(Methods, EnableStaticWithoutArgumentsOnlySwitchesTheMode) {
    expectSuccess(invoke("EnableStatic"));
    EXPECT_THAT(writes(), ElementsAre("setProperty(PROP_DHCP_ENABLED, 3)"));
    EXPECT_THAT(setup.faulty.calls(), Not(Contains("args.getArg IPAddress")));
}

TEST_F(Methods, EnableStaticIgnoresWhatIsNoStringArray) {
    expectSuccess(
        invoke("EnableStatic", {{"IPAddress", Value::string("192.0.2.20")},
                                {"SubnetMask", Value{CMPI_uint8A, Value::Array{Value::uint(CMPI_uint8, 1)}}}}));
    EXPECT_THAT(writes(), ElementsAre("setProperty(PROP_DHCP_ENABLED, 3)"));
    EXPECT_THAT(texts(4000), Not(Contains(HasSubstr("'ipAddr'"))));
    EXPECT_THAT(texts(4000), Not(Contains(HasSubstr("'subnet_mask'"))));
}

TEST_F(Methods, EnableStaticIgnoresNULLAndWhatIsMissing) {
    expectSuccess(invoke("EnableStatic", {{"IPAddress", Value::null(CMPI_stringA)}}));
    EXPECT_THAT(writes(), ElementsAre("setProperty(PROP_DHCP_ENABLED, 3)"));
}

TEST_F(Methods, OnlyTheFirstElementsOfTheArraysCount) {
    expectSuccess(invoke("EnableStatic", {{"IPAddress", strings({"192.0.2.20", "192.0.2.21"})},
                                          {"SubnetMask", strings({"255.0.0.0", "255.255.0.0"})}}));
    EXPECT_THAT(writes(),
                ElementsAre("setProperty(PROP_DHCP_ENABLED, 3)", "setProperty(PROP_IPV4_ADDRESS, \"255.0.0.0\")",
                            "setProperty(PROP_IPV4_SUBNET_MASK, \"192.0.2.20\")"));
    expectSuccess(invoke("SetGateways", {{"DefaultIPGateway", strings({"192.0.2.2", "192.0.2.3"})}}));
    EXPECT_THAT(writes(), ElementsAre("setProperty(PROP_DEFAULT_GATEWAY, \"192.0.2.2\")"));
}

TEST_F(Methods, EmptyArraysAndNULLElementsAreEmptyValues) {
    expectSuccess(
        invoke("EnableStatic", {{"IPAddress", strings({})},
                                {"SubnetMask", Value{CMPI_stringA, Value::Array{Value::null(CMPI_string)}}}}));
    EXPECT_THAT(writes(), ElementsAre("setProperty(PROP_DHCP_ENABLED, 3)"));
    EXPECT_THAT(texts(4000), Contains(HasSubstr("'ipAddr' has Value ''")));
    EXPECT_THAT(texts(4000), Contains(HasSubstr("'subnet_mask' has Value ''")));
}

TEST_F(Methods, SetGatewaysWritesTheGateway) {
    expectSuccess(invoke("SetGateways", {{"DefaultIPGateway", strings({"192.0.2.2"})}}));
    EXPECT_THAT(writes(), ElementsAre("setProperty(PROP_DEFAULT_GATEWAY, \"192.0.2.2\")"));
    EXPECT_THAT(texts(4000),
                Contains("VARIABLE: 'ipGateway' has Value '192.0.2.2' at line N in NetworkAdapterObjectFactory"));
}

TEST_F(Methods, SetGatewaysWithoutArgumentsIsASuccessThatWritesNothing) {
    expectSuccess(invoke("SetGateways"));
    EXPECT_THAT(writes(), IsEmpty());
    EXPECT_THAT(texts(4000), Contains(HasSubstr("ENTERING: executeGatewayChanges() in NetworkAdapterConfiguration")));
}

TEST_F(Methods, SetDNSDomainWritesTheDomainOfTheAdapterOfThePath) {
    expectSuccess(invoke("SetDNSDomain", {{"DNSDomain", Value::string("example.net")}}));
    EXPECT_THAT(writes(), ElementsAre("setProperty(PROP_DNS_DOMAIN, \"example.net\")"));
    EXPECT_THAT(texts(4000), Contains("VARIABLE: 'settingId' has Value 'eth1' at line N in NetworkAdapterProvider"));
    EXPECT_EQ(script().nodes[5].texts[PROP_DNS_DOMAIN], "example.net");
}

TEST_F(Methods, OnlySetDNSDomainLogsTheSettingId) {
    invoke("EnableDHCP");
    EXPECT_THAT(texts(4000), Not(Contains(HasSubstr("'settingId'"))));
    invoke("SetGateways");
    EXPECT_THAT(texts(4000), Not(Contains(HasSubstr("'settingId'"))));
}

TEST_F(Methods, SetDNSDomainOfNULLOrOfAnotherTypeIsAnEmptyDomain) {
    expectSuccess(invoke("SetDNSDomain", {{"DNSDomain", Value::null(CMPI_string)}}));
    EXPECT_THAT(writes(), IsEmpty());
    EXPECT_THAT(texts(4000), Not(Contains(HasSubstr("'dnsDomain' has Value '' at line N in NetworkAdapterObject"))));
    expectSuccess(invoke("SetDNSDomain", {{"DNSDomain", strings({"example.net"})}}));
    EXPECT_THAT(writes(), IsEmpty());
}

TEST_F(Methods, SetDNSDomainOfAnUnknownAdapterDoesNotTouchTheDomainAndWritesNoLists) {
    expectSuccess(invokeOn(eth("eth9"), "SetDNSDomain", {{"DNSDomain", Value::string("example.net")}}));
    EXPECT_THAT(writes(), IsEmpty());
    EXPECT_THAT(texts(4000), Contains(HasSubstr("ENTERING: executeDNSChanges() in NetworkAdapterConfiguration")));
    EXPECT_THAT(texts(4000), Not(Contains(HasSubstr("executeDNSDomainChanges"))));
    EXPECT_THAT(setup.faulty.calls(), Not(Contains("args.getArg DNSDomain")));
}

TEST_F(Methods, SearchOrdersGoToTheFirstAdapterWhateverThePathNames) {
    expectSuccess(
        invoke("SetDNSServerSearchOrder", {{"DNSServerSearchOrder", strings({"192.0.2.54", "192.0.2.55"})}}));
    EXPECT_THAT(writes(), ElementsAre("setProperty(PROP_DNS_SERVERS, [\"192.0.2.54\", \"192.0.2.55\"])"));
    EXPECT_THAT(texts(4000),
                Contains("VARIABLE: 'dns_Servers.size()' has Value '2' at line N in NetworkAdapterObjectFactory"));
    EXPECT_THAT(script().nodes[2].lists[PROP_DNS_SERVERS], ElementsAre("192.0.2.54", "192.0.2.55"));
    expectSuccess(invoke("SetDNSSuffixSearchOrder", {{"DNSDomainSuffixSearchOrder", strings({"example.net"})}}));
    EXPECT_THAT(writes(), ElementsAre("setProperty(PROP_DNS_SUFFIXES, [\"example.net\"])"));
    EXPECT_THAT(texts(4000),
                Contains("VARIABLE: 'dns_Suffixes.size()' has Value '1' at line N in NetworkAdapterObjectFactory"));
}

TEST_F(Methods, SearchOrdersDoNotReadTheKeyOfThePath) {
    for (const char* method : {"SetDNSServerSearchOrder", "SetDNSSuffixSearchOrder", "RestartNetworkNot"}) {
        invoke(method, {{"Any", Value::boolean(true)}});
        EXPECT_THAT(setup.faulty.calls(), Not(Contains("objectPath.getKey SettingID"))) << method;
    }
}

TEST_F(Methods, SearchOrderWithoutItsArgumentWritesNothing) {
    expectSuccess(invoke("SetDNSServerSearchOrder", {{"DNSDomainSuffixSearchOrder", strings({"example.net"})}}));
    EXPECT_THAT(writes(), IsEmpty());
    EXPECT_THAT(texts(4000), Not(Contains(HasSubstr("dns_Servers"))));
    expectSuccess(invoke("SetDNSServerSearchOrder", {{"DNSServerSearchOrder", Value::string("192.0.2.54")}}));
    EXPECT_THAT(writes(), IsEmpty());
}

TEST_F(Methods, SearchOrderWhereAnAdapterHasNoIdentityReachesTheDomainOnly) {
    // The empty identifier that these methods pass is then that of a record: the one of the node without identity.
    addBareAdapter();
    expectSuccess(invoke("SetDNSServerSearchOrder", {{"DNSServerSearchOrder", strings({"192.0.2.54"})}}));
    EXPECT_THAT(writes(), IsEmpty());
    EXPECT_THAT(texts(4000), Contains(HasSubstr("ENTERING: executeDNSDomainChanges()")));
    EXPECT_THAT(texts(4000),
                Not(Contains(HasSubstr("ENTERING: executeDNSChanges() in NetworkAdapterConfiguration"))));
    EXPECT_THAT(setup.faulty.calls(), Not(Contains("args.getArg DNSServerSearchOrder"))) << "the list is not read";
}

TEST_F(Methods, AllThreeDNSMethodsFailWithoutArguments) {
    for (const char* method : {"SetDNSDomain", "SetDNSServerSearchOrder", "SetDNSSuffixSearchOrder"}) {
        expectSilentFailure(invoke(method), {"No Arguments Passed is Empty", CHANGE_FAILED});
    }
}

TEST_F(Methods, DNSMethodsWithoutArgumentsFailEvenWithoutAdapters) {
    script().nodes.clear();
    expectSilentFailure(invoke("SetDNSDomain"), {"No Arguments Passed is Empty", CHANGE_FAILED});
}

TEST_F(Methods, DNSMethodsSucceedOnAHostWithoutAdaptersAndAllOthersFail) {
    script().nodes.clear();
    expectSuccess(invoke("SetDNSDomain", {{"DNSDomain", Value::string("example.net")}}));
    expectSuccess(invoke("SetDNSServerSearchOrder", {{"DNSServerSearchOrder", strings({"192.0.2.54"})}}));
    for (const char* method : {"EnableDHCP", "EnableStatic", "SetGateways"}) {
        expectSilentFailure(invoke(method), {"_networkAdapterConfigurationMap is Empty", CHANGE_FAILED});
    }
}

TEST_F(Methods, UnknownAdapterFailsWithOneTextForDHCPAndAnotherForTheRest) {
    expectSilentFailure(invokeOn(eth("eth9"), "EnableDHCP"),
                        {"Failed to find the SettingID in the Map", CHANGE_FAILED});
    expectSilentFailure(invokeOn(eth("eth9"), "EnableStatic", staticArguments()),
                        {"No Adapter Found for Setting ID", CHANGE_FAILED});
    expectSilentFailure(invokeOn(eth("eth9"), "SetGateways", {{"DefaultIPGateway", strings({"192.0.2.2"})}}),
                        {"No Adapter Found for Setting ID", CHANGE_FAILED});
    EXPECT_THAT(setup.faulty.calls(), Not(Contains("args.getArgCount"))) << "the arguments are not looked at";
}

TEST_F(Methods, AdapterWhoseIdentityHasSpacesIsUnknownByItsSettingID) {
    addFullAdapter("eth 5");
    expectSilentFailure(invokeOn(eth("eth5"), "EnableDHCP"),
                        {"Failed to find the SettingID in the Map", CHANGE_FAILED});
}

TEST_F(Methods, FailedWriteIsLoggedByRecordHandlerAndFrontEndEachWithItsText) {
    const auto refuse = [] { failAt("setProperty", 1, [] { throw std::runtime_error("refused"); }); };
    const std::string configuration = "Failed to Execute Static Configuration";
    refuse();
    expectSilentFailure(invoke("EnableDHCP"), {"Caught Exception", CHANGE_FAILED, CHANGE_FAILED});
    refuse();
    expectSilentFailure(invoke("EnableStatic"), {"Caught Exception", configuration, CHANGE_FAILED});
    refuse();
    expectSilentFailure(invoke("SetGateways", {{"DefaultIPGateway", strings({"192.0.2.2"})}}),
                        {"Caught Exception", configuration, CHANGE_FAILED});
    refuse();
    expectSilentFailure(invoke("SetDNSDomain", {{"DNSDomain", Value::string("example.net")}}),
                        {"Caught Exception", configuration, CHANGE_FAILED});
    refuse();
    expectSilentFailure(invoke("SetDNSServerSearchOrder", {{"DNSServerSearchOrder", strings({"192.0.2.54"})}}),
                        {"Caught Exception", configuration, CHANGE_FAILED});
}

TEST_F(Methods, NamesOfMethodsAreComparedByTheAgentInTheTablesOrderUntilOneIsEqual) {
    expectSuccess(invoke("enablestatic"));
    EXPECT_THAT(writes(), ElementsAre("setProperty(PROP_DHCP_ENABLED, 3)"));
    EXPECT_THAT(recorded("textEqual(\"enablestatic\""),
                ElementsAre("textEqual(\"enablestatic\", \"EnableDHCP\") = false",
                            "textEqual(\"enablestatic\", \"EnableStatic\") = true"));
    invoke("Unknown");
    EXPECT_THAT(recorded("textEqual(\"Unknown\""),
                ElementsAre("textEqual(\"Unknown\", \"EnableDHCP\") = false",
                            "textEqual(\"Unknown\", \"EnableStatic\") = false",
                            "textEqual(\"Unknown\", \"SetDNSDomain\") = false",
                            "textEqual(\"Unknown\", \"SetDNSSuffixSearchOrder\") = false",
                            "textEqual(\"Unknown\", \"SetDNSServerSearchOrder\") = false",
                            "textEqual(\"Unknown\", \"SetGateways\") = false",
                            "textEqual(\"Unknown\", \"RestartNetwork\") = false"));
}

TEST_F(Methods, UnknownMethodIsAnsweredZeroWithoutALineOfItsOwn) {
    expectSuccess(invoke("DisableEverything", staticArguments()));
    EXPECT_THAT(writes(), IsEmpty());
}

TEST_F(Methods, ClassIsComparedByteForByteAndAnyOtherIsAnsweredZeroWithoutAFactory) {
    for (const char* className :
         {"marlo_NetworkAdapterConfiguration", "MARLO_PhysicalNetworkAdapter", "MARLO_Other"}) {
        marlo::ObjectPath path = eth("eth1");
        path.className = className;
        expectSuccess(invokeOn(path, "EnableDHCP"));
        EXPECT_THAT(writes(), IsEmpty());
        EXPECT_THAT(recorded("textEqual"), IsEmpty()) << "no factory, no method";
        EXPECT_THAT(texts(4000), SizeIs(4)) << "the entry mark and the exit mark";
    }
}

TEST_F(Methods, PathIsLoggedWholeAfterTheFactoryIsMade) {
    invoke("EnableDHCP");
    const std::vector<std::string> lines = texts(4000);
    const auto objstring = std::find_if(lines.begin(), lines.end(), [](const std::string& line) {
        return line.starts_with("VARIABLE: 'objstring' has Value 'root/tavis:MARLO_NetworkAdapterConfiguration."
                                "SettingID=\"eth1\"'");
    });
    ASSERT_NE(objstring, lines.end());
    EXPECT_THAT(*(objstring - 1), HasSubstr("EXITING: NetworkAdapterObjectFactory()"));
}

TEST_F(Methods, PathWithoutKeyIsOneOfTheEmptyIdentifier) {
    // Nothing guards against it here: object managers do. It must only not go down.
    const Answer answer = invokeOn(classPath(CONFIGURATION), "EnableDHCP");
    EXPECT_EQ(answer.code, CMPI_RC_ERR_NOT_FOUND) << "that of the reading of the key";
    EXPECT_FALSE(answer.done);
    EXPECT_THAT(failures(), ElementsAre("Failed to find the SettingID in the Map", CHANGE_FAILED));
}

TEST_F(Methods, ResultIsTheCodeThatTheLastCallOfTheBrokerLeft) {
    setup.faulty.failAt("objectPath.getKey", 1, Failure::withStatus);
    scripted_agent::clearRecord();
    const Answer answer =
        calls.invokeMethod(eth("eth1"), "SetDNSDomain", {{"DNSDomain", Value::string("example.net")}});
    EXPECT_EQ(answer.code, CMPI_RC_ERR_FAILED);
    EXPECT_THAT(answer.values, ElementsAre(Value::uint(CMPI_uint32, 1)));
    EXPECT_TRUE(answer.done);
}

TEST_F(Methods, WhatTheAgentThrowsOutsideOfAChangeLeavesTheCall) {
    failAt("textEqual(\"EnableDHCP\"", 1, [] { throw std::runtime_error("gone"); });
    EXPECT_THROW(invoke("EnableDHCP"), std::runtime_error);
    EXPECT_THAT(recorded("log 4000"), Not(Contains(HasSubstr("markProviderExit"))));
    EXPECT_EQ(recorded("buffer()").size(), recorded("~buffer()").size());
}

TEST_F(Methods, FailuresInTheInventoryLeaveWhatWasReadToBeChanged) {
    // The second node cannot be read: the factory's map has the first only, and that one can be changed.
    testing::internal::CaptureStderr();
    failAt("getProperty(PROP_NODE_STRING)", 2, [] { throw std::runtime_error("gone"); });
    expectSilentFailure(invoke("EnableDHCP"), {"Failed to find the SettingID in the Map", CHANGE_FAILED});
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "gone\n");
    script().before = nullptr;
    expectSuccess(invokeOn(eth("eth0"), "EnableDHCP"));
}

} // namespace

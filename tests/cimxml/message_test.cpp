/** @file Messages, calls and their frames. */
#include "tests/cimxml/Documents.h"

#include <gtest/gtest.h>

namespace marlo::test {
namespace {

using cimxml::ExportCall;
using cimxml::ExtrinsicCall;
using cimxml::IntrinsicCall;
using cimxml::MessageError;
using cimxml::readMessage;
using Kind = MessageError::Kind;

TEST(Message, GivesMethodNamespaceAndArgumentsOfAnIntrinsicCall) {
    const auto message = readMessage(intrinsic("GetInstance", "<IPARAMVALUE NAME=\"LocalOnly\"><VALUE>FALSE</VALUE>"
                                                              "</IPARAMVALUE><IPARAMVALUE NAME=\"Nothing\"/>"));
    EXPECT_EQ(message.id, "1001");
    EXPECT_EQ(message.protocolVersion, "1.0");
    const auto& call = std::get<IntrinsicCall>(message.call);
    EXPECT_EQ(call.method, "GetInstance");
    EXPECT_EQ(call.nameSpace, "root/cimv2");
    ASSERT_EQ(call.arguments.size(), 2U);
    EXPECT_EQ(call.arguments[0].name, "LocalOnly");
    EXPECT_EQ(std::get<cimxml::Untyped>(call.arguments[0].value).text, "FALSE");
    EXPECT_EQ(call.arguments[1].name, "Nothing");
    EXPECT_TRUE(std::holds_alternative<std::monostate>(call.arguments[1].value));
}

TEST(Message, GivesThePathOfAnExtrinsicCall) {
    const auto message = readMessage(
        frame("<SIMPLEREQ><METHODCALL NAME=\"Reset\"><LOCALINSTANCEPATH><LOCALNAMESPACEPATH>"
              "<NAMESPACE NAME=\"root\"/></LOCALNAMESPACEPATH><INSTANCENAME CLASSNAME=\"A\">"
              "<KEYBINDING NAME=\"K\"><KEYVALUE VALUETYPE=\"string\">x</KEYVALUE></KEYBINDING>"
              "</INSTANCENAME></LOCALINSTANCEPATH><PARAMVALUE NAME=\"P\" PARAMTYPE=\"uint8\"><VALUE>7</VALUE>"
              "</PARAMVALUE></METHODCALL></SIMPLEREQ>"));
    const auto& call = std::get<ExtrinsicCall>(message.call);
    EXPECT_EQ(call.method, "Reset");
    EXPECT_EQ(call.path, (ObjectPath{"", "root", "A", {{"K", Value::string("x")}}}));
    ASSERT_EQ(call.arguments.size(), 1U);
    EXPECT_EQ(std::get<cimxml::Untyped>(call.arguments[0].value).text, "7");
}

TEST(Message, GivesThePathWithoutKeysOfACallOfAClass) {
    const auto message =
        readMessage(frame("<SIMPLEREQ><METHODCALL NAME=\"Reset\"><LOCALCLASSPATH><LOCALNAMESPACEPATH>"
                          "<NAMESPACE NAME=\"root\"/></LOCALNAMESPACEPATH><CLASSNAME NAME=\"A\"/></LOCALCLASSPATH>"
                          "</METHODCALL></SIMPLEREQ>"));
    EXPECT_EQ(std::get<ExtrinsicCall>(message.call).path, (ObjectPath{"", "root", "A", {}}));
}

TEST(Message, GivesTheIndicationOfAnExport) {
    const auto message = readMessage(
        frame("<SIMPLEEXPREQ><EXPMETHODCALL NAME=\"ExportIndication\"><EXPPARAMVALUE NAME=\"NewIndication\">"
              "<INSTANCE CLASSNAME=\"Alert\"><PROPERTY NAME=\"Text\" TYPE=\"string\"><VALUE>hot</VALUE></PROPERTY>"
              "</INSTANCE></EXPPARAMVALUE></EXPMETHODCALL></SIMPLEEXPREQ>"));
    const auto& call = std::get<ExportCall>(message.call);
    EXPECT_EQ(call.method, "ExportIndication");
    EXPECT_EQ(call.arguments.at(0).name, "NewIndication");
    EXPECT_EQ(std::get<Instance>(call.arguments.at(0).value),
              (Instance{{"", "", "Alert", {}}, {{"Text", Value::string("hot")}}}));
}

TEST(Message, OverlooksCorrelatorsUnknownAttributesCommentsAndInstructions) {
    const std::string document =
        "<?xml version=\"1.0\"?><!-- a --><?b c?><CIM CIMVERSION=\"2.0\" DTDVERSION=\"2.9\" xmlns=\"http://a.b/\" "
        "x=\"y\"><!-- c --><MESSAGE ID=\"\" PROTOCOLVERSION=\"1.4\" xml:lang=\"en\"><SIMPLEREQ>"
        "<CORRELATOR NAME=\"c\" TYPE=\"string\"><VALUE>1</VALUE></CORRELATOR><IMETHODCALL NAME=\"EnumerateClasses\">"
        "<LOCALNAMESPACEPATH><NAMESPACE NAME=\"a\"/></LOCALNAMESPACEPATH><?d e?></IMETHODCALL></SIMPLEREQ></MESSAGE>"
        "</CIM><!-- f -->";
    const auto message = readMessage(document);
    EXPECT_EQ(message.id, "");
    EXPECT_EQ(message.protocolVersion, "1.4");
    EXPECT_EQ(std::get<IntrinsicCall>(message.call).nameSpace, "a");
}

TEST(Message, TakesNamespacesAsTheyAreMeant) {
    const std::string document = intrinsic("Any", "");
    for (const char* names :
         {"<NAMESPACE NAME=\"root/cimv2\"/>", "<NAMESPACE NAME=\"//root/\"/><NAMESPACE NAME=\"/cimv2\"/>",
          "<NAMESPACE NAME=\"root\"/><NAMESPACE NAME=\"\"/><NAMESPACE NAME=\"cimv2\"/>"}) {
        std::string changed = document;
        const std::string usual = "<NAMESPACE NAME=\"root\"/><NAMESPACE NAME=\"cimv2\"/>";
        changed.replace(changed.find(usual), usual.size(), names);
        EXPECT_EQ(std::get<IntrinsicCall>(readMessage(changed).call).nameSpace, "root/cimv2") << names;
    }
}

struct Flaw {
    const char* replaced;
    const char* by;
    Kind kind;
    const char* reason;
};

void PrintTo(const Flaw& flaw, std::ostream* out) {
    *out << flaw.replaced << " -> " << flaw.by;
}

/** Documents in which one place is other than it should be. */
class FlawedMessage : public testing::TestWithParam<Flaw> {};

TEST_P(FlawedMessage, IsRefusedWithKindPlaceAndReason) {
    std::string document = intrinsic("A", "<IPARAMVALUE NAME=\"B\"><VALUE>C</VALUE></IPARAMVALUE>");
    ASSERT_FALSE(refusalOf(document));
    const std::size_t place = document.find(GetParam().replaced);
    ASSERT_NE(place, std::string::npos);
    document.replace(place, std::string(GetParam().replaced).size(), GetParam().by);
    const auto refusal = refusalOf(document);
    ASSERT_TRUE(refusal);
    EXPECT_EQ(refusal->kind, GetParam().kind);
    EXPECT_EQ(refusal->reason, GetParam().reason);
}

INSTANTIATE_TEST_SUITE_P(
    Versions, FlawedMessage,
    testing::Values(Flaw{"CIMVERSION=\"2.0\"", "CIMVERSION=\"3.0\"", Kind::unsupportedCimVersion,
                         "line 2, column 1: CIMVERSION is '3.0', not 2.x"},
                    Flaw{"CIMVERSION=\"2.0\"", "CIMVERSION=\"20\"", Kind::unsupportedCimVersion,
                         "line 2, column 1: CIMVERSION is '20', not 2.x"},
                    Flaw{"CIMVERSION=\"2.0\"", "", Kind::notValid, "line 2, column 1: CIM without CIMVERSION"},
                    Flaw{"DTDVERSION=\"2.0\"", "DTDVERSION=\"1.1\"", Kind::unsupportedDtdVersion,
                         "line 2, column 1: DTDVERSION is '1.1', not 2.x"},
                    Flaw{"DTDVERSION=\"2.0\"", "", Kind::notValid, "line 2, column 1: CIM without DTDVERSION"},
                    Flaw{"PROTOCOLVERSION=\"1.0\"", "PROTOCOLVERSION=\"2.0\"", Kind::unsupportedProtocolVersion,
                         "line 3, column 1: PROTOCOLVERSION is '2.0', not 1.x"},
                    Flaw{"PROTOCOLVERSION=\"1.0\"", "", Kind::notValid,
                         "line 3, column 1: MESSAGE without PROTOCOLVERSION"}));

INSTANTIATE_TEST_SUITE_P(
    Shape, FlawedMessage,
    testing::Values(Flaw{"ID=\"1001\"", "", Kind::notValid, "line 3, column 1: MESSAGE without ID"},
                    Flaw{"<SIMPLEREQ>", "<SIMPLEREQ/><SIMPLEREQ>", Kind::notValid,
                         "line 3, column 1: MESSAGE holds 2 elements instead of one"},
                    Flaw{"<VALUE>C</VALUE>", "<VALUE>C</VALUE><VALUE/>", Kind::notValid,
                         "line 3, column 165: IPARAMVALUE holds 2 elements instead of one"},
                    Flaw{"<VALUE>C</VALUE>", "<HOST>C</HOST>", Kind::notValid,
                         "line 3, column 187: HOST out of place"},
                    Flaw{"<VALUE>C</VALUE>", "<VALUES>C</VALUES>", Kind::notValid,
                         "line 3, column 187: the element 'VALUES' is none of DSP0201"},
                    Flaw{"<VALUE>C</VALUE>", "<x:VALUE>C</x:VALUE>", Kind::notValid,
                         "line 3, column 187: the element 'VALUE' is none of DSP0201"},
                    Flaw{"<VALUE>C</VALUE>", "C", Kind::notValid, "line 3, column 187: text that is no value's"},
                    Flaw{"<VALUE>C</VALUE>", "<VALUE>C<VALUE/></VALUE>", Kind::notValid,
                         "line 3, column 195: an element within VALUE"},
                    Flaw{"<IPARAMVALUE NAME=\"B\">", "<IPARAMVALUE>", Kind::notValid,
                         "line 3, column 165: IPARAMVALUE without NAME"},
                    Flaw{"<NAMESPACE NAME=\"root\"/><NAMESPACE NAME=\"cimv2\"/>", "", Kind::notValid,
                         "line 3, column 75: a namespace without a name"},
                    Flaw{"<NAMESPACE NAME=\"root\"/><NAMESPACE NAME=\"cimv2\"/>", "<NAMESPACE NAME=\"/\"/>",
                         Kind::notValid, "line 3, column 75: a namespace without a name"},
                    Flaw{"<IMETHODCALL NAME=\"A\">", "<IMETHODCALL>", Kind::notValid,
                         "line 3, column 53: IMETHODCALL without NAME"}));

TEST(Message, IsRefusedWithSeveralRequests) {
    for (const char* element : {"MULTIREQ", "MULTIEXPREQ"}) {
        const auto refusal = refusalOf(frame(std::string("<") + element + "/>"));
        ASSERT_TRUE(refusal) << element;
        EXPECT_EQ(refusal->kind, Kind::multipleRequestsUnsupported) << element;
    }
}

TEST(Message, IsRefusedWithoutARequest) {
    const std::string call =
        "<IMETHODCALL NAME=\"A\"><LOCALNAMESPACEPATH><NAMESPACE NAME=\"a\"/></LOCALNAMESPACEPATH>"
        "</IMETHODCALL>";
    for (const std::string& inner :
         {std::string(), std::string("<SIMPLEREQ/>"), std::string("<SIMPLERSP/>"), std::string("<VALUE/>"),
          std::string("<SIMPLEEXPREQ/>"), "<SIMPLEEXPREQ>" + call + "</SIMPLEEXPREQ>",
          "<SIMPLEREQ>" + call + call + "</SIMPLEREQ>",
          std::string("<SIMPLEREQ><IMETHODCALL NAME=\"A\"/></SIMPLEREQ>"),
          std::string("<SIMPLEREQ><METHODCALL NAME=\"A\"/></SIMPLEREQ>"),
          std::string("<SIMPLEREQ><EXPMETHODCALL NAME=\"A\"/></SIMPLEREQ>"),
          std::string("<SIMPLEREQ><METHODRESPONSE NAME=\"A\"/></SIMPLEREQ>")}) {
        const auto refusal = refusalOf(frame(inner));
        ASSERT_TRUE(refusal) << inner;
        EXPECT_EQ(refusal->kind, Kind::notValid) << inner;
    }
}

TEST(Message, IsRefusedWhenTheRootIsAnother) {
    const auto refusal = refusalOf("<MESSAGE ID=\"1\" PROTOCOLVERSION=\"1.0\"/>");
    ASSERT_TRUE(refusal);
    EXPECT_EQ(refusal->kind, Kind::notValid);
    EXPECT_EQ(refusal->reason, "line 1, column 1: MESSAGE out of place");
}

TEST(Message, IsRefusedAsADeclaration) {
    const auto refusal = refusalOf("<CIM CIMVERSION=\"2.0\" DTDVERSION=\"2.0\"><DECLARATION/></CIM>");
    ASSERT_TRUE(refusal);
    EXPECT_EQ(refusal->reason, "line 1, column 40: DECLARATION is no message");
}

} // namespace
} // namespace marlo::test

/** @file What is written, byte by byte. */
#include "tests/cimxml/Validity.h"
#include "tests/cimxml/Written.h"

#include <cmath>
#include <limits>
#include <stdexcept>

#include <gtest/gtest.h>

namespace marlo::test {
namespace {

using cimxml::PathWrap;
using cimxml::Wrap;
using cimxml::Writer;

TEST(Writer, FramesAnIntrinsicAnswer) {
    EXPECT_EQ(written([](Writer& writer) {
                  writer.beginIntrinsic("<4711>", "GetClass");
                  writer.beginReturnValue();
                  writer.endReturnValue();
                  writer.outParameter({"EndOfSequence", Value::boolean(true)});
                  writer.endIntrinsic();
              }),
              "<?xml version=\"1.0\" encoding=\"utf-8\" ?>\n"
              "<CIM CIMVERSION=\"2.0\" DTDVERSION=\"2.0\"><MESSAGE ID=\"&lt;4711&gt;\" PROTOCOLVERSION=\"1.0\">"
              "<SIMPLERSP><IMETHODRESPONSE NAME=\"GetClass\"><IRETURNVALUE></IRETURNVALUE>"
              "<PARAMVALUE NAME=\"EndOfSequence\" PARAMTYPE=\"boolean\"><VALUE>TRUE</VALUE></PARAMVALUE>"
              "</IMETHODRESPONSE></SIMPLERSP></MESSAGE></CIM>\n");
}

TEST(Writer, FramesAnExtrinsicAnswer) {
    EXPECT_EQ(
        written([](Writer& writer) {
            writer.beginExtrinsic("1", "Reset");
            writer.returnValue(Value::uint(CMPI_uint32, 5));
            writer.outParameter({"Job", Value{CMPI_ref, std::make_shared<const ObjectPath>(ObjectPath{
                                                            "", "root", "A", {{"K", Value::boolean(true)}}})}});
            writer.endExtrinsic();
        }),
        "<?xml version=\"1.0\" encoding=\"utf-8\" ?>\n"
        "<CIM CIMVERSION=\"2.0\" DTDVERSION=\"2.0\"><MESSAGE ID=\"1\" PROTOCOLVERSION=\"1.0\">"
        "<SIMPLERSP><METHODRESPONSE NAME=\"Reset\"><RETURNVALUE PARAMTYPE=\"uint32\"><VALUE>5</VALUE></RETURNVALUE>"
        "<PARAMVALUE NAME=\"Job\" PARAMTYPE=\"reference\"><VALUE.REFERENCE><LOCALINSTANCEPATH><LOCALNAMESPACEPATH>"
        "<NAMESPACE NAME=\"root\"/></LOCALNAMESPACEPATH><INSTANCENAME CLASSNAME=\"A\"><KEYBINDING NAME=\"K\">"
        "<KEYVALUE VALUETYPE=\"boolean\" "
        "TYPE=\"boolean\">TRUE</KEYVALUE></KEYBINDING></INSTANCENAME></LOCALINSTANCEPATH>"
        "</VALUE.REFERENCE></PARAMVALUE></METHODRESPONSE></SIMPLERSP></MESSAGE></CIM>\n");
}

TEST(Writer, WritesErrors) {
    EXPECT_EQ(written([](Writer& writer) { writer.error(6, "no \"such\"\nthing"); }),
              "<ERROR CODE=\"6\" DESCRIPTION=\"no &quot;such&quot;&#10;thing\"/>");
}

std::string writtenText(const std::string& text) {
    return written([&text](Writer& writer) { writer.value(Value::string(text)); });
}

TEST(WrittenText, IsReadAsItWasByAnotherParser) {
    for (const char* text :
         {"", "plain", "<&>\"'", "]]>", "\r", "a\r\nb\nc\td", "  ", "\x7F", "\xC2\x80", "\xEF\xBF\xBD",
          "\xE2\x82\xAC", "\xF0\x9F\x98\x80", "&amp;", "<!-- -->", "<![CDATA[x]]>"}) {
        EXPECT_EQ(textOf(writtenText(text), "VALUE"), text);
        const std::string error = written([text](Writer& writer) { writer.error(1, text); });
        EXPECT_EQ(attributeOf(error, "ERROR", "DESCRIPTION"), text);
    }
}

TEST(WrittenText, HasReplacementsForWhatXmlCannotCarry) {
    const std::string replaced = "\xEF\xBF\xBD";
    EXPECT_EQ(textOf(writtenText(std::string("a\0b", 3)), "VALUE"), "a" + replaced + "b");
    EXPECT_EQ(textOf(writtenText("\x01\x1F\x0B"), "VALUE"), replaced + replaced + replaced);
    EXPECT_EQ(textOf(writtenText("\xEF\xBF\xBE\xEF\xBF\xBF"), "VALUE"), replaced + replaced);
    EXPECT_EQ(textOf(writtenText("a\x80z"), "VALUE"), "a" + replaced + "z");
    EXPECT_EQ(textOf(writtenText("\xC0\xAF"), "VALUE"), replaced + replaced);
    EXPECT_EQ(textOf(writtenText("\xED\xA0\x80"), "VALUE"), replaced + replaced + replaced);
    EXPECT_EQ(textOf(writtenText("\xE2\x82"), "VALUE"), replaced + replaced);
    const Value surrogate{CMPI_char16, static_cast<char16_t>(0xD800)};
    EXPECT_EQ(textOf(written([&](Writer& writer) { writer.value(surrogate); }), "VALUE"), replaced);
    const Value control{CMPI_char16, u'\x01'};
    EXPECT_EQ(textOf(written([&](Writer& writer) { writer.value(control); }), "VALUE"), replaced);
}

TEST(WrittenText, OfAnEmbeddedInstanceIsADocument) {
    const Instance instance{{"", "", "A", {}}, {{"T", Value::string("\x01<")}}};
    const std::string document = written([&](Writer& writer) {
        writer.value({CMPI_instance, std::make_shared<const Instance>(instance)});
    });
    EXPECT_EQ(textOf(document, "VALUE"), "<INSTANCE CLASSNAME=\"A\"><PROPERTY NAME=\"T\" TYPE=\"string\"><VALUE>"
                                         "\xEF\xBF\xBD&lt;</VALUE></PROPERTY></INSTANCE>");
}

struct Written {
    Value value;
    const char* text;
};

TEST(WrittenValue, HasTheFormOfItsType) {
    const std::vector<Written> forms = {
        {Value::boolean(true), "TRUE"},
        {Value::boolean(false), "FALSE"},
        {Value::uint(CMPI_uint64, 18446744073709551615U), "18446744073709551615"},
        {Value::sint(CMPI_sint8, -5), "-5"},
        {{CMPI_real64, 0.1}, "0.1"},
        {{CMPI_real32, double{0.1F}}, "0.1"},
        {{CMPI_real64, double{0.1F}}, "0.10000000149011612"},
        {{CMPI_real64, 2.0}, "2.0"},
        {{CMPI_real64, 1e300}, "1.0e+300"},
        {{CMPI_real64, -0.0}, "-0.0"},
        {{CMPI_real64, HUGE_VAL}, "INF"},
        {{CMPI_real64, -HUGE_VAL}, "-INF"},
        {{CMPI_real64, std::numeric_limits<double>::quiet_NaN()}, "NaN"},
        {{CMPI_dateTime, DateTime{"20240101000000.000000+000"}}, "20240101000000.000000+000"},
    };
    for (const auto& [value, text] : forms) {
        const Value& one = value;
        EXPECT_EQ(written([&one](Writer& writer) { writer.value(one); }), std::string("<VALUE>") + text + "</VALUE>");
    }
}

Property property(const std::string& name, CMPIType type, const std::string& origin) {
    Property result;
    result.name = name;
    result.type = type;
    result.origin = origin;
    result.defaultValue = Value::null(type);
    return result;
}

Class exampleClass() {
    Class definition;
    definition.name = "B";
    definition.superClass = "A";
    definition.qualifiers.push_back({"Version", Value::string("1"), true, false, true, true});
    definition.properties = {property("Key", CMPI_string, "A"), property("Number", CMPI_uint8, "B"),
                             property("Part", CMPI_ref, "A"), property("Many", CMPI_stringA, "B")};
    definition.properties[0].qualifiers.push_back({"Key", Value::boolean(true), false, true, false, true});
    definition.properties[2].referenceClass = "P";
    return definition;
}

TEST(WrittenInstance, HasWhatTheClassKnowsOfItsProperties) {
    const Class definition = exampleClass();
    const Instance instance{{"", "root", "B", {{"Key", Value::string("k")}}},
                            {{"Key", Value::string("k")},
                             {"Number", Value::uint(CMPI_uint8, 1)},
                             {"Part", Value::null(CMPI_ref)},
                             {"Many", Value::null(CMPI_stringA)}}};
    const std::string plain =
        "<INSTANCE CLASSNAME=\"B\"><PROPERTY NAME=\"Key\" TYPE=\"string\"><VALUE>k</VALUE></PROPERTY>"
        "<PROPERTY NAME=\"Number\" TYPE=\"uint8\"><VALUE>1</VALUE></PROPERTY>"
        "<PROPERTY.REFERENCE NAME=\"Part\" REFERENCECLASS=\"P\"></PROPERTY.REFERENCE>"
        "<PROPERTY.ARRAY NAME=\"Many\" TYPE=\"string\"></PROPERTY.ARRAY></INSTANCE>";
    const std::string full =
        "<INSTANCE CLASSNAME=\"B\"><QUALIFIER NAME=\"Version\" TYPE=\"string\" PROPAGATED=\"true\" "
        "TOSUBCLASS=\"false\" "
        "TRANSLATABLE=\"true\"><VALUE>1</VALUE></QUALIFIER>"
        "<PROPERTY NAME=\"Key\" TYPE=\"string\" CLASSORIGIN=\"A\"><QUALIFIER NAME=\"Key\" TYPE=\"boolean\" "
        "PROPAGATED=\"true\" OVERRIDABLE=\"false\"><VALUE>TRUE</VALUE></QUALIFIER><VALUE>k</VALUE></PROPERTY>"
        "<PROPERTY NAME=\"Number\" TYPE=\"uint8\" CLASSORIGIN=\"B\"><VALUE>1</VALUE></PROPERTY>"
        "<PROPERTY.REFERENCE NAME=\"Part\" REFERENCECLASS=\"P\" CLASSORIGIN=\"A\"></PROPERTY.REFERENCE>"
        "<PROPERTY.ARRAY NAME=\"Many\" TYPE=\"string\" CLASSORIGIN=\"B\"></PROPERTY.ARRAY></INSTANCE>";
    EXPECT_EQ(written([&](Writer& writer) {
                  writer.instance(instance, Wrap::instance, &definition, {});
                  writer.instance(instance, Wrap::instance, &definition, {true, true});
                  writer.instance(instance, Wrap::instance, &definition, {});
              }),
              plain + full + plain);
}

TEST(WrittenInstance, HasItsPropertiesInAnyOrderSomeOrOthersThanTheClass) {
    const Class definition = exampleClass();
    const Instance instance{{"", "root", "B", {}},
                            {{"Number", Value::uint(CMPI_uint8, 1)},
                             {"key", Value::string("k")},
                             {"Other", Value::string("o")},
                             {"Many", Value{CMPI_instanceA, Value::Array{}}}}};
    EXPECT_EQ(
        written([&](Writer& writer) {
            writer.instance(instance, Wrap::instance, &definition, {false, true});
        }),
        "<INSTANCE CLASSNAME=\"B\"><PROPERTY NAME=\"Number\" TYPE=\"uint8\" CLASSORIGIN=\"B\"><VALUE>1</VALUE>"
        "</PROPERTY><PROPERTY NAME=\"Key\" TYPE=\"string\" CLASSORIGIN=\"A\"><VALUE>k</VALUE></PROPERTY>"
        "<PROPERTY NAME=\"Other\" TYPE=\"string\"><VALUE>o</VALUE></PROPERTY>"
        "<PROPERTY.ARRAY NAME=\"Many\" TYPE=\"string\" CLASSORIGIN=\"B\" EmbeddedObject=\"instance\"><VALUE.ARRAY>"
        "</VALUE.ARRAY></PROPERTY.ARRAY></INSTANCE>");
}

TEST(WrittenInstance, SaysObjectWhereAnyClassMayBeEmbedded) {
    Class definition = exampleClass();
    definition.properties[0].qualifiers.push_back({"EmbeddedObject", Value::boolean(true)});
    const Instance instance{{"", "root", "B", {}}, {{"Key", Value::null(CMPI_instance)}}};
    EXPECT_EQ(written([&](Writer& writer) { writer.instance(instance, Wrap::instance, &definition, {}); }),
              "<INSTANCE CLASSNAME=\"B\"><PROPERTY NAME=\"Key\" TYPE=\"string\" EmbeddedObject=\"object\"></PROPERTY>"
              "</INSTANCE>");
}

TEST(WrittenClass, SaysWhatIsInherited) {
    Class definition = exampleClass();
    definition.properties.resize(2);
    definition.properties[0].propagated = true;
    definition.methods.push_back({"Do", CMPI_uint32, {}, {}, "A", true});
    definition.properties.push_back(property("Overridden", CMPI_string, "A"));
    EXPECT_EQ(
        written([&](Writer& writer) { writer.classDefinition(definition, {}); }),
        "<CLASS NAME=\"B\" SUPERCLASS=\"A\"><PROPERTY NAME=\"Key\" TYPE=\"string\" PROPAGATED=\"true\"></PROPERTY>"
        "<PROPERTY NAME=\"Number\" TYPE=\"uint8\"></PROPERTY><PROPERTY NAME=\"Overridden\" TYPE=\"string\">"
        "</PROPERTY><METHOD NAME=\"Do\" TYPE=\"uint32\" PROPAGATED=\"true\"></METHOD></CLASS>");
}

TEST(Writer, HandsOverPiecesWhileItWrites) {
    std::size_t largest = 0;
    std::size_t pieces = 0;
    std::size_t total = 0;
    Writer writer(
        [&](std::string_view piece) {
            largest = std::max(largest, piece.size());
            total += piece.size();
            ++pieces;
        },
        "h");
    const Instance instance{{"", "root", "B", {}}, {{"Text", Value::string(std::string(1000, 'x'))}}};
    for (int i = 0; i < 1000; ++i) {
        writer.instance(instance, Wrap::instance, nullptr, {});
    }
    EXPECT_GT(pieces, 50U);
    EXPECT_LT(largest, 20000U);
    writer.finish();
    EXPECT_EQ(total,
              1000 * written([&](Writer& one) { one.instance(instance, Wrap::instance, nullptr, {}); }).size());
    writer.finish();
    EXPECT_EQ(total,
              1000 * written([&](Writer& one) { one.instance(instance, Wrap::instance, nullptr, {}); }).size());
}

TEST(Writer, PassesOnWhatTheSinkThrows) {
    Writer writer([](std::string_view) { throw std::runtime_error("gone"); }, "h");
    writer.className("A");
    EXPECT_THROW(writer.finish(), std::runtime_error);
}

} // namespace
} // namespace marlo::test

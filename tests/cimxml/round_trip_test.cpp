/** @file What is written is valid, and is read back as it was. */
#include "tests/cimxml/Documents.h"
#include "tests/cimxml/Validity.h"
#include "tests/cimxml/Written.h"

#include <cmath>
#include <limits>

#include <gtest/gtest.h>

namespace marlo::test {
namespace {

using cimxml::Form;
using cimxml::PathWrap;
using cimxml::Wrap;
using cimxml::Writer;

/** A whole answer around what is returned. */
template <typename Write>
std::string answer(Write write) {
    return written([&write](Writer& writer) {
        writer.beginIntrinsic("1", "Any");
        writer.beginReturnValue();
        write(writer);
        writer.endReturnValue();
        writer.endIntrinsic();
    });
}

Value reference(ObjectPath path) {
    return {CMPI_ref, std::make_shared<const ObjectPath>(std::move(path))};
}

/** A property of each type, with the ends of its range. */
std::vector<NamedValue> numbers() {
    return {
        {"Uint8", Value::uint(CMPI_uint8, 255)},
        {"Uint16", Value::uint(CMPI_uint16, 65535)},
        {"Uint32", Value::uint(CMPI_uint32, 4294967295)},
        {"Uint64", Value::uint(CMPI_uint64, std::numeric_limits<std::uint64_t>::max())},
        {"Sint8", Value::sint(CMPI_sint8, -128)},
        {"Sint16", Value::sint(CMPI_sint16, -32768)},
        {"Sint32", Value::sint(CMPI_sint32, -2147483648)},
        {"Sint64", Value::sint(CMPI_sint64, std::numeric_limits<std::int64_t>::min())},
        {"Real32", {CMPI_real32, double{0.1F}}},
        {"Real32Large", {CMPI_real32, double{std::numeric_limits<float>::max()}}},
        {"Real64", {CMPI_real64, 0.1}},
        {"Real64Whole", {CMPI_real64, -2.0}},
        {"Real64Large", {CMPI_real64, 1e300}},
        {"Real64Small", {CMPI_real64, -1.5e-300}},
        {"Real64Endless", {CMPI_real64, -HUGE_VAL}},
    };
}

Instance everyType() {
    Instance inner{{"", "", "Inner", {}},
                   {{"Text", Value::string("<a b=\"c\">&]]>\n")}, {"Null", Value::null(CMPI_uint8)}}};
    Instance middle{{"", "", "Middle", {}},
                    {{"Inner", {CMPI_instance, std::make_shared<const Instance>(std::move(inner))}}}};
    const Value embedded{CMPI_instance, std::make_shared<const Instance>(std::move(middle))};
    const ObjectPath key{
        "",
        "root/a b",
        "B",
        {{"K", Value::string("\"x\"")}, {"R", reference({"", "", "C", {{"N", Value::uint(CMPI_uint8, 1)}}})}}};
    ObjectPath far = key;
    far.host = "other:1";
    ObjectPath near = key;
    near.nameSpace = "";
    Instance instance{{"", "", "Every", {}}, numbers()};
    instance.path.keys = numbers();
    instance.path.keys.push_back({"When", {CMPI_dateTime, DateTime{"20240229235959.000000+060"}}});
    instance.path.keys.push_back({"Ref", reference(key)});
    const std::vector<NamedValue> others = {
        {"True", Value::boolean(true)},
        {"False", Value::boolean(false)},
        {"Text", Value::string(" \t<&>\"'\r\n\xE2\x82\xAC\xF0\x9F\x98\x80 ")},
        {"Empty", Value::string("")},
        {"Null", Value::null(CMPI_string)},
        {"Letter", {CMPI_char16, u'<'}},
        {"Space", {CMPI_char16, u' '}},
        {"Foreign", {CMPI_char16, u'\u20AC'}},
        {"When", {CMPI_dateTime, DateTime{"00000001000000.000000:000"}}},
        {"Texts", {CMPI_stringA, Value::Array{Value::string("a"), Value::string("")}}},
        {"Numbers", {CMPI_uint8A, Value::Array{Value::uint(CMPI_uint8, 1)}}},
        {"None", {CMPI_uint8A, Value::Array{}}},
        {"NullArray", Value::null(CMPI_uint8A)},
        {"Near", reference(near)},
        {"Local", reference(key)},
        {"Far", reference(far)},
        {"ClassNear", reference({"", "", "B", {}})},
        {"ClassLocal", reference({"", "root/x", "B", {}})},
        {"ClassFar", reference({"other", "root/x", "B", {}})},
        {"NullReference", Value::null(CMPI_ref)},
        {"Embedded", embedded},
        {"NullEmbedded", Value::null(CMPI_instance)},
        {"EmbeddedArray", {CMPI_instanceA, Value::Array{embedded, Value::null(CMPI_instance)}}},
    };
    instance.properties.insert(instance.properties.end(), others.begin(), others.end());
    return instance;
}

TEST(RoundTrip, KeepsAnInstanceOfEveryType) {
    const Instance instance = everyType();
    const std::string element =
        written([&](Writer& writer) { writer.instance(instance, Wrap::namedInstance, nullptr, {}); });
    const auto read = std::get<Instance>(argumentOf(element));
    EXPECT_EQ(read.path.keys.size(), instance.path.keys.size());
    EXPECT_EQ(read.path, instance.path);
    ASSERT_EQ(read.properties.size(), instance.properties.size());
    for (std::size_t i = 0; i < read.properties.size(); ++i) {
        EXPECT_EQ(read.properties[i], instance.properties[i]) << instance.properties[i].name;
    }
}

TEST(RoundTrip, GivesTextsThatAreNullInAnArrayAsEmptyOnes) {
    const Value texts{CMPI_stringA, Value::Array{Value::string("a"), Value::null(CMPI_string)}};
    const Value numbers{CMPI_uint8A, Value::Array{Value::null(CMPI_uint8)}};
    const Instance instance{{"", "", "C", {}}, {{"Texts", texts}, {"Numbers", numbers}}};
    const std::string document =
        written([&](Writer& writer) { writer.instance(instance, Wrap::namedInstance, nullptr, {}); });
    EXPECT_NE(document.find("<VALUE.ARRAY><VALUE>a</VALUE><VALUE></VALUE></VALUE.ARRAY>"), std::string::npos);
    EXPECT_NE(document.find("<VALUE.ARRAY><VALUE.NULL/></VALUE.ARRAY>"), std::string::npos);
}

TEST(RoundTrip, KeepsAnIndicationThatIsExported) {
    Instance instance = everyType();
    const std::string document = written([&](Writer& writer) { writer.exportIndication("77", instance); });
    EXPECT_EQ(invalidity(document), "");
    const auto message = cimxml::readMessage(document);
    EXPECT_EQ(message.id, "77");
    const auto& call = std::get<cimxml::ExportCall>(message.call);
    EXPECT_EQ(call.method, "ExportIndication");
    EXPECT_EQ(call.arguments.at(0).name, "NewIndication");
    instance.path = {"", "", "Every", {}}; // keys do not go out with an indication
    EXPECT_EQ(std::get<Instance>(call.arguments.at(0).value), instance);
}

TEST(Validity, IsSeenToFail) {
    EXPECT_EQ(invalidity("<CIM>"), "not well-formed: Premature end of data in tag CIM line 1\n");
    EXPECT_EQ(invalidity("<CIM CIMVERSION=\"2.0\" DTDVERSION=\"2.0\"/>"),
              "not valid: Element CIM content does not follow the DTD, expecting (MESSAGE), got \n");
}

TEST(Validity, OfInstancesInAllWraps) {
    for (const Wrap wrap :
         {Wrap::instance, Wrap::namedInstance, Wrap::instanceWithPath, Wrap::objectWithPath, Wrap::object}) {
        EXPECT_EQ(invalidity(answer([&](Writer& writer) {
                      Instance instance = everyType();
                      instance.path.nameSpace = "root/x";
                      writer.instance(instance, wrap, nullptr, {});
                      writer.instance(instance, wrap, nullptr, {});
                  })),
                  "");
    }
}

TEST(Validity, OfPathsInAllWraps) {
    ObjectPath path = everyType().path;
    path.nameSpace = "root/x";
    for (const PathWrap wrap : {PathWrap::name, PathWrap::path, PathWrap::object}) {
        EXPECT_EQ(invalidity(answer([&](Writer& writer) {
                      writer.path(path, wrap);
                      writer.path({"", "root/x", "WithoutKeys", {}}, wrap);
                  })),
                  "");
    }
    const std::string call = "<METHODCALL NAME=\"A\">" +
                             written([&](Writer& writer) { writer.path(path, PathWrap::local); }) + "</METHODCALL>";
    EXPECT_EQ(invalidity(frame("<SIMPLEREQ>" + call + "</SIMPLEREQ>")), "");
    EXPECT_EQ(
        std::get<cimxml::ExtrinsicCall>(cimxml::readMessage(frame("<SIMPLEREQ>" + call + "</SIMPLEREQ>")).call).path,
        path);
}

TEST(Validity, OfNamesOfClasses) {
    EXPECT_EQ(invalidity(answer([](Writer& writer) {
                  writer.className("A");
                  writer.className("B");
              })),
              "");
    EXPECT_EQ(invalidity(answer([](Writer& writer) { writer.classPath("root/x", "A"); })), "");
}

TEST(Validity, OfEmptyAnswersAndErrors) {
    EXPECT_EQ(invalidity(answer([](Writer& /*writer*/) {})), "");
    EXPECT_EQ(invalidity(written([](Writer& writer) {
                  writer.beginIntrinsic("1", "A");
                  writer.error(1, "\"<&>\x01");
                  writer.endIntrinsic();
              })),
              "");
    EXPECT_EQ(invalidity(written([](Writer& writer) {
                  writer.beginExtrinsic("1", "A");
                  writer.error(1, "");
                  writer.endExtrinsic();
              })),
              "");
}

TEST(Validity, OfReturnValuesAndParametersOfEveryType) {
    for (const NamedValue& value : everyType().properties) {
        EXPECT_EQ(
            invalidity(written([&](Writer& writer) {
                writer.beginExtrinsic("1", "A");
                if (!value.value.isArray()) {
                    writer.returnValue(value.value);
                }
                writer.outParameter(value);
                writer.outParameter(
                    {"References", {CMPI_refA, Value::Array{reference({"", "", "B", {}}), Value::null(CMPI_ref)}}});
                writer.endExtrinsic();
            })),
            "")
            << value.name;
    }
}

TEST(Validity, OfTheValueOfAProperty) {
    for (const NamedValue& value : everyType().properties) {
        EXPECT_EQ(invalidity(answer([&](Writer& writer) { writer.value(value.value); })), "") << value.name;
    }
}

void expectSameQualifiers(const Qualifiers& read, const Qualifiers& expected) {
    ASSERT_EQ(read.size(), expected.size());
    for (std::size_t i = 0; i < read.size(); ++i) {
        EXPECT_EQ(read[i].name, expected[i].name);
        EXPECT_EQ(read[i].value.data, expected[i].value.data) << read[i].name;
        EXPECT_EQ(read[i].overridable, expected[i].overridable);
        EXPECT_EQ(read[i].toSubclass, expected[i].toSubclass);
        EXPECT_EQ(read[i].translatable, expected[i].translatable);
        EXPECT_EQ(read[i].propagated, expected[i].propagated);
    }
}

void expectSameProperties(const Class& read, const Class& expected) {
    ASSERT_EQ(read.properties.size(), expected.properties.size());
    for (std::size_t i = 0; i < read.properties.size(); ++i) {
        SCOPED_TRACE(expected.properties[i].name);
        EXPECT_EQ(read.properties[i].name, expected.properties[i].name);
        EXPECT_EQ(read.properties[i].type, expected.properties[i].type);
        EXPECT_EQ(read.properties[i].referenceClass, expected.properties[i].referenceClass);
        EXPECT_EQ(read.properties[i].defaultValue, expected.properties[i].defaultValue);
        EXPECT_EQ(read.properties[i].origin, expected.properties[i].origin);
        EXPECT_EQ(read.properties[i].key, expected.properties[i].key);
        expectSameQualifiers(read.properties[i].qualifiers, expected.properties[i].qualifiers);
    }
}

void expectSameMethods(const Class& read, const Class& expected) {
    ASSERT_EQ(read.methods.size(), expected.methods.size());
    for (std::size_t i = 0; i < read.methods.size(); ++i) {
        SCOPED_TRACE(expected.methods[i].name);
        EXPECT_EQ(read.methods[i].name, expected.methods[i].name);
        EXPECT_EQ(read.methods[i].returnType, expected.methods[i].returnType);
        EXPECT_EQ(read.methods[i].origin, expected.methods[i].origin);
        expectSameQualifiers(read.methods[i].qualifiers, expected.methods[i].qualifiers);
        ASSERT_EQ(read.methods[i].parameters.size(), expected.methods[i].parameters.size());
        for (std::size_t j = 0; j < read.methods[i].parameters.size(); ++j) {
            const Parameter& parameter = expected.methods[i].parameters[j];
            EXPECT_EQ(read.methods[i].parameters[j].name, parameter.name);
            EXPECT_EQ(read.methods[i].parameters[j].type, parameter.type);
            EXPECT_EQ(read.methods[i].parameters[j].referenceClass, parameter.referenceClass);
            EXPECT_EQ(read.methods[i].parameters[j].in, parameter.in);
            EXPECT_EQ(read.methods[i].parameters[j].out, parameter.out);
            expectSameQualifiers(read.methods[i].parameters[j].qualifiers, parameter.qualifiers);
        }
    }
}

const Schema& shippedSchema() {
    static const Schema schema = Schema::readDirectory(MARLO_SCHEMA_DIRECTORY);
    return schema;
}

/** A schema with what the shipped one does not have. */
const Schema& oddSchema() {
    static const Schema schema = Schema::readText(R"(
Qualifier Key : boolean = false, Scope(property, reference), Flavor(DisableOverride, ToSubclass);
Qualifier Association : boolean = false, Scope(association), Flavor(DisableOverride, ToSubclass);
Qualifier In : boolean = true, Scope(parameter), Flavor(DisableOverride, ToSubclass);
Qualifier Out : boolean = false, Scope(parameter), Flavor(DisableOverride, ToSubclass);
Qualifier Override : string = null, Scope(property, method, reference), Flavor(EnableOverride, Restricted);
Qualifier Description : string = null, Scope(any), Flavor(EnableOverride, ToSubclass, Translatable);
Qualifier Values : string[], Scope(property, method, parameter), Flavor(EnableOverride, ToSubclass);
#pragma namespace ("root/odd")
[Description("<&>\"\n")] class A { [Key] string K; uint8 N = 7; string Many[] = {"a", "b"}; real64 R = 1.5;
  datetime When = "20240101000000.000000+000"; char16 C = 'x'; boolean B = true;
  uint32 Do([In(false), Out] A REF result, string names[], [In] A REF all[], uint8 one); };
class B : A { [Override("N"), Values{"x", "y"}] uint8 N = 8; sint16 Own; };
[Association] class L { [Key] A REF Left; [Key] B REF Right; };
)",
                                                  "odd.mof");
    return schema;
}

void expectClassesToComeBack(const Schema& schema) {
    for (const std::string& nameSpace : schema.nameSpaces()) {
        ASSERT_FALSE(schema.classes(nameSpace).empty());
        for (const Class* definition : schema.classes(nameSpace)) {
            SCOPED_TRACE(definition->name);
            const auto read = std::get<Class>(argumentOf(written([&](Writer& writer) {
                writer.classDefinition(*definition, {true, true});
            })));
            EXPECT_EQ(read.name, definition->name);
            EXPECT_EQ(read.superClass, definition->superClass);
            EXPECT_EQ(read.isAbstract, definition->isAbstract);
            EXPECT_EQ(read.isAssociation, definition->isAssociation);
            EXPECT_EQ(read.isIndication, definition->isIndication);
            expectSameQualifiers(read.qualifiers, definition->qualifiers);
            expectSameProperties(read, *definition);
            expectSameMethods(read, *definition);
        }
    }
}

TEST(RoundTrip, KeepsClasses) {
    expectClassesToComeBack(shippedSchema());
    expectClassesToComeBack(oddSchema());
}

TEST(RoundTrip, KeepsQualifierTypes) {
    for (const Schema* schema : {&shippedSchema(), &oddSchema()}) {
        for (const QualifierType* type : schema->qualifierTypes(schema->nameSpaces().front())) {
            SCOPED_TRACE(type->name);
            const auto read = std::get<QualifierType>(
                argumentOf(written([&](Writer& writer) { writer.qualifierDeclaration(*type); })));
            EXPECT_EQ(read.name, type->name);
            EXPECT_EQ(read.defaultValue, type->defaultValue);
            EXPECT_EQ(read.overridable, type->overridable);
            EXPECT_EQ(read.toSubclass, type->toSubclass);
            EXPECT_EQ(read.translatable, type->translatable);
        }
    }
}

TEST(Validity, OfClassesInAllForms) {
    for (const Schema* schema : {&shippedSchema(), &oddSchema()}) {
        for (const Form form : {Form{false, false}, Form{true, false}, Form{false, true}, Form{true, true}}) {
            for (const std::string& nameSpace : schema->nameSpaces()) {
                EXPECT_EQ(invalidity(answer([&](Writer& writer) {
                              for (const Class* definition : schema->classes(nameSpace)) {
                                  writer.classDefinition(*definition, form);
                              }
                          })),
                          "");
                EXPECT_EQ(invalidity(answer([&](Writer& writer) {
                              for (const Class* definition : schema->classes(nameSpace)) {
                                  writer.classWithPath(nameSpace, *definition, form);
                              }
                          })),
                          "");
                EXPECT_EQ(invalidity(answer([&](Writer& writer) {
                              for (const QualifierType* type : schema->qualifierTypes(nameSpace)) {
                                  writer.qualifierDeclaration(*type);
                              }
                          })),
                          "");
            }
        }
    }
}

TEST(Validity, OfInstancesWithTheirClassInAllForms) {
    const Class& definition = *oddSchema().findClass("root/odd", "B");
    const Instance instance{{"", "root/odd", "B", {{"K", Value::string("x")}}},
                            {{"Own", Value::sint(CMPI_sint16, 1)},
                             {"K", Value::string("x")},
                             {"N", Value::null(CMPI_uint8)},
                             {"Many", {CMPI_instanceA, Value::Array{}}}}};
    for (const Form form : {Form{false, false}, Form{true, false}, Form{false, true}, Form{true, true}}) {
        EXPECT_EQ(invalidity(answer([&](Writer& writer) {
                      writer.instance(instance, Wrap::namedInstance, &definition, form);
                      writer.instance(instance, Wrap::namedInstance, &definition, form);
                  })),
                  "");
    }
}

} // namespace
} // namespace marlo::test

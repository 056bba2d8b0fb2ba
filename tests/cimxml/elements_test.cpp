/** @file Every element that a request may hold. */
#include "tests/cimxml/Documents.h"

#include <gtest/gtest.h>

namespace marlo::test {
namespace {

using cimxml::MessageError;
using cimxml::Untyped;
using cimxml::UntypedArray;
using Kind = MessageError::Kind;

constexpr const char* nameSpacePath =
    "<LOCALNAMESPACEPATH><NAMESPACE NAME=\"root\"/><NAMESPACE NAME=\"b\"/></LOCALNAMESPACEPATH>";

std::string hostPath() {
    return std::string("<NAMESPACEPATH><HOST>h:5989</HOST>") + nameSpacePath + "</NAMESPACEPATH>";
}

ObjectPath pathOf(const std::string& element) {
    return std::get<ObjectPath>(argumentOf(element));
}

Value keyOf(const std::string& element) {
    const ObjectPath path =
        pathOf("<INSTANCENAME CLASSNAME=\"A\"><KEYBINDING NAME=\"K\">" + element + "</KEYBINDING></INSTANCENAME>");
    EXPECT_EQ(path.keys.at(0).name, "K");
    return path.keys.at(0).value;
}

Value propertyOf(const std::string& element) {
    const auto instance = std::get<Instance>(argumentOf("<INSTANCE CLASSNAME=\"A\">" + element + "</INSTANCE>"));
    EXPECT_EQ(instance.properties.at(0).name, "P");
    return instance.properties.at(0).value;
}

Value reference(const ObjectPath& path) {
    return {CMPI_ref, std::make_shared<const ObjectPath>(path)};
}

std::string escaped(const std::string& text) {
    std::string result;
    for (const char c : text) {
        result += c == '<' ? "&lt;" : c == '&' ? "&amp;" : std::string(1, c);
    }
    return result;
}

/** The kind of the refusal of an argument. */
std::optional<Kind> refused(const std::string& element, const std::string& attributes = "") {
    const auto refusal =
        refusalOf(intrinsic("Any", "<IPARAMVALUE NAME=\"It\"" + attributes + ">" + element + "</IPARAMVALUE>"));
    return refusal ? std::optional(refusal->kind) : std::nullopt;
}

TEST(Value, KeepsItsTextExactly) {
    EXPECT_EQ(std::get<Untyped>(argumentOf("<VALUE> a&lt;&gt;&amp;&quot;&apos;&#x41;&#66;\tb\n </VALUE>")).text,
              " a<>&\"'AB\tb\n ");
    EXPECT_EQ(std::get<Untyped>(argumentOf("<VALUE><![CDATA[<a> & ]]>b<!-- c --><![CDATA[]]></VALUE>")).text,
              "<a> & b");
    EXPECT_EQ(std::get<Untyped>(argumentOf("<VALUE>a\r\nb&#13;c</VALUE>")).text, "a\nb\rc");
    EXPECT_EQ(std::get<Untyped>(argumentOf("<VALUE/>")).text, "");
    EXPECT_EQ(std::get<Untyped>(argumentOf("<VALUE>\xE2\x82\xAC\xF0\x9F\x98\x80</VALUE>")).text,
              "\xE2\x82\xAC\xF0\x9F\x98\x80");
}

TEST(ValueArray, HasTextsAndNulls) {
    const auto array =
        std::get<UntypedArray>(argumentOf("<VALUE.ARRAY> <VALUE>a</VALUE><VALUE.NULL/> <VALUE/></VALUE.ARRAY>"));
    EXPECT_EQ(array, (UntypedArray{Untyped{"a"}, std::nullopt, Untyped{""}}));
    EXPECT_EQ(std::get<UntypedArray>(argumentOf("<VALUE.ARRAY/>")), UntypedArray());
    EXPECT_EQ(refused("<VALUE.ARRAY><HOST/></VALUE.ARRAY>"), Kind::notValid);
}

TEST(Reference, IsAnyOfSixKindsOfPaths) {
    const std::string name = "<INSTANCENAME CLASSNAME=\"A\"/>";
    const std::string className = "<CLASSNAME NAME=\"A\"/>";
    const auto read = [](const std::string& inner) {
        return pathOf("<VALUE.REFERENCE>" + inner + "</VALUE.REFERENCE>");
    };
    EXPECT_EQ(read(name), (ObjectPath{"", "", "A", {}}));
    EXPECT_EQ(read("<LOCALINSTANCEPATH>" + (nameSpacePath + name) + "</LOCALINSTANCEPATH>"),
              (ObjectPath{"", "root/b", "A", {}}));
    EXPECT_EQ(read("<INSTANCEPATH>" + hostPath() + name + "</INSTANCEPATH>"),
              (ObjectPath{"h:5989", "root/b", "A", {}}));
    EXPECT_EQ(read(className), (ObjectPath{"", "", "A", {}}));
    EXPECT_EQ(read("<LOCALCLASSPATH>" + (nameSpacePath + className) + "</LOCALCLASSPATH>"),
              (ObjectPath{"", "root/b", "A", {}}));
    EXPECT_EQ(read("<CLASSPATH>" + hostPath() + className + "</CLASSPATH>"),
              (ObjectPath{"h:5989", "root/b", "A", {}}));
}

TEST(Reference, IsRefusedWithPartsMissingOrOutOfOrder) {
    const std::string name = "<INSTANCENAME CLASSNAME=\"A\"/>";
    for (const std::string& inner :
         {std::string(), name + name, std::string("<VALUE/>"), "<LOCALINSTANCEPATH>" + name + "</LOCALINSTANCEPATH>",
          "<LOCALINSTANCEPATH>" + (name + nameSpacePath) + "</LOCALINSTANCEPATH>",
          "<INSTANCEPATH>" + (nameSpacePath + name) + "</INSTANCEPATH>",
          "<CLASSPATH>" + hostPath() + name + "</CLASSPATH>",
          "<INSTANCEPATH><NAMESPACEPATH><HOST/></NAMESPACEPATH>" + name + "</INSTANCEPATH>",
          std::string("<INSTANCENAME/>"), std::string("<CLASSNAME/>")}) {
        EXPECT_EQ(refused("<VALUE.REFERENCE>" + inner + "</VALUE.REFERENCE>"), Kind::notValid) << inner;
    }
}

TEST(ReferenceArray, HasReferencesAndNulls) {
    const auto value = std::get<Value>(
        argumentOf("<VALUE.REFARRAY><VALUE.REFERENCE><INSTANCENAME CLASSNAME=\"A\"/></VALUE.REFERENCE>"
                   "<VALUE.NULL/></VALUE.REFARRAY>"));
    EXPECT_EQ(value, (Value{CMPI_refA, Value::Array{reference({"", "", "A", {}}), Value::null(CMPI_ref)}}));
    EXPECT_EQ(refused("<VALUE.REFARRAY><VALUE/></VALUE.REFARRAY>"), Kind::notValid);
}

TEST(ClassName, IsAName) {
    EXPECT_EQ(std::get<cimxml::ClassName>(argumentOf("<CLASSNAME NAME=\"A\"/>")).name, "A");
}

TEST(Key, IsTypedByTypeElseByValueType) {
    EXPECT_EQ(keyOf("<KEYVALUE>x</KEYVALUE>"), Value::string("x"));
    EXPECT_EQ(keyOf("<KEYVALUE VALUETYPE=\"string\"> 5 </KEYVALUE>"), Value::string(" 5 "));
    EXPECT_EQ(keyOf("<KEYVALUE VALUETYPE=\"boolean\">true</KEYVALUE>"), Value::boolean(true));
    EXPECT_EQ(keyOf("<KEYVALUE VALUETYPE=\"numeric\"> 5 </KEYVALUE>"), Value::uint(CMPI_uint64, 5));
    EXPECT_EQ(keyOf("<KEYVALUE VALUETYPE=\"numeric\">-5</KEYVALUE>"), Value::sint(CMPI_sint64, -5));
    EXPECT_EQ(keyOf("<KEYVALUE VALUETYPE=\"numeric\">0x1F</KEYVALUE>"), Value::uint(CMPI_uint64, 31));
    EXPECT_EQ(keyOf("<KEYVALUE VALUETYPE=\"numeric\">1.5</KEYVALUE>"), (Value{CMPI_real64, 1.5}));
    EXPECT_EQ(keyOf("<KEYVALUE VALUETYPE=\"numeric\" TYPE=\"sint8\">5</KEYVALUE>"), Value::sint(CMPI_sint8, 5));
    EXPECT_EQ(keyOf("<KEYVALUE TYPE=\"datetime\">20240101000000.000000+000</KEYVALUE>"),
              (Value{CMPI_dateTime, DateTime{"20240101000000.000000+000"}}));
}

TEST(Key, ThatIsNoValueOfItsTypeStaysAText) {
    EXPECT_EQ(keyOf("<KEYVALUE VALUETYPE=\"numeric\">x</KEYVALUE>"), Value::string("x"));
    EXPECT_EQ(keyOf("<KEYVALUE VALUETYPE=\"boolean\">x</KEYVALUE>"), Value::string("x"));
    EXPECT_EQ(keyOf("<KEYVALUE TYPE=\"uint8\">256</KEYVALUE>"), Value::string("256"));
}

TEST(Key, IsAReferenceTooAndReferencesAsTextsStayTexts) {
    EXPECT_EQ(
        keyOf(
            "<VALUE.REFERENCE><INSTANCENAME CLASSNAME=\"B\"><KEYVALUE>x</KEYVALUE></INSTANCENAME></VALUE.REFERENCE>"),
        reference({"", "", "B", {{"", Value::string("x")}}}));
    EXPECT_EQ(keyOf("<KEYVALUE VALUETYPE=\"string\">127.0.0.1/root/interop:B.K=\"x\"</KEYVALUE>"),
              Value::string("127.0.0.1/root/interop:B.K=\"x\""));
}

TEST(InstanceName, WithALoneKeyHasOneWithoutAName) {
    EXPECT_EQ(pathOf("<INSTANCENAME CLASSNAME=\"A\"><KEYVALUE>x</KEYVALUE></INSTANCENAME>"),
              (ObjectPath{"", "", "A", {{"", Value::string("x")}}}));
    EXPECT_EQ(pathOf("<INSTANCENAME CLASSNAME=\"A\"><VALUE.REFERENCE><CLASSNAME NAME=\"B\"/></VALUE.REFERENCE>"
                     "</INSTANCENAME>"),
              (ObjectPath{"", "", "A", {{"", reference({"", "", "B", {}})}}}));
}

TEST(InstanceName, IsRefusedWhenItsKeysAreNone) {
    for (const char* keys :
         {"<KEYVALUE>x</KEYVALUE><KEYVALUE>y</KEYVALUE>", "<KEYBINDING NAME=\"K\"/>",
          "<KEYBINDING><KEYVALUE/></KEYBINDING>", "<KEYBINDING NAME=\"K\"><VALUE/></KEYBINDING>",
          "<KEYBINDING NAME=\"K\"><KEYVALUE/><KEYVALUE/></KEYBINDING>", "<VALUE/>", "<KEYVALUE VALUETYPE=\"text\"/>",
          "<KEYVALUE TYPE=\"uint7\"/>", "<KEYVALUE/><KEYBINDING NAME=\"K\"><KEYVALUE/></KEYBINDING>"}) {
        EXPECT_EQ(refused("<INSTANCENAME CLASSNAME=\"A\">" + std::string(keys) + "</INSTANCENAME>"), Kind::notValid)
            << keys;
    }
}

TEST(Property, HasAValueOfItsTypeOrNull) {
    EXPECT_EQ(propertyOf("<PROPERTY NAME=\"P\" TYPE=\"uint16\"><VALUE>7</VALUE></PROPERTY>"),
              Value::uint(CMPI_uint16, 7));
    EXPECT_EQ(propertyOf("<PROPERTY NAME=\"P\" TYPE=\"string\"/>"), Value::null(CMPI_string));
    EXPECT_EQ(
        propertyOf("<PROPERTY NAME=\"P\" TYPE=\"uint16\"><QUALIFIER NAME=\"Q\" TYPE=\"string\"/><VALUE>7</VALUE>"
                   "</PROPERTY>"),
        Value::uint(CMPI_uint16, 7));
    EXPECT_EQ(propertyOf("<PROPERTY NAME=\"P\" TYPE=\"uint8\"><VALUE>256</VALUE></PROPERTY>"), Value::string("256"));
}

TEST(Property, IsAnArray) {
    EXPECT_EQ(
        propertyOf("<PROPERTY.ARRAY NAME=\"P\" TYPE=\"uint8\"><VALUE.ARRAY><VALUE>7</VALUE><VALUE.NULL/>"
                   "<VALUE>x</VALUE></VALUE.ARRAY></PROPERTY.ARRAY>"),
        (Value{CMPI_uint8A, Value::Array{Value::uint(CMPI_uint8, 7), Value::null(CMPI_uint8), Value::string("x")}}));
    EXPECT_EQ(propertyOf("<PROPERTY.ARRAY NAME=\"P\" TYPE=\"uint8\"/>"), Value::null(CMPI_uint8A));
}

TEST(Property, IsAReference) {
    EXPECT_EQ(
        propertyOf("<PROPERTY.REFERENCE NAME=\"P\" REFERENCECLASS=\"B\"><VALUE.REFERENCE><CLASSNAME NAME=\"B\"/>"
                   "</VALUE.REFERENCE></PROPERTY.REFERENCE>"),
        reference({"", "", "B", {}}));
    EXPECT_EQ(propertyOf("<PROPERTY.REFERENCE NAME=\"P\"/>"), Value::null(CMPI_ref));
}

TEST(Property, IsRefusedWhenItIsNone) {
    for (const char* property :
         {"<PROPERTY NAME=\"P\"/>", "<PROPERTY TYPE=\"uint8\"/>", "<PROPERTY NAME=\"P\" TYPE=\"integer\"/>",
          "<PROPERTY NAME=\"P\" TYPE=\"uint8\"><VALUE/><VALUE/></PROPERTY>",
          "<PROPERTY NAME=\"P\" TYPE=\"uint8\"><VALUE.ARRAY/></PROPERTY>",
          "<PROPERTY NAME=\"P\" TYPE=\"uint8\"><VALUE/><QUALIFIER NAME=\"Q\" TYPE=\"string\"/></PROPERTY>",
          "<PROPERTY.ARRAY NAME=\"P\" TYPE=\"uint8\"><VALUE/></PROPERTY.ARRAY>",
          "<PROPERTY.REFERENCE NAME=\"P\"><VALUE/></PROPERTY.REFERENCE>", "<METHOD NAME=\"P\"/>"}) {
        EXPECT_EQ(refused("<INSTANCE CLASSNAME=\"A\">" + std::string(property) + "</INSTANCE>"), Kind::notValid)
            << property;
    }
    EXPECT_EQ(refused("<INSTANCE/>"), Kind::notValid);
}

TEST(NamedInstance, HasItsKeysInItsPath) {
    const std::string name =
        "<INSTANCENAME CLASSNAME=\"A\"><KEYBINDING NAME=\"K\"><KEYVALUE>x</KEYVALUE></KEYBINDING></INSTANCENAME>";
    EXPECT_EQ(
        std::get<Instance>(argumentOf("<VALUE.NAMEDINSTANCE>" + name +
                                      "<INSTANCE CLASSNAME=\"a\"><PROPERTY NAME=\"P\" TYPE=\"string\"/></INSTANCE>"
                                      "</VALUE.NAMEDINSTANCE>")),
        (Instance{{"", "", "A", {{"K", Value::string("x")}}}, {{"P", Value::null(CMPI_string)}}}));
    for (const char* instance : {"<INSTANCE CLASSNAME=\"B\"/>", "", "<CLASS NAME=\"A\"/>"}) {
        EXPECT_EQ(refused("<VALUE.NAMEDINSTANCE>" + (name + instance) + "</VALUE.NAMEDINSTANCE>"), Kind::notValid)
            << instance;
    }
}

TEST(EmbeddedObject, IsReadFromTextInBothSpellingsOfItsAttribute) {
    const Instance inner{{"", "", "B", {}}, {{"T", Value::string("<&>")}}};
    const std::string text =
        "<INSTANCE CLASSNAME=\"B\"><PROPERTY NAME=\"T\" TYPE=\"string\"><VALUE>&lt;&amp;&gt;</VALUE>"
        "</PROPERTY></INSTANCE>";
    const Value value{CMPI_instance, std::make_shared<const Instance>(inner)};
    for (const char* attribute : {"EmbeddedObject=\"instance\"", "EMBEDDEDOBJECT=\"object\""}) {
        EXPECT_EQ(propertyOf(std::string("<PROPERTY NAME=\"P\" TYPE=\"string\" ") + attribute + "><VALUE>" +
                             escaped(text) + "</VALUE></PROPERTY>"),
                  value);
    }
    EXPECT_EQ(propertyOf("<PROPERTY NAME=\"P\" TYPE=\"string\" EmbeddedObject=\"instance\"><VALUE><![CDATA[" + text +
                         "]]></VALUE></PROPERTY>"),
              value);
    EXPECT_EQ(std::get<Value>(argumentOf("<VALUE>" + escaped(text) + "</VALUE>", " EmbeddedObject=\"instance\"")),
              value);
    EXPECT_EQ(
        std::get<Value>(argumentOf("<VALUE.ARRAY><VALUE>" + escaped(text) + "</VALUE><VALUE.NULL/></VALUE.ARRAY>",
                                   " EmbeddedObject=\"instance\"")),
        (Value{CMPI_instanceA, Value::Array{value, Value::null(CMPI_instance)}}));
    EXPECT_EQ(propertyOf("<PROPERTY NAME=\"P\" TYPE=\"string\" EmbeddedObject=\"instance\"/>"),
              Value::null(CMPI_instance));
    EXPECT_EQ(propertyOf("<PROPERTY NAME=\"P\" TYPE=\"string\" EmbeddedObject=\"\"><VALUE>x</VALUE></PROPERTY>"),
              Value::string("x"));
}

TEST(EmbeddedObject, IsRefusedWhenItIsNoInstance) {
    for (const char* text : {"", "x", "<INSTANCE CLASSNAME=\"B\">", "<CLASS NAME=\"B\"/>", "<INSTANCE/>",
                             "<!DOCTYPE a [<!ENTITY b 'c'>]><INSTANCE CLASSNAME=\"B\"/>"}) {
        const auto refusal =
            refusalOf(intrinsic("Any", "<IPARAMVALUE NAME=\"It\" EmbeddedObject=\"instance\"><VALUE>" +
                                           escaped(text) + "</VALUE></IPARAMVALUE>"));
        ASSERT_TRUE(refusal) << text;
        EXPECT_EQ(refusal->kind, Kind::notLooselyValid) << text;
        EXPECT_EQ(refusal->reason.find("line 3, column 216: embedded object: line 1, column "), 0U)
            << refusal->reason;
    }
}

TEST(ClassElement, IsReadWithQualifiersPropertiesAndMethods) {
    const auto definition = std::get<Class>(argumentOf(
        "<CLASS NAME=\"A\" SUPERCLASS=\"B\"><QUALIFIER NAME=\"Association\" TYPE=\"boolean\" OVERRIDABLE=\"false\" "
        "TOSUBCLASS=\"false\" TRANSLATABLE=\"true\"><VALUE>true</VALUE></QUALIFIER>"
        "<PROPERTY NAME=\"P\" TYPE=\"uint8\" CLASSORIGIN=\"C\"><QUALIFIER NAME=\"Key\" "
        "TYPE=\"boolean\"><VALUE>TRUE</VALUE>"
        "</QUALIFIER><VALUE>3</VALUE></PROPERTY><PROPERTY.ARRAY NAME=\"Q\" TYPE=\"string\"/>"
        "<PROPERTY.REFERENCE NAME=\"R\" REFERENCECLASS=\"D\"/><METHOD NAME=\"M\" TYPE=\"uint32\"><PARAMETER "
        "NAME=\"a\" "
        "TYPE=\"string\"><QUALIFIER NAME=\"In\" TYPE=\"boolean\"><VALUE>false</VALUE></QUALIFIER><QUALIFIER "
        "NAME=\"Out\" "
        "TYPE=\"boolean\"><VALUE>true</VALUE></QUALIFIER></PARAMETER><PARAMETER.ARRAY NAME=\"b\" TYPE=\"string\"/>"
        "<PARAMETER.REFERENCE NAME=\"c\" REFERENCECLASS=\"D\"/><PARAMETER.REFARRAY NAME=\"d\"/></METHOD></CLASS>"));
    EXPECT_EQ(definition.name, "A");
    EXPECT_EQ(definition.superClass, "B");
    EXPECT_TRUE(definition.isAssociation);
    EXPECT_FALSE(definition.isIndication);
    EXPECT_FALSE(definition.isAbstract);
    ASSERT_EQ(definition.qualifiers.size(), 1U);
    EXPECT_FALSE(definition.qualifiers[0].overridable);
    EXPECT_FALSE(definition.qualifiers[0].toSubclass);
    EXPECT_TRUE(definition.qualifiers[0].translatable);
    ASSERT_EQ(definition.properties.size(), 3U);
    EXPECT_TRUE(definition.properties[0].key);
    EXPECT_EQ(definition.properties[0].origin, "C");
    EXPECT_EQ(definition.properties[0].defaultValue, Value::uint(CMPI_uint8, 3));
    EXPECT_EQ(definition.properties[1].type, CMPI_stringA);
    EXPECT_EQ(definition.properties[1].defaultValue, Value::null(CMPI_stringA));
    EXPECT_EQ(definition.properties[1].origin, "A");
    EXPECT_EQ(definition.properties[2].type, CMPI_ref);
    EXPECT_EQ(definition.properties[2].referenceClass, "D");
    ASSERT_EQ(definition.methods.size(), 1U);
    EXPECT_EQ(definition.methods[0].returnType, CMPI_uint32);
    const auto& parameters = definition.methods[0].parameters;
    ASSERT_EQ(parameters.size(), 4U);
    EXPECT_FALSE(parameters[0].in);
    EXPECT_TRUE(parameters[0].out);
    EXPECT_TRUE(parameters[1].in);
    EXPECT_FALSE(parameters[1].out);
    EXPECT_EQ(parameters[1].type, CMPI_stringA);
    EXPECT_EQ(parameters[2].type, CMPI_ref);
    EXPECT_EQ(parameters[2].referenceClass, "D");
    EXPECT_EQ(parameters[3].type, CMPI_refA);
}

TEST(ClassElement, IsRefusedWhenItHoldsWhatItMayNot) {
    for (const char* inner :
         {"<VALUE/>", "<METHOD NAME=\"M\"><VALUE/></METHOD>", "<METHOD/>", "<PROPERTY NAME=\"P\"/>",
          "<QUALIFIER NAME=\"Q\"/>", "<QUALIFIER NAME=\"Q\" TYPE=\"string\"><VALUE.NULL/></QUALIFIER>",
          "<QUALIFIER NAME=\"Q\" TYPE=\"string\"><VALUE/><VALUE/></QUALIFIER>"}) {
        EXPECT_EQ(refused("<CLASS NAME=\"A\">" + std::string(inner) + "</CLASS>"), Kind::notValid) << inner;
    }
    EXPECT_EQ(refused("<CLASS/>"), Kind::notValid);
}

TEST(QualifierDeclaration, IsReadWithScopesAndFlavors) {
    const auto type = std::get<QualifierType>(argumentOf(
        "<QUALIFIER.DECLARATION NAME=\"Q\" TYPE=\"string\" ISARRAY=\"true\" TOSUBCLASS=\"false\">"
        "<SCOPE CLASS=\"true\" METHOD=\"false\" INDICATION=\"true\"/><VALUE.ARRAY><VALUE>x</VALUE></VALUE.ARRAY>"
        "</QUALIFIER.DECLARATION>"));
    EXPECT_EQ(type.name, "Q");
    EXPECT_EQ(type.defaultValue, (Value{CMPI_stringA, Value::Array{Value::string("x")}}));
    EXPECT_EQ(type.scopes, (std::vector<std::string>{"CLASS", "INDICATION"}));
    EXPECT_TRUE(type.overridable);
    EXPECT_FALSE(type.toSubclass);
    EXPECT_FALSE(type.translatable);
    EXPECT_EQ(
        refused("<QUALIFIER.DECLARATION NAME=\"Q\" TYPE=\"string\"><CLASS NAME=\"A\"/></QUALIFIER.DECLARATION>"),
        Kind::notValid);
}

} // namespace
} // namespace marlo::test

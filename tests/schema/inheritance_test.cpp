#include "tests/schema/Mof.h"

#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace marlo::test {
namespace {

using testing::ElementsAre;

constexpr const char* NS = "root/test";

template <class Elements>
std::vector<std::string> namesOf(const Elements& elements) {
    std::vector<std::string> names;
    for (const auto& element : elements) {
        if constexpr (std::is_pointer_v<std::decay_t<decltype(element)>>) {
            names.push_back(element->name);
        } else {
            names.push_back(element.name);
        }
    }
    return names;
}

TEST(SchemaInheritance, PutsInheritedFeaturesFirstAndOverridesInTheirPlace) {
    const Schema schema = read("class A { string One; string Two = \"2\"; uint8 M(); };\n"
                               "class B : A { string Three; [Override(\"One\")] string One = \"1\"; uint8 N(); };");
    const Class* const b = schema.findClass(NS, "B");
    EXPECT_THAT(namesOf(b->properties), ElementsAre("One", "Two", "Three"));
    EXPECT_THAT(namesOf(b->methods), ElementsAre("M", "N"));
    EXPECT_EQ(b->superClass, "A");
    EXPECT_EQ(b->findProperty("One")->defaultValue, Value::string("1"));
    EXPECT_EQ(b->findProperty("Two")->defaultValue, Value::string("2"));
    EXPECT_EQ(schema.findClass(NS, "A")->findProperty("One")->defaultValue, Value::null(CMPI_string));
}

TEST(SchemaInheritance, KeepsTheDefaultThatAnOverrideDoesNotName) {
    const Schema schema = read("class A { uint8 P = 7; }; class B : A { [Override(\"A.P\"), MaxLen(3)] uint8 P; };");
    EXPECT_EQ(schema.findClass(NS, "B")->findProperty("P")->defaultValue, Value::uint(CMPI_uint8, 7));
}

TEST(SchemaInheritance, NamesTheClassThatIntroducedAFeature) {
    const Schema schema = read("class A { string P; uint8 M(); };\n"
                               "class B : A { [Override(\"P\")] string P; [Override(\"M\")] uint8 M(); string Q; };");
    const Class* const b = schema.findClass(NS, "B");
    EXPECT_EQ(b->findProperty("P")->origin, "A");
    EXPECT_EQ(b->findProperty("Q")->origin, "B");
    EXPECT_EQ(b->findMethod("M")->origin, "A");
}

TEST(SchemaInheritance, InheritsKeysAndLetsAnOverrideBecomeOne) {
    const Schema schema = read("class A { string P; }; class B : A { [Key, Override(\"P\")] string P; };\n"
                               "class C : B { [Override(\"P\")] string P; string Q; };");
    EXPECT_TRUE(schema.findClass(NS, "A")->keys().empty());
    EXPECT_THAT(namesOf(schema.findClass(NS, "B")->keys()), ElementsAre("P"));
    EXPECT_THAT(namesOf(schema.findClass(NS, "C")->keys()), ElementsAre("P"));
}

TEST(SchemaInheritance, PassesOnQualifiersButRestrictedOnes) {
    const Schema schema = read("[Abstract, Description(\"of A\")] class A { [MaxLen(5)] string P; };\n"
                               "class B : A {}; class C : B { [Override(\"P\")] string P; }; class D : C {};");
    const Class* const b = schema.findClass(NS, "B");
    EXPECT_TRUE(schema.findClass(NS, "A")->isAbstract);
    EXPECT_FALSE(b->isAbstract);
    EXPECT_EQ(findQualifier(b->qualifiers, "Abstract"), nullptr);
    ASSERT_NE(findQualifier(b->qualifiers, "description"), nullptr);
    EXPECT_EQ(findQualifier(b->qualifiers, "Description")->value, Value::string("of A"));
    EXPECT_TRUE(findQualifier(b->qualifiers, "Description")->propagated);
    EXPECT_FALSE(findQualifier(schema.findClass(NS, "A")->qualifiers, "Description")->propagated);
    const Property* const overriding = schema.findClass(NS, "C")->findProperty("P");
    EXPECT_EQ(findQualifier(overriding->qualifiers, "MaxLen")->value, Value::uint(CMPI_uint32, 5));
    EXPECT_NE(findQualifier(overriding->qualifiers, "Override"), nullptr);
    EXPECT_EQ(findQualifier(schema.findClass(NS, "D")->findProperty("P")->qualifiers, "Override"), nullptr);
}

TEST(SchemaInheritance, LetsAUseChangeTheFlavors) {
    const Schema schema = read("[Description(\"of A\"): Restricted] class A {}; class B : A {};\n"
                               "[Description(\"of C\"): DisableOverride] class C {}; class D : C {};");
    EXPECT_EQ(findQualifier(schema.findClass(NS, "B")->qualifiers, "Description"), nullptr);
    EXPECT_FALSE(findQualifier(schema.findClass(NS, "D")->qualifiers, "Description")->overridable);
    EXPECT_EQ(readError(Qualifiers + "[Description(\"of C\"): DisableOverride] class C {};\n"
                                     "[Description(\"of D\")] class D : C {};"),
              "t.mof:3:2: class D inherits another value of qualifier Description, which cannot be overridden");
}

TEST(SchemaInheritance, GivesQualifiersWithoutAValueTheirMeaning) {
    const Schema schema = read("class A { [Key, Description] string P; };");
    const Property* const property = schema.findClass(NS, "A")->findProperty("P");
    EXPECT_EQ(findQualifier(property->qualifiers, "Key")->value, Value::boolean(true));
    EXPECT_EQ(findQualifier(property->qualifiers, "Description")->value, Value::null(CMPI_string));
    EXPECT_TRUE(findQualifier(property->qualifiers, "Description")->translatable);
}

TEST(SchemaInheritance, ReadsMethodsWithTheirParameters) {
    const Schema schema = read("class A { [Description(\"m\")] uint32 M([In, Description(\"p\")] string P[],"
                               " [In(false), Out] A REF Q, datetime R); };");
    const Method* const method = schema.findClass(NS, "A")->findMethod("m");
    ASSERT_NE(method, nullptr);
    EXPECT_EQ(method->returnType, CMPI_uint32);
    ASSERT_EQ(method->parameters.size(), 3U);
    EXPECT_EQ(method->parameters[0].type, CMPI_stringA);
    EXPECT_TRUE(method->parameters[0].in);
    EXPECT_FALSE(method->parameters[0].out);
    EXPECT_EQ(method->parameters[1].type, CMPI_ref);
    EXPECT_EQ(method->parameters[1].referenceClass, "A");
    EXPECT_FALSE(method->parameters[1].in);
    EXPECT_TRUE(method->parameters[1].out);
    EXPECT_EQ(method->parameters[2].type, CMPI_dateTime);
    EXPECT_TRUE(method->parameters[2].in);
}

TEST(SchemaInheritance, PassesOnQualifiersOfParameters) {
    const Schema schema = read("class A { uint32 M([Out, MaxLen(4)] string P); };\n"
                               "class B : A { [Override(\"M\")] uint32 M(string P); };");
    const Method* const method = schema.findClass(NS, "B")->findMethod("M");
    EXPECT_TRUE(method->parameters[0].out);
    EXPECT_EQ(findQualifier(method->parameters[0].qualifiers, "MaxLen")->value, Value::uint(CMPI_uint32, 4));
}

TEST(SchemaInheritance, InheritsBeingAnAssociationAndNarrowsItsReferences) {
    const Schema schema = read("class X {}; class Y : X {}; [Association] class A { [Key] X REF P; };\n"
                               "class B : A { [Override(\"P\")] Y REF P; };");
    const Class* const b = schema.findClass(NS, "B");
    EXPECT_TRUE(b->isAssociation);
    EXPECT_EQ(b->findProperty("P")->referenceClass, "Y");
    EXPECT_TRUE(b->findProperty("P")->key);
}

TEST(SchemaInheritance, DoesNotMindTheOrderOfClasses) {
    const Schema schema = read("class C : B {}; class A { string P; }; class B : A {};");
    EXPECT_THAT(namesOf(schema.classes(NS)), ElementsAre("A", "B", "C"));
    EXPECT_NE(schema.findClass(NS, "C")->findProperty("P"), nullptr);
}

TEST(SchemaInheritance, AnswersWhatDerivesFromWhat) {
    const Schema schema = read("class A {}; class B : A {}; class C : B {}; class D : A {}; class E {};");
    EXPECT_THAT(namesOf(schema.withSubclasses(NS, "a")), ElementsAre("A", "B", "C", "D"));
    EXPECT_THAT(namesOf(schema.withSubclasses(NS, "B")), ElementsAre("B", "C"));
    EXPECT_TRUE(schema.withSubclasses(NS, "Nowhere").empty());
    EXPECT_TRUE(schema.isA(NS, "C", "A"));
    EXPECT_TRUE(schema.isA(NS, "c", "C"));
    EXPECT_FALSE(schema.isA(NS, "A", "C"));
    EXPECT_FALSE(schema.isA(NS, "E", "A"));
    EXPECT_FALSE(schema.isA(NS, "Nowhere", "Nowhere"));
    EXPECT_FALSE(schema.isA("root/nowhere", "C", "A"));
}

TEST(SchemaInheritance, ReadsALineOfTenThousandClassesInReverse) {
    std::string text;
    for (int i = 10000; i > 0; --i) {
        text += "class C" + std::to_string(i) + " : C" + std::to_string(i - 1) + " {};\n";
    }
    const Schema schema = read(text + "class C0 { string P; };");
    EXPECT_NE(schema.findClass(NS, "C10000")->findProperty("P"), nullptr);
}

} // namespace
} // namespace marlo::test

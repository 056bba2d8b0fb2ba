/** @file Classes as clients ask to see them. */
#include "host/schema/ClassView.h"
#include "tests/schema/Mof.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace marlo::test {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using testing::UnorderedElementsAre;

constexpr const char* NS = "root/test";

constexpr const char* family = R"(
[Description("the root")] class A {
    [Key, Description("of A")] string Id;
    [Description("of A")] string Kept;
    [Description("of A"), MaxLen(5)] string Changed;
    [Description("do"), Values{"x"}] uint32 Do([In, Description("what")] string What);
    uint32 Stay();
};
class B : A {
    [Override("Changed"), Description("of B")] string Changed;
    string Own;
    [Override("Do")] uint32 Do([In] string What);
};
class C : B {};
class D : A {};
class E {};
)";

template <typename Elements>
std::vector<std::string> namesOf(const Elements& elements) {
    std::vector<std::string> names;
    for (const auto& element : elements) {
        names.push_back(element.name);
    }
    return names;
}

class ClassViews : public testing::Test {
  protected:
    Class view(const std::string& name) { return viewClass(*schema.findClass(NS, name), filter); }

    std::vector<std::string> below(const std::string& name, bool deep) {
        std::vector<std::string> names;
        for (const Class* each : subclasses(schema, NS, name, deep)) {
            names.push_back(each->name);
        }
        return names;
    }

    Schema schema = read(family);
    ClassFilter filter;
};

TEST_F(ClassViews, LocalOnesHaveWhatTheClassDeclaresOrOverrides) {
    const Class b = view("B");
    EXPECT_THAT(namesOf(b.properties), ElementsAre("Changed", "Own"));
    EXPECT_THAT(namesOf(b.methods), ElementsAre("Do"));
    EXPECT_THAT(namesOf(b.qualifiers), IsEmpty()) << "the Description is of A";
    EXPECT_THAT(namesOf(b.findProperty("Changed")->qualifiers), UnorderedElementsAre("Override", "Description"));
    EXPECT_THAT(namesOf(b.findMethod("Do")->qualifiers), ElementsAre("Override"));
    EXPECT_THAT(namesOf(b.findMethod("Do")->parameters.at(0).qualifiers), ElementsAre("In"));
    const Class c = view("C");
    EXPECT_THAT(c.properties, testing::SizeIs(0));
    EXPECT_THAT(c.methods, testing::SizeIs(0));
    EXPECT_THAT(namesOf(view("A").properties), ElementsAre("Id", "Kept", "Changed"));
}

TEST_F(ClassViews, WholeOnesHaveWhatIsInheritedToo) {
    filter.localOnly = false;
    const Class b = view("B");
    EXPECT_THAT(namesOf(b.properties), ElementsAre("Id", "Kept", "Changed", "Own"));
    EXPECT_THAT(namesOf(b.methods), ElementsAre("Do", "Stay"));
    ASSERT_EQ(b.qualifiers.size(), 1U);
    EXPECT_TRUE(b.qualifiers[0].propagated);
    EXPECT_THAT(namesOf(b.findProperty("Changed")->qualifiers),
                UnorderedElementsAre("Override", "Description", "MaxLen"));
    EXPECT_TRUE(findQualifier(b.findProperty("Changed")->qualifiers, "MaxLen")->propagated);
    EXPECT_FALSE(b.findProperty("Changed")->propagated);
    EXPECT_TRUE(b.findProperty("Kept")->propagated);
    EXPECT_TRUE(b.findMethod("Stay")->propagated);
    EXPECT_EQ(b.superClass, "A");
}

TEST_F(ClassViews, WithoutQualifiersHaveNoneAnywhere) {
    filter.localOnly = false;
    filter.includeQualifiers = false;
    const Class b = view("B");
    EXPECT_THAT(b.qualifiers, testing::SizeIs(0));
    EXPECT_THAT(b.findProperty("Id")->qualifiers, testing::SizeIs(0));
    EXPECT_TRUE(b.findProperty("Id")->key) << "what it says stays known";
    EXPECT_THAT(b.findMethod("Do")->qualifiers, testing::SizeIs(0));
    EXPECT_THAT(b.findMethod("Do")->parameters.at(0).qualifiers, testing::SizeIs(0));
}

TEST_F(ClassViews, TellOriginsWhereTheyAreAskedFor) {
    filter.localOnly = false;
    EXPECT_EQ(view("B").findProperty("Changed")->origin, "");
    EXPECT_EQ(view("B").findMethod("Do")->origin, "");
    filter.includeClassOrigin = true;
    EXPECT_EQ(view("B").findProperty("Changed")->origin, "A");
    EXPECT_EQ(view("B").findProperty("Own")->origin, "B");
    EXPECT_EQ(view("B").findMethod("Do")->origin, "A");
}

TEST_F(ClassViews, PropertyListCutsPropertiesAndOverlooksWhatThereIsNot) {
    filter.localOnly = false;
    filter.properties = std::vector<std::string>{"OWN", "id", "nothing", "own"};
    EXPECT_THAT(namesOf(view("B").properties), ElementsAre("Id", "Own"));
    EXPECT_THAT(view("B").methods, testing::SizeIs(2));
    filter.properties = std::vector<std::string>{};
    EXPECT_THAT(view("B").properties, testing::SizeIs(0));
    filter.properties = std::vector<std::string>{"Id", "Own"};
    filter.localOnly = true;
    EXPECT_THAT(namesOf(view("B").properties), ElementsAre("Own")) << "both hold";
}

TEST_F(ClassViews, SubclassesAreDirectOnesOrAll) {
    EXPECT_THAT(below("a", false), ElementsAre("B", "D"));
    EXPECT_THAT(below("A", true), ElementsAre("B", "C", "D"));
    EXPECT_THAT(below("C", true), IsEmpty());
    EXPECT_THAT(below("Nothing", true), IsEmpty());
    EXPECT_THAT(below("Nothing", false), IsEmpty());
}

TEST_F(ClassViews, SubclassesOfNothingAreTheRootsOrAll) {
    EXPECT_THAT(below("", false), ElementsAre("A", "E"));
    EXPECT_THAT(below("", true), ElementsAre("A", "B", "C", "D", "E"));
    EXPECT_THAT(subclasses(schema, "root/none", "", true), testing::SizeIs(0));
}

} // namespace
} // namespace marlo::test

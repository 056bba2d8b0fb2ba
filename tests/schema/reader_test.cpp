#include "tests/schema/Mof.h"

#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace marlo::test {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;

/** A directory of MOF files that goes away with the test. */
class SchemaReader : public testing::Test {
  protected:
    SchemaReader() {
        std::string pattern = testing::TempDir() + "marlo-schema-XXXXXX";
        _directory = mkdtemp(pattern.data());
    }

    ~SchemaReader() override { std::filesystem::remove_all(_directory); }

    void write(const std::string& name, const std::string& text) const {
        std::filesystem::create_directories(std::filesystem::path(path(name)).parent_path());
        std::ofstream(path(name)) << text;
    }

    [[nodiscard]] std::string path(const std::string& name) const { return _directory + "/" + name; }

    [[nodiscard]] Schema read() const { return Schema::readDirectory(_directory); }

    [[nodiscard]] std::string error() const {
        try {
            static_cast<void>(read());
        } catch (const std::runtime_error& failure) {
            return failure.what();
        }
        return "";
    }

  private:
    std::string _directory;
};

TEST_F(SchemaReader, ShowsWhatPrecedesAnyNamespaceInAllOfThem) {
    write("a.mof", "class Common {};");
    write("b.mof", "class AlsoCommon : Common {};\n#pragma namespace (\"root/one\")\nclass One : Common {};");
    write("c.mof", "#pragma namespace (\"/root/two/\")\nclass Two : AlsoCommon {};");
    const Schema schema = read();
    EXPECT_THAT(schema.nameSpaces(), ElementsAre("root/one", "root/two"));
    EXPECT_TRUE(schema.hasNameSpace("ROOT/One"));
    EXPECT_FALSE(schema.hasNameSpace("root"));
    EXPECT_NE(schema.findClass("root/one", "Common"), nullptr);
    EXPECT_NE(schema.findClass("root/two", "Common"), nullptr);
    EXPECT_NE(schema.findClass("root/one", "One"), nullptr);
    EXPECT_EQ(schema.findClass("root/two", "One"), nullptr);
    EXPECT_TRUE(schema.isA("root/two", "Two", "Common"));
    EXPECT_EQ(schema.findClass("root", "Common"), nullptr);
    EXPECT_TRUE(schema.classes("root").empty());
}

TEST_F(SchemaReader, LetsNamespacesHaveClassesOfOneName) {
    write("a.mof", "#pragma namespace (\"root/one\")\nclass A { string P; };\n"
                   "#pragma namespace (\"root/two\")\nclass A { uint8 P; };");
    const Schema schema = read();
    EXPECT_EQ(schema.findClass("root/one", "A")->findProperty("P")->type, CMPI_string);
    EXPECT_EQ(schema.findClass("root/two", "A")->findProperty("P")->type, CMPI_uint8);
}

TEST_F(SchemaReader, RefusesANamespacesClassThatAllHaveAlready) {
    write("a.mof", "class A {};");
    write("b.mof", "#pragma namespace (\"root/one\")\nclass A {};");
    EXPECT_EQ(error(), path("b.mof") + ":2:7: class A is declared already, at " + path("a.mof") + ":1");
}

TEST_F(SchemaReader, TakesTheFirstOfAQualifiersDeclarationsInSeveralFiles) {
    write("a.mof", "Qualifier Mine : boolean = false, Scope(class), Flavor(DisableOverride);\n");
    write("b.mof",
          "Qualifier MINE : boolean = true, Scope(any);\n#pragma namespace (\"root/one\")\n[Mine] class A {};");
    const Schema schema = read();
    const auto types = schema.qualifierTypes("root/one");
    const auto mine =
        std::find_if(types.begin(), types.end(), [](const QualifierType* type) { return type->name == "Mine"; });
    ASSERT_NE(mine, types.end());
    EXPECT_FALSE((*mine)->overridable);
    write("c.mof", "Qualifier Mine : string, Scope(any);\n");
    EXPECT_EQ(error(), path("c.mof") + ":1:11: qualifier Mine is declared already");
}

TEST_F(SchemaReader, DoesNotLookForSuperclassesInOtherNamespaces) {
    write("a.mof",
          "#pragma namespace (\"root/one\")\nclass A {};\n#pragma namespace (\"root/two\")\nclass B : A {};");
    EXPECT_EQ(error(), path("a.mof") + ":4:11: superclass A of B is not declared");
}

TEST_F(SchemaReader, ReadsIncludedFilesOnceInTheNamespaceInForce) {
    write("a.mof", "#pragma namespace (\"root/one\")\n#pragma include (\"b.mof\")\n"
                   "#pragma include (\"deep/c.inc\")\nclass A : B {};");
    write("b.mof", "#pragma include (\"a.mof\")\nclass B {};");
    write("deep/c.inc", "#pragma include (\"d.inc\")");
    write("deep/d.inc", "class D {};");
    const Schema schema = read();
    EXPECT_TRUE(schema.isA("root/one", "A", "B"));
    EXPECT_NE(schema.findClass("root/one", "D"), nullptr);
}

TEST_F(SchemaReader, IgnoresPragmasThatSayNothingAboutClasses) {
    write("a.mof", "#pragma locale (\"en_US\")\n#pragma instancelocale (\"en_US\", \"UTF-8\")\n"
                   "#pragma namespace (\"root/one\")\nclass A {};");
    EXPECT_NE(read().findClass("root/one", "A"), nullptr);
}

TEST_F(SchemaReader, NamesAnIncludedFileThatCannotBeRead) {
    write("a.mof", "class A {};\n#pragma include (\"gone.mof\")");
    EXPECT_EQ(error(), path("a.mof") + ":2:18: cannot read \"gone.mof\": No such file or directory");
}

TEST_F(SchemaReader, NamesTheIncludedFileThatIsWrong) {
    write("a.mof", "#pragma include (\"b.inc\")");
    write("b.inc", "\nwrong");
    EXPECT_THAT(error(), HasSubstr("/b.inc:2:1: expected a class"));
}

TEST_F(SchemaReader, RefusesIncludesThatAreNestedTooDeep) {
    for (int i = 0; i < 20; ++i) {
        write("f" + std::to_string(i) + ".inc", "#pragma include (\"f" + std::to_string(i + 1) + ".inc\")");
    }
    write("a.mof", "#pragma include (\"f0.inc\")");
    EXPECT_THAT(error(), HasSubstr("/f15.inc:1:18: files include each other more than 16 deep"));
    write("f15.inc", "#pragma namespace (\"root/one\")");
    EXPECT_EQ(error(), "");
}

TEST_F(SchemaReader, RefusesADirectoryThatIsMissingOrHasNoMof) {
    EXPECT_THAT(error(), HasSubstr("no *.mof files in the schema directory "));
    try {
        Schema::readDirectory("/nonexistent/schema");
        FAIL() << "a missing directory was read";
    } catch (const std::runtime_error& failure) {
        EXPECT_STREQ(failure.what(),
                     "cannot read the schema directory /nonexistent/schema: No such file or directory");
    }
}

TEST_F(SchemaReader, ReadsDirectoriesOneAfterTheOtherIntoOneSchema) {
    write("first/z.mof", "#pragma namespace (\"root/one\")\nclass A {};");
    write("second/a.mof", "class Everywhere {};\n#pragma namespace (\"root/one\")\nclass B : A {};\n"
                          "#pragma namespace (\"root/two\")\nclass C : Everywhere {};");
    std::filesystem::create_directory(path("empty"));
    const Schema schema = Schema::readDirectories({path("first"), path("empty"), path("second")});
    EXPECT_THAT(schema.nameSpaces(), ElementsAre("root/one", "root/two"));
    EXPECT_TRUE(schema.isA("root/one", "B", "A"));
    EXPECT_NE(schema.findClass("root/two", "Everywhere"), nullptr);
    EXPECT_EQ(*schema.findNameSpace("ROOT/One"), "root/one");
    EXPECT_EQ(schema.findNameSpace("root/three"), nullptr);
    EXPECT_THROW(Schema::readDirectories({path("empty")}), std::runtime_error);
    EXPECT_THROW(Schema::readDirectories({path("first"), path("none")}), std::runtime_error);
}

TEST_F(SchemaReader, RefusesAFileThatIsADirectory) {
    write("a.mof/inside", "");
    EXPECT_EQ(error(), "cannot read " + path("a.mof") + ": Is a directory");
}

TEST_F(SchemaReader, ReadsFilesLargerThanOneStep) {
    write("a.mof", "#pragma namespace (\"root/one\")\n/*" + std::string(200000, '-') + "*/ class A {};");
    EXPECT_NE(read().findClass("root/one", "A"), nullptr);
}

TEST_F(SchemaReader, TellsWhereAClassWasDeclared) {
    write("a.mof", "#pragma namespace (\"root/one\")\n\nclass A {};");
    const Schema schema = read();
    EXPECT_EQ(schema.findClass("root/one", "A")->file, path("a.mof"));
    EXPECT_EQ(schema.findClass("root/one", "A")->line, 3);
}

TEST_F(SchemaReader, KeepsQualifierTypesWithScopesAndFlavors) {
    write("a.mof", "Qualifier Loud : string[] = {\"a\"}, Scope(Class, PROPERTY), Flavor(DisableOverride, Restricted,"
                   " Translatable);\n#pragma namespace (\"root/one\")\nQualifier Soft : uint8, Scope(any);");
    const Schema schema = read();
    const auto types = schema.qualifierTypes("root/one");
    ASSERT_EQ(types.size(), 2U);
    EXPECT_EQ(types[0]->name, "Loud");
    EXPECT_EQ(types[0]->defaultValue, (Value{CMPI_stringA, Value::Array{Value::string("a")}}));
    EXPECT_THAT(types[0]->scopes, ElementsAre("class", "property"));
    EXPECT_FALSE(types[0]->overridable);
    EXPECT_FALSE(types[0]->toSubclass);
    EXPECT_TRUE(types[0]->translatable);
    EXPECT_EQ(types[1]->name, "Soft");
    EXPECT_EQ(types[1]->defaultValue, Value::null(CMPI_uint8));
    EXPECT_TRUE(types[1]->overridable);
    EXPECT_TRUE(types[1]->toSubclass);
    EXPECT_FALSE(types[1]->translatable);
}

TEST_F(SchemaReader, CanBeMovedAndHasNothingWhenItReadNothing) {
    write("a.mof", "#pragma namespace (\"root/one\")\nclass A {};");
    Schema schema;
    EXPECT_TRUE(schema.nameSpaces().empty());
    schema = read();
    const Class* const before = schema.findClass("root/one", "A");
    const Schema moved = std::move(schema);
    EXPECT_EQ(moved.findClass("root/one", "A"), before);
}

} // namespace
} // namespace marlo::test

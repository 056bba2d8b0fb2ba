/** @file Registration files: what is read, and how typing errors are told. */
#include "host/cimom/Registration.h"
#include "tests/support/ProviderSite.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace marlo::test {
namespace {

class Registrations : public testing::Test {
  protected:
    std::vector<Registration> read() {
        return readRegistrations({(site.directory() / "providers").string()}, "/libraries", schema);
    }

    /** Reads "providers/a.toml" with this text; the message of the refusal without the directory. */
    std::string refusal(const std::string& text) {
        site.write("providers/a.toml", text);
        try {
            read();
            return "read";
        } catch (const std::runtime_error& error) {
            const std::string message = error.what();
            const auto name = message.find("a.toml");
            return name == std::string::npos ? message : message.substr(name);
        }
    }

    ProviderSite site;
    Schema schema = Schema::readText(ProviderSite::schemaText, "test.mof");
};

constexpr const char* good = R"(library = "libA.so"
[[provider]]
name = "A"
kinds = ["instance", "method", "indication", "association", "property"]
namespaces = ["ROOT/Test"]
classes = ["test_thing", "Test_Odd"]
[[provider]]
name = "B"
kinds = ["instance"]
namespaces = ["root/test"]
classes = ["Test_Unserved"]
)";

TEST_F(Registrations, AreReadInTheSchemasSpelling) {
    site.write("providers/b.toml", good);
    site.write("providers/a.toml",
               "library = \"/elsewhere/libC.so\"\n[[provider]]\nname = \"C\"\nkinds = [\"method\"]\n"
               "namespaces = [\"root/other\"]\nclasses = [\"Test_Elsewhere\"]\n");
    site.write("providers/readme.txt", "not a registration");
    const auto registrations = read();
    ASSERT_EQ(registrations.size(), 3U);
    EXPECT_EQ(registrations[0].name, "C");
    EXPECT_EQ(registrations[0].library, "/elsewhere/libC.so");
    EXPECT_EQ(registrations[1].name, "A");
    EXPECT_EQ(registrations[1].library, "/libraries/libA.so");
    EXPECT_EQ(registrations[1].kinds.size(), 5U);
    EXPECT_THAT(registrations[1].nameSpaces, testing::ElementsAre("root/test"));
    EXPECT_THAT(registrations[1].classes, testing::ElementsAre("Test_Thing", "Test_Odd"));
    EXPECT_EQ(registrations[2].line, 7);
}

struct Error {
    const char* text;
    const char* message;
};

class RegistrationErrors : public Registrations, public testing::WithParamInterface<Error> {};

TEST_P(RegistrationErrors, NameFileLineKeyAndReason) {
    EXPECT_THAT(refusal(GetParam().text), testing::StartsWith(GetParam().message));
}

#define HEAD "library = \"l.so\"\n[[provider]]\n"
#define NAME "name = \"A\"\n"
#define KINDS "kinds = [\"instance\"]\n"
#define SPACES "namespaces = [\"root/test\"]\n"
#define CLASSES "classes = [\"Test_Odd\"]\n"

INSTANTIATE_TEST_SUITE_P(
    Files, RegistrationErrors,
    testing::Values(
        Error{"", "a.toml:1: library: missing"}, Error{"library = 5\n", "a.toml:1: library: expected a string"},
        Error{"library = \"\"\n", "a.toml:1: library: must not be empty"}, Error{"library = \n", "a.toml:1: "},
        Error{"library = \"l.so\"\n", "a.toml:1: provider: expected at least one [[provider]] table"},
        Error{"library = \"l.so\"\nprovider = 1\n", "a.toml:2: provider: expected [[provider]] tables"},
        Error{"library = \"l.so\"\nlibary = 1\n" HEAD, "a.toml:3: "},
        Error{"library = \"l.so\"\nversion = 1\n[[provider]]\n", "a.toml:2: version: unknown key"},
        Error{HEAD KINDS SPACES CLASSES, "a.toml:2: provider.name: missing"},
        Error{HEAD "name = \"a b\"\n" KINDS SPACES CLASSES,
              "a.toml:3: provider.name: 'a b' cannot be part of a symbol"},
        Error{HEAD NAME SPACES CLASSES, "a.toml:2: provider.kinds: missing"},
        Error{HEAD NAME "kinds = \"instance\"\n" SPACES CLASSES, "a.toml:4: provider.kinds: expected a list"},
        Error{HEAD NAME "kinds = []\n" SPACES CLASSES, "a.toml:4: provider.kinds: must not be empty"},
        Error{
            HEAD NAME "kinds = [\"instnce\"]\n" SPACES CLASSES,
            "a.toml:4: provider.kinds: unknown kind 'instnce', known are instance, method, indication, association, "
            "property"},
        Error{HEAD NAME KINDS CLASSES, "a.toml:2: provider.namespaces: missing"},
        Error{HEAD NAME KINDS "namespaces = [\"root/none\"]\n" CLASSES,
              "a.toml:5: provider.namespaces: the schema has no namespace 'root/none'"},
        Error{HEAD NAME KINDS SPACES, "a.toml:2: provider.classes: missing"},
        Error{HEAD NAME KINDS SPACES "classes = [\"Test_None\"]\n",
              "a.toml:6: provider.classes: the schema has no class 'Test_None' in root/test"},
        Error{HEAD NAME KINDS SPACES CLASSES "colour = 1\n", "a.toml:7: provider.colour: unknown key"}));

TEST_F(Registrations, RefuseTwoProvidersOfOneKindForOneClass) {
    const std::string again = "[[provider]]\nname = \"B\"\n" KINDS SPACES CLASSES;
    EXPECT_THAT(refusal(HEAD NAME KINDS SPACES CLASSES + again),
                testing::StartsWith("a.toml:7: provider.classes: Test_Odd in root/test has its instance provider "
                                    "already, A of "));
    EXPECT_EQ(refusal(HEAD NAME "kinds = [\"method\"]\n" SPACES CLASSES + again), "read");
}

TEST_F(Registrations, RefuseADirectoryThatCannotBeRead) {
    EXPECT_THROW(
        {
            try {
                readRegistrations({"/nonexistent/providers"}, "", schema);
            } catch (const std::runtime_error& error) {
                EXPECT_THAT(error.what(), testing::HasSubstr("/nonexistent/providers: cannot read"));
                throw;
            }
        },
        std::runtime_error);
}

} // namespace
} // namespace marlo::test

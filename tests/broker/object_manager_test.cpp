/** @file The object manager over providers that behave and providers that do not. */
#include "tests/support/ProviderSite.h"

#include <atomic>
#include <stdexcept>
#include <thread>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace marlo::test {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;

/** What an enumeration gave, as texts: the path and then the properties of each instance. */
struct Answer {
    Status status;
    std::vector<std::string> paths;
    std::vector<Instance> instances;
};

std::string propertiesOf(const Instance& instance) {
    std::string text;
    for (const NamedValue& property : instance.properties) {
        text += (text.empty() ? "" : " ") + property.name + "=" + toText(property.value);
    }
    return text;
}

class ObjectManagerTest : public testing::Test {
  protected:
    /** Registers one of the odd providers for Test_Odd. */
    void provideOdd(const std::string& provider) { site.provide("libodd_providers.so", provider, "Test_Odd"); }

    void provideThings() {
        site.provide("libthing_provider.so", "ThingProvider", "Test_Thing");
        site.provide("libthing_provider.so", "SubThingProvider", "Test_SubThing");
    }

    ObjectManager& manager() {
        if (!_manager) {
            _manager = site.start(PROVIDER_DIRECTORY);
        }
        return *_manager;
    }

    Answer enumerate(const std::string& className, const PropertyList& properties = std::nullopt,
                     const std::string& nameSpace = "root/test") {
        Answer answer;
        answer.status = manager().enumerateInstances(nameSpace, className, properties, [&](Instance&& instance) {
            answer.paths.push_back(instance.path.toString());
            answer.instances.push_back(std::move(instance));
        });
        return answer;
    }

    Answer names(const std::string& className) {
        Answer answer;
        answer.status = manager().enumerateInstanceNames(
            "root/test", className, [&](ObjectPath&& path) { answer.paths.push_back(path.toString()); });
        return answer;
    }

    Answer get(const std::string& path, const PropertyList& properties = std::nullopt) {
        Answer answer;
        answer.status = manager().getInstance(ObjectPath::parse(path), properties, [&](Instance&& instance) {
            answer.paths.push_back(instance.path.toString());
            answer.instances.push_back(std::move(instance));
        });
        return answer;
    }

    static void expect(const Answer& answer, CMPIrc code, const std::string& message) {
        EXPECT_EQ(answer.status.code, code) << answer.status.message;
        EXPECT_THAT(answer.status.message, HasSubstr(message));
    }

    ProviderSite site;

  private:
    std::unique_ptr<ObjectManager> _manager;
};

TEST_F(ObjectManagerTest, GivesInstancesWithCompletePathsInTheSchemasSpelling) {
    provideThings();
    const Answer answer = enumerate("test_subthing");
    ASSERT_TRUE(answer.status.ok()) << answer.status.message;
    EXPECT_THAT(answer.paths, ElementsAre("root/test:Test_SubThing.Id=\"a\",Number=1",
                                          "root/test:Test_SubThing.Id=\"b\",Number=2"));
    EXPECT_EQ(propertiesOf(answer.instances[0]), "Id=\"a\" Number=1 List={} Note=\"Test_SubThing\"");
    EXPECT_EQ(names("Test_SubThing").paths, answer.paths);
}

TEST_F(ObjectManagerTest, AsksTheProvidersOfAllSubclasses) {
    provideThings();
    const Answer answer = enumerate("Test_Base");
    ASSERT_TRUE(answer.status.ok()) << answer.status.message;
    EXPECT_THAT(answer.paths,
                ElementsAre("root/test:Test_Thing.Id=\"a\",Number=1", "root/test:Test_Thing.Id=\"b\",Number=2",
                            "root/test:Test_SubThing.Id=\"a\",Number=1",
                            "root/test:Test_SubThing.Id=\"b\",Number=2"));
    EXPECT_EQ(names("Test_Base").paths, answer.paths);
}

TEST_F(ObjectManagerTest, AddsTheKeysToWhatItAsksForAndLeavesThemOutOfTheAnswer) {
    provideThings();
    const Answer answer = enumerate("Test_Thing", std::vector<std::string>{"LIST", "extra", "number"});
    ASSERT_TRUE(answer.status.ok()) << answer.status.message;
    ASSERT_EQ(answer.instances.size(), 4U);
    EXPECT_EQ(answer.paths[0], "root/test:Test_Thing.Id=\"a\",Number=1");
    EXPECT_EQ(propertiesOf(answer.instances[0]), "Number=1 List={\"List\",\"Number\",\"Id\"}");
    EXPECT_EQ(propertiesOf(answer.instances[2]), "Number=1 List={\"List\",\"Extra\",\"Number\",\"Id\"}");
    const Answer none = enumerate("Test_Thing", std::vector<std::string>{});
    EXPECT_EQ(none.paths, answer.paths);
    EXPECT_EQ(propertiesOf(none.instances[0]), "");
}

TEST_F(ObjectManagerTest, GetsOneInstanceByItsKeys) {
    provideThings();
    const Answer answer = get("//somewhere/root/test:test_thing.number=1,ID=\"a\"", std::vector<std::string>{"Note"});
    ASSERT_TRUE(answer.status.ok()) << answer.status.message;
    EXPECT_THAT(answer.paths, ElementsAre("root/test:Test_Thing.Id=\"a\",Number=1"));
    EXPECT_EQ(propertiesOf(answer.instances[0]), "Note=\"Test_Thing\"");
    const Answer list = get("root/test:Test_Thing.Id=\"a\",Number=1", std::vector<std::string>{"List"});
    EXPECT_EQ(propertiesOf(list.instances.at(0)), "List={\"List\",\"Id\",\"Number\"}") << "what it was asked for";
    const Answer none = get("root/test:Test_Thing.Id=\"a\",Number=1", std::vector<std::string>{});
    EXPECT_EQ(none.paths, answer.paths);
    EXPECT_EQ(propertiesOf(none.instances.at(0)), "");
}

TEST_F(ObjectManagerTest, AnswersNotFoundWhenTheProviderGivesNothing) {
    provideThings();
    expect(get("root/test:Test_Thing.Id=\"a\",Number=2"), CMPI_RC_ERR_NOT_FOUND,
           "there is no instance root/test:Test_Thing.Id=\"a\",Number=2");
}

TEST_F(ObjectManagerTest, OffersAllOfCmpiToAProviderInC) {
    provideThings();
    const Answer answer = get("root/test:Test_Thing.Id=\"exercise\",Number=65535");
    ASSERT_TRUE(answer.status.ok()) << answer.status.message;
    EXPECT_THAT(propertiesOf(answer.instances.at(0)), HasSubstr("Note=\"good\""));
    EXPECT_THAT(site.lines(), ElementsAre("exercise: logged")); // and no trace
}

TEST_F(ObjectManagerTest, RefusesUnknownNameSpacesClassesAndProperties) {
    provideThings();
    expect(enumerate("Test_Thing", std::nullopt, "root/none"), CMPI_RC_ERR_INVALID_NAMESPACE,
           "there is no namespace 'root/none', but root/other, root/test");
    expect(enumerate("Test_None"), CMPI_RC_ERR_INVALID_CLASS, "there is no class 'Test_None' in root/test");
    expect(enumerate("Test_Elsewhere"), CMPI_RC_ERR_INVALID_CLASS, "Test_Elsewhere");
    expect(names("Test_None"), CMPI_RC_ERR_INVALID_CLASS, "Test_None");
    expect(get("root/test:Test_None.Id=\"x\""), CMPI_RC_ERR_INVALID_CLASS, "Test_None");
    expect(enumerate("Test_Thing", std::vector<std::string>{"Id", "Colour"}), CMPI_RC_ERR_NO_SUCH_PROPERTY,
           "Test_Thing has no property 'Colour'");
    expect(get("root/test:Test_Thing.Id=\"a\",Number=1", std::vector<std::string>{"Extra"}), CMPI_RC_OK,
           ""); // a subclass has it
}

TEST_F(ObjectManagerTest, RefusesClassesThatNobodyServes) {
    provideThings();
    expect(enumerate("Test_Unserved"), CMPI_RC_ERR_NOT_SUPPORTED,
           "no provider serves the instances of Test_Unserved in root/test");
    expect(names("Test_Unserved"), CMPI_RC_ERR_NOT_SUPPORTED, "Test_Unserved");
    expect(get("root/test:Test_Unserved.Id=\"x\""), CMPI_RC_ERR_NOT_SUPPORTED, "Test_Unserved");
    expect(get("root/test:Test_Base"), CMPI_RC_ERR_NOT_SUPPORTED, "the instances of Test_Base in root/test");
}

struct BadKeys {
    const char* path;
    const char* message;
};

class ObjectManagerKeys : public ObjectManagerTest, public testing::WithParamInterface<BadKeys> {};

TEST_P(ObjectManagerKeys, ThatAreWrongAreRefusedByName) {
    provideOdd("ThrowsException"); // never reached
    provideThings();
    expect(get(GetParam().path), CMPI_RC_ERR_INVALID_PARAMETER, GetParam().message);
}

INSTANTIATE_TEST_SUITE_P(
    Refused, ObjectManagerKeys,
    testing::Values(BadKeys{"root/test:Test_Odd", "the path lacks the key Id of Test_Odd"},
                    BadKeys{"root/test:Test_Odd.Id=\"x\",Colour=1", "Test_Odd has no key 'Colour'"},
                    BadKeys{"root/test:Test_Odd.Id=\"x\",Note=\"y\"", "Test_Odd has no key 'Note'"},
                    BadKeys{"root/test:Test_Odd.Id=1", "the key Id of Test_Odd is of type string, which 1 is not"},
                    BadKeys{"root/test:Test_Thing.Id=\"a\",Number=\"1\"",
                            "the key Number of Test_Thing is of type uint16"},
                    BadKeys{"root/test:Test_Thing.Id=\"a\",Number=65536", "which 65536 is not"},
                    BadKeys{"root/test:Test_Thing.Id=\"a\",Number=-1", "which -1 is not"},
                    BadKeys{"root/test:Test_Thing.Id=\"a\",Number=TRUE", "which TRUE is not"},
                    BadKeys{"root/test:Test_Keys.When=\"now\",Small=1,Flag=TRUE", "the key When of Test_Keys"},
                    BadKeys{"root/test:Test_Keys.When=\"20200229120000.000000+000\",Small=128,Flag=TRUE",
                            "the key Small of Test_Keys"},
                    BadKeys{"root/test:Test_Keys.When=\"20200229120000.000000+000\",Small=-129,Flag=TRUE",
                            "the key Small of Test_Keys"},
                    BadKeys{"root/test:Test_Keys.When=\"20200229120000.000000+000\",Small=-128,Flag=1",
                            "the key Flag of Test_Keys"}));

TEST_F(ObjectManagerTest, SaysWhichLibraryOrFactoryIsMissing) {
    site.provide("libnone.so", "NoLibrary", "Test_Odd");
    site.provide("libodd_providers.so", "NoFactory", "Test_Thing");
    const Answer library = enumerate("Test_Odd");
    expect(library, CMPI_RC_ERR_FAILED, "provider NoLibrary: cannot load " PROVIDER_DIRECTORY "/libnone.so: ");
    EXPECT_THAT(library.status.message, HasSubstr("No such file"));
    const Answer factory = enumerate("Test_Thing");
    expect(factory, CMPI_RC_ERR_FAILED, "no factory NoFactory_Create_InstanceMI in " PROVIDER_DIRECTORY);
    EXPECT_THAT(factory.status.message, HasSubstr("undefined symbol"));
}

struct OddCase {
    const char* provider;
    CMPIrc code;
    const char* message;
};

class ObjectManagerOdd : public ObjectManagerTest, public testing::WithParamInterface<OddCase> {};

TEST_P(ObjectManagerOdd, FailuresAreAnsweredAndOtherRequestsGoOn) {
    const OddCase& odd = GetParam();
    provideOdd(odd.provider);
    provideThings();
    for (int i = 0; i < 2; ++i) {
        expect(enumerate("Test_Odd"), odd.code, odd.message);
        expect(names("Test_Odd"), odd.code, odd.message);
        expect(get("root/test:Test_Odd.Id=\"x\""), odd.code, odd.message);
        EXPECT_EQ(enumerate("Test_Thing").paths.size(), 4U);
    }
}

INSTANTIATE_TEST_SUITE_P(
    Providers, ObjectManagerOdd,
    testing::Values(OddCase{"ThrowsException", CMPI_RC_ERR_FAILED,
                            "provider ThrowsException threw: the text of the exception"},
                    OddCase{"ThrowsInt", CMPI_RC_ERR_FAILED, "provider ThrowsInt threw: an exception of type int"},
                    OddCase{"NullFactory", CMPI_RC_ERR_FAILED, "made nothing: not today"},
                    OddCase{"ThrowingFactory", CMPI_RC_ERR_FAILED,
                            "factory ThrowingFactory_Create_InstanceMI of " PROVIDER_DIRECTORY
                            "/libodd_providers.so threw: the factory's text"},
                    OddCase{"NoReason", CMPI_RC_ERR_ACCESS_DENIED, "provider NoReason gave no reason"},
                    OddCase{"Reason", CMPI_RC_ERR_ACCESS_DENIED, "the provider's own reason"},
                    OddCase{"ForeignCode", CMPI_RC_ERR_FAILED, "CMPI return code 60"},
                    OddCase{"CimError", CMPI_RC_ERR_ACCESS_DENIED, "an error object"},
                    OddCase{"Recursing", CMPI_RC_ERR_FAILED, "in a circle: 16 requests"}),
    [](const auto& testCase) { return std::string(testCase.param.provider); });

TEST_F(ObjectManagerTest, TriesAgainToMakeAProvider) {
    provideOdd("SecondTry");
    expect(enumerate("Test_Odd"), CMPI_RC_ERR_FAILED, "SecondTry_Create_InstanceMI");
    EXPECT_TRUE(enumerate("Test_Odd").status.ok());
}

TEST_F(ObjectManagerTest, LeavesOutValuesOfAnotherTypeAndSaysSoOnce) {
    provideOdd("WrongTypes");
    EXPECT_EQ(propertiesOf(enumerate("Test_Odd").instances.at(0)), "Id=\"x\" Note=NULL");
    const Answer again = enumerate("Test_Odd");
    EXPECT_EQ(again.instances.at(0).properties.at(1).value, Value::null(CMPI_string)); // typed by the schema
    EXPECT_THAT(
        site.lines(),
        ElementsAre("provider WrongTypes: left out the value of Test_Odd.Count, which is of type uint32 and not "
                    "uint16",
                    "provider WrongTypes: left out the value of Test_Odd.Counts, which is of type string[] and "
                    "not uint16[]"));
}

TEST_F(ObjectManagerTest, LeavesOutPropertiesThatTheClassLacksAndSaysSoOnce) {
    provideOdd("UnknownProperty");
    enumerate("Test_Odd");
    EXPECT_EQ(propertiesOf(enumerate("Test_Odd").instances.at(0)), "Id=\"x\" Note=\"kept\"");
    EXPECT_THAT(site.lines(), ElementsAre("provider UnknownProperty: left out the property 'Unheard', which Test_Odd "
                                          "does not have"));
}

TEST_F(ObjectManagerTest, LeavesOutAnswersThatAreNone) {
    provideOdd("NullInstance");
    EXPECT_THAT(enumerate("Test_Odd").paths, ElementsAre("root/test:Test_Odd.Id=\"x\""));
}

TEST_F(ObjectManagerTest, LeavesOutAnswersOfAnotherClass) {
    provideOdd("OtherClass");
    EXPECT_THAT(enumerate("Test_Odd").paths, ElementsAre("root/test:Test_Odd.Id=\"x\""));
    EXPECT_THAT(site.lines(), ElementsAre(HasSubstr("'Test_Thing'"), HasSubstr("'Unheard'")));
}

TEST_F(ObjectManagerTest, LeavesOutAnswersWithoutTheirKeys) {
    provideOdd("MissingKey");
    EXPECT_THAT(enumerate("Test_Odd").paths, ElementsAre("root/test:Test_Odd.Id=\"x\""));
    EXPECT_THAT(site.lines(), ElementsAre(HasSubstr("lacks the key Id")));
}

TEST_F(ObjectManagerTest, TakesOneInstanceOfSeveralAndNoneForNotFound) {
    provideOdd("TwoAnswers");
    EXPECT_EQ(get("root/test:Test_Odd.Id=\"x\"").paths.size(), 1U);
}

TEST_F(ObjectManagerTest, NeedsNoReturnDone) {
    provideOdd("Silent");
    EXPECT_TRUE(enumerate("Test_Odd").status.ok());
    expect(get("root/test:Test_Odd.Id=\"x\""), CMPI_RC_ERR_NOT_FOUND, "Test_Odd.Id=\"x\"");
}

TEST_F(ObjectManagerTest, ReportsTheFailuresThatTheAgentLoggedMeanwhile) {
    site.provide("liblogging_provider.so", "Logging", "Test_Odd");
    provideThings();
    for (int i = 0; i < 2; ++i) {
        const Answer answer = enumerate("Test_Odd");
        EXPECT_TRUE(answer.status.ok());
        EXPECT_THAT(answer.status.reported, ElementsAre("failure", "other failure", "within"));
        EXPECT_THAT(enumerate("Test_Thing").status.reported, ElementsAre());
    }
}

TEST_F(ObjectManagerTest, ThrowsOnWhatASinkThrows) {
    provideThings();
    EXPECT_THROW(manager().enumerateInstances("root/test", "Test_Thing", std::nullopt,
                                              [](Instance&&) { throw std::runtime_error("sink"); }),
                 std::runtime_error);
    EXPECT_TRUE(enumerate("Test_Thing").status.ok());
}

TEST_F(ObjectManagerTest, ServesManyThreads) {
    provideThings();
    provideOdd("ThrowsException");
    std::atomic<int> good{0};
    std::vector<std::thread> threads;
    manager();
    for (int t = 0; t < 4; ++t) {
        threads.emplace_back([&] {
            for (int i = 0; i < 25; ++i) {
                good += enumerate("Test_Base").status.code == CMPI_RC_ERR_FAILED ? 1 : 0;
                good += enumerate("Test_SubThing").paths.size() == 2 ? 1 : 0;
                good += get("root/test:Test_Thing.Id=\"exercise\",Number=65535").paths.size() == 1 ? 1 : 0;
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(good, 300);
}

TEST(StatusName, IsThatOfCim) {
    EXPECT_EQ(statusName(CMPI_RC_OK), "CIM_OK");
    EXPECT_EQ(statusName(CMPI_RC_ERR_NOT_FOUND), "CIM_ERR_NOT_FOUND");
    EXPECT_EQ(statusName(CMPI_RC_ERR_INVALID_HANDLE), "status 60");
}

} // namespace
} // namespace marlo::test

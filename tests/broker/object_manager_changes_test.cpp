/** @file Changes through the object manager: what it refuses, what it hands on, and how it answers for the provider.
 */
#include "tests/support/ProviderSite.h"

#include <atomic>
#include <functional>
#include <ostream>
#include <thread>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace marlo::test {
namespace {

using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using Names = std::vector<std::string>;
using Values = std::vector<NamedValue>;

constexpr const char* changeableSchema = R"(
Qualifier In : boolean = true, Scope(parameter), Flavor(DisableOverride);
Qualifier Out : boolean = false, Scope(parameter), Flavor(DisableOverride);
Qualifier Static : boolean = false, Scope(property, method), Flavor(DisableOverride);
Qualifier Write : boolean = false, Scope(property, reference);
#pragma namespace ("root/test")
class Test_Changing {
    [Key] string Id;
    [Write] uint16 Count;
    [Write] string Texts[];
    [Write] datetime When;
    string Fixed;
    uint32 Do([In] string Text, [In] uint16 Numbers[], [In, Out] uint16 Both, [In(false), Out] string Back);
    [Static] uint32 DoForAll([In] string Text);
};
class Test_SubChanging : Test_Changing {};
class Test_InstancesOnly : Test_Changing {};
)";

Value texts(const Names& elements) {
    Value::Array array;
    for (const std::string& element : elements) {
        array.push_back(Value::string(element));
    }
    return {CMPI_stringA, array};
}

class Changes : public testing::Test {
  protected:
    Changes() {
        site.write("schema/zz-changing.mof", changeableSchema);
        site.provide("libchanging_provider.so", "Changing", "Test_Changing", {"instance", "method"});
        manager = site.start(PROVIDER_DIRECTORY);
    }

    Status modify(const std::string& path, const Values& values, const PropertyList& properties = std::nullopt) {
        return manager->modifyInstance({ObjectPath::parse(path), values}, properties);
    }

    Status invoke(const std::string& path, const std::string& method, const Values& arguments = {}) {
        return manager->invokeMethod(ObjectPath::parse(path), method, arguments, answer);
    }

    static void expect(const Status& status, CMPIrc code, const std::string& message) {
        EXPECT_EQ(status.code, code) << status.message;
        EXPECT_THAT(status.message, HasSubstr(message));
    }

    ProviderSite site;
    std::unique_ptr<ObjectManager> manager;
    MethodAnswer answer;
};

const std::string A = "root/test:Test_Changing.Id=\"a\"";

TEST_F(Changes, ProviderGetsTheNamesAndEveryPropertyOfTheClassInTheSchemasSpelling) {
    const Status status = modify("//host/root/test:test_changing.ID=\"a\"",
                                 {{"texts", texts({"x", "y"})}, {"COUNT", Value::sint(CMPI_sint64, 7)}});
    EXPECT_TRUE(status.ok()) << status.message;
    EXPECT_THAT(site.lines(), ElementsAre("changing: modify root/test:Test_Changing.Id=\"a\" names Texts Count of "
                                          "Id=\"a\" Count=7 Texts={\"x\",\"y\"} When=NULL Fixed=NULL"));
}

TEST_F(Changes, PropertyListSaysWhatIsChangedAndWhatItLacksBecomesNULL) {
    const Status status =
        modify(A, {{"Count", Value::uint(CMPI_uint16, 7)}, {"Texts", texts({"x"})}}, Names{"TEXTS", "When", "texts"});
    EXPECT_TRUE(status.ok()) << status.message;
    EXPECT_THAT(site.lines(), ElementsAre("changing: modify root/test:Test_Changing.Id=\"a\" names Texts When of "
                                          "Id=\"a\" Count=NULL Texts={\"x\"} When=NULL Fixed=NULL"));
}

TEST_F(Changes, InstanceThatWasReadAndIsSentBackIsChangedWhereItCanBe) {
    const Status status = modify(
        A,
        {{"Id", Value::string("a")}, {"Fixed", Value::string("as it was")}, {"Count", Value::uint(CMPI_uint16, 8)}});
    EXPECT_TRUE(status.ok()) << status.message;
    EXPECT_THAT(site.lines(), ElementsAre("changing: modify root/test:Test_Changing.Id=\"a\" names Count of "
                                          "Id=\"a\" Count=8 Texts=NULL When=NULL Fixed=NULL"));
}

struct Refusal {
    const char* name;
    std::function<Status(ObjectManager&)> request;
    CMPIrc code;
    const char* message;

    friend std::ostream& operator<<(std::ostream& stream, const Refusal& refusal) { return stream << refusal.name; }
};

Status modifyAt(ObjectManager& manager, const std::string& path, const Values& values,
                const PropertyList& properties = std::nullopt) {
    return manager.modifyInstance({ObjectPath::parse(path), values}, properties);
}

Status call(ObjectManager& manager, const std::string& path, const std::string& method,
            const Values& arguments = {}) {
    MethodAnswer answer;
    return manager.invokeMethod(ObjectPath::parse(path), method, arguments, answer);
}

const std::vector<Refusal> REFUSALS{
    {"ModifyInAnUnknownNamespace",
     [](ObjectManager& m) { return modifyAt(m, "root/none:Test_Changing.Id=\"a\"", {}); },
     CMPI_RC_ERR_INVALID_NAMESPACE, "there is no namespace 'root/none'"},
    {"ModifyAnUnknownClass", [](ObjectManager& m) { return modifyAt(m, "root/test:Test_None.Id=\"a\"", {}); },
     CMPI_RC_ERR_INVALID_CLASS, "there is no class 'Test_None'"},
    {"ModifyWithoutKeys", [](ObjectManager& m) { return modifyAt(m, "root/test:Test_Changing", {}); },
     CMPI_RC_ERR_INVALID_PARAMETER, "the path lacks the key Id of Test_Changing"},
    {"ModifyByAnUnknownKey",
     [](ObjectManager& m) { return modifyAt(m, "root/test:Test_Changing.Id=\"a\",Other=1", {}); },
     CMPI_RC_ERR_INVALID_PARAMETER, "Test_Changing has no key 'Other'"},
    {"ModifyByAKeyOfAnotherType", [](ObjectManager& m) { return modifyAt(m, "root/test:Test_Changing.Id=1", {}); },
     CMPI_RC_ERR_INVALID_PARAMETER, "the key Id of Test_Changing is of type string, which 1 is not"},
    {"ModifyAnUnknownProperty",
     [](ObjectManager& m) {
         return modifyAt(m, A, {{"Colour", Value::string("x")}});
     },
     CMPI_RC_ERR_NO_SUCH_PROPERTY, "Test_Changing has no property 'Colour'"},
    {"ModifyAnUnknownPropertyOfTheList", [](ObjectManager& m) { return modifyAt(m, A, {}, Names{"Colour"}); },
     CMPI_RC_ERR_NO_SUCH_PROPERTY, "Test_Changing has no property 'Colour'"},
    {"ModifyAPropertyThatCannotBeWritten",
     [](ObjectManager& m) {
         return modifyAt(m, A, {{"Fixed", Value::string("x")}}, Names{"Fixed"});
     },
     CMPI_RC_ERR_INVALID_PARAMETER, "Test_Changing.Fixed cannot be changed"},
    {"ModifyAKey",
     [](ObjectManager& m) {
         return modifyAt(m, A, {{"Id", Value::string("b")}});
     },
     CMPI_RC_ERR_INVALID_PARAMETER, "the key Id of an instance of Test_Changing cannot be changed"},
    {"ModifyToAnotherType",
     [](ObjectManager& m) {
         return modifyAt(m, A, {{"Count", Value::string("7")}});
     },
     CMPI_RC_ERR_INVALID_PARAMETER, "Test_Changing.Count is of type uint16, which \"7\" is not"},
    {"ModifyToANumberThatDoesNotFit",
     [](ObjectManager& m) {
         return modifyAt(m, A, {{"Count", Value::uint(CMPI_uint64, 65536)}});
     },
     CMPI_RC_ERR_INVALID_PARAMETER, "Test_Changing.Count is of type uint16, which 65536 is not"},
    {"ModifyAnArrayToOneValue",
     [](ObjectManager& m) {
         return modifyAt(m, A, {{"Texts", Value::string("x")}});
     },
     CMPI_RC_ERR_INVALID_PARAMETER, "Test_Changing.Texts is of type string[], which \"x\" is not"},
    {"ModifyOneValueToAnArray",
     [](ObjectManager& m) {
         return modifyAt(m, A, {{"When", texts({"x"})}});
     },
     CMPI_RC_ERR_INVALID_PARAMETER, "Test_Changing.When is of type datetime, which {\"x\"} is not"},
    {"ModifyAnElementToAnotherType",
     [](ObjectManager& m) {
         return modifyAt(m, A, {{"Texts", {CMPI_uint16A, Value::Array{Value::uint(CMPI_uint16, 1)}}}});
     },
     CMPI_RC_ERR_INVALID_PARAMETER, "Test_Changing.Texts is of type string[], which {1} is not"},
    {"ModifyADerivedClassThatNobodyServes",
     [](ObjectManager& m) { return modifyAt(m, "root/test:Test_SubChanging.Id=\"a\"", {}); },
     CMPI_RC_ERR_NOT_SUPPORTED, "no provider serves the instances of Test_SubChanging in root/test"},
    {"InvokeInAnUnknownNamespace", [](ObjectManager& m) { return call(m, "root/none:Test_Changing.Id=\"a\"", "Do"); },
     CMPI_RC_ERR_INVALID_NAMESPACE, "there is no namespace 'root/none'"},
    {"InvokeOnAnUnknownClass", [](ObjectManager& m) { return call(m, "root/test:Test_None.Id=\"a\"", "Do"); },
     CMPI_RC_ERR_INVALID_CLASS, "there is no class 'Test_None'"},
    {"InvokeAnUnknownMethod", [](ObjectManager& m) { return call(m, A, "Undo"); }, CMPI_RC_ERR_METHOD_NOT_FOUND,
     "Test_Changing has no method 'Undo'"},
    {"InvokeAMethodThatNobodyServes",
     [](ObjectManager& m) { return call(m, "root/test:Test_SubChanging.Id=\"a\"", "Do"); },
     CMPI_RC_ERR_METHOD_NOT_AVAILABLE, "no provider serves the methods of Test_SubChanging in root/test"},
    {"InvokeWithoutKeys", [](ObjectManager& m) { return call(m, "root/test:Test_Changing", "Do"); },
     CMPI_RC_ERR_INVALID_PARAMETER, "the path lacks the key Id of Test_Changing"},
    {"InvokeAMethodOfTheClassOnAWrongKey",
     [](ObjectManager& m) { return call(m, "root/test:Test_Changing.Other=1", "DoForAll"); },
     CMPI_RC_ERR_INVALID_PARAMETER, "Test_Changing has no key 'Other'"},
    {"InvokeWithAnUnknownParameter",
     [](ObjectManager& m) {
         return call(m, A, "Do", {{"Colour", Value::string("x")}});
     },
     CMPI_RC_ERR_INVALID_PARAMETER, "Do takes no parameter 'Colour'"},
    {"InvokeWithAParameterThatOnlyComesBack",
     [](ObjectManager& m) {
         return call(m, A, "Do", {{"Back", Value::string("x")}});
     },
     CMPI_RC_ERR_INVALID_PARAMETER, "Do takes no parameter 'Back'"},
    {"InvokeWithAParameterTwice",
     [](ObjectManager& m) {
         return call(m, A, "Do", {{"Text", Value::string("x")}, {"TEXT", Value::string("y")}});
     },
     CMPI_RC_ERR_INVALID_PARAMETER, "Do takes one parameter TEXT, which is given twice"},
    {"InvokeWithAParameterOfAnotherType",
     [](ObjectManager& m) {
         return call(m, A, "Do", {{"Text", Value::boolean(true)}});
     },
     CMPI_RC_ERR_INVALID_PARAMETER, "the parameter Text of Do is of type string, which TRUE is not"},
    {"InvokeWithOneValueForAnArray",
     [](ObjectManager& m) {
         return call(m, A, "Do", {{"Numbers", Value::uint(CMPI_uint16, 1)}});
     },
     CMPI_RC_ERR_INVALID_PARAMETER, "the parameter Numbers of Do is of type uint16[], which 1 is not"},
};

class RefusedChanges : public Changes, public testing::WithParamInterface<Refusal> {};

TEST_P(RefusedChanges, NeverReachTheProvider) {
    expect(GetParam().request(*manager), GetParam().code, GetParam().message);
    EXPECT_THAT(site.lines(), IsEmpty());
}

INSTANTIATE_TEST_SUITE_P(Each, RefusedChanges, testing::ValuesIn(REFUSALS),
                         [](const auto& instance) { return instance.param.name; });

TEST_F(Changes, MethodGetsItsArgumentsAsTheSchemaHasThemAndAnswers) {
    const Status status =
        invoke("root/test:test_changing.ID=\"a\"", "DO",
               {{"both", Value::sint(CMPI_sint64, 2)},
                {"numbers", {CMPI_sint64A, Value::Array{Value::sint(CMPI_sint64, 1), Value::null(CMPI_sint64)}}},
                {"text", Value::string("x")}});
    ASSERT_TRUE(status.ok()) << status.message;
    EXPECT_EQ(answer.returned, Value::uint(CMPI_uint32, 0));
    EXPECT_EQ(answer.out, (Values{{"Both", Value::uint(CMPI_uint16, 7)}, {"Back", Value::string("given back")}}));
    EXPECT_THAT(site.lines(),
                ElementsAre("changing: invoke root/test:Test_Changing.Id=\"a\" Do Text=\"x\" Numbers={1,NULL} Both=2",
                            "provider Changing: left out the parameter 'Text' of type string, which Do does not give "
                            "back",
                            "provider Changing: left out the parameter 'Unheard' of type string, which Do does not "
                            "give back"));
}

TEST_F(Changes, ArgumentsThatAreNotGivenAreNotThereAndNULLStaysNULL) {
    ASSERT_TRUE(invoke(A, "Do", {{"Text", Value::null(CMPI_null)}}).ok());
    EXPECT_THAT(site.lines(), Contains("changing: invoke root/test:Test_Changing.Id=\"a\" Do Text=NULL"));
}

TEST_F(Changes, MethodOfTheClassNeedsNoKeysAndTakesThem) {
    ASSERT_TRUE(invoke("root/test:Test_Changing", "DoForAll").ok());
    ASSERT_TRUE(invoke(A, "DoForAll").ok());
    EXPECT_THAT(site.lines(), Contains("changing: invoke root/test:Test_Changing DoForAll"));
    EXPECT_THAT(site.lines(), Contains("changing: invoke root/test:Test_Changing.Id=\"a\" DoForAll"));
}

TEST_F(Changes, ProvidersOwnRefusalAndItsTextAreAnswered) {
    expect(modify("root/test:Test_Changing.Id=\"refused\"", {}), CMPI_RC_ERR_ACCESS_DENIED, "no such thing today");
    expect(invoke(A, "Do", {{"Text", Value::string("refused")}}), CMPI_RC_ERR_ACCESS_DENIED, "no such thing today");
}

TEST_F(Changes, ExceptionIsAFailureWithItsText) {
    const std::string text = "provider Changing threw: the text of the exception";
    expect(modify("root/test:Test_Changing.Id=\"throws\"", {}), CMPI_RC_ERR_FAILED, text);
    expect(invoke(A, "Do", {{"Text", Value::string("throws")}}), CMPI_RC_ERR_FAILED, text);
    EXPECT_TRUE(invoke(A, "Do").ok()) << "others go on";
}

TEST_F(Changes, SuccessWithoutAnAnswerIsAFailureWithWhatWasLogged) {
    for (const Status& status :
         {modify("root/test:Test_Changing.Id=\"logs\"", {}), invoke(A, "Do", {{"Text", Value::string("logs")}})}) {
        expect(status, CMPI_RC_ERR_FAILED, "the cause; what came of it");
        EXPECT_THAT(status.reported, ElementsAre("the cause", "what came of it"));
    }
}

TEST_F(Changes, SuccessWithoutAnAnswerAndWithoutALogLineIsAFailureToo) {
    const std::string text = "the provider ended without an answer, and nothing was logged";
    expect(modify("root/test:Test_Changing.Id=\"silent\"", {}), CMPI_RC_ERR_FAILED, text);
    expect(invoke(A, "Do", {{"Text", Value::string("silent")}}), CMPI_RC_ERR_FAILED, text);
    expect(invoke(A, "Do", {{"Text", Value::string("nothing")}}), CMPI_RC_ERR_FAILED, text);
}

TEST_F(Changes, ResultIsOfTheMethodsTypeOrAFailure) {
    ASSERT_TRUE(invoke(A, "Do", {{"Text", Value::string("small")}}).ok());
    EXPECT_EQ(answer.returned, Value::uint(CMPI_uint32, 3)) << "a smaller number fits";
    expect(invoke(A, "Do", {{"Text", Value::string("text")}}), CMPI_RC_ERR_FAILED,
           "provider Changing returned \"zero\" of type string from Do, which is uint32");
    expect(invoke(A, "Do", {{"Text", Value::string("null")}}), CMPI_RC_ERR_FAILED, "provider Changing returned NULL");
}

TEST_F(Changes, ProviderWithoutTheFactoryOfMethodsIsAFailureThatNamesIt) {
    site.provide("libthing_provider.so", "ThingProvider", "Test_InstancesOnly", {"instance", "method"});
    manager = site.start(PROVIDER_DIRECTORY);
    expect(invoke("root/test:Test_InstancesOnly.Id=\"a\"", "Do"), CMPI_RC_ERR_FAILED,
           "ThingProvider_Create_MethodMI");
}

TEST_F(Changes, InterfaceOfMethodsIsEndedWithTheManagerWhenItWasUsed) {
    manager.reset();
    EXPECT_THAT(site.lines(), IsEmpty());
    manager = site.start(PROVIDER_DIRECTORY);
    ASSERT_TRUE(invoke(A, "DoForAll").ok());
    manager.reset();
    EXPECT_EQ(site.lines().back(), "changing: the methods' end");
}

TEST_F(Changes, ComeFromManyThreadsAtOnce) {
    std::vector<std::thread> threads;
    std::atomic<int> wrong = 0;
    for (int i = 0; i < 8; ++i) {
        threads.emplace_back([&] {
            for (int round = 0; round < 20; ++round) {
                wrong += modifyAt(*manager, A, {{"Count", Value::uint(CMPI_uint16, 1)}}).ok() ? 0 : 1;
                wrong += call(*manager, A, "Do", {{"Text", Value::string("x")}}).ok() ? 0 : 1;
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(wrong, 0);
}

} // namespace
} // namespace marlo::test

/** @file Classes that the object manager serves by itself: reading, creation, deletion, methods, queries. */
#include "tests/broker/BuiltIns.h"

namespace marlo::test {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

TEST_F(BuiltIns, AreReadLikeProvidersWithTheirPathsCompleted) {
    fill();
    ASSERT_TRUE(manager->enumerateInstances("root/test", "Test_Node", Names{"Weight"}, taking()).ok());
    EXPECT_THAT(foundPaths(), ElementsAre("root/test:Test_Disk.Id=\"d\"", "root/test:Test_Box.Id=\"one\"",
                                          "root/test:Test_Box.Id=\"two\"", "root/test:Test_Crate.Id=\"c\""));
    EXPECT_EQ(found[2].properties, (std::vector<NamedValue>{{"Weight", Value::uint(CMPI_uint16, 3)}}));
    ASSERT_TRUE(manager->enumerateInstanceNames("/root/test/", "Test_Box", takingPaths()).ok());
    EXPECT_THAT(paths, ElementsAre("root/test:Test_Box.Id=\"one\"", "root/test:Test_Box.Id=\"two\"",
                                   "root/test:Test_Crate.Id=\"c\""));
    ASSERT_TRUE(manager->getInstance(pathOf("root/test:Test_Box.Id=\"two\""), std::nullopt, taking()).ok());
    EXPECT_EQ(found.size(), 1U);
    expect(manager->getInstance(pathOf("root/test:Test_Box.Id=\"c\""), std::nullopt, taking()), CMPI_RC_ERR_NOT_FOUND,
           "there is no instance");
}

TEST_F(BuiltIns, FindAnInstanceByAReferenceHoweverItIsWritten) {
    fill();
    ObjectPath path{"", "root/test", "Test_Holds", {}};
    path.keys = {{"Whole", Value::string("127.0.0.1/root/test:test_box.id=\"one\"")},
                 {"Part", Value::string("localhost/root/test:Test_Disk.Id=\"d\"")}};
    ASSERT_TRUE(manager->getInstance(path, std::nullopt, taking()).ok());
    EXPECT_EQ(found.at(0).properties.at(0).value, reference("root/test:Test_Box.Id=\"one\""));
    EXPECT_EQ(found.at(0).path.toString(), "root/test:Test_Holds.Whole=\"root/test:Test_Box.Id=\\\"one\\\"\","
                                           "Part=\"root/test:Test_Disk.Id=\\\"d\\\"\"");
}

TEST_F(BuiltIns, CreateWithDefaultsAndCheckedValues) {
    const Status status = manager->createInstance(
        {{"", "root/test", "test_box", {}}, {{"ID", Value::string("new")}, {"note", Value::null(CMPI_null)}}},
        created);
    ASSERT_TRUE(status.ok()) << status.message;
    EXPECT_EQ(created.toString(), "root/test:Test_Box.Id=\"new\"");
    EXPECT_EQ(shelf->kept.at(0).properties, (std::vector<NamedValue>{{"Id", Value::string("new")},
                                                                     {"Weight", Value::uint(CMPI_uint16, 7)},
                                                                     {"Note", Value::null(CMPI_string)}}));
}

TEST_F(BuiltIns, CreateTakesKeysOfThePathAndLeavesMissingOnesToTheServant) {
    ASSERT_TRUE(manager->createInstance({pathOf("root/test:Test_Box.Id=\"p\""), {}}, created).ok());
    EXPECT_EQ(created.toString(), "root/test:Test_Box.Id=\"p\"");
    EXPECT_EQ(shelf->kept.at(0).properties.at(0), (NamedValue{"Id", Value::string("p")}));
    ASSERT_TRUE(manager->createInstance({{"", "root/test", "Test_Box", {}}, {}}, created).ok());
    EXPECT_EQ(created.toString(), "root/test:Test_Box.Id=\"made up\"");
}

TEST_F(BuiltIns, CreateRefusesWhatTheSchemaDoesNotHave) {
    const auto create = [this](const std::string& path, std::vector<NamedValue> properties) {
        return manager->createInstance({pathOf(path), std::move(properties)}, created);
    };
    expect(create("root/none:Test_Box", {}), CMPI_RC_ERR_INVALID_NAMESPACE, "root/none");
    expect(create("root/test:Test_None", {}), CMPI_RC_ERR_INVALID_CLASS, "there is no class 'Test_None'");
    expect(create("root/test:Test_Node", {}), CMPI_RC_ERR_INVALID_CLASS, "Test_Node itself, which is abstract");
    expect(create("root/test:Test_Event", {}), CMPI_RC_ERR_INVALID_CLASS, "which is a class of indications");
    expect(create("root/test:Test_Box", {{"Size", Value::string("x")}}), CMPI_RC_ERR_NO_SUCH_PROPERTY,
           "Test_Box has no property 'Size'");
    expect(create("root/test:Test_Box", {{"Id", Value::string("x")}, {"id", Value::string("x")}}),
           CMPI_RC_ERR_INVALID_PARAMETER, "the property id is given twice");
    expect(create("root/test:Test_Box", {{"Weight", Value::string("x")}}), CMPI_RC_ERR_INVALID_PARAMETER,
           "Test_Box.Weight is of type uint16, which \"x\" is not");
    expect(create("root/test:Test_Box.Id=\"a\"", {{"Id", Value::string("b")}}), CMPI_RC_ERR_INVALID_PARAMETER,
           "the key Id is another in the path than among the properties");
    expect(create("root/test:Test_Box.Size=1", {}), CMPI_RC_ERR_INVALID_PARAMETER, "Test_Box has no key 'Size'");
    expect(create("root/test:Test_Unserved", {}), CMPI_RC_ERR_NOT_SUPPORTED, "no provider serves the instances of");
    EXPECT_THAT(shelf->kept, IsEmpty());
}

TEST_F(BuiltIns, FailuresOfTheServantAreAnswered) {
    const auto create = [this](const std::string& id) {
        return manager->createInstance({pathOf("root/test:Test_Box.Id=\"" + id + "\""), {}}, created);
    };
    expect(create("throws"), CMPI_RC_ERR_FAILED, "Test_Box: the text of the exception");
    expect(create("refused"), CMPI_RC_ERR_ALREADY_EXISTS, "there is one already");
    expect(create("astray"), CMPI_RC_ERR_FAILED, "gave back a path that is none of one: Test_Disk.Id=\"astray\"");
    EXPECT_EQ(created, ObjectPath{});
    const Instance changed{pathOf("root/test:Test_Box.Id=\"x\""), {{"Weight", Value::uint(CMPI_uint16, 1)}}};
    expect(manager->modifyInstance(changed, std::nullopt), CMPI_RC_ERR_NOT_SUPPORTED,
           "modification is not supported for Test_Box");
    shelf->failure = {CMPI_RC_ERR_ACCESS_DENIED, "not today", {}};
    expect(manager->enumerateInstances("root/test", "Test_Box", std::nullopt, taking()), CMPI_RC_ERR_ACCESS_DENIED,
           "not today");
}

TEST_F(BuiltIns, WhatASinkThrowsIsThrownOn) {
    fill();
    EXPECT_THROW(manager->enumerateInstances("root/test", "Test_Box", std::nullopt,
                                             [](Instance&&) { throw std::out_of_range("sink"); }),
                 std::out_of_range);
}

TEST_F(BuiltIns, DeleteByACheckedPath) {
    ASSERT_TRUE(manager->deleteInstance(pathOf("//host/root/test:TEST_BOX.id=\"gone\"")).ok());
    EXPECT_THAT(shelf->removed, ElementsAre("root/test:Test_Box.Id=\"gone\""));
    expect(manager->deleteInstance(pathOf("root/test:Test_Box")), CMPI_RC_ERR_INVALID_PARAMETER, "lacks the key Id");
    expect(manager->deleteInstance(pathOf("root/test:Test_Unserved.Id=\"x\"")), CMPI_RC_ERR_NOT_SUPPORTED,
           "no provider serves the instances of");
    EXPECT_EQ(shelf->removed.size(), 1U);
}

TEST_F(BuiltIns, InvokeMethodsAndSpellTheReferencesThatComeBack) {
    MethodAnswer answer;
    const Status status = manager->invokeMethod(pathOf("root/test:Test_Disk.Id=\"d\""), "spin",
                                                {{"rate", Value::sint(CMPI_sint64, 5)}}, answer);
    ASSERT_TRUE(status.ok()) << status.message;
    EXPECT_EQ(answer.returned, Value::uint(CMPI_uint32, 5));
    EXPECT_EQ(answer.out.at(0).value, reference("root/test:Test_Disk.Id=\"Test_Disk\""));
}

TEST_F(BuiltIns, AreRefusedForClassesThatDoNotExistOrAreServedAlready) {
    const auto add = [this](const std::string& className) {
        auto other = std::make_shared<Shelf>();
        other->served = {className};
        manager->add(other);
    };
    EXPECT_THROW(add("Test_None"), std::runtime_error);
    EXPECT_THROW(add("Test_Box"), std::runtime_error);
    site.provide("libthing_provider.so", "ThingProvider", "Test_Thing");
    manager = site.start(PROVIDER_DIRECTORY);
    EXPECT_THROW(add("Test_Thing"), std::runtime_error);
}

TEST_F(BuiltIns, AnswerQueriesInBothLanguages) {
    fill();
    const auto query = [this](const std::string& text, const std::string& language) {
        return manager->execQuery("root/test", text, language, taking());
    };
    ASSERT_TRUE(query("SELECT Note, Weight FROM test_node WHERE Weight >= 3", "WQL").ok());
    EXPECT_THAT(foundPaths(), ElementsAre("root/test:Test_Box.Id=\"two\"", "root/test:Test_Crate.Id=\"c\""));
    EXPECT_EQ(found[0].properties, (std::vector<NamedValue>{{"Weight", Value::uint(CMPI_uint16, 3)}}));
    ASSERT_TRUE(query("SELECT * FROM Test_Box b WHERE b.Colour = 'red'", "dmtf:cql").ok());
    EXPECT_THAT(foundPaths(), ElementsAre("root/test:Test_Box.Id=\"one\""));
    EXPECT_EQ(found[0].properties.size(), 2U);
    ASSERT_TRUE(query("SELECT * FROM Test_Node WHERE __this ISA Test_Crate", "WQL").ok());
    EXPECT_THAT(foundPaths(), ElementsAre("root/test:Test_Crate.Id=\"c\""));
}

TEST_F(BuiltIns, RefuseQueriesThatAreNone) {
    const auto query = [this](const std::string& text, const std::string& language = "WQL") {
        return manager->execQuery("root/test", text, language, taking());
    };
    expect(query("SELECT * FROM Test_Box", "SQL"), CMPI_RC_ERR_QUERY_LANGUAGE_NOT_SUPPORTED, "'SQL'");
    expect(query("SELECT FROM Test_Box"), CMPI_RC_ERR_INVALID_QUERY, "the query is refused: ");
    expect(query("SELECT Size FROM Test_Box"), CMPI_RC_ERR_INVALID_QUERY, "Size");
    expect(query("SELECT * FROM Test_Unserved"), CMPI_RC_ERR_NOT_SUPPORTED, "Test_Unserved");
    expect(manager->execQuery("root/none", "SELECT * FROM Test_Box", "WQL", taking()), CMPI_RC_ERR_INVALID_NAMESPACE,
           "root/none");
}

TEST_F(BuiltIns, InteropGoesByItsShortNameToo) {
    EXPECT_EQ(manager->spell("interop"), "root/interop");
    EXPECT_EQ(manager->spell("/InterOp/"), "root/interop");
    EXPECT_EQ(manager->spell("ROOT/Test//"), "root/test");
    EXPECT_EQ(manager->spell("none/"), "none");
    expect(manager->enumerateInstances("interop", "Test_Far", std::nullopt, taking()), CMPI_RC_ERR_NOT_SUPPORTED,
           "in root/interop");
}

} // namespace
} // namespace marlo::test

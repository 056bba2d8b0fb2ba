/** @file Classes that the object manager serves by itself, and the operations that go to them: creation, deletion,
 * queries, associations. */
#include "host/cimom/BuiltIn.h"
#include "host/cimom/ClassChecks.h"
#include "tests/support/ProviderSite.h"

#include <algorithm>
#include <atomic>
#include <stdexcept>
#include <thread>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace marlo::test {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::UnorderedElementsAre;
using Names = std::vector<std::string>;

constexpr const char* classes = R"(
Qualifier Abstract : boolean = false, Scope(class, association, indication), Flavor(Restricted);
Qualifier Association : boolean = false, Scope(association), Flavor(DisableOverride);
Qualifier Indication : boolean = false, Scope(class, indication), Flavor(DisableOverride);
Qualifier In : boolean = true, Scope(parameter), Flavor(DisableOverride);
Qualifier Out : boolean = false, Scope(parameter), Flavor(DisableOverride);
Qualifier Override : string = null, Scope(property, method, reference), Flavor(Restricted);
Qualifier Write : boolean = false, Scope(property, reference);
#pragma namespace ("root/interop")
class Test_Far { [Key] string Id; };
#pragma namespace ("root/test")
[Abstract] class Test_Node { [Key] string Id; [Write] uint16 Weight = 7; string Note; [Write] datetime When; };
class Test_Disk : Test_Node { uint32 Spin([In] uint16 Rate, [In(false), Out] Test_Node REF Twin); };
class Test_Box : Test_Node { string Colour; };
class Test_Crate : Test_Box {};
[Indication] class Test_Event { string Text; };
[Association, Abstract] class Test_Link { [Key] Test_Node REF Whole; [Key] Test_Node REF Part; };
[Association] class Test_Holds : Test_Link { uint16 Slot; };
[Association] class Test_Mirrors : Test_Link { [Override("Whole")] Test_Disk REF Whole; };
[Association] class Test_Unserved2 { [Key] Test_Node REF Left; [Key] Test_Node REF Right; };
)";

ObjectPath pathOf(const std::string& text) {
    return ObjectPath::parse(text);
}

Value reference(const std::string& text) {
    return {CMPI_ref, std::make_shared<const ObjectPath>(pathOf(text))};
}

/** Keeps instances in memory; what the key Id says may make it fail. */
class Shelf final : public BuiltIn {
  public:
    [[nodiscard]] std::string nameSpace() const override { return "root/test"; }

    [[nodiscard]] std::vector<std::string> classes() const override { return served; }

    Status enumerate(const Class& definition, const ObjectManager::InstanceSink& sink) override {
        if (failure.code != CMPI_RC_OK) {
            return failure;
        }
        for (const Instance& each : kept) {
            if (each.path.className == definition.name) {
                sink(Instance(each));
            }
        }
        return {};
    }

    Status create(const Class& definition, const Instance& instance, ObjectPath& created) override {
        const NamedValue* id = findName(instance.properties, "Id");
        if (id == nullptr) {
            created = pathOf("Test_Box.Id=\"made up\"");
            created.className = definition.name;
            return {};
        }
        if (id->value == Value::string("throws")) {
            throw std::runtime_error("the text of the exception");
        }
        if (id->value == Value::string("refused")) {
            throw RequestError(CMPI_RC_ERR_ALREADY_EXISTS, "there is one already");
        }
        if (id->value == Value::string("astray")) {
            created = pathOf("Test_Disk.Id=\"astray\"");
        }
        kept.push_back({{"", "", definition.name, {}}, instance.properties});
        return {};
    }

    Status remove(const Class& /*definition*/, const ObjectPath& path) override {
        removed.push_back(path.toString());
        return {};
    }

    Status invoke(const Class& /*definition*/, const ObjectPath& path, const Method& /*method*/,
                  const std::vector<NamedValue>& arguments, MethodAnswer& answer) override {
        answer.returned = Value::uint(CMPI_uint32, std::get<std::uint64_t>(arguments.at(0).value.data));
        answer.out = {{"Twin", reference("//host/root/test:Test_Disk.Id=\"" + path.className + "\"")}};
        return {};
    }

    void put(const std::string& className, std::vector<NamedValue> properties) {
        kept.push_back({{"", "", className, {}}, std::move(properties)});
    }

    std::vector<std::string> served{"Test_Disk", "Test_Box", "Test_Crate", "Test_Holds", "Test_Mirrors"};
    std::vector<Instance> kept;
    std::vector<std::string> removed;
    Status failure;
};

class BuiltIns : public testing::Test {
  protected:
    BuiltIns() {
        site.write("schema/zz-nodes.mof", classes);
        manager = site.start(PROVIDER_DIRECTORY);
        manager->add(shelf);
    }

    /** Two boxes, a crate, and a disk which both the first box and the crate hold, and which mirrors itself. */
    void fill() {
        shelf->put("Test_Box", {{"Id", Value::string("one")}, {"Colour", Value::string("red")}});
        shelf->put("Test_Box", {{"Id", Value::string("two")}, {"Weight", Value::uint(CMPI_uint16, 3)}});
        shelf->put("Test_Crate", {{"Id", Value::string("c")}, {"Weight", Value::uint(CMPI_uint16, 9)}});
        shelf->put("Test_Disk", {{"Id", Value::string("d")}, {"Note", Value::string("turns")}});
        hold("Test_Box.Id=\"one\"", "//elsewhere/root/test:test_disk.ID=\"d\"");
        hold("root/TEST:Test_Crate.Id=\"c\"", "Test_Disk.Id=\"d\"");
        hold("Test_Box.Id=\"one\"", "Test_Disk.Id=\"lost\"");
        hold("Test_Box.Id=\"two\"", "root/interop:Test_Far.Id=\"f\"");
        shelf->put("Test_Mirrors",
                   {{"Whole", reference("Test_Disk.Id=\"d\"")}, {"Part", reference("Test_Disk.Id=\"d\"")}});
    }

    void hold(const std::string& whole, const std::string& part) const {
        shelf->put("Test_Holds", {{"Whole", reference(whole)}, {"Part", reference(part)}});
    }

    ObjectManager::InstanceSink taking() {
        found.clear();
        return [this](Instance&& instance) { found.push_back(std::move(instance)); };
    }

    ObjectManager::PathSink takingPaths() {
        paths.clear();
        return [this](ObjectPath&& path) { paths.push_back(path.toString()); };
    }

    [[nodiscard]] Names foundPaths() const {
        Names texts;
        for (const Instance& each : found) {
            texts.push_back(each.path.toString());
        }
        return texts;
    }

    static void expect(const Status& status, CMPIrc code, const std::string& message) {
        EXPECT_EQ(status.code, code) << status.message;
        EXPECT_THAT(status.message, HasSubstr(message));
    }

    ProviderSite site;
    std::shared_ptr<Shelf> shelf = std::make_shared<Shelf>();
    std::unique_ptr<ObjectManager> manager;
    std::vector<Instance> found;
    Names paths;
    ObjectPath created;
};

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

const std::string disk = "root/test:Test_Disk.Id=\"d\"";

TEST_F(BuiltIns, AssociatorNamesAreAtTheOtherEndsEachOnce) {
    fill();
    ASSERT_TRUE(manager->associatorNames(pathOf("root/test:Test_Box.Id=\"one\""), {}, takingPaths()).ok());
    EXPECT_THAT(paths, UnorderedElementsAre(disk, "root/test:Test_Disk.Id=\"lost\""));
    ASSERT_TRUE(manager->associatorNames(pathOf(disk), {}, takingPaths()).ok());
    EXPECT_THAT(paths, UnorderedElementsAre("root/test:Test_Box.Id=\"one\"", "root/test:Test_Crate.Id=\"c\"", disk));
}

TEST_F(BuiltIns, AssociationFiltersHoldTogether) {
    fill();
    const auto names = [this](const AssociationFilter& filter) {
        const Status status = manager->associatorNames(pathOf(disk), filter, takingPaths());
        EXPECT_TRUE(status.ok()) << status.message;
        std::sort(paths.begin(), paths.end());
        return paths;
    };
    const std::string one = "root/test:Test_Box.Id=\"one\"";
    const std::string crate = "root/test:Test_Crate.Id=\"c\"";
    EXPECT_EQ(names({"test_holds", "", "", ""}), (Names{one, crate}));
    EXPECT_EQ(names({"Test_Mirrors", "", "", ""}), (Names{disk}));
    EXPECT_EQ(names({"Test_Link", "Test_Crate", "", ""}), (Names{crate}));
    EXPECT_EQ(names({"", "Test_Box", "", ""}), (Names{one, crate}));
    EXPECT_EQ(names({"", "Test_Disk", "part", ""}), (Names{disk}));
    EXPECT_EQ(names({"Test_Holds", "", "Whole", ""}), Names{});
    EXPECT_EQ(names({"Test_Holds", "", "Part", "WHOLE"}), (Names{one, crate}));
    EXPECT_EQ(names({"Test_Holds", "", "", "Part"}), Names{});
    EXPECT_EQ(names({"Test_Unserved2", "", "", ""}), Names{});
}

TEST_F(BuiltIns, AssociatorsAreTheInstancesThatExist) {
    fill();
    const Status status =
        manager->associators(pathOf("root/test:Test_Box.Id=\"one\""), {}, Names{"note", "Colour"}, taking());
    ASSERT_TRUE(status.ok()) << status.message;
    EXPECT_THAT(foundPaths(), ElementsAre(disk));
    EXPECT_EQ(found[0].properties, (std::vector<NamedValue>{{"Note", Value::string("turns")}}));
}

TEST_F(BuiltIns, AssociatorsThatCannotBeHadAreLeftOutAndLoggedOnce) {
    fill();
    for (int i = 0; i < 2; ++i) {
        ASSERT_TRUE(manager->associators(pathOf("root/test:Test_Box.Id=\"two\""), {}, std::nullopt, taking()).ok());
        EXPECT_THAT(foundPaths(), IsEmpty());
    }
    EXPECT_THAT(site.lines(), ElementsAre(HasSubstr("root/interop:Test_Far.Id=\"f\": no provider serves")));
}

TEST_F(BuiltIns, ReferencesAreTheAssociationsThemselves) {
    fill();
    ASSERT_TRUE(manager->references(pathOf(disk), {"", "", "Part", ""}, Names{"Whole"}, taking()).ok());
    ASSERT_EQ(found.size(), 3U);
    EXPECT_EQ(found[0].properties, (std::vector<NamedValue>{{"Whole", reference("root/test:Test_Box.Id=\"one\"")}}));
    ASSERT_TRUE(manager->referenceNames(pathOf(disk), {"Test_Mirrors", "", "", ""}, takingPaths()).ok());
    EXPECT_THAT(paths, ElementsAre("root/test:Test_Mirrors.Whole=\"root/test:Test_Disk.Id=\\\"d\\\"\","
                                   "Part=\"root/test:Test_Disk.Id=\\\"d\\\"\""));
}

TEST_F(BuiltIns, AssociationsNeedNoInstanceAtTheStart) {
    fill();
    ASSERT_TRUE(manager->referenceNames(pathOf("root/test:Test_Disk.Id=\"lost\""), {}, takingPaths()).ok());
    EXPECT_EQ(paths.size(), 1U);
    ASSERT_TRUE(
        manager->associators(pathOf("root/test:Test_Thing.Id=\"x\",Number=1"), {}, std::nullopt, taking()).ok());
    EXPECT_THAT(found, IsEmpty());
}

TEST_F(BuiltIns, AssociationsRefuseWhatTheSchemaDoesNotHave) {
    const auto names = [this](const std::string& path, const AssociationFilter& filter) {
        return manager->associatorNames(pathOf(path), filter, takingPaths());
    };
    expect(names("root/test:Test_None.Id=\"x\"", {}), CMPI_RC_ERR_INVALID_CLASS, "Test_None");
    expect(names("root/test:Test_Disk", {}), CMPI_RC_ERR_INVALID_PARAMETER, "lacks the key Id");
    expect(names(disk, {"Test_None", "", "", ""}), CMPI_RC_ERR_INVALID_PARAMETER, "there is no class 'Test_None'");
    expect(names(disk, {"Test_Box", "", "", ""}), CMPI_RC_ERR_INVALID_PARAMETER, "not a class of associations");
    expect(names(disk, {"", "Test_None", "", ""}), CMPI_RC_ERR_INVALID_PARAMETER, "there is no class 'Test_None'");
    expect(names(disk, {"", "", "Slot", ""}), CMPI_RC_ERR_INVALID_PARAMETER, "no association has a reference 'Slot'");
    expect(names(disk, {"Test_Holds", "", "", "Left"}), CMPI_RC_ERR_INVALID_PARAMETER, "a reference 'Left'");
}

TEST_F(BuiltIns, FailureOfAnAssociationsServantIsAnswered) {
    fill();
    shelf->failure = {CMPI_RC_ERR_ACCESS_DENIED, "not today", {}};
    expect(manager->referenceNames(pathOf(disk), {}, takingPaths()), CMPI_RC_ERR_ACCESS_DENIED, "not today");
    shelf->failure = {CMPI_RC_ERR_NOT_SUPPORTED, "never", {}};
    EXPECT_TRUE(manager->referenceNames(pathOf(disk), {}, takingPaths()).ok());
}

TEST_F(BuiltIns, InteropGoesByItsShortNameToo) {
    EXPECT_EQ(manager->spell("interop"), "root/interop");
    EXPECT_EQ(manager->spell("/InterOp/"), "root/interop");
    EXPECT_EQ(manager->spell("ROOT/Test//"), "root/test");
    EXPECT_EQ(manager->spell("none/"), "none");
    expect(manager->enumerateInstances("interop", "Test_Far", std::nullopt, taking()), CMPI_RC_ERR_NOT_SUPPORTED,
           "in root/interop");
}

TEST_F(BuiltIns, ServeManyThreads) {
    fill();
    std::vector<std::thread> threads;
    std::atomic<int> wrong{0};
    for (int i = 0; i < 4; ++i) {
        threads.emplace_back([&] {
            for (int round = 0; round < 20; ++round) {
                int count = 0;
                const auto counting = [&count](ObjectPath&&) { ++count; };
                const bool ok = manager->associatorNames(pathOf(disk), {}, counting).ok() &&
                                manager->enumerateInstanceNames("root/test", "Test_Node", counting).ok();
                wrong += ok && count == 7 ? 0 : 1;
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

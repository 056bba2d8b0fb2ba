/**
 * @file
 * Classes that the object manager serves by itself, over a shelf of nodes and links between them.
 */
#pragma once

#include "host/cimom/BuiltIn.h"
#include "host/cimom/ClassChecks.h"
#include "tests/support/ProviderSite.h"

#include <memory>
#include <stdexcept>
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace marlo::test {

using Names = std::vector<std::string>;

inline constexpr const char* nodeClasses = R"(
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

inline ObjectPath pathOf(const std::string& text) {
    return ObjectPath::parse(text);
}

inline Value reference(const std::string& text) {
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
        site.write("schema/zz-nodes.mof", nodeClasses);
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
        EXPECT_THAT(status.message, testing::HasSubstr(message));
    }

    ProviderSite site;
    std::shared_ptr<Shelf> shelf = std::make_shared<Shelf>();
    std::unique_ptr<ObjectManager> manager;
    std::vector<Instance> found;
    Names paths;
    ObjectPath created;
};

} // namespace marlo::test

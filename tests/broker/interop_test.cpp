/** @file What the interop namespace says of the object manager, over the shipped schema. */
#include "host/cimom/BuiltIn.h"
#include "tests/support/ProviderSite.h"

#include <algorithm>
#include <filesystem>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace marlo::test {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::UnorderedElementsAre;

std::string textOf(const Instance& instance, const char* name) {
    const NamedValue* found = findName(instance.properties, name);
    return found == nullptr ? "absent" : toText(found->value);
}

/** One CIM_IndicationService. */
class Service final : public BuiltIn {
  public:
    [[nodiscard]] std::string nameSpace() const override { return "root/interop"; }

    [[nodiscard]] std::vector<std::string> classes() const override { return {"CIM_IndicationService"}; }

    Status enumerate(const Class& /*definition*/, const ObjectManager::InstanceSink& sink) override {
        Instance service;
        for (const char* key : {"SystemCreationClassName", "SystemName", "CreationClassName", "Name"}) {
            service.properties.push_back({key, Value::string("x")});
        }
        sink(std::move(service));
        return {};
    }
};

class Interop : public testing::Test {
  protected:
    Interop() {
        std::filesystem::remove(site.directory() / "schema/test.mof");
        for (const char* file : {"00-qualifiers.mof", "10-core.mof", "40-interop.mof"}) {
            std::filesystem::copy(std::filesystem::path(MARLO_SHIPPED_SCHEMA) / file, site.directory() / "schema");
        }
        site.write("schema/50-site.mof",
                   "#pragma namespace (\"root/site\")\n"
                   "[Description(\"of the site\")] class Site_Profile : CIM_ManagedElement {};");
    }

    ObjectManager& manager() {
        if (!_manager) {
            _manager = site.start(PROVIDER_DIRECTORY);
        }
        return *_manager;
    }

    std::vector<Instance> enumerate(const std::string& className, const std::string& nameSpace = "root/interop") {
        std::vector<Instance> found;
        const Status status =
            manager().enumerateInstances(nameSpace, className, std::nullopt,
                                         [&found](Instance&& instance) { found.push_back(std::move(instance)); });
        EXPECT_TRUE(status.ok()) << status.message;
        return found;
    }

    std::vector<std::string> texts(const std::string& className, const char* property) {
        std::vector<std::string> texts;
        for (const Instance& instance : enumerate(className)) {
            texts.push_back(textOf(instance, property));
        }
        return texts;
    }

    ProviderSite site;

  private:
    std::unique_ptr<ObjectManager> _manager;
};

TEST_F(Interop, HasOneNamespaceForEachOfTheSchemaItselfIncluded) {
    EXPECT_THAT(texts("CIM_Namespace", "Name"), ElementsAre("\"root/interop\"", "\"root/site\""));
    for (const Instance& each : enumerate("CIM_Namespace", "interop")) {
        EXPECT_EQ(each.path.nameSpace, "root/interop");
        EXPECT_EQ(each.path.keys.size(), 6U);
        EXPECT_EQ(textOf(each, "ClassInfo"), "1");
        EXPECT_THAT(textOf(each, "DescriptionOfClassInfo"), HasSubstr("CIM 2"));
        EXPECT_TRUE(manager().getInstance(each.path, std::nullopt, [](Instance&&) {}).ok());
    }
}

TEST_F(Interop, HasOneObjectManagerThatTellsItsVersion) {
    const auto managers = enumerate("CIM_ObjectManager");
    ASSERT_EQ(managers.size(), 1U);
    EXPECT_EQ(textOf(managers[0], "ElementName"), "\"marlo\"");
    EXPECT_THAT(textOf(managers[0], "Description"), HasSubstr("version " MARLO_VERSION));
    EXPECT_EQ(textOf(managers[0], "GatherStatisticalData"), "FALSE");
    EXPECT_NE(textOf(managers[0], "SystemName"), "\"\"");
    EXPECT_EQ(managers[0].path.keys.size(), 4U);
}

TEST_F(Interop, ManagerIsAssociatedWithItsNamespaces) {
    std::vector<std::string> found;
    const auto managers = enumerate("CIM_ObjectManager");
    const Status status = manager().associators(
        managers.at(0).path, {"CIM_NamespaceInManager", "CIM_Namespace", "Antecedent", "Dependent"},
        std::vector<std::string>{"Name"},
        [&found](Instance&& instance) { found.push_back(textOf(instance, "Name")); });
    ASSERT_TRUE(status.ok()) << status.message;
    EXPECT_THAT(found, UnorderedElementsAre("\"root/interop\"", "\"root/site\""));
}

TEST_F(Interop, RegistersTheProfilesThatAreThere) {
    EXPECT_THAT(texts("CIM_RegisteredProfile", "RegisteredName"), ElementsAre("\"Profile Registration\""));
    EXPECT_EQ(enumerate("CIM_ElementConformsToProfile").size(), 1U);
    manager().add(std::make_shared<Service>());
    EXPECT_THAT(texts("CIM_RegisteredProfile", "RegisteredName"),
                ElementsAre("\"Profile Registration\"", "\"Indications\""));
    EXPECT_THAT(texts("CIM_RegisteredProfile", "RegisteredVersion"), ElementsAre("\"1.0.0\"", "\"1.2.2\""));
    EXPECT_THAT(texts("CIM_RegisteredProfile", "AdvertiseTypes"), ElementsAre("{2}", "{2}"));
    EXPECT_THAT(texts("CIM_ElementConformsToProfile", "ManagedElement"),
                ElementsAre(HasSubstr("DSP1033"), HasSubstr("DSP1054"), HasSubstr("CIM_IndicationService")));
}

TEST_F(Interop, LeavesAClassThatAProviderServesToIt) {
    site.write("providers/odd.toml", "library = \"libodd_providers.so\"\n[[provider]]\nname = \"Silent\"\n"
                                     "kinds = [\"instance\"]\nnamespaces = [\"root/interop\"]\n"
                                     "classes = [\"CIM_RegisteredProfile\"]\n");
    EXPECT_TRUE(enumerate("CIM_RegisteredProfile").empty());
    EXPECT_EQ(enumerate("CIM_ObjectManager").size(), 1U);
}

TEST_F(Interop, CannotBeChanged) {
    const auto managers = enumerate("CIM_ObjectManager");
    EXPECT_EQ(manager().deleteInstance(managers.at(0).path).code, CMPI_RC_ERR_NOT_SUPPORTED);
    ObjectPath created;
    EXPECT_EQ(manager().createInstance({{"", "interop", "CIM_Namespace", {}}, {}}, created).code,
              CMPI_RC_ERR_NOT_SUPPORTED);
}

} // namespace
} // namespace marlo::test

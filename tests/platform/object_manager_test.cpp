/**
 * @file
 * The platform's classes as clients of the object manager see them: shipped schema, shipped registration.
 */
#include "host/cimom/ObjectManager.h"
#include "tests/platform/PlatformProvider.h"

#include <algorithm>

namespace marlo::test {
namespace {

constexpr const char* nameSpace = "root/quarn";

class PlatformBySuperclass : public testing::Test {
  protected:
    static ObjectManagerOptions options() {
        ObjectManagerOptions options;
        options.schemaDirectories = {MARLO_SHARE_DIR "/schema"};
        options.providerDirectories = {MARLO_SHARE_DIR "/providers"};
        options.libraryDirectory = MARLO_LIBRARY_DIR;
        return options;
    }

    std::vector<Instance> instances(const std::string& className, const PropertyList& properties = std::nullopt) {
        std::vector<Instance> result;
        status = manager.enumerateInstances(nameSpace, className, properties,
                                            [&](Instance&& instance) { result.push_back(std::move(instance)); });
        return result;
    }

    std::vector<Instance> get(const ObjectPath& path, const PropertyList& properties = std::nullopt) {
        std::vector<Instance> result;
        status = manager.getInstance(path, properties,
                                     [&](Instance&& instance) { result.push_back(std::move(instance)); });
        return result;
    }

    DescribedHost host{"[[card]]\nname = \"eth0\"\npackage_type = 9\n[[card]]\nname = \"eth1\"\n"
                       "[[port]]\nidentity = \"eth0\"\ncard = \"eth0\"\nspeed = 1000000000\nfull_duplex = true\n"
                       "[[port]]\nidentity = \"eth1\"\ncard = \"eth1\"\n"};
    ObjectManager manager{options()};
    Status status;
};

class PlatformThroughObjectManager : public PlatformBySuperclass, public testing::WithParamInterface<const char*> {};

INSTANTIATE_TEST_SUITE_P(Classes, PlatformThroughObjectManager,
                         testing::Values("TAVIS_NetworkCard", "TAVIS_NetworkPort"),
                         [](const auto& tested) { return std::string(tested.param); });

TEST_P(PlatformThroughObjectManager, PropertiesAreThoseOfTheClassWithItsTypes) {
    const Class* definition = manager.schema().findClass(nameSpace, GetParam());
    ASSERT_NE(definition, nullptr);
    const auto all = instances(GetParam());
    ASSERT_TRUE(status.ok()) << status.message;
    ASSERT_EQ(all.size(), 2U);
    for (const auto& instance : all) {
        for (const auto& property : instance.properties) {
            const Property* declared = definition->findProperty(property.name);
            ASSERT_NE(declared, nullptr) << property.name;
            EXPECT_EQ(declared->type, property.value.type) << property.name;
            EXPECT_FALSE(declared->key && property.value.isNull()) << property.name;
        }
    }
}

TEST_P(PlatformThroughObjectManager, NamesAreThePathsOfTheInstancesWithAllKeysOfTheClass) {
    std::vector<ObjectPath> names;
    status = manager.enumerateInstanceNames(nameSpace, GetParam(),
                                            [&](ObjectPath&& path) { names.push_back(std::move(path)); });
    ASSERT_TRUE(status.ok()) << status.message;
    const auto all = instances(GetParam());
    ASSERT_EQ(names.size(), all.size());
    for (std::size_t i = 0; i < names.size(); ++i) {
        EXPECT_EQ(names[i], all[i].path);
        EXPECT_EQ(names[i].keys.size(), manager.schema().findClass(nameSpace, GetParam())->keys().size());
    }
}

TEST_P(PlatformThroughObjectManager, APropertyListIsHonoured) {
    for (const auto& instance : instances(GetParam(), std::vector<std::string>{"Description", "name"})) {
        std::vector<std::string> names;
        for (const auto& property : instance.properties) {
            names.push_back(property.name);
        }
        std::sort(names.begin(), names.end());
        EXPECT_EQ(names, (std::vector<std::string>{"Description", "Name"}));
        EXPECT_FALSE(instance.path.keys.empty());
    }
}

TEST_P(PlatformThroughObjectManager, AnInstanceIsFoundByItsPathAndNoOtherIs) {
    const auto all = instances(GetParam());
    for (const auto& instance : all) {
        EXPECT_EQ(get(instance.path), std::vector{instance});
        EXPECT_TRUE(status.ok()) << status.message;
    }
    ObjectPath unknown = all.at(0).path;
    unknown.keys.at(1).value = Value::string("nothing");
    EXPECT_TRUE(get(unknown).empty());
    EXPECT_EQ(status.code, CMPI_RC_ERR_NOT_FOUND);
}

TEST_P(PlatformThroughObjectManager, AWrongDescriptionIsTheStatusOfTheRequest) {
    const DescribedHost wrong("[[adapter]]\nstatus = \"up\"\n");
    EXPECT_TRUE(instances(GetParam()).empty());
    EXPECT_EQ(status.code, CMPI_RC_ERR_FAILED);
    EXPECT_NE(status.message.find(wrong.file() + ":2: adapter.status"), std::string::npos) << status.message;
}

TEST_F(PlatformBySuperclass, InstancesAreAmongThoseOfTheirSuperclasses) {
    EXPECT_EQ(instances("CIM_NetworkPort"), instances("TAVIS_NetworkPort"));
    EXPECT_EQ(instances("CIM_PhysicalPackage"), instances("TAVIS_NetworkCard"));
    EXPECT_EQ(instances("TAVIS_NetworkCard").size(), 2U);
}

} // namespace
} // namespace marlo::test

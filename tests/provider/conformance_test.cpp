/** What a management client may rely on for every class alike. */
#include "tests/provider/Scene.h"

#include <algorithm>
#include <set>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace provider_test;
using marlo::Instance;
using marlo::NamedValue;
using marlo::ObjectPath;
using marlo::Value;
using testing::IsEmpty;
using testing::SizeIs;

class Conformance : public testing::TestWithParam<Subject> {
  protected:
    Conformance() {
        scripted_agent::reset();
        addAdapters(setup);
    }

    static std::vector<std::string> keyNames(const ObjectPath& path) {
        std::vector<std::string> found;
        for (const NamedValue& key : path.keys) {
            found.push_back(key.name);
        }
        return found;
    }

    /** The path as an object manager would complete it: the names' paths have the keys already. */
    std::vector<ObjectPath> paths() { return calls.enumInstanceNames(GetParam()).paths; }

    BrokerSetup setup;
    ProviderCalls calls{setup};
};

TEST_P(Conformance, NamesHaveAllKeysAndNoOthers) {
    ASSERT_THAT(paths(), SizeIs(3));
    for (const ObjectPath& path : paths()) {
        EXPECT_THAT(keyNames(path), testing::UnorderedElementsAreArray(GetParam().keys));
        for (const NamedValue& key : path.keys) {
            EXPECT_FALSE(key.value.isNull()) << key.name;
            EXPECT_EQ(key.value.type, CMPI_string) << key.name;
        }
    }
}

TEST_P(Conformance, KeysAreTheInstancesPropertiesOfThoseNames) {
    const std::vector<ObjectPath> names = paths();
    const std::vector<Instance> instances = calls.enumInstances(GetParam()).instances;
    ASSERT_EQ(names.size(), instances.size());
    for (std::size_t i = 0; i < names.size(); ++i) {
        for (const NamedValue& key : names[i].keys) {
            EXPECT_EQ(get(instances[i], key.name), key.value);
        }
        EXPECT_EQ(names[i].className, instances[i].path.className);
        EXPECT_EQ(names[i].nameSpace, instances[i].path.nameSpace);
        EXPECT_EQ(names[i].host, instances[i].path.host);
    }
}

TEST_P(Conformance, NamesAreDistinct) {
    std::set<std::string> distinct;
    for (const ObjectPath& path : paths()) {
        EXPECT_TRUE(distinct.insert(path.toString()).second) << path.toString();
    }
}

TEST_P(Conformance, EveryNameGetsTheInstanceThatTheEnumerationHas) {
    const std::vector<Instance> instances = calls.enumInstances(GetParam()).instances;
    const std::vector<ObjectPath> names = paths();
    for (std::size_t i = 0; i < names.size(); ++i) {
        const Answer answer = calls.getInstance(GetParam(), names[i]);
        EXPECT_EQ(answer.code, CMPI_RC_OK);
        ASSERT_THAT(answer.instances, SizeIs(1));
        EXPECT_EQ(answer.instances[0], instances.at(i));
    }
}

TEST_P(Conformance, OrderOfKeysAndCaseOfTheirNamesDoNotMatter) {
    for (ObjectPath path : paths()) {
        std::reverse(path.keys.begin(), path.keys.end());
        for (NamedValue& key : path.keys) {
            std::transform(key.name.begin(), key.name.end(), key.name.begin(),
                           [](char c) { return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c; });
        }
        EXPECT_THAT(calls.getInstance(GetParam(), path).instances, SizeIs(1));
    }
}

TEST_P(Conformance, EveryWrongKeyValueIsNotFound) {
    const ObjectPath good = paths().at(0);
    for (std::size_t i = 0; i < good.keys.size(); ++i) {
        ObjectPath bad = good;
        bad.keys[i].value = Value::string("no such value");
        const Answer answer = calls.getInstance(GetParam(), bad);
        EXPECT_EQ(answer.code, CMPI_RC_OK);
        EXPECT_THAT(answer.instances, IsEmpty()) << good.keys[i].name;
        EXPECT_TRUE(answer.done);
    }
}

TEST_P(Conformance, MissingAdditionalAndUnknownKeysAreNotFound) {
    const ObjectPath good = paths().at(0);
    ObjectPath more = good;
    more.keys.push_back({"Unknown", Value::string("x")});
    EXPECT_THAT(calls.getInstance(GetParam(), more).instances, IsEmpty());
    ObjectPath other = good;
    other.keys[0].name = "Unknown";
    EXPECT_THAT(calls.getInstance(GetParam(), other).instances, IsEmpty());
    if (good.keys.size() > 1) {
        ObjectPath less = good;
        less.keys.pop_back();
        EXPECT_THAT(calls.getInstance(GetParam(), less).instances, IsEmpty());
    }
}

TEST_P(Conformance, KeyOfAnotherTypeIsNotFound) {
    ObjectPath path = paths().at(0);
    path.keys[0].value = Value::uint(CMPI_uint64, 1);
    const Answer answer = calls.getInstance(GetParam(), path);
    EXPECT_EQ(answer.code, CMPI_RC_OK);
    EXPECT_THAT(answer.instances, IsEmpty());
}

TEST_P(Conformance, PropertyListWithTheKeysStillFindsTheInstance) {
    std::vector<const char*> list;
    for (const std::string& key : GetParam().keys) {
        list.push_back(key.c_str());
    }
    const Answer answer = calls.getInstance(GetParam(), paths().at(1), PropertyList(list));
    ASSERT_THAT(answer.instances, SizeIs(1));
    for (const std::string& key : GetParam().keys) {
        EXPECT_FALSE(get(answer.instances[0], key).isNull()) << key;
    }
    if (GetParam().className == CONFIGURATION) {
        EXPECT_THAT(answer.instances[0].properties, SizeIs(1));
    }
}

TEST_P(Conformance, InstancesHaveNoPropertyTwice) {
    for (const Instance& instance : calls.enumInstances(GetParam()).instances) {
        std::set<std::string> distinct;
        for (const std::string& name : names(instance)) {
            EXPECT_TRUE(distinct.insert(name).second) << name;
        }
    }
}

TEST_P(Conformance, EmptyHostIsServed) {
    scripted_agent::script().nodes.clear();
    setup.platform.cards.clear();
    setup.platform.ports.clear();
    const Answer instances = calls.enumInstances(GetParam());
    EXPECT_EQ(instances.code, CMPI_RC_OK);
    EXPECT_TRUE(instances.done);
    EXPECT_THAT(instances.instances, IsEmpty());
    EXPECT_THAT(paths(), IsEmpty());
    EXPECT_EQ(calls.getInstance(GetParam(), pathOf(GetParam(), "eth0")).code, CMPI_RC_OK);
}

INSTANTIATE_TEST_SUITE_P(EveryClass, Conformance, testing::ValuesIn(allProviders()),
                         [](const auto& instance) { return instance.param.prefix; });

} // namespace

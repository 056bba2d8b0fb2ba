// The utilities that take CMPI objects, with the objects of a real broker.
#include "host/broker/Broker.h"
#include "instrumentation/Utilities.h"
#include "tests/support/StaticSchema.h"

#include <cmpimacs.h>
#include <gtest/gtest.h>

namespace {

using marlo::Instance;
using marlo::NamedValue;
using marlo::ObjectPath;
using marlo::Value;

struct CmpiTest : testing::Test {
    const CMPIObjectPath* pathOf(const ObjectPath& path) { return broker.newObjectPath(path); }

    /** `Thing` in root/test with these keys. */
    const CMPIObjectPath* thing(std::vector<NamedValue> keys, const std::string& host = "") {
        return pathOf({host, "root/test", "Thing", std::move(keys)});
    }

    const marlo::test::StaticSchema schema{};
    const marlo::broker::Broker broker{schema};
    const marlo::broker::CallScope scope{};
};

NamedValue text(const std::string& name, const std::string& value) {
    return {name, Value::string(value)};
}

NamedValue number(const std::string& name, std::uint64_t value, CMPIType type = CMPI_uint16) {
    return {name, Value::uint(type, value)};
}

struct ObjectPathsEqual : CmpiTest {
    bool equal(std::vector<NamedValue> left, std::vector<NamedValue> right) {
        const CMPIObjectPath* one = thing(std::move(left));
        const CMPIObjectPath* other = thing(std::move(right));
        const bool isEqual = Orv::isObjPathsEqual(one, other, false);
        EXPECT_EQ(Orv::isObjPathsEqual(other, one, false), isEqual) << "whichever comes first";
        return isEqual;
    }
};

TEST_F(ObjectPathsEqual, WhenClassAndKeysAre) {
    EXPECT_TRUE(equal({text("Id", "a"), number("Number", 1)}, {text("Id", "a"), number("Number", 1)}));
    EXPECT_TRUE(equal({}, {}));
}

TEST_F(ObjectPathsEqual, WhateverTheOrderOfTheKeys) {
    EXPECT_TRUE(equal({text("Id", "a"), number("Number", 1)}, {number("Number", 1), text("Id", "a")}));
}

TEST_F(ObjectPathsEqual, WhateverTheCaseOfTheNames) {
    EXPECT_TRUE(equal({text("Id", "a")}, {text("ID", "a")}));
    EXPECT_TRUE(
        Orv::isObjPathsEqual(pathOf({"", "root/test", "Thing", {}}), pathOf({"", "root/test", "THING", {}}), false));
}

TEST_F(ObjectPathsEqual, WhateverTheHosts) {
    EXPECT_TRUE(Orv::isObjPathsEqual(thing({text("Id", "a")}, "one"), thing({text("Id", "a")}, "two"), true));
}

TEST_F(ObjectPathsEqual, NotOfAnotherClass) {
    EXPECT_FALSE(
        Orv::isObjPathsEqual(pathOf({"", "root/test", "Thing", {}}), pathOf({"", "root/test", "Base", {}}), false));
}

TEST_F(ObjectPathsEqual, NotWithAnotherValue) {
    EXPECT_FALSE(equal({text("Id", "a")}, {text("Id", "A")}));
    EXPECT_FALSE(equal({text("Id", "a")}, {text("Id", "a ")}));
    EXPECT_FALSE(equal({number("Number", 1)}, {number("Number", 257)}));
    EXPECT_FALSE(equal({{"Id", Value::boolean(true)}}, {{"Id", Value::boolean(false)}}));
}

TEST_F(ObjectPathsEqual, NotWithAValueOfAnotherType) {
    EXPECT_FALSE(equal({number("Number", 1, CMPI_uint16)}, {number("Number", 1, CMPI_uint32)}));
    EXPECT_FALSE(equal({text("Number", "1")}, {number("Number", 1)}));
}

TEST_F(ObjectPathsEqual, NotWithMoreKeys) {
    EXPECT_FALSE(equal({text("Id", "a")}, {text("Id", "a"), number("Number", 1)}));
    EXPECT_FALSE(equal({}, {text("Id", "a")}));
}

TEST_F(ObjectPathsEqual, NotWithAnotherKey) {
    EXPECT_FALSE(equal({text("Id", "a")}, {text("Name", "a")}));
}

TEST_F(ObjectPathsEqual, OfEveryTypeThatAKeyMayHave) {
    const std::vector<Value> values{
        Value::boolean(true),
        Value::uint(CMPI_uint8, 200),
        Value::uint(CMPI_uint16, 60000),
        Value::uint(CMPI_uint32, 4000000000),
        Value::uint(CMPI_uint64, 18446744073709551615U),
        Value::sint(CMPI_sint8, -100),
        Value::sint(CMPI_sint16, -30000),
        Value::sint(CMPI_sint32, -2000000000),
        Value::sint(CMPI_sint64, -9000000000000000000),
        Value{CMPI_char16, u'x'},
        Value{CMPI_real64, 0.5},
        Value{CMPI_dateTime, marlo::DateTime{"20261121010203.000000+060"}},
        Value::string(""),
    };
    for (std::size_t i = 0; i < values.size(); ++i) {
        for (std::size_t j = 0; j < values.size(); ++j) {
            EXPECT_EQ(equal({{"Id", values[i]}}, {{"Id", values[j]}}), i == j) << i << ' ' << j;
        }
    }
}

TEST_F(ObjectPathsEqual, OfDateTimesByTheirTexts) {
    EXPECT_FALSE(equal({{"Id", Value{CMPI_dateTime, marlo::DateTime{"20261121010203.000000+060"}}}},
                       {{"Id", Value{CMPI_dateTime, marlo::DateTime{"20261121010203.000000+000"}}}}));
}

TEST_F(ObjectPathsEqual, OfReferencesByTheObjectsTheyName) {
    const auto reference = [](const std::string& id, const std::string& nameSpace = "root/test") {
        return NamedValue{"Ref", Value{CMPI_ref, std::make_shared<const ObjectPath>(
                                                     ObjectPath{"", nameSpace, "Thing", {text("Id", id)}})}};
    };
    EXPECT_TRUE(equal({reference("a")}, {reference("a")}));
    EXPECT_FALSE(equal({reference("a")}, {reference("b")}));
    EXPECT_FALSE(equal({reference("a")}, {reference("a", "root/other")}));
}

TEST_F(ObjectPathsEqual, WithNamespacesWhenTheyCount) {
    const auto* here = pathOf({"", "root/test", "Thing", {text("Id", "a")}});
    const auto* there = pathOf({"", "root/other", "Thing", {text("Id", "a")}});
    const auto* here2 = pathOf({"", "ROOT/Test", "Thing", {text("Id", "a")}});
    EXPECT_TRUE(Orv::isObjPathsEqual(here, there, false));
    EXPECT_FALSE(Orv::isObjPathsEqual(here, there, true));
    EXPECT_TRUE(Orv::isObjPathsEqual(here, here2, true));
}

TEST_F(ObjectPathsEqual, NeverWithoutAPath) {
    EXPECT_FALSE(Orv::isObjPathsEqual(nullptr, nullptr, false));
    EXPECT_FALSE(Orv::isObjPathsEqual(thing({}), nullptr, false));
    EXPECT_FALSE(Orv::isObjPathsEqual(nullptr, thing({}), false));
}

struct MapProperty : CmpiTest {
    MapProperty() : target(broker.newInstance({{"", "root/test", "Thing", {}}, {}})) {}

    CMPIData sourceWith(std::vector<NamedValue> properties) {
        CMPIData data{};
        data.type = CMPI_instance;
        data.value.inst = broker.newInstance({{"", "root/test", "Thing", {}}, std::move(properties)});
        return data;
    }

    /** What the property of `target` has become; nothing when it was not set. */
    const Value* mapped() {
        result = marlo::broker::Broker::toModel(*target);
        const NamedValue* found = marlo::findName(result.properties, "Name");
        return found == nullptr ? nullptr : &found->value;
    }

    void map(const CMPIData& source, Orv::DataType type) { Orv::mapProperty(source, target, "Name", type, &status); }

    CMPIInstance* target;
    CMPIStatus status{CMPI_RC_ERR_FAILED, nullptr};
    Instance result;
};

struct Typed {
    Orv::DataType type;
    Value value;
};

const std::vector<Typed>& typedValues() {
    static const std::vector<Typed> values{
        {Orv::DATA_TYPE_UINT16, Value::uint(CMPI_uint16, 60000)},
        {Orv::DATA_TYPE_UINT64, Value::uint(CMPI_uint64, 10000000000)},
        {Orv::DATA_TYPE_BOOLEAN, Value::boolean(true)},
        {Orv::DATA_TYPE_STRING, Value::string("eth0")},
    };
    return values;
}

TEST_F(MapProperty, CopiesAValueOfEachType) {
    for (const auto& [type, value] : typedValues()) {
        target = broker.newInstance({{"", "root/test", "Thing", {}}, {}});
        map(sourceWith({{"name", value}}), type);
        EXPECT_EQ(status.rc, CMPI_RC_OK);
        ASSERT_NE(mapped(), nullptr);
        EXPECT_EQ(*mapped(), value);
    }
}

TEST_F(MapProperty, SetsNullOfTheTargetTypeForNullOfAnyType) {
    for (const auto& [type, value] : typedValues()) {
        for (const auto& [otherType, otherValue] : typedValues()) {
            target = broker.newInstance({{"", "root/test", "Thing", {}}, {{"Name", value}}});
            map(sourceWith({{"Name", Value::null(otherValue.type)}}), type);
            EXPECT_EQ(status.rc, CMPI_RC_OK);
            ASSERT_NE(mapped(), nullptr);
            EXPECT_EQ(*mapped(), Value::null(value.type));
        }
    }
}

TEST_F(MapProperty, SetsNullOfTheTargetTypeWhenThereIsNoSuchProperty) {
    map(sourceWith({{"Other", Value::string("x")}}), Orv::DATA_TYPE_UINT64);
    EXPECT_EQ(status.rc, CMPI_RC_OK);
    ASSERT_NE(mapped(), nullptr);
    EXPECT_EQ(*mapped(), Value::null(CMPI_uint64));
}

TEST_F(MapProperty, SetsNullWhenThereIsNoInstance) {
    CMPIData nothing{};
    nothing.type = CMPI_instance;
    nothing.state = CMPI_nullValue;
    map(nothing, Orv::DATA_TYPE_STRING);
    EXPECT_EQ(status.rc, CMPI_RC_OK);
    ASSERT_NE(mapped(), nullptr);
    EXPECT_EQ(*mapped(), Value::null(CMPI_string));
}

TEST_F(MapProperty, ReportsAValueOfAnotherTypeAndSetsNothing) {
    for (const auto& [type, value] : typedValues()) {
        for (const auto& [otherType, otherValue] : typedValues()) {
            if (type == otherType) {
                continue;
            }
            map(sourceWith({{"Name", otherValue}}), type);
            EXPECT_EQ(status.rc, CMPI_RC_ERR_TYPE_MISMATCH);
            EXPECT_EQ(mapped(), nullptr);
        }
    }
    map(sourceWith({{"Name", Value::uint(CMPI_uint32, 1)}}), Orv::DATA_TYPE_UINT16);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_TYPE_MISMATCH);
}

TEST_F(MapProperty, ReportsATargetThatIsNot) {
    Orv::mapProperty(sourceWith({}), nullptr, "Name", Orv::DATA_TYPE_STRING, &status);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_INVALID_PARAMETER);
}

TEST_F(MapProperty, ReportsATypeThatIsNot) {
    map(sourceWith({}), static_cast<Orv::DataType>(2));
    EXPECT_EQ(status.rc, CMPI_RC_ERR_INVALID_PARAMETER);
    EXPECT_EQ(mapped(), nullptr);
}

TEST_F(MapProperty, EndsAsTheWriteEnded) {
    CMPIInstanceFT table = *target->ft;
    table.setProperty = [](const CMPIInstance*, const char*, const CMPIValue*, CMPIType) {
        return CMPIStatus{CMPI_RC_ERR_ACCESS_DENIED, nullptr};
    };
    CMPIInstance refusing{target->hdl, &table};
    Orv::mapProperty(sourceWith({{"Name", Value::string("x")}}), &refusing, "Name", Orv::DATA_TYPE_STRING, &status);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_ACCESS_DENIED);
    Orv::mapProperty(sourceWith({}), &refusing, "Name", Orv::DATA_TYPE_STRING, &status);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_ACCESS_DENIED);
}

TEST_F(MapProperty, NeedsNoStatus) {
    Orv::mapProperty(sourceWith({{"Name", Value::string("eth0")}}), target, "Name", Orv::DATA_TYPE_STRING, nullptr);
    ASSERT_NE(mapped(), nullptr);
    EXPECT_EQ(*mapped(), Value::string("eth0"));
}

} // namespace

/** @file Values through properties, keys, arguments, arrays and context entries. */
#include "tests/support/BrokerFixture.h"

#include <cstring>

namespace marlo::test {
namespace {

using Values = BrokerFixture;

template <typename T>
CMPIValue valueOf(T CMPIValue::*member, T value) {
    CMPIValue result{};
    result.*member = value;
    return result;
}

struct SimpleCase {
    CMPIType type;
    CMPIValue value;
    std::size_t size;
};

class SimpleValues : public BrokerFixture, public testing::WithParamInterface<SimpleCase> {};

TEST_P(SimpleValues, AreReadBackByPropertyKeyArgumentElementAndEntry) {
    const auto& [type, value, size] = GetParam();
    CMPIInstance* thing = instance();
    CMPIObjectPath* name = path();
    CMPIArgs* args = CMNewArgs(mb, nullptr);
    CMPIArray* array = CMNewArray(mb, 1, type, nullptr);
    CMPIContext* context = broker.newContext();
    ASSERT_EQ(CMSetProperty(thing, "P", &value, type).rc, CMPI_RC_OK);
    ASSERT_EQ(CMAddKey(name, "P", &value, type).rc, CMPI_RC_OK);
    ASSERT_EQ(CMAddArg(args, "P", &value, type).rc, CMPI_RC_OK);
    ASSERT_EQ(CMSetArrayElementAt(array, 0, &value, type).rc, CMPI_RC_OK);
    ASSERT_EQ(CMAddContextEntry(context, "P", &value, type).rc, CMPI_RC_OK);
    const CMPIData read[] = {CMGetProperty(thing, "p", &status), CMGetKey(name, "p", &status),
                             CMGetArg(args, "p", &status), CMGetArrayElementAt(array, 0, &status),
                             CMGetContextEntry(context, "p", &status)};
    for (const CMPIData& data : read) {
        EXPECT_EQ(data.type, type);
        EXPECT_EQ(data.state & CMPI_nullValue, 0);
        EXPECT_EQ(std::memcmp(&data.value, &value, size), 0);
    }
}

INSTANTIATE_TEST_SUITE_P(
    Types, SimpleValues,
    testing::Values(SimpleCase{CMPI_boolean, valueOf<CMPIBoolean>(&CMPIValue::boolean, 1), 1},
                    SimpleCase{CMPI_char16, valueOf<CMPIChar16>(&CMPIValue::char16, 0x20AC), 2},
                    SimpleCase{CMPI_uint8, valueOf<CMPIUint8>(&CMPIValue::uint8, 0xFF), 1},
                    SimpleCase{CMPI_uint16, valueOf<CMPIUint16>(&CMPIValue::uint16, 0xFFFF), 2},
                    SimpleCase{CMPI_uint32, valueOf<CMPIUint32>(&CMPIValue::uint32, 0xFFFFFFFF), 4},
                    SimpleCase{CMPI_uint64, valueOf<CMPIUint64>(&CMPIValue::uint64, ~0ULL), 8},
                    SimpleCase{CMPI_sint8, valueOf<CMPISint8>(&CMPIValue::sint8, -128), 1},
                    SimpleCase{CMPI_sint16, valueOf<CMPISint16>(&CMPIValue::sint16, -32768), 2},
                    SimpleCase{CMPI_sint32, valueOf<CMPISint32>(&CMPIValue::sint32, -2147483647), 4},
                    SimpleCase{CMPI_sint64, valueOf<CMPISint64>(&CMPIValue::sint64, -5), 8},
                    SimpleCase{CMPI_real32, valueOf<CMPIReal32>(&CMPIValue::real32, 1.5F), 4},
                    SimpleCase{CMPI_real64, valueOf<CMPIReal64>(&CMPIValue::real64, -2.5), 8}));

TEST_F(Values, OfABareVariableOfTheTypeAreReadNoFurtherThanItIs) {
    const auto number = std::make_unique<CMPIUint16>(static_cast<CMPIUint16>(513)); // under ASan: no byte beyond
    CMPIInstance* thing = instance();
    ASSERT_EQ(CMSetProperty(thing, "P", number.get(), CMPI_uint16).rc, CMPI_RC_OK);
    EXPECT_EQ(CMGetProperty(thing, "P", nullptr).value.uint64, 513U);
}

TEST_F(Values, OfTypeCharsAreTheTextItselfAndAreReadAsStrings) {
    CMPIInstance* thing = instance();
    ASSERT_EQ(CMSetProperty(thing, "P", "text", CMPI_chars).rc, CMPI_RC_OK);
    const CMPIData data = CMGetProperty(thing, "P", &status);
    EXPECT_EQ(status.rc, CMPI_RC_OK);
    EXPECT_EQ(data.type, CMPI_string);
    EXPECT_EQ(text(data.value.string), "text");
}

TEST_F(Values, WithANullPointerOrANullHandleAreNullOfTheirType) {
    CMPIInstance* thing = instance();
    CMPIString* none = nullptr;
    ASSERT_EQ(CMSetProperty(thing, "A", nullptr, CMPI_uint16).rc, CMPI_RC_OK);
    ASSERT_EQ(CMSetProperty(thing, "B", nullptr, CMPI_chars).rc, CMPI_RC_OK);
    ASSERT_EQ(CMSetProperty(thing, "C", &none, CMPI_string).rc, CMPI_RC_OK);
    ASSERT_EQ(CMSetProperty(thing, "D", nullptr, CMPI_stringA).rc, CMPI_RC_OK);
    const std::pair<const char*, CMPIType> expected[] = {
        {"A", CMPI_uint16}, {"B", CMPI_string}, {"C", CMPI_string}, {"D", CMPI_stringA}};
    for (const auto& [name, type] : expected) {
        const CMPIData data = CMGetProperty(thing, name, &status);
        EXPECT_EQ(status.rc, CMPI_RC_OK) << name;
        EXPECT_EQ(data.type, type) << name;
        EXPECT_EQ(data.state, CMPI_nullValue) << name;
    }
}

TEST_F(Values, OfUnknownTypesAreRefused) {
    CMPIInstance* thing = instance();
    const CMPIUint16 number = 1;
    for (const int type : {0x01, 0x7F, 0x1300, 0x1400, 0x1500, 0x1900, 0x2001, 0x4000}) {
        EXPECT_EQ(CMSetProperty(thing, "P", &number, static_cast<CMPIType>(type)).rc, CMPI_RC_ERR_INVALID_DATA_TYPE)
            << type;
    }
    EXPECT_EQ(CMGetPropertyCount(thing, nullptr), 0U);
}

TEST_F(Values, WhoseHandleIsOfAnotherTypeAreRefused) {
    CMPIInstance* thing = instance();
    CMPIObjectPath* name = path();
    CMPIArray* numbers = CMNewArray(mb, 1, CMPI_uint16, nullptr);
    EXPECT_EQ(CMSetProperty(thing, "P", &name, CMPI_string).rc, CMPI_RC_ERR_TYPE_MISMATCH);
    EXPECT_EQ(CMSetProperty(thing, "P", &name, CMPI_stringA).rc, CMPI_RC_ERR_TYPE_MISMATCH);
    EXPECT_EQ(CMSetProperty(thing, "P", &numbers, CMPI_stringA).rc, CMPI_RC_ERR_TYPE_MISMATCH);
    EXPECT_EQ(CMGetPropertyCount(thing, nullptr), 0U);
}

TEST_F(Values, AreCopiesOfWhatWasGiven) {
    CMPIInstance* thing = instance();
    CMPIArray* numbers = CMNewArray(mb, 1, CMPI_uint16, nullptr);
    CMPIObjectPath* name = path();
    ASSERT_EQ(CMSetProperty(thing, "Numbers", &numbers, CMPI_uint16A).rc, CMPI_RC_OK);
    ASSERT_EQ(CMSetProperty(thing, "Path", &name, CMPI_ref).rc, CMPI_RC_OK);
    const CMPIUint16 number = 7;
    CMSetArrayElementAt(numbers, 0, &number, CMPI_uint16);
    CMSetClassName(name, "Changed");
    const CMPIArray* kept = CMGetProperty(thing, "Numbers", nullptr).value.array;
    EXPECT_EQ(CMGetArrayElementAt(kept, 0, nullptr).state, CMPI_nullValue);
    EXPECT_EQ(text(CMGetClassName(CMGetProperty(thing, "Path", nullptr).value.ref, nullptr)), "Thing");
}

TEST_F(Values, KeepEmbeddedInstancesReferencesAndDateTimes) {
    CMPIInstance* inner = instance();
    CMSetProperty(inner, "Id", "in", CMPI_chars);
    CMPIDateTime* time = CMNewDateTimeFromChars(mb, "20200229120000.000001+060", nullptr);
    CMPIInstance* thing = instance();
    ASSERT_EQ(CMSetProperty(thing, "I", &inner, CMPI_instance).rc, CMPI_RC_OK);
    ASSERT_EQ(CMSetProperty(thing, "T", &time, CMPI_dateTime).rc, CMPI_RC_OK);
    const CMPIData kept = CMGetProperty(thing, "I", nullptr);
    EXPECT_EQ(text(CMGetProperty(kept.value.inst, "Id", nullptr).value.string), "in");
    const CMPIDateTime* keptTime = CMGetProperty(thing, "T", nullptr).value.dateTime;
    EXPECT_EQ(text(keptTime->ft->getStringFormat(keptTime, nullptr)), "20200229120000.000001+060");
}

TEST_F(Values, ThatArePointersAreForArgumentsAndContextsOnly) {
    int target = 0;
    CMPIValue value{};
    value.dataPtr = {&target, sizeof target};
    CMPIArgs* args = CMNewArgs(mb, nullptr);
    CMPIContext* context = broker.newContext();
    ASSERT_EQ(CMAddArg(args, "P", &value, CMPI_ptr).rc, CMPI_RC_OK);
    ASSERT_EQ(CMAddContextEntry(context, "P", &value, CMPI_ptr).rc, CMPI_RC_OK);
    EXPECT_EQ(CMGetArg(args, "P", nullptr).value.dataPtr.ptr, &target);
    EXPECT_EQ(CMGetContextEntry(context, "P", nullptr).value.dataPtr.length, sizeof target);
}

TEST_F(Values, ThatAreAbsentAreNullAndNotFound) {
    CMPIInstance* thing = instance();
    CMPIObjectPath* name = path();
    CMPIArgs* args = CMNewArgs(mb, nullptr);
    CMPIContext* context = broker.newContext();
    const CMPIValueState absent = CMPI_nullValue | CMPI_notFound;
    EXPECT_EQ(CMGetProperty(thing, "P", &status).state, absent);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_NO_SUCH_PROPERTY);
    EXPECT_EQ(CMGetPropertyAt(thing, 0, nullptr, &status).state, absent);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_NO_SUCH_PROPERTY);
    EXPECT_EQ(CMGetKey(name, "P", &status).state, absent);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_NOT_FOUND);
    EXPECT_EQ(CMGetKeyAt(name, 0, nullptr, &status).state, absent);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_NOT_FOUND);
    EXPECT_EQ(CMGetArg(args, "P", &status).state, absent);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_NOT_FOUND);
    EXPECT_EQ(CMGetContextEntry(context, "P", &status).state, absent);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_NOT_FOUND);
}

TEST_F(Values, SetAgainReplaceTheFormerAndKeepTheirPlace) {
    CMPIInstance* thing = instance();
    CMSetProperty(thing, "A", "1", CMPI_chars);
    CMSetProperty(thing, "B", "2", CMPI_chars);
    CMSetProperty(thing, "a", "3", CMPI_chars);
    ASSERT_EQ(CMGetPropertyCount(thing, nullptr), 2U);
    CMPIString* name = nullptr;
    const CMPIData data = CMGetPropertyAt(thing, 0, &name, nullptr);
    EXPECT_EQ(text(name), "A");
    EXPECT_EQ(text(data.value.string), "3");
}

TEST_F(Values, KeepTheirOrderWhenThereAreMany) {
    CMPIInstance* thing = instance();
    for (int i = 0; i < 1000; ++i) {
        CMSetProperty(thing, ("P" + std::to_string(i)).c_str(), &i, CMPI_sint32);
    }
    ASSERT_EQ(CMGetPropertyCount(thing, nullptr), 1000U);
    for (unsigned i = 0; i < 1000; ++i) {
        CMPIString* name = nullptr;
        EXPECT_EQ(CMGetPropertyAt(thing, i, &name, nullptr).value.sint32, static_cast<int>(i));
        EXPECT_EQ(text(name), "P" + std::to_string(i));
    }
}

TEST_F(Values, ArgumentsGoToTheirObjectAndBackInOrder) {
    const std::vector<NamedValue> given{
        {"Text", Value::string("text")},
        {"List", {CMPI_stringA, Value::Array{Value::string("a"), Value::null(CMPI_string)}}},
        {"Nothing", Value::null(CMPI_stringA)},
        {"Number", Value::uint(CMPI_uint16, 7)}};
    const CMPIArgs* args = broker.newArgs(given);
    EXPECT_EQ(CMGetArgCount(args, &status), 4U);
    EXPECT_EQ(text(CMGetArg(args, "TEXT", &status).value.string), "text");
    const CMPIData nothing = CMGetArg(args, "Nothing", &status);
    EXPECT_EQ(nothing.type, CMPI_stringA);
    EXPECT_NE(nothing.state & CMPI_nullValue, 0);
    EXPECT_EQ(broker::Broker::toModel(*args), given);
}

} // namespace
} // namespace marlo::test

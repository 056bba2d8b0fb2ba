/** @file What each encapsulated type does beyond keeping values. */
#include "tests/support/BrokerFixture.h"

#include <array>
#include <chrono>

namespace marlo::test {
namespace {

using Strings = BrokerFixture;
using Arrays = BrokerFixture;
using DateTimes = BrokerFixture;
using ObjectPaths = BrokerFixture;
using Instances = BrokerFixture;
using Errors = BrokerFixture;
using Handles = BrokerFixture;

TEST_F(Strings, HoldTheirTextAndRefuseNone) {
    EXPECT_EQ(text(CMNewString(mb, "a \xC3\xA4", &status)), "a \xC3\xA4");
    EXPECT_EQ(status.rc, CMPI_RC_OK);
    EXPECT_EQ(CMNewString(mb, nullptr, &status), nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_INVALID_PARAMETER);
    EXPECT_EQ(text(string("")), "");
}

TEST_F(Arrays, AreNullAtFirstAndKnowSizeAndType) {
    CMPIArray* array = CMNewArray(mb, 2, CMPI_chars, &status);
    ASSERT_NE(array, nullptr);
    EXPECT_EQ(CMGetArrayCount(array, nullptr), 2U);
    EXPECT_EQ(CMGetArrayType(array, nullptr), CMPI_string);
    ASSERT_EQ(CMSetArrayElementAt(array, 1, "x", CMPI_chars).rc, CMPI_RC_OK);
    const CMPIData unset = CMGetArrayElementAt(array, 0, nullptr);
    EXPECT_EQ(unset.type, CMPI_string);
    EXPECT_EQ(unset.state, CMPI_nullValue);
    EXPECT_EQ(text(CMGetArrayElementAt(array, 1, nullptr).value.string), "x");
    ASSERT_EQ(CMSetArrayElementAt(array, 1, nullptr, CMPI_null).rc, CMPI_RC_OK);
    EXPECT_EQ(CMGetArrayElementAt(array, 1, nullptr).state, CMPI_nullValue);
}

TEST_F(Arrays, RefuseIndexesBeyondTheirEndAndOtherTypes) {
    CMPIArray* array = CMNewArray(mb, 1, CMPI_uint16, nullptr);
    const CMPIUint16 number = 1;
    EXPECT_EQ(CMSetArrayElementAt(array, 1, &number, CMPI_uint16).rc, CMPI_RC_ERR_NO_SUCH_PROPERTY);
    EXPECT_EQ(CMGetArrayElementAt(array, 1, &status).state, CMPI_nullValue | CMPI_notFound);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_NO_SUCH_PROPERTY);
    EXPECT_EQ(CMSetArrayElementAt(array, 0, "x", CMPI_chars).rc, CMPI_RC_ERR_TYPE_MISMATCH);
    EXPECT_EQ(CMGetArrayElementAt(array, 0, nullptr).state, CMPI_nullValue);
}

TEST_F(Arrays, OfNoElementOfBadTypeAndOfTooManyElements) {
    EXPECT_EQ(CMGetArrayCount(CMNewArray(mb, 0, CMPI_string, nullptr), nullptr), 0U);
    EXPECT_EQ(CMNewArray(mb, 1, 0x7F, &status), nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_INVALID_DATA_TYPE);
    EXPECT_EQ(CMNewArray(mb, 1, CMPI_stringA, &status), nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_INVALID_DATA_TYPE);
    EXPECT_NE(CMNewArray(mb, 1U << 20, CMPI_uint8, &status), nullptr);
    EXPECT_EQ(CMNewArray(mb, (1U << 20) + 1, CMPI_uint8, &status), nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_SERVER_LIMITS_EXCEEDED);
}

struct TimeText {
    const char* text;
    CMPIUint64 microseconds;
    bool interval;
};

class GoodDateTimes : public BrokerFixture, public testing::WithParamInterface<TimeText> {};

TEST_P(GoodDateTimes, KeepTheirTextAndKnowTheirBinaryForm) {
    const CMPIDateTime* time = CMNewDateTimeFromChars(mb, GetParam().text, &status);
    ASSERT_NE(time, nullptr) << status.rc;
    EXPECT_EQ(text(time->ft->getStringFormat(time, nullptr)), GetParam().text);
    EXPECT_EQ(time->ft->getBinaryFormat(time, nullptr), GetParam().microseconds);
    EXPECT_EQ(time->ft->isInterval(time, nullptr) != 0, GetParam().interval);
}

INSTANTIATE_TEST_SUITE_P(Forms, GoodDateTimes,
                         testing::Values(TimeText{"19700101000000.000000+000", 0, false},
                                         TimeText{"19700101000001.000002+000", 1'000'002, false},
                                         TimeText{"20200229120000.000000+000", 1'582'977'600'000'000, false},
                                         TimeText{"20200229120000.000000+060", 1'582'974'000'000'000, false},
                                         TimeText{"20200229120000.000000-060", 1'582'981'200'000'000, false},
                                         TimeText{"20200229120000.000***+000", 1'582'977'600'000'000, false},
                                         TimeText{"2020**********.******+000", 1'577'836'800'000'000, false},
                                         TimeText{"19691231235959.000000+000", 0, false},
                                         TimeText{"00000001000000.000000:000", 86'400'000'000, true},
                                         TimeText{"99999999235959.999999:000", 8'639'999'999'999'999'999, true}));

class BadDateTimes : public BrokerFixture, public testing::WithParamInterface<const char*> {};

TEST_P(BadDateTimes, AreRefused) {
    EXPECT_EQ(CMNewDateTimeFromChars(mb, GetParam(), &status), nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_INVALID_PARAMETER);
}

INSTANTIATE_TEST_SUITE_P(Texts, BadDateTimes,
                         testing::Values("", "2020", "20200229120000.000000-60", "20200229120000.000000+0600",
                                         "20190229120000.000000+000", "20201301120000.000000+000",
                                         "20200229240000.000000+000", "20200229126000.000000+000",
                                         "20200229120060.000000+000", "20200229120000,000000+000",
                                         "20200229120000.000000*000", "2020022912*000.000000+000",
                                         "00000001000000.000000:001", "00000001240000.000000:000",
                                         "x0200229120000.000000+000", "20200229120000.000000+0x0"));

TEST_F(DateTimes, FromBinaryAreWrittenInUtcOrAsInterval) {
    const auto textFrom = [this](CMPIUint64 microseconds, CMPIBoolean interval) {
        const CMPIDateTime* time = CMNewDateTimeFromBinary(mb, microseconds, interval, &status);
        return time == nullptr ? "(null)" : text(time->ft->getStringFormat(time, nullptr));
    };
    EXPECT_EQ(textFrom(1'582'977'600'000'001, 0), "20200229120000.000001+000");
    EXPECT_EQ(textFrom(86'400'000'000 + 3'661'000'001, 1), "00000001010101.000001:000");
    EXPECT_EQ(textFrom(253'402'300'799'999'999, 0), "99991231235959.999999+000");
    EXPECT_EQ(textFrom(253'402'300'800'000'000, 0), "(null)"); // the year 10000
    EXPECT_EQ(status.rc, CMPI_RC_ERR_INVALID_PARAMETER);
    EXPECT_EQ(textFrom(8'640'000'000'000'000'000, 1), "(null)"); // days of nine digits
}

TEST_F(DateTimes, OfNowAreBetweenBeforeAndAfter) {
    const auto now = [] {
        return static_cast<CMPIUint64>(
            std::chrono::duration_cast<std::chrono::microseconds>(std::chrono::system_clock::now().time_since_epoch())
                .count());
    };
    const CMPIUint64 before = now();
    const CMPIDateTime* time = CMNewDateTime(mb, nullptr);
    const CMPIUint64 read = time->ft->getBinaryFormat(time, nullptr);
    EXPECT_LE(before, read);
    EXPECT_LE(read, now());
    EXPECT_EQ(time->ft->isInterval(time, nullptr), 0);
}

TEST_F(ObjectPaths, HaveNameSpaceClassHostAndKeys) {
    CMPIObjectPath* name = path();
    EXPECT_EQ(text(CMGetNameSpace(name, nullptr)), "root/test");
    EXPECT_EQ(text(CMGetClassName(name, nullptr)), "Thing");
    EXPECT_EQ(text(CMGetHostname(name, nullptr)), "");
    const CMPIString* before = CMGetNameSpace(name, nullptr);
    CMSetNameSpace(name, "root/other");
    CMSetHostname(name, "host");
    CMSetClassName(name, "Other");
    CMAddKey(name, "Id", "a\"b", CMPI_chars);
    EXPECT_EQ(text(before), "root/test"); // what was read stays as it was
    EXPECT_EQ(text(CMObjectPathToString(name, nullptr)), R"(//host/root/other:Other.Id="a\"b")");
    EXPECT_EQ(CMGetKey(name, "ID", nullptr).state, CMPI_keyValue);
    CMPIString* key = nullptr;
    EXPECT_EQ(text(CMGetKeyAt(name, 0, &key, nullptr).value.string), "a\"b");
    EXPECT_EQ(text(key), "Id");
    EXPECT_EQ(CMGetKeyCount(name, nullptr), 1U);
}

TEST_F(ObjectPaths, RefuseArrayKeysAndNullTexts) {
    CMPIObjectPath* name = path();
    EXPECT_EQ(CMAddKey(name, "K", nullptr, CMPI_stringA).rc, CMPI_RC_ERR_INVALID_DATA_TYPE);
    EXPECT_EQ(CMAddKey(name, nullptr, "x", CMPI_chars).rc, CMPI_RC_ERR_INVALID_PARAMETER);
    EXPECT_EQ(CMSetNameSpace(name, nullptr).rc, CMPI_RC_ERR_INVALID_PARAMETER);
    EXPECT_EQ(CMSetHostname(name, nullptr).rc, CMPI_RC_ERR_INVALID_PARAMETER);
    EXPECT_EQ(CMSetClassName(name, nullptr).rc, CMPI_RC_ERR_INVALID_PARAMETER);
    EXPECT_EQ(CMNewObjectPath(mb, "root/test", nullptr, &status), nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_INVALID_PARAMETER);
    EXPECT_EQ(text(CMObjectPathToString(CMNewObjectPath(mb, nullptr, "C", nullptr), nullptr)), "C");
}

TEST_F(ObjectPaths, TakeNameSpaceAndHostFromAnother) {
    CMPIObjectPath* source = CMNewObjectPath(mb, "root/source", "S", nullptr);
    CMSetHostname(source, "far");
    CMPIObjectPath* name = path();
    ASSERT_EQ(name->ft->setNameSpaceFromObjectPath(name, source).rc, CMPI_RC_OK);
    EXPECT_EQ(text(CMObjectPathToString(name, nullptr)), "root/source:Thing");
    ASSERT_EQ(name->ft->setHostAndNameSpaceFromObjectPath(name, source).rc, CMPI_RC_OK);
    EXPECT_EQ(text(CMObjectPathToString(name, nullptr)), "//far/root/source:Thing");
}

TEST_F(ObjectPaths, TellTheQualifiersOfTheSchema) {
    const CMPIObjectPath* name = path("thing");
    const CMPIObjectPathFT* ft = name->ft;
    EXPECT_EQ(text(ft->getClassQualifier(name, "description", &status).value.string), "Thing");
    EXPECT_EQ(text(ft->getPropertyQualifier(name, "id", "Description", &status).value.string), "Thing.Id");
    EXPECT_EQ(text(ft->getMethodQualifier(name, "do", "Description", &status).value.string), "Thing.Do");
    EXPECT_EQ(text(ft->getParameterQualifier(name, "Do", "What", "Description", &status).value.string),
              "Thing.Do.What");
    EXPECT_EQ(status.rc, CMPI_RC_OK);
    EXPECT_EQ(ft->getClassQualifier(name, "None", &status).state, CMPI_nullValue | CMPI_notFound);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_NOT_FOUND);
    EXPECT_EQ(ft->getPropertyQualifier(name, nullptr, nullptr, &status).state, CMPI_nullValue | CMPI_notFound);
}

TEST_F(Instances, CompleteTheirPathByTheKeysOfTheSchema) {
    CMPIInstance* thing = instance("thing");
    const CMPIUint16 number = 5;
    CMSetProperty(thing, "number", &number, CMPI_uint16);
    CMSetProperty(thing, "id", "x", CMPI_chars);
    CMSetProperty(thing, "Other", "y", CMPI_chars);
    EXPECT_EQ(text(CMObjectPathToString(CMGetObjectPath(thing, nullptr), nullptr)),
              R"(root/test:thing.Id="x",Number=5)");
}

TEST_F(Instances, LeaveKeysAloneThatThePathHasAndThoseWithoutValue) {
    CMPIObjectPath* name = path();
    CMAddKey(name, "Id", "from path", CMPI_chars);
    CMPIInstance* thing = CMNewInstance(mb, name, nullptr);
    CMSetProperty(thing, "Id", "from property", CMPI_chars);
    CMSetProperty(thing, "Number", nullptr, CMPI_uint16);
    EXPECT_EQ(text(CMObjectPathToString(CMGetObjectPath(thing, nullptr), nullptr)),
              R"(root/test:Thing.Id="from path")");
    EXPECT_EQ(text(CMObjectPathToString(CMGetObjectPath(instance("Unknown"), nullptr), nullptr)),
              "root/test:Unknown");
}

TEST_F(Instances, AreNotChangedThroughThePathTheyGaveOrGot) {
    CMPIObjectPath* name = path();
    CMPIInstance* thing = CMNewInstance(mb, name, nullptr);
    CMSetNameSpace(name, "root/changed");
    CMSetHostname(CMGetObjectPath(thing, nullptr), "changed");
    EXPECT_EQ(text(CMObjectPathToString(CMGetObjectPath(thing, nullptr), nullptr)), "root/test:Thing");
    ASSERT_EQ(thing->ft->setObjectPath(thing, name).rc, CMPI_RC_OK);
    EXPECT_EQ(text(CMObjectPathToString(CMGetObjectPath(thing, nullptr), nullptr)), "root/changed:Thing");
}

TEST_F(Instances, TakeOnlyWhatTheirFilterLetsThrough) {
    CMPIInstance* thing = instance();
    std::array<const char*, 2> names{"A", nullptr};
    std::array<const char*, 2> keys{"Id", nullptr};
    ASSERT_EQ(thing->ft->setPropertyFilter(thing, names.data(), keys.data()).rc, CMPI_RC_OK);
    CMSetProperty(thing, "a", "1", CMPI_chars);
    CMSetProperty(thing, "B", "2", CMPI_chars);
    EXPECT_EQ(thing->ft->setPropertyWithOrigin(thing, "Id", CMPI_VALUE_ARGUMENT("3"), CMPI_chars, "Base").rc,
              CMPI_RC_OK);
    EXPECT_EQ(CMGetPropertyCount(thing, nullptr), 2U);
    EXPECT_EQ(CMGetProperty(thing, "B", &status).state, CMPI_nullValue | CMPI_notFound);
    ASSERT_EQ(thing->ft->setPropertyFilter(thing, nullptr, nullptr).rc, CMPI_RC_OK);
    CMSetProperty(thing, "B", "2", CMPI_chars);
    EXPECT_EQ(CMGetPropertyCount(thing, nullptr), 3U);
}

TEST_F(Errors, HoldWhatIsSet) {
    CMPIError* error = mb->eft->newCMPIError(mb, "owner", "id", "message", ErrorSeverityHigh, ErrorProbCauseOther,
                                             CMPI_RC_ERR_ACCESS_DENIED, &status);
    ASSERT_NE(error, nullptr);
    const CMPIErrorFT* ft = error->ft;
    CMPIArray* texts = CMNewArray(mb, 1, CMPI_string, nullptr);
    CMPIArray* numbers = CMNewArray(mb, 1, CMPI_uint16, nullptr);
    CMSetArrayElementAt(texts, 0, "do", CMPI_chars);
    EXPECT_EQ(ft->getRecommendedActions(error, nullptr), nullptr);
    EXPECT_EQ(ft->setErrorType(error, SoftwareErrorType).rc, CMPI_RC_OK);
    EXPECT_EQ(ft->setOtherErrorType(error, "other").rc, CMPI_RC_OK);
    EXPECT_EQ(ft->setProbableCauseDescription(error, "cause").rc, CMPI_RC_OK);
    EXPECT_EQ(ft->setRecommendedActions(error, texts).rc, CMPI_RC_OK);
    EXPECT_EQ(ft->setRecommendedActions(error, numbers).rc, CMPI_RC_ERR_TYPE_MISMATCH);
    EXPECT_EQ(ft->setErrorSource(error, "source").rc, CMPI_RC_OK);
    EXPECT_EQ(ft->setErrorSourceFormat(error, CMPIErrorSrcFormatOther).rc, CMPI_RC_OK);
    EXPECT_EQ(ft->setOtherErrorSourceFormat(error, "format").rc, CMPI_RC_OK);
    EXPECT_EQ(ft->setCIMStatusCodeDescription(error, "code").rc, CMPI_RC_OK);
    EXPECT_EQ(ft->setMessageArguments(error, texts).rc, CMPI_RC_OK);
    EXPECT_EQ(ft->setErrorSource(error, nullptr).rc, CMPI_RC_ERR_INVALID_PARAMETER);
    CMPIError* clone = CMClone(error, nullptr);
    for (const CMPIError* read : {error, clone}) {
        EXPECT_EQ(ft->getErrorType(read, nullptr), SoftwareErrorType);
        EXPECT_EQ(text(ft->getOtherErrorType(read, nullptr)), "other");
        EXPECT_EQ(text(ft->getOwningEntity(read, nullptr)), "owner");
        EXPECT_EQ(text(ft->getMessageID(read, nullptr)), "id");
        EXPECT_EQ(text(ft->getMessage(read, nullptr)), "message");
        EXPECT_EQ(ft->getPerceivedSeverity(read, nullptr), ErrorSeverityHigh);
        EXPECT_EQ(ft->getProbableCause(read, nullptr), ErrorProbCauseOther);
        EXPECT_EQ(text(ft->getProbableCauseDescription(read, nullptr)), "cause");
        const CMPIArray* actions = ft->getRecommendedActions(read, nullptr);
        EXPECT_EQ(text(CMGetArrayElementAt(actions, 0, nullptr).value.string), "do");
        EXPECT_EQ(text(ft->getErrorSource(read, nullptr)), "source");
        EXPECT_EQ(ft->getErrorSourceFormat(read, nullptr), CMPIErrorSrcFormatOther);
        EXPECT_EQ(text(ft->getOtherErrorSourceFormat(read, nullptr)), "format");
        EXPECT_EQ(ft->getCIMStatusCode(read, nullptr), CMPI_RC_ERR_ACCESS_DENIED);
        EXPECT_EQ(text(ft->getCIMStatusCodeDescription(read, nullptr)), "code");
        EXPECT_EQ(CMGetArrayCount(ft->getMessageArguments(read, nullptr), nullptr), 1U);
    }
    CMRelease(clone);
}

TEST_F(Handles, ThatAreNullEmptyOrOfAnotherTypeAreRefused) {
    const CMPIStringFT* stringFt = string("x")->ft;
    const CMPIInstanceFT* instanceFt = instance()->ft;
    CMPIString empty{nullptr, stringFt};
    CMPIString* mixedUp = reinterpret_cast<CMPIString*>(path());
    for (CMPIString* bad : {static_cast<CMPIString*>(nullptr), &empty, mixedUp}) {
        status = {};
        EXPECT_EQ(stringFt->getCharPtr(bad, &status), nullptr);
        EXPECT_EQ(status.rc, CMPI_RC_ERR_INVALID_HANDLE);
        EXPECT_EQ(stringFt->clone(bad, &status), nullptr);
        EXPECT_EQ(status.rc, CMPI_RC_ERR_INVALID_HANDLE);
        EXPECT_EQ(stringFt->release(bad).rc, CMPI_RC_ERR_INVALID_HANDLE);
    }
    EXPECT_EQ(instanceFt->setProperty(nullptr, "P", nullptr, CMPI_string).rc, CMPI_RC_ERR_INVALID_HANDLE);
    EXPECT_EQ(instanceFt->getProperty(nullptr, "P", &status).state, CMPI_nullValue);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_INVALID_HANDLE);
    EXPECT_EQ(CMNewInstance(mb, nullptr, &status), nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_INVALID_HANDLE);
    const CMPIBroker noBroker{nullptr, mb->bft, mb->eft, mb->xft, mb->mft};
    EXPECT_EQ(CMNewString(&noBroker, "x", &status), nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_INVALID_HANDLE);
}

TEST_F(Handles, AreFoundThroughTheirHdlInAnyCopyWithAnyTable) {
    CMPIInstance* thing = instance();
    CMPIInstanceFT table = *thing->ft;
    table.setProperty = [](const CMPIInstance*, const char*, const CMPIValue*, CMPIType) -> CMPIStatus {
        return {CMPI_RC_ERR_ACCESS_DENIED, nullptr};
    };
    thing->ft = &table;
    EXPECT_EQ(CMSetProperty(thing, "P", "x", CMPI_chars).rc, CMPI_RC_ERR_ACCESS_DENIED);
    EXPECT_EQ(CMGetPropertyCount(thing, nullptr), 0U);
    const CMPIInstance copy{thing->hdl, thing->ft};
    EXPECT_EQ(text(CMGetClassName(CMGetObjectPath(&copy, nullptr), nullptr)), "Thing");

    CMPIBrokerEncFT encapsulation = *mb->eft;
    encapsulation.newArray = [](const CMPIBroker*, CMPICount, CMPIType, CMPIStatus* st) -> CMPIArray* {
        CMSetStatus(st, CMPI_RC_ERR_FAILED);
        return nullptr;
    };
    const CMPIBroker changed{mb->hdl, mb->bft, &encapsulation, mb->xft, mb->mft};
    EXPECT_EQ(CMNewArray(&changed, 1, CMPI_string, &status), nullptr);
    EXPECT_EQ(text(CMNewString(&changed, "works", nullptr)), "works");
}

} // namespace
} // namespace marlo::test

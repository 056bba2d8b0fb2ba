/** Event times as CIM date-times, with what is peculiar about them. */
#include "tests/provider/Indications.h"

namespace {

using namespace provider_test;
using namespace Orv::NetworkAdapterComposite;
using Fields = Orv::DateTime::Fields;

struct Conversion {
    const char* name;
    Fields fields;
    const char* text;
};

class DateTimeText : public testing::TestWithParam<Conversion> {};

TEST_P(DateTimeText, IsWrittenAs) {
    scripted_agent::reset();
    EXPECT_EQ(convertCIMDateTime(Orv::DateTime(GetParam().fields)), GetParam().text);
}

INSTANTIATE_TEST_SUITE_P(
    All, DateTimeText,
    testing::Values(
        Conversion{"AnOrdinaryTime", {2009, 3, 7, 5, 4, 9, 250, 1}, "20090307050409.000250+060"},
        Conversion{"TwoDigitsStayTwoDigits", {2026, 11, 21, 14, 35, 59, 999, 2}, "20261121143559.000999+120"},
        Conversion{"MillisecondsFillSixDigits", {2009, 3, 7, 5, 4, 9, 0, 0}, "20090307050409.000000+000"},
        Conversion{
            "OneMillisecondIsNotOneThousandMicroseconds", {2009, 3, 7, 5, 4, 9, 1, 0}, "20090307050409.000001+000"},
        Conversion{"NoOffsetIsPositive", {2009, 3, 7, 5, 4, 9, 250, 0}, "20090307050409.000250+000"},
        Conversion{"MinusSignCountsAsADigit", {2009, 3, 7, 5, 4, 9, 250, -1}, "20090307050409.000250-60"},
        Conversion{"MinusFiveHours", {2009, 3, 7, 5, 4, 9, 250, -5}, "20090307050409.000250-300"},
        Conversion{"PlusFourteenHours", {2009, 3, 7, 5, 4, 9, 250, 14}, "20090307050409.000250+840"},
        Conversion{"PlusOneHourIsFilledUp", {2009, 3, 7, 5, 4, 9, 250, 1}, "20090307050409.000250+060"},
        Conversion{"YearHasNoLeadingZeros", {987, 3, 7, 5, 4, 9, 250, 0}, "9870307050409.000250+000"},
        Conversion{"NothingIsKnown", {}, "00000000000.000000+000"},
        Conversion{"FieldsAreNotChecked",
                   {2009, 123, 99, 77, 66, 65, 1000, 0},
                   "20091239977"
                   "6665.001000+000"},
        Conversion{"FiveDigitsFit",
                   {65535, 65535, 65535, 65535, 65535, 65535, 65535, 0},
                   "655356553565535655356553565535.065535+000"},
        Conversion{"LongOffsetsAreCut", {2009, 3, 7, 5, 4, 9, 250, 32767}, "20090307050409.000250+19660"},
        Conversion{"LongNegativeOffsetsAreCut", {2009, 3, 7, 5, 4, 9, 250, -32768}, "20090307050409.000250-1966"}),
    [](const auto& instance) { return instance.param.name; });

TEST(DateTimeTextTrace, HasAnEntryAndNoExit) {
    scripted_agent::reset();
    convertCIMDateTime(Orv::DateTime(EVENT_TIME));
    EXPECT_THAT(normalised(scripted_agent::recorded("log ")), testing::ElementsAre(entering("convertCIMDateTime")));
    EXPECT_THAT(scripted_agent::recorded("trace "), testing::SizeIs(1));
}

TEST(AddZero, GivesThatManyZeros) {
    EXPECT_EQ(addZero(0), "");
    EXPECT_EQ(addZero(1), "0");
    EXPECT_EQ(addZero(3), "000");
    EXPECT_EQ(addZero(255), std::string(255, '0'));
}

} // namespace

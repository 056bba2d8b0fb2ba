#include "host/cimxml/Message.h"
#include "host/delivery/Latency.h"
#include "host/delivery/Message.h"
#include "tests/delivery/DeliveryFixture.h"

namespace marlo::delivery {
namespace {

using testing::HasSubstr;

Instance embedded(const cimxml::Message& message) {
    const auto& call = std::get<cimxml::ExportCall>(message.call);
    EXPECT_EQ(call.method, "ExportIndication");
    EXPECT_EQ(call.arguments.size(), 1U);
    EXPECT_EQ(call.arguments.front().name, "NewIndication");
    return std::get<Instance>(call.arguments.front().value);
}

TEST(Messages, CarryTheIndicationAndItsPlaceInTheSequence) {
    Instance indication = alert("a </INSTANCE> & <b>");
    indication.properties.push_back({"sequencenumber", Value::sint(CMPI_sint64, 77)});
    indication.properties.push_back({"SEQUENCECONTEXT", Value::null(CMPI_string)});
    const std::string text = inSequence(exportMessage("id 1", indication), "con<text>", 1234567890123);
    const cimxml::Message message = cimxml::readMessage(text);
    EXPECT_EQ(message.id, "id 1");
    Instance expected = alert("a </INSTANCE> & <b>");
    expected.properties.push_back({"SequenceContext", Value::string("con<text>")});
    expected.properties.push_back({"SequenceNumber", Value::sint(CMPI_sint64, 1234567890123)});
    EXPECT_EQ(embedded(message), expected);
}

TEST(Messages, CarryAnIndicationWithoutProperties) {
    Instance indication;
    indication.path.className = "LAB_Alert";
    const Instance read = embedded(cimxml::readMessage(inSequence(exportMessage("1", indication), "c", 0)));
    ASSERT_EQ(read.properties.size(), 2U);
    EXPECT_EQ(read.properties[1].value, Value::sint(CMPI_sint64, 0));
}

TEST(Messages, NumberTheIndicationAndNotWhatIsEmbeddedInIt) {
    Instance indication = alert("outer");
    Instance inner = alert("inner");
    indication.properties.push_back({"Inner", {CMPI_instance, std::make_shared<const Instance>(std::move(inner))}});
    const Instance read = embedded(cimxml::readMessage(inSequence(exportMessage("1", indication), "c", 5)));
    ASSERT_EQ(read.properties.size(), 5U);
    EXPECT_EQ(read.properties[4].name, "SequenceNumber");
}

TEST(Messages, SayWhatWasLost) {
    const Instance notice = lossNotice(3, 5, 9, 1'700'000'000'000'000);
    EXPECT_EQ(notice.path.className, "CIM_AlertIndication");
    const NamedValue* text = findName(notice.properties, "Message");
    ASSERT_NE(text, nullptr);
    EXPECT_THAT(std::get<std::string>(text->value.data), HasSubstr("3 indications for this listener were lost"));
    EXPECT_THAT(std::get<std::string>(text->value.data), HasSubstr("SequenceNumber 5 to 9"));
    const NamedValue* time = findName(notice.properties, "IndicationTime");
    ASSERT_NE(time, nullptr);
    EXPECT_EQ(time->value, (Value{CMPI_dateTime, DateTime{"20231114221320.000000+000"}}));
}

TEST(Messages, QuoteNoMoreOfAListenerThanFitsALine) {
    const std::string problem = problemOf(400, "a\nb" + std::string(1000, 'x'), "");
    EXPECT_THAT(problem, HasSubstr("answered HTTP 400, CIMError \"a bxx"));
    EXPECT_LT(problem.size(), 300U);
}

TEST(Latencies, AreRightToWithinAnEighth) {
    Latency latency;
    EXPECT_EQ(latency.quantile(0.5).count(), 0);
    for (std::int64_t time = 1; time <= 100000; ++time) {
        latency.count(std::chrono::microseconds(time));
    }
    for (const double share : {0.0001, 0.01, 0.5, 0.99, 1.0}) {
        const double exact = share * 100000;
        EXPECT_GE(static_cast<double>(latency.quantile(share).count()), exact);
        EXPECT_LE(static_cast<double>(latency.quantile(share).count()), exact * 1.126) << share;
    }
}

TEST(Latencies, HaveAnUpperEnd) {
    Latency latency;
    latency.count(std::chrono::hours(1000));
    latency.count(std::chrono::microseconds(-5));
    EXPECT_EQ(latency.quantile(0.5).count(), 0);
    EXPECT_GT(latency.quantile(1), std::chrono::hours(1));
}

} // namespace
} // namespace marlo::delivery

/** @file Answers while they come about: streamed, broken off, lost; and what the log is told. */
#include "tests/wbem/Host.h"
#include "tests/wbem/MemoryResponder.h"

#include <stdexcept>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace marlo::test {
namespace {

using security::Identity;
using security::Role;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::Not;
using testing::StartsWith;

const Identity alice("alice", {Role::read, Role::change});
constexpr std::size_t plenty = 5000; ///< instances of 200 bytes and some: more than any buffer holds

std::string fieldOf(const http::Fields& fields, const std::string& name) {
    for (const http::Field& field : fields) {
        if (field.name == name) {
            return field.value;
        }
    }
    return "";
}

/** The value between two texts. */
std::string between(const std::string& text, const std::string& before, const std::string& after) {
    const auto begin = text.find(before);
    return begin == std::string::npos
               ? ""
               : text.substr(begin + before.size(), text.find(after, begin + before.size()) - begin - before.size());
}

class ServiceTest : public testing::Test {
  protected:
    MemoryResponder& handle(http::Request&& request) {
        responder = {};
        responder.goneAfter = goneAfter;
        host.service().handle(std::move(request), responder);
        return responder;
    }

    Host host;
    MemoryResponder responder;
    std::optional<std::size_t> goneAfter;
};

TEST_F(ServiceTest, WritesWhileTheProviderStillDelivers) {
    host.items().streamLength = plenty;
    std::size_t unwritten = 0; // the most that had been delivered and not been written
    host.items().onStream = [&](std::size_t index) {
        unwritten = std::max(unwritten, (index - 1) * 200 - std::min((index - 1) * 200, responder.body.size()));
    };
    handle(intrinsic(alice, "EnumerateInstances", classArgument("TEST_Stream")));
    EXPECT_TRUE(responder.finished);
    EXPECT_GT(responder.body.size(), plenty * 200);
    EXPECT_LT(unwritten, 64U * 1024);
    EXPECT_LT(responder.largestPiece, 64U * 1024);
}

TEST_F(ServiceTest, EndsAnAnswerThatBreaksOffWithTheErrorAsTrailers) {
    host.items().streamLength = plenty;
    host.items().streamFailsAt = plenty;
    handle(intrinsic(alice, "EnumerateInstances", classArgument("TEST_Stream")));
    ASSERT_TRUE(responder.instead);
    EXPECT_FALSE(responder.finished);
    EXPECT_EQ(fieldOf(responder.trailers, "CIMStatusCode"), "1");
    EXPECT_EQ(fieldOf(responder.trailers, "CIMStatusCodeDescription"), "broke off at 100 %25");
    EXPECT_THAT(responder.instead->body, HasSubstr("<ERROR CODE=\"1\" DESCRIPTION=\"broke off at 100 %\"/>"));
    EXPECT_THAT(responder.instead->body, Not(HasSubstr("TEST_Stream.Index")));
}

TEST_F(ServiceTest, AnswersWhatIsThrownInTheMiddle) {
    host.items().onStream = [](std::size_t index) {
        if (index == 2) {
            throw std::logic_error("no more");
        }
    };
    handle(intrinsic(alice, "EnumerateInstances", classArgument("TEST_Stream")));
    const std::string& body = responder.instead ? responder.instead->body : responder.body;
    EXPECT_THAT(body, HasSubstr("<ERROR CODE=\"1\" DESCRIPTION=\"TEST_Stream: no more\"/>"));
    EXPECT_EQ(host.records().at(0).cimStatus, 1U);
}

TEST_F(ServiceTest, AnnouncesTrailersToWhomTakesThem) {
    http::Request request = intrinsic(alice, "EnumerateClassNames", "");
    request.head.fields.push_back({"TE", "trailers"});
    EXPECT_EQ(fieldOf(handle(std::move(request)).beginFields, "Trailer"), "CIMStatusCode, CIMStatusCodeDescription");
    EXPECT_EQ(fieldOf(handle(intrinsic(alice, "EnumerateClassNames", "")).beginFields, "Trailer"), "");
}

TEST_F(ServiceTest, StopsTheProviderWhenTheClientIsGone) {
    host.items().streamLength = plenty;
    std::size_t last = 0;
    host.items().onStream = [&last](std::size_t index) { last = index; };
    goneAfter = 100000;
    handle(intrinsic(alice, "EnumerateInstances", classArgument("TEST_Stream")));
    EXPECT_FALSE(responder.finished);
    EXPECT_FALSE(responder.instead);
    EXPECT_LT(last, plenty / 2);
    const wbem::Record record = host.records().at(0);
    EXPECT_EQ(record.httpStatus, 0U);
    EXPECT_EQ(record.error, "it went away");
}

TEST_F(ServiceTest, ForgetsAnEnumerationWhoseObjectsWereLostOnTheWay) {
    handle(intrinsic(alice, "OpenEnumerateInstances", classArgument("TEST_Item")));
    const std::string context =
        between(responder.body, "\"EnumerationContext\" PARAMTYPE=\"string\"><VALUE>", "</VALUE>");
    ASSERT_EQ(context.size(), 32U);
    EXPECT_EQ(host.service().openEnumerations(), 1U);
    goneAfter = 10;
    const std::string arguments = argument("EnumerationContext", context) + argument("MaxObjectCount", "1");
    handle(intrinsic(alice, "PullInstancesWithPath", arguments));
    EXPECT_EQ(host.service().openEnumerations(), 0U);
    goneAfter.reset();
    handle(intrinsic(alice, "PullInstancesWithPath", arguments));
    EXPECT_THAT(responder.body + (responder.instead ? responder.instead->body : ""), HasSubstr("ERROR CODE=\"21\""));
}

TEST_F(ServiceTest, TellsTheLogWhatBecameOfEachRequest) {
    handle(intrinsic(alice, "EnumerateInstances", classArgument("TEST_Item")));
    const wbem::Record good = host.records().at(0);
    EXPECT_EQ(good.id, 7U);
    EXPECT_EQ(good.peer, "192.0.2.99:4000");
    EXPECT_EQ(good.user, "alice");
    EXPECT_EQ(good.operation, "EnumerateInstances");
    EXPECT_EQ(good.nameSpace, "root/test");
    EXPECT_EQ(good.className, "TEST_Item");
    EXPECT_EQ(good.cimStatus, 0U);
    EXPECT_EQ(good.httpStatus, 200U);
    EXPECT_EQ(good.bytesOut, responder.body.size());
    EXPECT_GT(good.bytesIn, 200U);
    EXPECT_GT(good.time.count(), 0);

    handle(intrinsic(alice, "GetClass", classArgument("TEST_Nobody")));
    const wbem::Record failed = host.records().at(1);
    EXPECT_EQ(failed.cimStatus, 6U);
    EXPECT_EQ(failed.httpStatus, 200U);
    EXPECT_EQ(failed.error, "there is no class 'TEST_Nobody' in root/test");

    http::Request request = intrinsic(alice, "GetClass", "");
    request.head.method = "GET";
    handle(std::move(request));
    const wbem::Record refused = host.records().at(2);
    EXPECT_EQ(refused.operation, "GET /cimom");
    EXPECT_EQ(refused.cimStatus, std::nullopt);
    EXPECT_EQ(refused.httpStatus, 405U);
}

TEST_F(ServiceTest, TellsTheLogWhatTheAgentHadToSayToAFailure) {
    const std::string path =
        "<LOCALINSTANCEPATH><LOCALNAMESPACEPATH><NAMESPACE NAME=\"root\"/><NAMESPACE "
        "NAME=\"tavis\"/></LOCALNAMESPACEPATH><INSTANCENAME "
        "CLASSNAME=\"MARLO_NetworkAdapterConfiguration\"><KEYBINDING NAME=\"SettingID\"><KEYVALUE>"
        "eth0</KEYVALUE></KEYBINDING></INSTANCENAME></LOCALINSTANCEPATH>";
    handle(requestOf(alice, "EnableStatic", "root/tavis:MARLO_NetworkAdapterConfiguration.SettingID=\"eth0\"",
                     "<METHODCALL NAME=\"EnableStatic\">" + path +
                         "<PARAMVALUE NAME=\"IPAddress\"><VALUE.ARRAY><VALUE>no address</VALUE></VALUE.ARRAY>"
                         "</PARAMVALUE></METHODCALL>"));
    const wbem::Record record = host.records().at(0);
    EXPECT_EQ(record.operation, "EnableStatic");
    EXPECT_EQ(record.className, "MARLO_NetworkAdapterConfiguration");
    EXPECT_EQ(record.cimStatus, 1U);
    ASSERT_FALSE(record.reported.empty());
    EXPECT_THAT(record.reported[0], HasSubstr("no IPv4 address"));
}

TEST_F(ServiceTest, GivesEverySmallAnswerInOnePiece) {
    handle(intrinsic(alice, "GetQualifier", argument("QualifierName", "Key")));
    EXPECT_EQ(responder.largestPiece, responder.body.size());
}

class LimitedServiceTest : public testing::Test {
  protected:
    static wbem::Limits limits() {
        wbem::Limits limits;
        limits.enumerationsPerUser = 2;
        limits.heldBytes = 20000;
        return limits;
    }

    std::string handle(http::Request&& request) {
        MemoryResponder responder;
        host.service().handle(std::move(request), responder);
        return responder.body;
    }

    Host host{limits()};
};

TEST_F(LimitedServiceTest, RefusesOneEnumerationTooMany) {
    for (int i = 0; i < 2; ++i) {
        EXPECT_THAT(handle(intrinsic(alice, "OpenEnumerateInstances", classArgument("TEST_Item"))),
                    HasSubstr("EndOfSequence"));
    }
    EXPECT_THAT(handle(intrinsic(alice, "OpenEnumerateInstances", classArgument("TEST_Item"))),
                HasSubstr("<ERROR CODE=\"27\""));
}

TEST_F(LimitedServiceTest, RefusesAnEnumerationThatIsTooLarge) {
    host.items().streamLength = plenty;
    std::size_t last = 0;
    host.items().onStream = [&last](std::size_t index) { last = index; };
    EXPECT_THAT(handle(intrinsic(alice, "OpenEnumerateInstances", classArgument("TEST_Stream"))),
                HasSubstr("<ERROR CODE=\"27\""));
    EXPECT_LT(last, 100U); // the provider was not heard to its end
    EXPECT_EQ(host.service().openEnumerations(), 0U);
    host.items().streamLength = 3;
    EXPECT_THAT(handle(intrinsic(alice, "OpenEnumerateInstances", classArgument("TEST_Stream"))),
                HasSubstr("EndOfSequence")); // and nothing is left over of the one before
}

} // namespace
} // namespace marlo::test

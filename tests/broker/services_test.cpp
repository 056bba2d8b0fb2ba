/** @file The broker's own services: types, messages, log, results, up-calls. */
#include "host/broker/Message.h"
#include "tests/support/BrokerFixture.h"

#include <stdexcept>

namespace marlo::test {
namespace {

using Services = BrokerFixture;

TEST_F(Services, KnowTheTypesOfObjects) {
    const std::pair<const void*, const char*> objects[] = {
        {string("x"), "CMPIString"},
        {CMNewArray(mb, 1, CMPI_string, nullptr), "CMPIArray"},
        {CMNewDateTime(mb, nullptr), "CMPIDateTime"},
        {path(), "CMPIObjectPath"},
        {instance(), "CMPIInstance"},
        {CMNewArgs(mb, nullptr), "CMPIArgs"},
        {broker.newContext(), "CMPIContext"},
        {mb, "CMPIBroker"},
    };
    for (const auto& [object, type] : objects) {
        EXPECT_EQ(text(mb->eft->getType(mb, object, nullptr)), type);
        EXPECT_EQ(mb->eft->isOfType(mb, object, type, nullptr), 1);
        EXPECT_EQ(mb->eft->isOfType(mb, object, "CMPIError", nullptr), 0);
    }
    EXPECT_EQ(mb->eft->getType(mb, nullptr, &status), nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_INVALID_HANDLE);
}

TEST_F(Services, DescribeObjectsInText) {
    CMPIInstance* thing = instance();
    CMSetProperty(thing, "Id", "x", CMPI_chars);
    CMPIArray* array = CMNewArray(mb, 2, CMPI_string, nullptr);
    CMSetArrayElementAt(array, 0, "x", CMPI_chars);
    EXPECT_EQ(text(mb->eft->toString(mb, string("plain"), nullptr)), "plain");
    EXPECT_EQ(text(mb->eft->toString(mb, path(), nullptr)), "root/test:Thing");
    EXPECT_EQ(text(mb->eft->toString(mb, array, nullptr)), "{\"x\",NULL}");
    EXPECT_EQ(text(mb->eft->toString(mb, thing, nullptr)), "instance of Thing {\n    Id = \"x\";\n};\n");
    EXPECT_EQ(text(mb->eft->toString(mb, CMNewArgs(mb, nullptr), nullptr)), "CMPIArgs");
    EXPECT_EQ(mb->eft->toString(mb, nullptr, &status), nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_INVALID_HANDLE);
}

TEST_F(Services, KnowWhatAClassIs) {
    EXPECT_EQ(CMClassPathIsA(mb, path(), "base", nullptr), 1);
    EXPECT_EQ(CMClassPathIsA(mb, path(), "thing", nullptr), 1);
    EXPECT_EQ(CMClassPathIsA(mb, path("Base"), "Thing", nullptr), 0);
    EXPECT_EQ(CMClassPathIsA(mb, path("Unheard"), "unheard", nullptr), 1);
    EXPECT_EQ(CMClassPathIsA(mb, nullptr, "Thing", &status), 0);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_INVALID_HANDLE);
    EXPECT_EQ(CMClassPathIsA(mb, path(), nullptr, &status), 0);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_INVALID_PARAMETER);
}

TEST_F(Services, FillInMessages) {
    const CMPIString* insert = string("string");
    const auto type = [](CMPIType code) { return static_cast<int>(code); };
    EXPECT_EQ(text(mb->eft->getMessage(mb, "id", "$2 and $1, $3 $4 $5 $6 $7 $8 $$1", &status, 7, type(CMPI_chars),
                                       "chars", type(CMPI_string), insert, type(CMPI_sint32), -1, type(CMPI_uint32),
                                       2U, type(CMPI_uint64), 3ULL, type(CMPI_boolean), 1, type(CMPI_sint64), -4LL)),
              "string and chars, -1 2 3 true -4 $8 $1");
    EXPECT_EQ(status.rc, CMPI_RC_OK);
    EXPECT_EQ(text(mb->eft->getMessage2(mb, "id", nullptr, "$1", nullptr, 1, type(CMPI_real64), 0.5)), "0.500000");
    CMPIMsgFileHandle file = nullptr;
    EXPECT_EQ(mb->eft->openMessageFile(mb, "f", &file).rc, CMPI_RC_ERR_NOT_SUPPORTED);
    EXPECT_EQ(mb->eft->closeMessageFile(mb, file).rc, CMPI_RC_ERR_NOT_SUPPORTED);
}

TEST_F(Services, HandLogAndTraceLinesToTheLog) {
    EXPECT_EQ(CMLogMessage(mb, CMPI_SEV_WARNING, "id", "text", nullptr).rc, CMPI_RC_OK);
    EXPECT_EQ(CMTraceMessage(mb, CMPI_LEV_VERBOSE, "component", nullptr, string("string")).rc, CMPI_RC_OK);
    EXPECT_EQ(CMTraceMessage(mb, CMPI_LEV_VERBOSE, nullptr, nullptr, nullptr).rc, CMPI_RC_ERR_INVALID_PARAMETER);
    ASSERT_EQ(log.size(), 2U);
    EXPECT_FALSE(log[0].trace);
    EXPECT_EQ(log[0].level, CMPI_SEV_WARNING);
    EXPECT_EQ(log[0].component + "/" + log[0].text, "id/text");
    EXPECT_TRUE(log[1].trace);
    EXPECT_EQ(log[1].component + "/" + log[1].text, "component/string");
}

/** Remembers what it is given; throws at paths. */
struct RecordingSink final : broker::ResultSink {
    void instance(const CMPIInstance& instance) override {
        given.push_back(broker::Broker::toModel(instance).path.toString());
    }

    void path(const CMPIObjectPath&) override { throw std::runtime_error("sink"); }

    void data(const CMPIData& data) override { given.push_back(toText(broker::Broker::toModel(data))); }

    void error(CMPIrc code, const std::string& message) override {
        given.push_back(std::to_string(code) + " " + message);
    }

    std::vector<std::string> given;
};

TEST_F(Services, TakeResultsUntilDone) {
    RecordingSink sink;
    const broker::Result result(sink);
    const CMPIResult* handle = result.handle();
    const CMPIUint16 number = 3;
    EXPECT_EQ(CMReturnInstance(handle, instance()).rc, CMPI_RC_OK);
    EXPECT_EQ(CMReturnInstance(handle, nullptr).rc, CMPI_RC_ERR_INVALID_HANDLE);
    EXPECT_EQ(CMReturnObjectPath(handle, nullptr).rc, CMPI_RC_ERR_INVALID_HANDLE);
    EXPECT_EQ(CMReturnData(handle, &number, CMPI_uint16).rc, CMPI_RC_OK);
    EXPECT_EQ(CMReturnData(handle, "x", CMPI_chars).rc, CMPI_RC_OK);
    EXPECT_EQ(CMReturnData(handle, &number, 0x7F).rc, CMPI_RC_ERR_INVALID_DATA_TYPE);
    CMPIError* error = mb->eft->newCMPIError(mb, "o", "i", "bad", ErrorSeverityLow, ErrorProbCauseOther,
                                             CMPI_RC_ERR_FAILED, nullptr);
    EXPECT_EQ(handle->ft->returnError(handle, error).rc, CMPI_RC_OK);
    EXPECT_FALSE(result.isDone());
    EXPECT_EQ(CMReturnDone(handle).rc, CMPI_RC_OK);
    EXPECT_TRUE(result.isDone());
    EXPECT_EQ(CMReturnInstance(handle, instance()).rc, CMPI_RC_ERR_FAILED);
    EXPECT_EQ(sink.given, (std::vector<std::string>{"root/test:Thing", "3", "\"x\"", "1 bad"}));
    EXPECT_EQ(handle->ft->clone(handle, &status), nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_NOT_SUPPORTED);
}

TEST_F(Services, GiveResultsTheirCompletePath) {
    CMPIObjectPath* name = path();
    CMAddKey(name, "Id", "from path", CMPI_chars);
    CMPIInstance* thing = CMNewInstance(mb, name, nullptr);
    const CMPIUint16 number = 5;
    CMSetProperty(thing, "Id", "from property", CMPI_chars);
    CMSetProperty(thing, "number", &number, CMPI_uint16);
    RecordingSink sink;
    const broker::Result result(sink);
    CMReturnInstance(result.handle(), thing);
    EXPECT_EQ(sink.given, std::vector<std::string>{"root/test:Thing.Id=\"from path\",Number=5"});
}

TEST_F(Services, KeepWhatASinkThrowsFromTheProvider) {
    RecordingSink sink;
    const broker::Result result(sink);
    EXPECT_EQ(CMReturnObjectPath(result.handle(), path()).rc, CMPI_RC_ERR_FAILED);
    EXPECT_EQ(CMReturnInstance(result.handle(), instance()).rc, CMPI_RC_ERR_FAILED);
    EXPECT_TRUE(sink.given.empty());
    EXPECT_THROW(result.rethrow(), std::runtime_error);
}

/** Answers every operation with one thing, or with a failure when the class is "Bad". */
struct OneThing final : broker::UpCalls {
    static Instance thing(const std::string& nameSpace) {
        return {{"", nameSpace, "Thing", {{"Id", Value::string("1")}}}, {{"Id", Value::string("1")}}};
    }

    static broker::Outcome outcome(const ObjectPath& path) {
        return path.className == "Bad" ? broker::Outcome{CMPI_RC_ERR_ACCESS_DENIED, "no"} : broker::Outcome{};
    }

    broker::Outcome enumerateInstances(const ObjectPath& path, const PropertyNames& names,
                                       const InstanceSink& sink) override {
        asked = names;
        sink(thing(path.nameSpace));
        return outcome(path);
    }

    broker::Outcome enumerateInstanceNames(const ObjectPath& path, const PathSink& sink) override {
        sink(thing(path.nameSpace).path);
        return outcome(path);
    }

    broker::Outcome getInstance(const ObjectPath& path, const PropertyNames& names,
                                const InstanceSink& sink) override {
        asked = names;
        if (path.className == "Thing") {
            sink(thing(path.nameSpace));
        }
        return outcome(path);
    }

    broker::Outcome deliverIndication(const std::string& nameSpace, Instance&& indication) override {
        delivered = nameSpace + " " + indication.path.className;
        return {};
    }

    PropertyNames asked;
    std::string delivered;
};

class UpCallServices : public testing::Test {
  protected:
    CMPIObjectPath* path(const char* className) { return CMNewObjectPath(mb, "root/test", className, nullptr); }

    StaticSchema schema;
    OneThing upCalls;
    broker::Broker broker{schema, &upCalls};
    const CMPIBroker* mb = broker.handle();
    broker::CallScope scope;
    const CMPIContext* context = broker.newContext();
    CMPIStatus status{};
};

TEST_F(UpCallServices, GiveEnumerationsThatAreReadOnce) {
    const char* names[] = {"Id", nullptr};
    CMPIEnumeration* things = CBEnumInstances(mb, context, path("Thing"), names, &status);
    ASSERT_NE(things, nullptr);
    EXPECT_EQ(upCalls.asked, std::vector<std::string>{"Id"});
    CMPIEnumeration* clone = CMClone(things, nullptr);
    EXPECT_EQ(CMHasNext(things, nullptr), 1);
    const CMPIData data = CMGetNext(things, &status);
    EXPECT_EQ(data.type, CMPI_instance);
    EXPECT_STREQ(CMGetCharPtr(CMGetProperty(data.value.inst, "Id", nullptr).value.string), "1");
    EXPECT_EQ(CMHasNext(things, nullptr), 0);
    EXPECT_EQ(CMGetNext(things, &status).state, CMPI_nullValue | CMPI_notFound);
    EXPECT_EQ(status.rc, CMPI_RC_NO_MORE_ELEMENTS);
    const CMPIArray* all = things->ft->toArray(things, nullptr);
    EXPECT_EQ(CMGetArrayCount(all, nullptr), 1U);
    EXPECT_EQ(CMGetArrayType(all, nullptr), CMPI_instance);
    EXPECT_EQ(CMHasNext(clone, nullptr), 1);
    CMRelease(clone);
}

TEST_F(UpCallServices, GiveNamesAndSingleInstances) {
    CMPIEnumeration* names = CBEnumInstanceNames(mb, context, path("Thing"), &status);
    ASSERT_NE(names, nullptr);
    const CMPIData name = CMGetNext(names, nullptr);
    EXPECT_EQ(name.type, CMPI_ref);
    EXPECT_STREQ(CMGetCharPtr(CMObjectPathToString(name.value.ref, nullptr)), "root/test:Thing.Id=\"1\"");
    const CMPIInstance* thing = CBGetInstance(mb, context, name.value.ref, nullptr, &status);
    ASSERT_NE(thing, nullptr);
    EXPECT_EQ(upCalls.asked, std::nullopt);
    EXPECT_EQ(CBGetInstance(mb, context, path("Absent"), nullptr, &status), nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_NOT_FOUND);
}

TEST_F(UpCallServices, HandOnFailuresWithTheirText) {
    EXPECT_EQ(CBEnumInstances(mb, context, path("Bad"), nullptr, &status), nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_ACCESS_DENIED);
    EXPECT_EQ(broker::messageOf(status), "no");
    EXPECT_EQ(CBEnumInstanceNames(mb, context, path("Bad"), nullptr), nullptr);
    EXPECT_EQ(CBEnumInstances(mb, context, nullptr, nullptr, &status), nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_INVALID_HANDLE);
}

TEST_F(UpCallServices, DeliverIndications) {
    const CMPIInstance* event = CMNewInstance(mb, path("Event"), nullptr);
    EXPECT_EQ(CBDeliverIndication(mb, context, "root/test", event).rc, CMPI_RC_OK);
    EXPECT_EQ(upCalls.delivered, "root/test Event");
    EXPECT_EQ(CBDeliverIndication(mb, context, nullptr, event).rc, CMPI_RC_ERR_INVALID_PARAMETER);
    EXPECT_EQ(CBDeliverIndication(mb, context, "root/test", nullptr).rc, CMPI_RC_ERR_INVALID_HANDLE);
    EXPECT_EQ(CBDeliverIndication(mb, nullptr, "root/test", event).rc, CMPI_RC_ERR_INVALID_HANDLE);
}

TEST_F(Services, WithoutUpCallsAnswerNotSupported) {
    const CMPIContext* context = broker.newContext();
    EXPECT_EQ(CBEnumInstances(mb, context, path(), nullptr, &status), nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_NOT_SUPPORTED);
    EXPECT_EQ(CBDeliverIndication(mb, context, "root/test", instance()).rc, CMPI_RC_ERR_NOT_SUPPORTED);
}

TEST_F(UpCallServices, OfOtherKindsAreNotSupported) {
    const CMPIBrokerFT* bft = mb->bft;
    const CMPIObjectPath* name = path("Thing");
    const CMPIInstance* thing = CMNewInstance(mb, name, nullptr);
    CMPIArgs* args = CMNewArgs(mb, nullptr);
    const auto expectRefused = [this](bool empty) {
        EXPECT_TRUE(empty);
        EXPECT_EQ(status.rc, CMPI_RC_ERR_NOT_SUPPORTED);
        status = {};
    };
    expectRefused(bft->createInstance(mb, context, name, thing, &status) == nullptr);
    expectRefused(bft->execQuery(mb, context, name, "", "", &status) == nullptr);
    expectRefused(bft->associators(mb, context, name, "", "", "", "", nullptr, &status) == nullptr);
    expectRefused(bft->associatorNames(mb, context, name, "", "", "", "", &status) == nullptr);
    expectRefused(bft->references(mb, context, name, "", "", nullptr, &status) == nullptr);
    expectRefused(bft->referenceNames(mb, context, name, "", "", &status) == nullptr);
    expectRefused(CBInvokeMethod(mb, context, name, "Do", args, args, &status).state == CMPI_nullValue);
    expectRefused(bft->enumerateInstancesFiltered(mb, context, name, nullptr, "", "", &status) == nullptr);
    expectRefused(bft->associatorsFiltered(mb, context, name, "", "", "", "", nullptr, "", "", &status) == nullptr);
    expectRefused(bft->referencesFiltered(mb, context, name, "", "", nullptr, "", "", &status) == nullptr);
    EXPECT_EQ(CBModifyInstance(mb, context, name, thing, nullptr).rc, CMPI_RC_ERR_NOT_SUPPORTED);
    EXPECT_EQ(bft->deleteInstance(mb, context, name).rc, CMPI_RC_ERR_NOT_SUPPORTED);
    EXPECT_EQ(bft->setProperty(mb, context, name, "Id", nullptr, CMPI_string).rc, CMPI_RC_ERR_NOT_SUPPORTED);
}

TEST(FillIn, LeavesWhatIsNoPlaceholder) {
    EXPECT_EQ(broker::fillIn("", {}), "");
    EXPECT_EQ(broker::fillIn("$", {"x"}), "$");
    EXPECT_EQ(broker::fillIn("$0 $2 $x", {"x"}), "$0 $2 $x");
    EXPECT_EQ(broker::fillIn("$1$1", {"x"}), "xx");
}

} // namespace
} // namespace marlo::test

/** @file Every slot of every table is there. */
#include "host/broker/Broker.h"
#include "tests/support/StaticSchema.h"

#include <cstddef>
#include <cstring>

#include <gtest/gtest.h>

namespace marlo::test {
namespace {

/** All pointer-sized members from `first` to the end of a table, none of which may be null. */
template <typename Table>
void expectNoNullSlot(const Table& table, std::size_t first, const char* name) {
    for (std::size_t offset = first; offset < sizeof table; offset += sizeof(void*)) {
        void* slot = nullptr;
        std::memcpy(&slot, reinterpret_cast<const char*>(&table) + offset, sizeof slot);
        EXPECT_NE(slot, nullptr) << name << " at offset " << offset;
    }
}

template <typename Handle>
void expectWholeTable(const Handle* object, const char* name) {
    ASSERT_NE(object, nullptr) << name;
    EXPECT_NE(object->hdl, nullptr) << name;
    EXPECT_EQ(object->ft->ftVersion, 200) << name;
    expectNoNullSlot(*object->ft, offsetof(std::remove_cvref_t<decltype(*object->ft)>, release), name);
}

struct IgnoringSink final : broker::ResultSink {
    void instance(const CMPIInstance&) override {}

    void path(const CMPIObjectPath&) override {}

    void data(const CMPIData&) override {}

    void error(CMPIrc, const std::string&) override {}
};

TEST(Tables, OfTheBrokerHaveNoNullSlot) {
    const StaticSchema schema;
    const broker::Broker broker(schema);
    const CMPIBroker* handle = broker.handle();
    EXPECT_NE(handle->hdl, nullptr);
    EXPECT_EQ(handle->bft->brokerVersion, 200);
    EXPECT_STREQ(handle->bft->brokerName, "marlo");
    EXPECT_EQ(handle->eft->ftVersion, 200);
    EXPECT_EQ(handle->xft->ftVersion, 200);
    EXPECT_EQ(handle->mft->ftVersion, 200);
    expectNoNullSlot(*handle->bft, offsetof(CMPIBrokerFT, brokerName), "bft");
    expectNoNullSlot(*handle->eft, offsetof(CMPIBrokerEncFT, newInstance), "eft");
    expectNoNullSlot(*handle->xft, offsetof(CMPIBrokerExtFT, resolveFileName), "xft");
    expectNoNullSlot(*handle->mft, offsetof(CMPIBrokerMemFT, mark), "mft");
}

struct SilentUpCalls final : broker::UpCalls {
    broker::Outcome enumerateInstances(const ObjectPath&, const PropertyNames&, const InstanceSink&) override {
        return {};
    }

    broker::Outcome enumerateInstanceNames(const ObjectPath&, const PathSink&) override { return {}; }

    broker::Outcome getInstance(const ObjectPath&, const PropertyNames&, const InstanceSink&) override { return {}; }

    broker::Outcome deliverIndication(const std::string&, Instance&&) override { return {}; }
};

TEST(Tables, OfEncapsulatedObjectsHaveNoNullSlot) {
    const StaticSchema schema;
    SilentUpCalls upCalls;
    const broker::Broker broker(schema, &upCalls);
    const broker::CallScope scope;
    const CMPIBroker* mb = broker.handle();
    const CMPIContext* context = broker.newContext();
    const CMPIObjectPath* path = mb->eft->newObjectPath(mb, "root/test", "Thing", nullptr);
    IgnoringSink sink;
    const broker::Result result(sink);
    expectWholeTable(context, "context");
    expectWholeTable(path, "object path");
    expectWholeTable(mb->eft->newInstance(mb, path, nullptr), "instance");
    expectWholeTable(mb->eft->newArgs(mb, nullptr), "args");
    expectWholeTable(mb->eft->newString(mb, "", nullptr), "string");
    expectWholeTable(mb->eft->newArray(mb, 0, CMPI_string, nullptr), "array");
    expectWholeTable(mb->eft->newDateTime(mb, nullptr), "date-time");
    expectWholeTable(mb->eft->newCMPIError(mb, nullptr, nullptr, nullptr, ErrorSeverityLow, ErrorProbCauseOther,
                                           CMPI_RC_ERR_FAILED, nullptr),
                     "error");
    expectWholeTable(mb->bft->enumerateInstances(mb, context, path, nullptr, nullptr), "enumeration");
    expectWholeTable(result.handle(), "result");
    expectWholeTable(mb->eft->newSelectExp(mb, "SELECT * FROM Thing", "WQL", nullptr, nullptr), "select expression");
}

} // namespace
} // namespace marlo::test

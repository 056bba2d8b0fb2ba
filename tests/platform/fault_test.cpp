/**
 * @file
 * Object managers that fail: no failure of theirs crashes the provider or passes through it.
 */
#include "tests/platform/PlatformProvider.h"

#include <cmpimacs.h>

namespace marlo::test {
namespace {

constexpr const char* hardware = "[[card]]\nname = \"eth0\"\n[[port]]\nidentity = \"eth0\"\n";

/** A broker whose factory table a test may change. */
class FaultyBroker : public testing::TestWithParam<const char*> {
  protected:
    FaultyBroker() : _factories(*real().eft), _broker(real()) { _broker.eft = &_factories; }

    ~FaultyBroker() override { PlatformProvider restored(GetParam()); } // the factory keeps the last broker

    FaultyBroker(const FaultyBroker&) = delete;
    FaultyBroker& operator=(const FaultyBroker&) = delete;

    static const CMPIBroker& real() { return *PlatformProvider::sharedBroker().handle(); }

    CMPIBrokerEncFT& factories() { return _factories; }

    void expectFailure(const std::string& reason) const {
        const PlatformProvider provider(GetParam(), &_broker);
        const Answer answer = provider.instances();
        EXPECT_EQ(answer.code, CMPI_RC_ERR_FAILED);
        EXPECT_EQ(answer.message, reason);
        EXPECT_FALSE(answer.done);
    }

  private:
    DescribedHost _host{hardware};
    CMPIBrokerEncFT _factories;
    CMPIBroker _broker;
};

INSTANTIATE_TEST_SUITE_P(Classes, FaultyBroker, testing::Values("TAVIS_NetworkCard", "TAVIS_NetworkPort"),
                         [](const auto& tested) { return std::string(tested.param); });

TEST_P(FaultyBroker, ThatMakesNoPathIsReported) {
    factories().newObjectPath = [](const CMPIBroker*, const char*, const char*, CMPIStatus* status) {
        CMSetStatus(status, CMPI_RC_ERR_SERVER_LIMITS_EXCEEDED);
        return static_cast<CMPIObjectPath*>(nullptr);
    };
    expectFailure("the object manager did not create an object path (status 27)");
}

TEST_P(FaultyBroker, ThatMakesNoInstanceIsReported) {
    factories().newInstance = [](const CMPIBroker*, const CMPIObjectPath*, CMPIStatus* status) {
        CMSetStatus(status, CMPI_RC_ERR_INVALID_CLASS);
        return static_cast<CMPIInstance*>(nullptr);
    };
    expectFailure("the object manager did not create an instance (status 5)");
}

TEST_P(FaultyBroker, ThatReportsAnErrorBesideAnInstanceIsReported) {
    factories().newInstance = [](const CMPIBroker* broker, const CMPIObjectPath* path, CMPIStatus* status) {
        CMPIInstance* instance = real().eft->newInstance(broker, path, nullptr);
        CMSetStatus(status, CMPI_RC_ERR_FAILED);
        return instance;
    };
    expectFailure("the object manager did not create an instance (status 1)");
}

TEST_P(FaultyBroker, ThatThrowsAnExceptionIsReportedWithItsText) {
    factories().newInstance = [](const CMPIBroker*, const CMPIObjectPath*, CMPIStatus*) -> CMPIInstance* {
        throw std::runtime_error("out of instances");
    };
    expectFailure("out of instances");
}

TEST_P(FaultyBroker, ThatThrowsSomethingElseIsReported) {
    factories().newInstance = [](const CMPIBroker*, const CMPIObjectPath*, CMPIStatus*) -> CMPIInstance* {
        throw 42; // NOLINT(hicpp-exception-baseclass): an object manager may
    };
    expectFailure("the request failed, and what was thrown does not say why");
}

TEST_P(FaultyBroker, ThatCannotEvenMakeATextGetsTheStatusAlone) {
    factories().newInstance = [](const CMPIBroker*, const CMPIObjectPath*, CMPIStatus*) -> CMPIInstance* {
        throw std::runtime_error("out of instances");
    };
    factories().newString = [](const CMPIBroker*, const char*, CMPIStatus*) -> CMPIString* {
        throw std::runtime_error("out of strings");
    };
    expectFailure("");
}

/** A result that takes nothing. */
class RefusingSink final : public broker::ResultSink {
  public:
    void instance(const CMPIInstance& /*instance*/) override { throw std::runtime_error("enough"); }

    void path(const CMPIObjectPath& /*path*/) override { throw std::runtime_error("enough"); }

    void data(const CMPIData& /*data*/) override {}

    void error(CMPIrc /*code*/, const std::string& /*message*/) override {}
};

TEST(RefusingResult, EndsTheAnswerWithTheBrokersStatus) {
    const DescribedHost host(std::string(hardware) + "[[port]]\nidentity = \"eth1\"\n");
    const PlatformProvider provider("TAVIS_NetworkPort");
    const broker::CallScope scope;
    RefusingSink sink;
    const broker::Result result(sink);
    const auto* path = provider.broker().newObjectPath({"", "root/quarn", "TAVIS_NetworkPort", {}});
    CMPIInstanceMI* mi = provider.mi();
    EXPECT_NE(mi->ft->enumerateInstances(mi, provider.broker().newContext(), result.handle(), path, nullptr).rc,
              CMPI_RC_OK);
    EXPECT_NE(mi->ft->enumerateInstanceNames(mi, provider.broker().newContext(), result.handle(), path).rc,
              CMPI_RC_OK);
    EXPECT_FALSE(result.isDone());
}

} // namespace
} // namespace marlo::test

#include "host/security/SelfSigned.h"
#include "tests/delivery/DeliveryFixture.h"

#include <fstream>

namespace marlo::delivery {
namespace {

using testing::HasSubstr;

/** A listener over TLS whose certificate is for the names given, signed by itself. */
class SecureListeners : public DeliveryFixture {
  protected:
    Listener::Identity identity(const std::vector<std::string>& names) const {
        const security::Key key = security::makeKey();
        const Listener::Identity files{directory.file("listener.pem"), directory.file("listener.key")};
        std::ofstream(files.keyFile) << security::toPem(key);
        std::ofstream(files.certificateFile)
            << security::toPem(security::makeCertificate(key, names, std::chrono::hours(24)));
        return files;
    }

    /** What the counters say after a failure; empty when the indication has arrived. */
    std::string errorOf(const Destination& destination) {
        const auto delivery = open();
        delivery->setDestination(destination);
        delivery->setSubscription({"a", "a", OnFatalError::ignore, {}});
        delivery->start();
        post(*delivery, 0, 1);
        EXPECT_TRUE(eventually([&] {
            const Counters counters = countersOf(*delivery);
            return counters.sent == 1 || counters.retried > 0;
        }));
        return countersOf(*delivery).lastError;
    }
};

TEST_F(SecureListeners, AreBelievedWhenSomebodyTrustedVouches) {
    const Listener::Identity files = identity({"localhost", "127.0.0.1"});
    const Listener listener(Listener::accept, files);
    EXPECT_EQ(errorOf({"a", listener.url("localhost"), true, files.certificateFile}), "");
    EXPECT_EQ(errorOf({"a", listener.url("127.0.0.1"), true, files.certificateFile}), "");
    EXPECT_EQ(listener.numbers(), upTo(2));
}

TEST_F(SecureListeners, AreNotBelievedOnTheirOwnWord) {
    const Listener listener(Listener::accept, identity({"localhost"}));
    EXPECT_THAT(errorOf({"a", listener.url("localhost"), true, {}}),
                HasSubstr("TLS: the certificate is not good: self-signed certificate"));
    EXPECT_EQ(listener.received().size(), 0U);
}

TEST_F(SecureListeners, MustBeTheHostOfTheUrl) {
    const Listener::Identity files = identity({"elsewhere.example.com"});
    const Listener listener(Listener::accept, files);
    EXPECT_THAT(errorOf({"a", listener.url("localhost"), true, files.certificateFile}),
                HasSubstr("hostname mismatch"));
    EXPECT_THAT(errorOf({"a", listener.url("127.0.0.1"), true, files.certificateFile}),
                HasSubstr("IP address mismatch"));
    EXPECT_EQ(listener.received().size(), 0U);
}

TEST_F(SecureListeners, AreTakenAsTheyAreWhereNothingIsVerified) {
    const Listener listener(Listener::accept, identity({"elsewhere.example.com"}));
    EXPECT_EQ(errorOf({"a", listener.url("localhost"), false, {}}), "");
    EXPECT_EQ(listener.numbers(), upTo(1));
}

TEST_F(SecureListeners, KeepTheirConnection) {
    const Listener::Identity files = identity({"localhost"});
    const Listener listener(Listener::accept, files);
    const auto delivery = open();
    delivery->setDestination({"a", listener.url("localhost"), true, files.certificateFile});
    delivery->setSubscription({"a", "a", OnFatalError::ignore, {}});
    delivery->start();
    post(*delivery, 0, 50);
    ASSERT_TRUE(listener.await(50));
    EXPECT_EQ(listener.numbers(), upTo(50));
    EXPECT_EQ(listener.connections(), 1);
}

TEST_F(SecureListeners, AreBelievedByWhatTheFileOfAuthoritiesSaysNow) {
    const Listener::Identity files = identity({"localhost"});
    const Listener listener(Listener::accept, files);
    const security::Key other = security::makeKey();
    const std::string authorities = directory.file("authorities.pem");
    std::ofstream(authorities) << security::toPem(
        security::makeCertificate(other, {"localhost"}, std::chrono::hours(24)));
    const auto delivery = open();
    const Destination destination{"a", listener.url("localhost"), true, authorities};
    delivery->setDestination(destination);
    delivery->setSubscription({"a", "a", OnFatalError::ignore, {}});
    delivery->start();
    post(*delivery, 0, 1);
    ASSERT_TRUE(eventually([&] { return countersOf(*delivery).retried > 0; }));
    std::filesystem::copy(files.certificateFile, authorities, std::filesystem::copy_options::overwrite_existing);
    delivery->setDestination(destination);
    EXPECT_TRUE(listener.await(1));
}

TEST_F(SecureListeners, ThatSpeakPlainHttpAreTriedAgain) {
    options.connectTime = std::chrono::milliseconds(200);
    const Listener listener;
    const std::string url = "https" + listener.url("localhost").substr(4);
    EXPECT_THAT(errorOf({"a", url, false, {}}), HasSubstr("TLS: "));
}

} // namespace
} // namespace marlo::delivery

/** @file Listeners with https: whom the server believes, and what becomes of it when its configuration changes. */
#include "tests/subscriptions/SubscribedServer.h"

#include <filesystem>
#include <optional>
#include <thread>

namespace marlo::test {
namespace {

using testing::AllOf;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::SizeIs;

/** A listener with a certificate that an authority of the test's own has signed. */
class Trust : public SubscribedServer {
  protected:
    Trust() {
        makeAuthority("lab");
        makeAuthority("other");
        configure("indications", "unverified = []\nauthorities = \"trusted.pem\"\n");
        trust("other");
    }

    void openssl(std::vector<std::string> arguments) const {
        arguments.insert(arguments.begin(), "openssl");
        const Outcome outcome = runProgram(arguments, {}, "", directory());
        ASSERT_EQ(outcome.exitCode, 0) << testing::PrintToString(arguments) << outcome.err;
    }

    void makeAuthority(const std::string& name) const {
        openssl({"req", "-x509", "-newkey", "ec", "-pkeyopt", "ec_paramgen_curve:P-256", "-nodes", "-days", "2",
                 "-subj", "/CN=" + name, "-keyout", name + ".key", "-out", name + ".pem"});
    }

    /** The file of authorities has this one from now on. */
    void trust(const std::string& authority) const {
        std::filesystem::copy_file(path(authority + ".pem"), path("trusted.pem"),
                                   std::filesystem::copy_options::overwrite_existing);
    }

    /** Listens by a certificate of the authority "lab" for a host. */
    void listenAs(const std::string& host) {
        write("extensions", "subjectAltName=DNS:" + host + "\n");
        openssl({"req", "-newkey", "ec", "-pkeyopt", "ec_paramgen_curve:P-256", "-nodes", "-subj", "/CN=" + host,
                 "-keyout", "listener.key", "-out", "listener.csr"});
        openssl({"x509", "-req", "-in", "listener.csr", "-CA", "lab.pem", "-CAkey", "lab.key", "-set_serial", "1",
                 "-days", "1", "-extfile", "extensions", "-out", "listener.pem"});
        secure.emplace(marlo::delivery::Listener::accept,
                       marlo::delivery::Listener::Identity{path("listener.pem"), path("listener.key")});
    }

    void subscribe() {
        start();
        EXPECT_THAT(json({"subscribe", secure->url("localhost"), "MARLO_NetworkAdapterOfflineEvent"}), SizeIs(1));
    }

    /** An event of eth2, which the listener gets, or why it does not. */
    [[nodiscard]] std::string errorOfEvent() const {
        const std::size_t before = secure->received().size();
        const unsigned retried = delivery()["retried"];
        play("status eth2 1\nstatus eth2 12\n");
        const auto end = std::chrono::steady_clock::now() + Patience;
        while (std::chrono::steady_clock::now() < end) {
            if (secure->received().size() > before) {
                return "";
            }
            if (const auto counters = delivery(); counters["retried"] > retried && counters["queued"] > 0) {
                return counters["last_error"];
            }
            std::this_thread::sleep_for(std::chrono::milliseconds(20));
        }
        return "nothing happened";
    }

    [[nodiscard]] nlohmann::json delivery() const { return json({"status"})["deliveries"][0]; }

    std::optional<marlo::delivery::Listener> secure;
};

constexpr const char* unknownAuthority = "TLS: the certificate is not good: unable to get local issuer certificate";

TEST_F(Trust, IsNotForListenersOfAnUnknownAuthorityUntilItIsNamed) {
    listenAs("localhost");
    subscribe();
    EXPECT_THAT(errorOfEvent(), HasSubstr(unknownAuthority));
    EXPECT_THAT(command({"status"}).out, HasSubstr(unknownAuthority));
    EXPECT_THAT(secure->received(), IsEmpty());
    readAnew("trusted.pem", "lab.pem");
    ASSERT_TRUE(secure->await(1, Patience)) << "what waits goes to whom is trusted by now";
    EXPECT_EQ(errorOfEvent(), "");
    EXPECT_EQ(secure->numbers(), (std::vector<std::int64_t>{0, 1}));
}

TEST_F(Trust, IsWhatTheFileOfAuthoritiesSaysWhenTheConfigurationIsReadAnew) {
    listenAs("localhost");
    subscribe();
    EXPECT_THAT(errorOfEvent(), HasSubstr(unknownAuthority));
    trust("lab");
    readAnew("trusted.pem", "trusted.pem");
    ASSERT_TRUE(secure->await(1, Patience));
    trust("other");
    readAnew("trusted.pem", "trusted.pem");
    EXPECT_THAT(errorOfEvent(), HasSubstr(unknownAuthority));
    EXPECT_THAT(secure->received(), SizeIs(1));
}

TEST_F(Trust, IsThereFromTheStartWhereTheAuthorityIsNamed) {
    listenAs("localhost");
    trust("lab");
    subscribe();
    EXPECT_EQ(errorOfEvent(), "");
    EXPECT_EQ(stop(), 0);
    start();
    EXPECT_EQ(errorOfEvent(), "");
}

TEST_F(Trust, IsNotForListenersOfAnotherNameUnlessNobodyLooks) {
    listenAs("elsewhere.example.com");
    trust("lab");
    subscribe();
    EXPECT_THAT(errorOfEvent(), HasSubstr("hostname mismatch"));
    EXPECT_THAT(secure->received(), IsEmpty());
    readAnew("unverified = []", "unverified = [\"127.0.0.1\"]");
    EXPECT_THAT(errorOfEvent(), HasSubstr("hostname mismatch")) << "that is another host";
    readAnew("unverified = [\"127.0.0.1\"]", "unverified = [\"localhost\"]");
    ASSERT_TRUE(secure->await(2, Patience));
    EXPECT_EQ(secure->numbers(), (std::vector<std::int64_t>{0, 1}));
}

TEST_F(Trust, ThatIsTakenBackEndsTheConnection) {
    listenAs("localhost");
    subscribe();
    readAnew("unverified = []", "unverified = [\"localhost\"]");
    EXPECT_EQ(errorOfEvent(), "");
    readAnew("unverified = [\"localhost\"]", "unverified = []");
    EXPECT_THAT(errorOfEvent(), HasSubstr(unknownAuthority));
    EXPECT_THAT(secure->received(), SizeIs(1));
}

TEST_F(Trust, StaysAsItIsWhereTheFileOfAuthoritiesIsNone) {
    listenAs("localhost");
    trust("lab");
    subscribe();
    EXPECT_EQ(errorOfEvent(), "");
    write("trusted.pem", "no certificates\n");
    readAnew("trusted.pem", "trusted.pem");
    EXPECT_THAT(log(), AllOf(HasSubstr("goes on with what it had"), HasSubstr("cannot use the authorities in")));
    EXPECT_THAT(command({"status"}).out, HasSubstr("cannot use the authorities in"));
    play("status eth2 1\nstatus eth2 12\n");
    EXPECT_TRUE(secure->await(2, Patience));
}

} // namespace
} // namespace marlo::test

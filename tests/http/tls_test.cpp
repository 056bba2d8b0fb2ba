#include "tests/http/ServerFixture.h"
#include "tests/http/TlsClient.h"

#include <fstream>
#include <string>

#include <openssl/tls1.h>

namespace {

using namespace marlo::http;
using std::chrono::milliseconds;

class Tls : public ServerFixture {
  protected:
    static void SetUpTestSuite() {
        certificates = std::make_unique<Certificates>();
        certificates->make("server", "/CN=first");
        certificates->make("other", "/CN=second");
        certificates->make("authority", "/CN=authority");
        certificates->issue("good", "/CN=anna", "authority");
        certificates->issue("double", "/CN=anna/CN=root", "authority");
        certificates->issue("nameless", "/O=nobody", "authority");
        certificates->make("stranger", "/CN=anna");
    }

    static void TearDownTestSuite() { certificates.reset(); }

    Tls() {
        endpoints = {{Transport::tls, "127.0.0.1", 0, 0}};
        tls = certificates->server("server");
        handler.onHandle = [](Request&& request, Responder& responder) {
            responder.send({200, {}, request.peer.commonName.value_or("nobody") + " " + request.body, true, {}});
        };
    }

    void askForCertificates(bool isRequired) {
        tls->clientCaFile = certificates->file("authority.pem");
        tls->clientCertificate = isRequired;
    }

    TlsClient tlsClient(const TlsClient::Options& options = {}) {
        return {server().endpoints().front(), *certificates, options};
    }

    /** What the handler said, or nothing. */
    std::string answerTo(TlsClient& asking) {
        asking.send(get());
        const std::string text = asking.read(std::string::npos);
        const auto end = text.find("\r\n\r\n");
        return end == std::string::npos ? "" : text.substr(end + 4);
    }

    static std::unique_ptr<Certificates> certificates;
};

std::unique_ptr<Certificates> Tls::certificates;

TEST_F(Tls, IsAnsweredInVersionsOnePointTwoAndUp) {
    for (const auto& [version, name] : {std::pair(TLS1_2_VERSION, "TLSv1.2"), std::pair(TLS1_3_VERSION, "TLSv1.3")}) {
        TlsClient asking = tlsClient({version, "", "", false});
        ASSERT_TRUE(asking.isConnected());
        EXPECT_EQ(asking.version(), name);
        EXPECT_EQ(answerTo(asking), "nobody ");
    }
}

TEST_F(Tls, IsRefusedInOlderVersions) {
    for (const int version : {TLS1_VERSION, TLS1_1_VERSION}) {
        EXPECT_FALSE(tlsClient({version, "ALL", "", false}).isConnected());
    }
    EXPECT_TRUE(comesTrue([this] { return lines.count("TLS with 127.0.0.1:") == 2; }));
}

TEST_F(Tls, HasNoCiphersWithoutForwardSecrecyOrAuthentication) {
    for (const std::string ciphers :
         {"AES128-GCM-SHA256", "ECDHE-ECDSA-AES128-SHA", "ECDHE-ECDSA-AES256-SHA384", "aNULL", "eNULL"}) {
        EXPECT_FALSE(tlsClient({TLS1_2_VERSION, ciphers, "", false}).isConnected()) << ciphers;
    }
    EXPECT_EQ(tlsClient({TLS1_2_VERSION, "ALL", "", false}).cipher().substr(0, 11), "ECDHE-ECDSA");
}

TEST_F(Tls, IsNotRenegotiated) {
    TlsClient asking = tlsClient({TLS1_2_VERSION, "", "", false});
    ASSERT_TRUE(asking.isConnected());
    EXPECT_FALSE(asking.renegotiate() && !answerTo(asking).empty());
}

TEST_F(Tls, CarriesBodiesOfAnySize) {
    handler.onHandle = [](Request&& request, Responder& responder) {
        responder.begin(200, {});
        responder.write(request.body);
        responder.finish();
    };
    for (const std::size_t size : {1U, 16384U, 16385U, 65000U, 1000000U}) {
        const std::string body(size, 'b');
        TlsClient asking = tlsClient();
        asking.send("POST / HTTP/1.0\r\nContent-Length: " + std::to_string(size) + "\r\n\r\n" + body);
        const std::string text = asking.read(std::string::npos);
        EXPECT_EQ(text.substr(text.find("\r\n\r\n") + 4), body);
    }
}

TEST_F(Tls, CarriesManyRequestsInOneRecord) {
    handler.onHandle = [](Request&& request, Responder& responder) {
        responder.send({200, {}, request.head.target, false, {}});
    };
    TlsClient asking = tlsClient();
    std::string all;
    for (int count = 0; count < 100; ++count) {
        all += get("/" + std::to_string(count));
    }
    asking.send(all + "GET /last HTTP/1.0\r\n\r\n");
    const std::string text = asking.read(std::string::npos);
    EXPECT_NE(text.find("/99"), std::string::npos);
    EXPECT_EQ(text.substr(text.size() - 5), "/last");
}

TEST_F(Tls, KeepsWhoHasACertificateThatIsVouchedFor) {
    askForCertificates(true);
    TlsClient asking = tlsClient({0, "", "good", false});
    EXPECT_EQ(answerTo(asking), "anna ");
}

TEST_F(Tls, TurnsAwayWhoHasNoneWhereOneIsRequired) {
    askForCertificates(true);
    for (const int version : {TLS1_2_VERSION, TLS1_3_VERSION}) {
        TlsClient asking = tlsClient({version, "", "", false});
        EXPECT_EQ(answerTo(asking), "");
    }
}

TEST_F(Tls, TurnsAwayWhomNobodyVouchesFor) {
    for (const bool isRequired : {true, false}) {
        endServer();
        askForCertificates(isRequired);
        TlsClient asking = tlsClient({0, "", "stranger", false});
        EXPECT_EQ(answerTo(asking), "");
    }
}

TEST_F(Tls, TakesThoseWithoutACertificateWhereItIsAnOption) {
    askForCertificates(false);
    TlsClient without = tlsClient();
    EXPECT_EQ(answerTo(without), "nobody ");
    TlsClient with = tlsClient({0, "", "good", false});
    EXPECT_EQ(answerTo(with), "anna ");
}

TEST_F(Tls, KnowsNobodyByACertificateWithTwoNamesOrNone) {
    askForCertificates(true);
    for (const std::string name : {"double", "nameless"}) {
        TlsClient asking = tlsClient({0, "", name, false});
        EXPECT_EQ(answerTo(asking), "nobody ") << name;
    }
}

TEST_F(Tls, TakesNewCertificatesForNewConnections) {
    TlsClient before = tlsClient();
    EXPECT_EQ(before.serverName(), "first");
    server().reloadTls(certificates->server("other"));
    EXPECT_EQ(tlsClient().serverName(), "second");
    EXPECT_EQ(answerTo(before), "nobody ");
}

TEST_F(Tls, KeepsItsCertificateWhenTheNewOneIsNoGood) {
    server();
    EXPECT_THROW(server().reloadTls(certificates->server("none")), std::runtime_error);
    EXPECT_EQ(tlsClient().serverName(), "first");
}

TEST_F(Tls, NamesTheFileThatIsNoGood) {
    const auto problem = [this](const TlsOptions& options) -> std::string {
        try {
            server().reloadTls(options);
        } catch (const std::runtime_error& error) {
            return error.what();
        }
        return "";
    };
    const auto file = [](const std::string& name) { return certificates->file(name); };
    EXPECT_EQ(problem({file("none.pem"), file("server.key"), "", false}),
              "TLS: cannot use the certificate " + file("none.pem") + ": No such file or directory");
    EXPECT_EQ(problem({file("server.pem"), file("none.key"), "", false}),
              "TLS: cannot use the private key " + file("none.key") + ": No such file or directory");
    EXPECT_EQ(problem({file("server.pem"), file("other.key"), "", false}),
              "TLS: cannot use the private key " + file("other.key") + ": key values mismatch");
    EXPECT_EQ(problem({file("server.pem"), file("server.key"), file("none.pem"), false}),
              "TLS: cannot use the client authorities " + file("none.pem") + ": No such file or directory");
    EXPECT_EQ(problem({file("server.pem"), file("server.key"), "", true}),
              "TLS: client certificates are required, and no file says whose are good");
    std::ofstream(file("broken.key")) << "no key";
    EXPECT_EQ(problem({file("server.pem"), file("broken.key"), "", false}),
              "TLS: cannot use the private key " + file("broken.key") + ": unsupported");
}

TEST_F(Tls, ClosesPlainRequestsAtOnce) {
    RawClient asking = clientOf(0);
    const auto start = std::chrono::steady_clock::now();
    asking.send(get());
    asking.readToEnd();
    EXPECT_LT(std::chrono::steady_clock::now() - start, milliseconds(5000));
    EXPECT_TRUE(comesTrue([this] { return lines.count("http request") == 1; }));
}

TEST_F(Tls, EndsHandshakesThatTakeTooLong) {
    limits.headTime = milliseconds(100);
    RawClient asking = clientOf(0);
    EXPECT_TRUE(asking.isEndedWithin(milliseconds(10000)));
}

TEST_F(Tls, SurvivesClientsThatVanish) {
    limits.gathered = 1000;
    handler.onHandle = [](Request&&, Responder& responder) {
        responder.begin(200, {});
        for (int count = 0; count < 100000; ++count) {
            responder.write(std::string(10000, 'b'));
        }
    };
    {
        TlsClient asking = tlsClient();
        asking.send(get());
        EXPECT_NE(asking.read(1), "");
    }
    EXPECT_TRUE(comesTrue([this] { return server().counters().connections == 0; }));
    EXPECT_TRUE(lines.all().empty());
}

} // namespace

#include "host/server/Configuration.h"
#include "host/server/Endpoints.h"

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <optional>
#include <stdexcept>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

namespace marlo::server {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

/** A directory with a configuration file in it. */
class ServerConfiguration : public testing::Test {
  protected:
    ServerConfiguration() {
        std::string pattern = testing::TempDir() + "marlo-server-XXXXXX";
        if (mkdtemp(pattern.data()) == nullptr) {
            throw std::runtime_error("mkdtemp failed");
        }
        _directory = pattern;
    }

    ~ServerConfiguration() override { std::filesystem::remove_all(_directory); }

    [[nodiscard]] std::string path(const std::string& name) const { return _directory + "/" + name; }

    [[nodiscard]] Configuration read(const std::string& text) const {
        std::ofstream(path("server.toml")) << text;
        return readConfiguration(path("server.toml"));
    }

    /** Why a file with this text is refused. */
    [[nodiscard]] std::string refusal(const std::string& text) const {
        try {
            static_cast<void>(read(text));
        } catch (const std::exception& error) {
            return error.what();
        }
        return "";
    }

  private:
    std::string _directory;
};

std::vector<std::string> texts(const std::optional<std::vector<http::Endpoint>>& endpoints) {
    std::vector<std::string> result;
    for (const http::Endpoint& endpoint : endpoints.value()) {
        result.push_back(toString(endpoint));
    }
    return result;
}

TEST_F(ServerConfiguration, IsTheUsualOneWhereTheFileSaysNothing) {
    const Configuration configuration = read("");
    EXPECT_EQ(configuration.file, path("server.toml"));
    EXPECT_FALSE(configuration.listen.http);
    EXPECT_FALSE(configuration.listen.https);
    EXPECT_FALSE(configuration.listen.socket);
    EXPECT_THAT(configuration.access.read, ElementsAre("root"));
    EXPECT_THAT(configuration.access.change, ElementsAre("root"));
    EXPECT_EQ(configuration.pamService, "marlo");
    EXPECT_EQ(configuration.log.sink, "stderr");
    EXPECT_EQ(configuration.limits.workers, http::Limits().workers);
}

TEST_F(ServerConfiguration, TakesEveryKey) {
    std::filesystem::create_directories(path("mof"));
    std::filesystem::create_directories(path("reg"));
    std::ofstream(path("ca.pem")) << "";
    const Configuration configuration = read(R"(
[listen]
http = ["127.0.0.1:1", "[::1]:2"]
https = ["0.0.0.0:3"]
socket = "m.sock"
[access]
read = ["*"]
change = ["alice", "@sudo"]
subscribe = []
pam_service = "login"
[tls]
certificate = "c.pem"
key = "/k.pem"
client_ca = "ca.pem"
require_client_certificate = true
[directories]
schema = ["mof"]
providers = ["reg"]
state = "s"
[log]
level = "warning"
format = "json"
sink = "file:log"
[indications]
authorities = "ca.pem"
unverified = ["station.example"]
queue_length = 7
queue_bytes = 65536
[limits]
connections = 10
connections_per_peer = 5
workers = 2
head_bytes = 2048
body_bytes = 4096
head_seconds = 1
body_seconds = 2
idle_seconds = 3
send_seconds = 4
)");
    EXPECT_THAT(texts(configuration.listen.http), ElementsAre("127.0.0.1:1", "[::1]:2"));
    EXPECT_THAT(texts(configuration.listen.https), ElementsAre("0.0.0.0:3"));
    EXPECT_EQ(configuration.listen.socket, path("m.sock"));
    EXPECT_THAT(configuration.access.read, ElementsAre("*"));
    EXPECT_THAT(configuration.access.change, ElementsAre("alice", "@sudo"));
    EXPECT_THAT(configuration.access.subscribe, IsEmpty());
    EXPECT_EQ(configuration.pamService, "login");
    EXPECT_EQ(configuration.tls.certificateFile, path("c.pem"));
    EXPECT_EQ(configuration.tls.keyFile, "/k.pem");
    EXPECT_EQ(configuration.tls.clientCaFile, path("ca.pem"));
    EXPECT_TRUE(configuration.tls.clientCertificate);
    EXPECT_THAT(configuration.schema, ElementsAre(path("mof")));
    EXPECT_THAT(configuration.providers, ElementsAre(path("reg")));
    EXPECT_EQ(configuration.stateDirectory, path("s"));
    EXPECT_EQ(configuration.log.level, LogLevel::warning);
    EXPECT_EQ(configuration.log.format, LogFormat::json);
    EXPECT_EQ(configuration.log.sink, "file:" + path("log"));
    EXPECT_EQ(configuration.indications, (IndicationOptions{path("ca.pem"), {"station.example"}, 7, 65536}));
    EXPECT_EQ(configuration.limits.connections, 10U);
    EXPECT_EQ(configuration.limits.connectionsPerPeer, 5U);
    EXPECT_EQ(configuration.limits.workers, 2U);
    EXPECT_EQ(configuration.limits.headBytes, 2048U);
    EXPECT_EQ(configuration.limits.bodyBytes, 4096U);
    EXPECT_EQ(configuration.limits.headTime, std::chrono::seconds(1));
    EXPECT_EQ(configuration.limits.bodyTime, std::chrono::seconds(2));
    EXPECT_EQ(configuration.limits.idleTime, std::chrono::seconds(3));
    EXPECT_EQ(configuration.limits.sendTime, std::chrono::seconds(4));
}

TEST_F(ServerConfiguration, TellsListeningNowhereFromSayingNothing) {
    const Configuration configuration = read("[listen]\nhttp = []\nsocket = \"\"\n");
    EXPECT_THAT(texts(configuration.listen.http), IsEmpty());
    EXPECT_EQ(configuration.listen.socket, "");
}

TEST_F(ServerConfiguration, RefusesWhatDoesNotBelongWithFileLineKeyAndReason) {
    const std::string file = path("server.toml");
    const std::vector<std::pair<std::string, std::string>> cases = {
        {"[listen]\nport = 5988\n", ":2: listen.port: unknown key"},
        {"colour = 1\n", ":1: colour: unknown key"},
        {"[listen]\n\nhttp = [\"0.0.0.0:5988\"]\n",
         ":3: listen.http: 0.0.0.0:5988 is beyond loopback, where passwords go by TLS only: list it under https"},
        {"[listen]\nhttp = [\"localhost:5988\"]\n",
         ":2: listen.http: expected a numeric address, found \"localhost:5988\""},
        {"[listen]\nhttps = [\"127.0.0.1\"]\n", ":2: listen.https: expected an address and a port"},
        {"[listen]\nhttps = [\"127.0.0.1:65536\"]\n",
         ":2: listen.https: expected a port from 0 to 65535, found \"65536\""},
        {"[access]\nread = \"root\"\n", ":2: access.read: expected a list of strings"},
        {"[access]\npam_service = \"../x\"\n", ":2: access.pam_service: expected the name of a file in /etc/pam.d"},
        {"[tls]\ncertificate = \"c.pem\"\n", ":2: tls.certificate: certificate and key go together"},
        {"[tls]\nrequire_client_certificate = true\n", ":2: tls.require_client_certificate: needs client_ca"},
        {"[directories]\nschema = [\"nowhere\"]\n",
         ":2: directories.schema: " + path("nowhere") + " is no directory"},
        {"[log]\nlevel = \"loud\"\n", ":2: log.level: expected \"error\", \"warning\", \"info\" or \"debug\""},
        {"[log]\nformat = \"xml\"\n", ":2: log.format: expected \"logfmt\" or \"json\", found \"xml\""},
        {"[log]\nsink = \"file:\"\n", ":2: log.sink: expected \"stderr\", \"syslog\" or \"file:PATH\""},
        {"[limits]\nworkers = 0\n", ":2: limits.workers: expected at least 1"},
        {"[limits]\nworkers = 257\n", ":2: limits.workers: expected an integer from 0 to 256, found 257"},
        {"[limits]\nidle_seconds = -1\n", ":2: limits.idle_seconds: expected an integer"},
        {"[log\n", ":1: "},
    };
    for (const auto& [text, reason] : cases) {
        EXPECT_THAT(refusal(text), HasSubstr(file + reason)) << text;
    }
}

TEST_F(ServerConfiguration, IsShownByAnExampleThatSaysWhatHoldsAnyway) {
    const Configuration example = readConfiguration(MARLO_EXAMPLE_CONFIGURATION);
    const Configuration usual;
    EXPECT_THAT(texts(example.listen.http), ElementsAre("127.0.0.1:5988", "[::1]:5988"));
    EXPECT_THAT(texts(example.listen.https), ElementsAre("127.0.0.1:5989", "[::1]:5989"));
    EXPECT_FALSE(example.listen.socket);
    EXPECT_EQ(example.access.read, usual.access.read);
    EXPECT_EQ(example.access.change, usual.access.change);
    EXPECT_EQ(example.access.subscribe, usual.access.subscribe);
    EXPECT_EQ(example.pamService, usual.pamService);
    EXPECT_EQ(example.tls.certificateFile, "");
    EXPECT_EQ(example.log.level, usual.log.level);
    EXPECT_EQ(example.log.format, usual.log.format);
    EXPECT_EQ(example.log.sink, usual.log.sink);
    EXPECT_EQ(example.limits, usual.limits);
    EXPECT_THAT(example.schema, IsEmpty());
    EXPECT_THAT(example.providers, IsEmpty());
}

TEST_F(ServerConfiguration, MustBeThereWhereItIsNamed) {
    EXPECT_THROW(static_cast<void>(loadConfiguration(path("none.toml"))), std::system_error);
}

TEST_F(ServerConfiguration, PutsThingsWhereThisUserMay) {
    const Places places = usualPlaces();
    if (::geteuid() == 0) {
        EXPECT_EQ(places.socket, "/run/marlo/marlo.sock");
        EXPECT_EQ(places.state, "/var/lib/marlo");
    } else {
        EXPECT_THAT(places.state, HasSubstr("/marlo"));
        EXPECT_NE(places.state, "/var/lib/marlo");
    }
}

TEST(Endpoints, ReadAddressesOfBothKinds) {
    const http::Endpoint four = parseEndpoint("127.0.0.2:80", http::Transport::tcp);
    EXPECT_EQ(four.address, "127.0.0.2");
    EXPECT_EQ(four.port, 80);
    const http::Endpoint six = parseEndpoint("[2001:db8::1]:0", http::Transport::tls);
    EXPECT_EQ(six.address, "2001:db8::1");
    EXPECT_EQ(six.port, 0);
    EXPECT_EQ(toString(six), "[2001:db8::1]:0");
    EXPECT_EQ(toString({http::Transport::local, "/run/x.sock", 0}), "/run/x.sock");
}

TEST(Endpoints, RefuseWhatIsNone) {
    for (const char* text : {"", ":", "127.0.0.1", "127.0.0.1:", "127.0.0.1:x", "127.0.0.1:-1", "::1:80", "[::1]",
                             "[::1]80", "[127.0.0.1]:80", "::1", "]:80", "[]:1", "localhost:80", "1.2.3:80"}) {
        EXPECT_THROW(static_cast<void>(parseEndpoint(text, http::Transport::tls)), std::invalid_argument) << text;
    }
}

TEST(Endpoints, KnowLoopback) {
    for (const char* text : {"127.0.0.1", "127.255.0.3", "::1"}) {
        EXPECT_TRUE(isLoopback(text)) << text;
    }
    for (const char* text : {"0.0.0.0", "128.0.0.1", "::", "::2", "fe80::1", "::ffff:127.0.0.1", "x", ""}) {
        EXPECT_FALSE(isLoopback(text)) << text;
    }
}

} // namespace
} // namespace marlo::server

#include "host/http/Sockets.h"
#include "tests/http/ServerFixture.h"

#include <filesystem>
#include <fstream>
#include <string>
#include <vector>

#include <sys/stat.h>
#include <unistd.h>

namespace {

using namespace marlo::http;
using std::chrono::milliseconds;

/** Where a server listens. */
class Endpoints : public ServerFixture {
  protected:
    Endpoints() {
        std::string name = (std::filesystem::temp_directory_path() / "http.XXXXXX").string();
        directory = ::mkdtemp(name.data());
    }

    ~Endpoints() override { std::filesystem::remove_all(directory); }

    std::string socketPath() const { return (directory / "socket").string(); }

    void listenLocally(unsigned mode = 0666) { endpoints = {{Transport::local, socketPath(), 0, mode}}; }

    std::string problem() {
        try {
            server();
        } catch (const std::runtime_error& error) {
            return error.what();
        }
        return "";
    }

    std::filesystem::path directory;
};

TEST_F(Endpoints, MayBeSeveral) {
    endpoints = {Endpoint(), {Transport::tcp, "::1", 0, 0}, {Transport::local, socketPath(), 0, 0666}};
    handler.onHandle = [](Request&& request, Responder& responder) {
        responder.send({200, {}, request.peer.toString(), false, {}});
    };
    std::vector<std::string> peers;
    for (std::size_t index = 0; index < 3; ++index) {
        RawClient asking = clientOf(index);
        asking.send(get());
        peers.push_back(asking.readAnswer().body);
    }
    EXPECT_EQ(peers[0].substr(0, 10), "127.0.0.1:");
    EXPECT_EQ(peers[1].substr(0, 6), "[::1]:");
    EXPECT_EQ(peers[2], "local uid " + std::to_string(::getuid()));
}

TEST_F(Endpoints, ThatAreTakenAreNamed) {
    server();
    ServerFixture::endpoints = {server().endpoints().front()};
    const std::string port = std::to_string(server().endpoints().front().port);
    try {
        const Server second(handler, endpoints, std::nullopt, limits, lines.sink());
        FAIL() << "two servers on one port";
    } catch (const std::runtime_error& error) {
        EXPECT_EQ(std::string(error.what()), "cannot listen on 127.0.0.1:" + port + ": Address already in use");
    }
}

TEST_F(Endpoints, AreNumbers) {
    endpoints = {{Transport::tcp, "localhost", 0, 0}};
    EXPECT_EQ(problem(), "cannot listen on localhost:0: not a numeric address");
}

TEST_F(Endpoints, OfTlsNeedACertificate) {
    endpoints = {{Transport::tls, "127.0.0.1", 0, 0}};
    EXPECT_EQ(problem(), "cannot listen on 127.0.0.1:0: there is no certificate");
}

TEST_F(Endpoints, OnAPathHaveItsMode) {
    for (const unsigned mode : {0666U, 0600U}) {
        listenLocally(mode);
        server();

        struct stat file {};

        ASSERT_EQ(::stat(socketPath().c_str(), &file), 0);
        EXPECT_EQ(file.st_mode & 07777U, mode);
        endServer();
    }
}

TEST_F(Endpoints, OnAPathAreRemovedWithTheServer) {
    listenLocally();
    server();
    EXPECT_TRUE(std::filesystem::exists(socketPath()));
    server().stop(milliseconds(0));
    EXPECT_FALSE(std::filesystem::exists(socketPath()));
}

TEST_F(Endpoints, OnAPathLeaveTheSocketOfASuccessor) {
    listenLocally();
    server();
    std::filesystem::remove(socketPath());
    ScriptedHandler other;
    Server successor(other, endpoints, std::nullopt, limits, lines.sink());
    endServer();
    EXPECT_TRUE(std::filesystem::exists(socketPath()));
}

TEST_F(Endpoints, OnAPathReplaceASocketThatWasLeftBehind) {
    listenLocally();
    { const Descriptor left = listenOn(endpoints.front()); }
    ASSERT_TRUE(std::filesystem::exists(socketPath()));
    RawClient asking = clientOf(0);
    asking.send(get());
    EXPECT_EQ(asking.readAnswer().status, 200U);
}

TEST_F(Endpoints, OnAPathLeaveASocketOnWhichSomebodyAnswers) {
    listenLocally();
    server();
    EXPECT_THROW(Server(handler, endpoints, std::nullopt, limits, lines.sink()), std::runtime_error);
    RawClient asking = clientOf(0);
    asking.send(get());
    EXPECT_EQ(asking.readAnswer().status, 200U);
}

TEST_F(Endpoints, OnAPathLeaveWhatIsNoSocket) {
    listenLocally();
    std::ofstream(socketPath()) << "mine";
    EXPECT_EQ(problem(), "cannot listen on " + socketPath() + ": there is a file that is no socket");
    EXPECT_TRUE(std::filesystem::exists(socketPath()));
}

TEST_F(Endpoints, OnAPathNeedItsDirectory) {
    endpoints = {{Transport::local, (directory / "none" / "socket").string(), 0, 0666}};
    EXPECT_EQ(problem(), "cannot listen on " + endpoints.front().address + ": No such file or directory");
}

TEST_F(Endpoints, OnAPathHaveOneThatTheSystemCanTake) {
    endpoints = {{Transport::local, std::string(108, 'x'), 0, 0666}};
    EXPECT_EQ(problem(), "cannot listen on " + std::string(108, 'x') + ": a path has between 1 and 107 bytes");
}

} // namespace

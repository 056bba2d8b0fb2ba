/**
 * @file
 * A server with a scripted handler, made when it is first asked for, so that a test can set its limits before.
 */
#pragma once

#include "tests/http/RawClient.h"
#include "tests/http/ScriptedHandler.h"

#include <memory>
#include <optional>
#include <string>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

namespace marlo::http {

class ServerFixture : public testing::Test {
  protected:
    Server& server() {
        if (!_server) {
            _server = std::make_unique<Server>(handler, endpoints, tls, limits, lines.sink());
        }
        return *_server;
    }

    void endServer() { _server.reset(); }

    /** Over a pair of sockets. */
    RawClient client() { return RawClient::servedBy(server()); }

    RawClient clientOf(std::size_t endpoint) { return RawClient::connectTo(server().endpoints().at(endpoint)); }

    /** Looks again and again, for at most 20 s. */
    template <typename Condition>
    static bool comesTrue(Condition condition) {
        for (int looks = 0; looks < 4000; ++looks) {
            if (condition()) {
                return true;
            }
            std::this_thread::sleep_for(std::chrono::milliseconds(5));
        }
        return false;
    }

    static std::string get(const std::string& target = "/") {
        return "GET " + target + " HTTP/1.1\r\nHost: x\r\n\r\n";
    }

    static std::string post(const std::string& body, const std::string& fields = "") {
        return "POST / HTTP/1.1\r\nHost: x\r\n" + fields + "Content-Length: " + std::to_string(body.size()) +
               "\r\n\r\n" + body;
    }

    ScriptedHandler handler;
    std::vector<Endpoint> endpoints{Endpoint()};
    std::optional<TlsOptions> tls;
    Limits limits;
    Lines lines;

  private:
    std::unique_ptr<Server> _server;
};

} // namespace marlo::http

// The server of host/http with a handler that has nothing to do: what is left is the server's own cost.
#include "host/http/Server.h"

#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <string>

namespace {

using namespace marlo::http;

class FixedHandler : public Handler {
  public:
    explicit FixedHandler(std::size_t bytes) : _body(bytes, 'x') {}

    std::optional<Answer> admit(const RequestHead& /*head*/, const Peer& /*peer*/, std::any& /*admission*/) override {
        return std::nullopt;
    }

    void handle(Request&& /*request*/, Responder& responder) override {
        responder.begin(200, {{"Content-Type", "application/xml; charset=utf-8"}});
        responder.write(_body);
        responder.finish();
    }

    Answer refuse(unsigned status, const std::string& reason) override { return {status, {}, reason, false, {}}; }

  private:
    const std::string _body;
};

} // namespace

/** Argument: bytes of the body. Prints where it listens; runs until it is interrupted. */
int main(int count, char** arguments) {
    sigset_t signals;
    sigemptyset(&signals);
    sigaddset(&signals, SIGTERM);
    sigaddset(&signals, SIGINT);
    sigprocmask(SIG_BLOCK, &signals, nullptr);
    FixedHandler handler(count > 1 ? std::strtoul(arguments[1], nullptr, 10) : 2048);
    Server server(handler, {Endpoint()}, std::nullopt, {}, [](const std::string& line) { std::puts(line.c_str()); });
    std::printf("127.0.0.1:%u\n", static_cast<unsigned>(server.endpoints().front().port));
    std::fflush(stdout);
    int signal = 0;
    sigwait(&signals, &signal);
}

// What answering over HTTP costs with the library alone: every request gets the same bytes. What a server that reads
// requests, finds out who asks and makes an answer reaches of this is what all of that costs.
#include <boost/asio/executor_work_guard.hpp>
#include <boost/asio/io_context.hpp>
#include <boost/asio/ip/tcp.hpp>
#include <boost/asio/post.hpp>
#include <boost/beast/core/flat_buffer.hpp>
#include <boost/beast/http/read.hpp>
#include <boost/beast/http/string_body.hpp>
#include <boost/beast/http/write.hpp>
#include <cstdio>
#include <cstdlib>
#include <memory>
#include <string>
#include <thread>
#include <vector>

namespace {

namespace asio = boost::asio;
namespace beast = boost::beast;
namespace http = beast::http;
using asio::ip::tcp;
using beast::error_code;

class Session : public std::enable_shared_from_this<Session> {
  public:
    Session(tcp::socket socket, const std::string& body) : _socket(std::move(socket)) {
        _response.version(11);
        _response.result(http::status::ok);
        _response.set(http::field::content_type, "application/xml; charset=utf-8");
        _response.set(http::field::date, "Thu, 01 Jan 1970 00:00:00 GMT");
        _response.body() = body;
        _response.prepare_payload();
    }

    void read() {
        _request = {};
        http::async_read(_socket, _buffer, _request, [self = shared_from_this()](error_code error, std::size_t) {
            if (!error) {
                self->write();
            }
        });
    }

  private:
    void write() {
        http::async_write(_socket, _response, [self = shared_from_this()](error_code error, std::size_t) {
            if (!error) {
                self->read();
            }
        });
    }

    tcp::socket _socket;
    beast::flat_buffer _buffer;
    http::request<http::string_body> _request;
    http::response<http::string_body> _response;
};

/** A context for each thread, so that threads share nothing; connections are dealt out in turn. */
class Service {
  public:
    Service(std::size_t threads, std::string body) : _body(std::move(body)) {
        for (std::size_t count = 0; count < threads; ++count) {
            _contexts.push_back(std::make_unique<asio::io_context>(1));
        }
        _acceptor =
            std::make_unique<tcp::acceptor>(*_contexts.front(), tcp::endpoint(asio::ip::address_v4::loopback(), 0));
    }

    void run() {
        std::printf("127.0.0.1:%u\n", static_cast<unsigned>(_acceptor->local_endpoint().port()));
        std::fflush(stdout);
        accept();
        std::vector<std::thread> threads;
        for (const auto& context : _contexts) {
            threads.emplace_back([&context] {
                const auto guard = asio::make_work_guard(*context);
                context->run();
            });
        }
        for (std::thread& thread : threads) {
            thread.join();
        }
    }

  private:
    void accept() {
        asio::io_context& context = *_contexts[_turn++ % _contexts.size()];
        _acceptor->async_accept(context, [this, &context](error_code error, tcp::socket socket) {
            if (!error) {
                socket.set_option(tcp::no_delay(true));
                const auto session = std::make_shared<Session>(std::move(socket), _body);
                asio::post(context, [session] { session->read(); });
            }
            accept();
        });
    }

    std::string _body;
    std::vector<std::unique_ptr<asio::io_context>> _contexts;
    std::unique_ptr<tcp::acceptor> _acceptor;
    std::size_t _turn = 0;
};

} // namespace

/** Arguments: bytes of the body, threads. Prints where it listens; runs until it is killed. */
int main(int count, char** arguments) {
    const std::size_t bytes = count > 1 ? std::strtoul(arguments[1], nullptr, 10) : 2048;
    const std::size_t threads = count > 2 ? std::strtoul(arguments[2], nullptr, 10) : 2;
    Service(threads, std::string(bytes, 'x')).run();
}

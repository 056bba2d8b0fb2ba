#include "host/server/LocalClient.h"

#include <boost/asio/io_context.hpp>
#include <boost/asio/local/stream_protocol.hpp>
#include <boost/beast/core/basic_stream.hpp>
#include <boost/beast/core/flat_buffer.hpp>
#include <boost/beast/http/parser.hpp>
#include <boost/beast/http/read.hpp>
#include <boost/beast/http/string_body.hpp>
#include <boost/beast/http/write.hpp>
#include <string>
#include <utility>

namespace marlo::server {

namespace {

namespace asio = boost::asio;
namespace beast = boost::beast;
using Error = boost::system::error_code;

constexpr unsigned httpVersion = 11;
constexpr std::uint64_t longestAnswer = std::uint64_t{256} * 1024 * 1024;

/** One request and its answer; asynchronous, since only then there is a time-out. */
class Exchange {
  public:
    using Request = beast::http::request<beast::http::string_body>;

    Exchange(std::string socket, Request request)
        : _stream(_context), _socket(std::move(socket)), _request(std::move(request)) {
        _request.set(beast::http::field::host, "localhost");
        _request.keep_alive(false);
        _request.prepare_payload();
        _response.body_limit(longestAnswer);
    }

    LocalAnswer run(std::chrono::milliseconds patience) {
        _stream.expires_after(patience);
        _stream.async_connect(asio::local::stream_protocol::endpoint(_socket), [this](Error error) { send(error); });
        _context.run();
        if (_error) {
            throw NotRunning(_socket + ": " + _error.message());
        }
        return {_response.get().result_int(), _response.get().body()};
    }

  private:
    using Stream = beast::basic_stream<asio::local::stream_protocol>;

    void send(Error error) {
        if (!keeps(error)) {
            beast::http::async_write(_stream, _request, [this](Error failed, std::size_t) { receive(failed); });
        }
    }

    void receive(Error error) {
        if (!keeps(error)) {
            beast::http::async_read(_stream, _buffer, _response,
                                    [this](Error failed, std::size_t) { keeps(failed); });
        }
    }

    /** True when there was an error. */
    bool keeps(Error error) {
        _error = error;
        return error.failed();
    }

    asio::io_context _context;
    Stream _stream;
    std::string _socket;
    beast::flat_buffer _buffer;
    Request _request;
    beast::http::response_parser<beast::http::string_body> _response;
    Error _error;
};

LocalAnswer exchange(const std::string& socket, Exchange::Request request, std::chrono::milliseconds patience) {
    try {
        return Exchange(socket, std::move(request)).run(patience);
    } catch (const boost::system::system_error& error) { // a path that is too long, for instance
        throw NotRunning(socket + ": " + error.what());
    }
}

} // namespace

LocalAnswer askLocally(const std::string& socket, const std::string& path, std::chrono::milliseconds patience) {
    return exchange(socket, Exchange::Request(beast::http::verb::get, path, httpVersion), patience);
}

LocalAnswer operateLocally(const std::string& socket, const std::string& method, const std::string& nameSpace,
                           const std::string& document, std::chrono::milliseconds patience) {
    Exchange::Request request(beast::http::verb::post, "/cimom", httpVersion, document);
    request.set(beast::http::field::content_type, "application/xml; charset=\"utf-8\"");
    request.set("CIMOperation", "MethodCall");
    request.set("CIMMethod", method);
    request.set("CIMObject", nameSpace);
    return exchange(socket, std::move(request), patience);
}

} // namespace marlo::server

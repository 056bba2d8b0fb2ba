#include "host/server/LocalClient.h"

#include <boost/asio/io_context.hpp>
#include <boost/asio/local/stream_protocol.hpp>
#include <boost/beast/core/basic_stream.hpp>
#include <boost/beast/core/flat_buffer.hpp>
#include <boost/beast/http/empty_body.hpp>
#include <boost/beast/http/read.hpp>
#include <boost/beast/http/string_body.hpp>
#include <boost/beast/http/write.hpp>

namespace marlo::server {

namespace {

namespace asio = boost::asio;
namespace beast = boost::beast;
using Error = boost::system::error_code;

/** One request and its answer; asynchronous, since only then there is a time-out. */
class Exchange {
  public:
    Exchange(const std::string& socket, const std::string& path) : _stream(_context), _socket(socket) {
        _request.method(beast::http::verb::get);
        _request.target(path);
        _request.set(beast::http::field::host, "localhost");
        _request.keep_alive(false);
    }

    LocalAnswer run(std::chrono::milliseconds patience) {
        _stream.expires_after(patience);
        _stream.async_connect(asio::local::stream_protocol::endpoint(_socket), [this](Error error) { send(error); });
        _context.run();
        if (_error) {
            throw NotRunning(_socket + ": " + _error.message());
        }
        return {_response.result_int(), _response.body()};
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
    beast::http::request<beast::http::empty_body> _request;
    beast::http::response<beast::http::string_body> _response;
    Error _error;
};

} // namespace

LocalAnswer askLocally(const std::string& socket, const std::string& path, std::chrono::milliseconds patience) {
    try {
        return Exchange(socket, path).run(patience);
    } catch (const boost::system::system_error& error) { // a path that is too long, for instance
        throw NotRunning(socket + ": " + error.what());
    }
}

} // namespace marlo::server

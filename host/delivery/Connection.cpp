#include "host/delivery/Connection.h"

#include "host/delivery/NetworkAsio.h"

#include <array>
#include <boost/asio/ip/tcp.hpp>
#include <boost/asio/ssl/context.hpp>
#include <boost/asio/ssl/stream.hpp>
#include <boost/asio/write.hpp>
#include <boost/beast/core/flat_buffer.hpp>
#include <boost/beast/core/tcp_stream.hpp>
#include <boost/beast/http/error.hpp>
#include <boost/beast/http/parser.hpp>
#include <boost/beast/http/read.hpp>
#include <boost/beast/http/string_body.hpp>
#include <optional>
#include <type_traits>
#include <utility>

#include <openssl/ssl.h>
#include <openssl/x509v3.h>

namespace marlo::delivery {
namespace {

namespace asio = boost::asio;
namespace beast = boost::beast;
namespace http = boost::beast::http;
using asio::ip::tcp;
using boost::system::error_code;

using Plain = beast::tcp_stream;
using Secure = asio::ssl::stream<Plain>;
using Parser = http::response_parser<http::string_body>;

constexpr int mostInterim = 4; ///< answers of status 1xx before the one that counts

/** The other end closed, in any of the ways in which it shows. */
bool isClosed(const error_code& error) {
    return error == http::error::end_of_stream || error == asio::error::eof ||
           error == asio::error::connection_reset || error == asio::error::broken_pipe ||
           error == asio::ssl::error::stream_truncated;
}

std::string textOf(const error_code& error) {
    if (error == beast::error::timeout) {
        return "not in time";
    }
    if (isClosed(error) || error == http::error::partial_message) {
        return "the listener closed the connection";
    }
    return error.message();
}

Plain& lowest(Plain& stream) {
    return stream;
}

Plain& lowest(Secure& stream) {
    return stream.next_layer();
}

template <typename Stream>
class Wire final : public Connection, public std::enable_shared_from_this<Wire<Stream>> {
  public:
    template <typename... Arguments>
    Wire(const Options& options, Url url, Arguments&&... arguments)
        : _options(options), _url(std::move(url)), _stream(std::forward<Arguments>(arguments)...) {}

    void open(const std::vector<std::string>& addresses, Opened opened) override {
        _opened = std::move(opened);
        std::vector<tcp::endpoint> endpoints;
        for (const std::string& address : addresses) {
            error_code error;
            const auto ip = asio::ip::make_address(address, error);
            if (!error) {
                endpoints.emplace_back(ip, _url.port);
            }
        }
        lowest(_stream).expires_after(_options.connectTime);
        lowest(_stream).async_connect(
            endpoints, [self = this->shared_from_this()](const error_code& error, const tcp::endpoint& /*end*/) {
                self->onConnected(error);
            });
    }

    void exchange(std::string&& head, std::string&& body, Answered answered) override {
        _head = std::move(head);
        _body = std::move(body);
        _answered = std::move(answered);
        _interim = 0;
        lowest(_stream).expires_after(_options.exchangeTime);
        const std::array<asio::const_buffer, 2> all{asio::buffer(_head), asio::buffer(_body)};
        asio::async_write(_stream, all,
                          [self = this->shared_from_this()](const error_code& error, std::size_t /*sent*/) {
                              self->onSent(error);
                          });
    }

    void close() override {
        _opened = nullptr;
        _answered = nullptr;
        lowest(_stream).close();
    }

    /** Names the host to servers that have several, and to the check of the certificate. */
    void expectHost(bool isVerified) {
        SSL* ssl = _stream.native_handle();
        X509_VERIFY_PARAM* parameters = SSL_get0_param(ssl);
        if (X509_VERIFY_PARAM_set1_ip_asc(parameters, _url.host.c_str()) == 1) {
            return; // an address, which is no name to ask for
        }
        SSL_set_tlsext_host_name(ssl, const_cast<char*>(_url.host.c_str()));
        if (isVerified) {
            X509_VERIFY_PARAM_set_hostflags(parameters, X509_CHECK_FLAG_NO_PARTIAL_WILDCARDS);
            X509_VERIFY_PARAM_set1_host(parameters, _url.host.c_str(), 0);
        }
    }

  private:
    void onConnected(const error_code& error) {
        if (error) {
            tellOpened("cannot connect: " + textOf(error));
            return;
        }
        error_code ignored;
        lowest(_stream).socket().set_option(tcp::no_delay(true), ignored);
        if constexpr (std::is_same_v<Stream, Secure>) {
            _stream.async_handshake(
                asio::ssl::stream_base::client,
                [self = this->shared_from_this()](const error_code& failure) { self->onShaken(failure); });
        } else {
            tellOpened({});
        }
    }

    void onShaken(const error_code& error) {
        if (!error) {
            tellOpened({});
            return;
        }
        const long verdict = SSL_get_verify_result(_stream.native_handle());
        tellOpened(verdict == X509_V_OK
                       ? "TLS: " + textOf(error)
                       : std::string("TLS: the certificate is not good: ") + X509_verify_cert_error_string(verdict));
    }

    void tellOpened(const std::string& problem) {
        if (const Opened opened = std::exchange(_opened, nullptr)) {
            opened(problem);
        }
    }

    void onSent(const error_code& error) {
        if (error) {
            tellProblem(error);
        } else {
            read();
        }
    }

    void read() {
        _parser.emplace();
        _parser->header_limit(static_cast<std::uint32_t>(_options.answerHeadBytes));
        _parser->body_limit(_options.answerBodyBytes);
        http::async_read(_stream, _buffer, *_parser,
                         [self = this->shared_from_this()](const error_code& error, std::size_t /*count*/) {
                             self->onRead(error);
                         });
    }

    void onRead(const error_code& error) {
        if (error) {
            tellProblem(error);
            return;
        }
        const unsigned status = _parser->get().result_int();
        if (status >= 100 && status < 200 && ++_interim <= mostInterim) {
            read();
            return;
        }
        Answer answer;
        answer.status = status;
        const auto cimError = _parser->get()["CIMError"];
        answer.cimError.assign(cimError.data(), cimError.size());
        answer.body = std::move(_parser->get().body());
        // What comes unasked would be taken for the answer to the next request.
        answer.keepsAlive = _parser->get().keep_alive() && _buffer.size() == 0;
        _parser.reset();
        tell(std::move(answer));
    }

    void tellProblem(const error_code& error) {
        Answer answer;
        answer.problem = "no answer: " + textOf(error);
        answer.wasClosed = isClosed(error) && _buffer.size() == 0 && (!_parser || !_parser->got_some());
        tell(std::move(answer));
    }

    void tell(Answer&& answer) {
        if (const Answered answered = std::exchange(_answered, nullptr)) {
            answered(std::move(answer));
        }
    }

    const Options& _options;
    const Url _url;
    Stream _stream;
    beast::flat_buffer _buffer;
    std::optional<Parser> _parser;
    std::string _head;
    std::string _body;
    int _interim = 0;
    Opened _opened;
    Answered _answered;
};

} // namespace

std::shared_ptr<Connection> Connection::make(Network& network, const Options& options, const Url& url,
                                             const TlsClient& tls, bool isVerified) {
    asio::io_context& context = network.asio().context;
    if (!tls) {
        return std::make_shared<Wire<Plain>>(options, url, context);
    }
    SSL_CTX_up_ref(tls.get()); // the wrapper gives it back
    asio::ssl::context wrapper(tls.get());
    auto wire = std::make_shared<Wire<Secure>>(options, url, context, wrapper);
    wire->expectHost(isVerified);
    return wire;
}

} // namespace marlo::delivery

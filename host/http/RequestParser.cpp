#include "host/http/RequestParser.h"

#include "host/http/Fault.h"
#include "host/http/FieldText.h"

#include <algorithm>
#include <boost/asio/buffer.hpp>
#include <boost/beast/http/basic_parser.hpp>
#include <optional>
#include <utility>

namespace marlo::http {
namespace {

using boost::beast::error_code;
using boost::beast::http::error;

constexpr std::string_view lineEnd = "\r\n";

unsigned statusOf(const error_code& code) {
    if (code == error::header_limit) {
        return 431;
    }
    if (code == error::body_limit) {
        return 413;
    }
    return code == error::bad_version ? 505 : 400;
}

std::string_view toView(boost::beast::string_view text) {
    return {text.data(), text.size()};
}

bool isControl(char character) {
    return (static_cast<unsigned char>(character) < ' ' && character != '\t') || character == '\x7f';
}

} // namespace

/** Collects what the library's parser finds. */
class RequestParser::Beast : public boost::beast::http::basic_parser<true> {
    using field = boost::beast::http::field;
    using view = boost::beast::string_view;

  public:
    RequestHead head;
    std::optional<Framing> framing;
    std::string* body = nullptr;
    std::size_t limit = 0; ///< of the body
    std::size_t size = 0;  ///< of the body so far

  private:
    void on_request_impl(boost::beast::http::verb, view method, view target, int version, error_code&) override {
        head.method = toView(method);
        head.target = toView(target);
        head.version = static_cast<unsigned>(version);
    }

    void on_response_impl(int, view, int, error_code&) override {}

    void on_field_impl(field, view name, view value, error_code&) override {
        if (!framing) { // what comes behind the body is no part of the head
            head.fields.push_back({std::string(toView(name)), std::string(toView(value))});
        }
    }

    void on_header_impl(error_code&) override { framing = framingOf(head); }

    void on_body_init_impl(const boost::optional<std::uint64_t>&, error_code&) override {}

    std::size_t on_body_impl(view bytes, error_code& code) override { return take(bytes, code); }

    /** Some readers end a line at a bare LF and would see another chunk behind an extension. */
    void on_chunk_header_impl(std::uint64_t, view extensions, error_code& code) override {
        if (std::any_of(extensions.begin(), extensions.end(), isControl)) {
            code = error::bad_chunk_extension;
        }
    }

    std::size_t on_chunk_body_impl(std::uint64_t, view bytes, error_code& code) override { return take(bytes, code); }

    void on_finish_impl(error_code&) override {}

    std::size_t take(view bytes, error_code& code) {
        if (size > limit || bytes.size() > limit - size) {
            code = error::body_limit;
            return 0;
        }
        size += bytes.size();
        body->append(bytes.data(), bytes.size());
        return bytes.size();
    }
};

RequestParser::RequestParser(std::size_t headBytes) : _headBytes(headBytes) {
    reset();
}

RequestParser::~RequestParser() = default;

void RequestParser::reset() {
    _scanned = 0;
    _beast = std::make_unique<Beast>();
    _beast->header_limit(static_cast<std::uint32_t>(_headBytes));
    // Counted here, since the head is wanted before its body is refused. (No limit at all would be below every
    // length.)
    _beast->body_limit(std::numeric_limits<std::uint64_t>::max());
}

bool RequestParser::hasHead() const {
    return _beast->framing.has_value();
}

bool RequestParser::isDone() const {
    return hasHead() && _beast->is_done();
}

RequestHead& RequestParser::head() {
    return _beast->head;
}

const RequestHead& RequestParser::head() const {
    return _beast->head;
}

const Framing& RequestParser::framing() const {
    return *_beast->framing;
}

std::size_t RequestParser::findEnd(std::string_view bytes) {
    while (_scanned < bytes.size()) {
        const auto feed = bytes.find('\n', _scanned);
        if (feed == std::string_view::npos) {
            _scanned = bytes.size();
            return 0;
        }
        if (feed == 0 || bytes[feed - 1] != '\r') {
            throw Fault(400, "a line ends without CR");
        }
        if (feed >= 3 && bytes.substr(feed - 3, 2) == lineEnd) {
            return feed + 1;
        }
        if (feed + 1 == bytes.size()) { // what comes next tells whether the line goes on
            _scanned = feed;
            return 0;
        }
        if (bytes[feed + 1] == ' ' || bytes[feed + 1] == '\t') {
            throw Fault(400, "a line begins with a space");
        }
        _scanned = feed + 1;
    }
    return 0;
}

std::size_t RequestParser::readHead(std::string_view bytes) {
    std::size_t skipped = 0; // empty lines in front of a request are ignored, as is usual (RFC 9112, 2.2)
    while (_scanned == 0 && bytes.substr(skipped, 2) == lineEnd) {
        skipped += 2;
    }
    bytes.remove_prefix(skipped);
    if (bytes.empty() || bytes == "\r") {
        return skipped;
    }
    if (!isTokenCharacter(bytes.front())) {
        throw Fault(400, "no method");
    }
    const std::size_t end = findEnd(bytes.substr(0, _headBytes));
    if (end == 0) {
        if (bytes.size() >= _headBytes) {
            throw Fault(431, "the head is longer than " + std::to_string(_headBytes) + " bytes");
        }
        return skipped;
    }
    error_code code;
    const std::size_t used = _beast->put(boost::asio::const_buffer(bytes.data(), end), code);
    if (code || used != end || !hasHead()) {
        throw Fault(statusOf(code), code ? code.message() : "the head ends in its middle");
    }
    return skipped + end;
}

std::size_t RequestParser::readBody(std::string_view bytes, std::string& body, std::size_t limit) {
    _beast->body = &body;
    _beast->limit = limit;
    std::size_t used = 0;
    while (!_beast->is_done() && used < bytes.size()) {
        const std::size_t before = body.size();
        error_code code;
        const auto rest = bytes.substr(used);
        const std::size_t step = _beast->put(boost::asio::const_buffer(rest.data(), rest.size()), code);
        used += step;
        const bool isMissing = code == error::need_more;
        const std::size_t frame = isMissing ? rest.size() - step + 1 : step - (body.size() - before);
        if (frame > _headBytes) {
            throw Fault(431, "the head of a chunk, or the trailers, are too long");
        }
        if (isMissing) {
            break;
        }
        if (code) {
            throw Fault(statusOf(code), code.message());
        }
    }
    return used;
}

} // namespace marlo::http

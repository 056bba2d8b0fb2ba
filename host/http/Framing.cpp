#include "host/http/Framing.h"

#include "host/http/Fault.h"
#include "host/http/FieldText.h"

#include <algorithm>
#include <charconv>

namespace marlo::http {
namespace {

bool hasElement(const RequestHead& head, std::string_view name, std::string_view element) {
    for (const std::string_view value : head.values(name)) {
        const auto elements = listElements(value);
        if (std::any_of(elements.begin(), elements.end(),
                        [element](std::string_view each) { return equalsIgnoringCase(each, element); })) {
            return true;
        }
    }
    return false;
}

std::uint64_t lengthOf(std::string_view text) {
    std::uint64_t length = 0;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), length);
    if (error != std::errc() || end != text.data() + text.size()) {
        throw Fault(400, "Content-Length is no number");
    }
    return length;
}

void readLength(const RequestHead& head, Framing& framing) {
    const auto lengths = head.values("Content-Length");
    const auto codings = head.values("Transfer-Encoding");
    if (lengths.size() + codings.size() > 1) {
        throw Fault(400, "more than one field tells the length of the body");
    }
    if (!lengths.empty()) {
        framing.hasLength = true;
        framing.length = lengthOf(lengths.front());
    }
    if (codings.empty()) {
        return;
    }
    if (head.version < 11) {
        throw Fault(400, "HTTP/1.0 has no transfer codings");
    }
    if (!equalsIgnoringCase(codings.front(), "chunked")) {
        throw Fault(501, "the only transfer coding known here is chunked");
    }
    framing.isChunked = true;
}

void readExpectation(const RequestHead& head, Framing& framing) {
    if (head.version < 11) {
        return;
    }
    for (const std::string_view value : head.values("Expect")) {
        (equalsIgnoringCase(value, "100-continue") ? framing.expectsContinue : framing.hasUnknownExpectation) = true;
    }
}

void checkHost(const RequestHead& head) {
    const std::size_t hosts = head.values("Host").size();
    if (hosts > 1) {
        throw Fault(400, "more than one Host");
    }
    if (hosts == 0 && head.version >= 11) {
        throw Fault(400, "a Host is missing");
    }
}

} // namespace

Framing framingOf(const RequestHead& head) {
    Framing framing;
    checkHost(head);
    readLength(head, framing);
    readExpectation(head, framing);
    framing.keepsAlive =
        head.version >= 11 ? !hasElement(head, "Connection", "close")
                           : hasElement(head, "Connection", "keep-alive") && !hasElement(head, "Connection", "close");
    framing.takesTrailers = hasElement(head, "TE", "trailers");
    return framing;
}

} // namespace marlo::http

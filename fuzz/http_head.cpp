#include "fuzz/Require.h"
#include "host/http/Fault.h"
#include "host/http/RequestParser.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

/**
 * Any bytes as what comes in on a connection: requests, one after the other, with the limits of a server. Where the
 * bytes are cut into pieces must not matter.
 */
namespace {

using namespace marlo::http;
using marlo::fuzz::require;

constexpr std::size_t headBytes = 2048;
constexpr std::size_t bodyBytes = 4096;

/** All that was understood, and what it ended with. */
std::string outcome(std::string_view bytes, std::size_t step) {
    RequestParser parser(headBytes);
    std::string seen;
    std::string input;
    std::string body;
    try {
        while (!bytes.empty() || !input.empty()) {
            input.append(bytes.substr(0, step));
            bytes.remove_prefix(std::min(step, bytes.size()));
            std::size_t used = 0;
            do {
                used = parser.hasHead() ? parser.readBody(input, body, bodyBytes) : parser.readHead(input);
                require(used <= input.size(), "no more is used than came");
                input.erase(0, used);
                require(body.size() <= bodyBytes, "a body keeps to its limit");
                if (parser.isDone()) {
                    seen += parser.head().method + ' ' + parser.head().target + '\n';
                    for (const Field& field : parser.head().fields) {
                        require(field.value.find_first_of("\r\n") == std::string::npos, "a value is one line");
                        seen += field.name + ':' + field.value + '\n';
                    }
                    seen += std::to_string(body.size()) + body + '\n';
                    body.clear();
                    parser.reset();
                    used = 1;
                }
            } while (used > 0 && !input.empty());
            require(input.size() < headBytes + step, "what is not understood is not collected");
            if (bytes.empty()) {
                break;
            }
        }
    } catch (const Fault&) { // of two faults at once the one that is found first depends on the pieces
        seen += "fault";
    }
    return seen;
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    const std::string_view bytes = marlo::fuzz::textOf(data, size);
    const std::string whole = outcome(bytes, size + 1);
    require(outcome(bytes, 1) == whole, "bytes one by one are the same requests");
    require(outcome(bytes, 7) == whole, "pieces are the same requests");
    return 0;
}

#include "host/http/HeadText.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <ctime>
#include <utility>

namespace marlo::http {
namespace {

constexpr std::array<std::pair<unsigned, std::string_view>, 26> reasons{{
    {100, "Continue"},
    {200, "OK"},
    {204, "No Content"},
    {301, "Moved Permanently"},
    {302, "Found"},
    {304, "Not Modified"},
    {400, "Bad Request"},
    {401, "Unauthorized"},
    {403, "Forbidden"},
    {404, "Not Found"},
    {405, "Method Not Allowed"},
    {406, "Not Acceptable"},
    {408, "Request Timeout"},
    {411, "Length Required"},
    {413, "Content Too Large"},
    {414, "URI Too Long"},
    {415, "Unsupported Media Type"},
    {417, "Expectation Failed"},
    {426, "Upgrade Required"},
    {429, "Too Many Requests"},
    {431, "Request Header Fields Too Large"},
    {500, "Internal Server Error"},
    {501, "Not Implemented"},
    {503, "Service Unavailable"},
    {505, "HTTP Version Not Supported"},
    {510, "Not Extended"},
}};

std::string_view reasonOf(unsigned status) {
    const auto found =
        std::find_if(reasons.begin(), reasons.end(), [status](const auto& reason) { return reason.first == status; });
    return found == reasons.end() ? std::string_view("Status") : found->second;
}

/** The date of now, in the one format that is sent (RFC 9110, 5.6.7). In English, whatever the locale. */
std::string dateText(std::time_t now) {
    static constexpr std::array<const char*, 7> days{"Sun", "Mon", "Tue", "Wed", "Thu", "Fri", "Sat"};
    static constexpr std::array<const char*, 12> months{"Jan", "Feb", "Mar", "Apr", "May", "Jun",
                                                        "Jul", "Aug", "Sep", "Oct", "Nov", "Dec"};
    std::tm date{};
    gmtime_r(&now, &date);
    std::array<char, 64> text{};
    const int length = std::snprintf(text.data(), text.size(), "%s, %02d %s %d %02d:%02d:%02d GMT",
                                     days.at(static_cast<std::size_t>(date.tm_wday)), date.tm_mday,
                                     months.at(static_cast<std::size_t>(date.tm_mon)), date.tm_year + 1900,
                                     date.tm_hour, date.tm_min, date.tm_sec);
    return {text.data(), static_cast<std::size_t>(length)};
}

const std::string& currentDate() {
    thread_local std::time_t second = -1;
    thread_local std::string text;
    const std::time_t now = std::time(nullptr);
    if (now != second) {
        second = now;
        text = dateText(now);
    }
    return text;
}

void appendNumber(std::string& text, std::size_t number, int base) {
    std::array<char, 24> digits{};
    const auto [end, error] = std::to_chars(digits.data(), digits.data() + digits.size(), number, base);
    static_cast<void>(error); // there is room for all digits
    text.append(digits.data(), end);
}

/** A control character in a value could end the line, and what follows would be a field or an answer of its own. */
void appendField(std::string& text, std::string_view name, std::string_view value) {
    text.append(name).append(": ");
    const std::size_t start = text.size();
    text.append(value);
    std::replace_if(
        text.begin() + static_cast<std::ptrdiff_t>(start), text.end(),
        [](char character) { return static_cast<unsigned char>(character) < ' ' || character == '\x7f'; }, ' ');
    text.append("\r\n");
}

void appendEnding(std::string& text, unsigned status, const Ending& ending) {
    if (ending.body == Ending::Body::chunks) {
        text.append("Transfer-Encoding: chunked\r\n");
    } else if (ending.body == Ending::Body::length && mayHaveBody(status)) {
        text.append("Content-Length: ");
        appendNumber(text, ending.length, 10);
        text.append("\r\n");
    }
    if (!ending.keepsAlive) {
        text.append("Connection: close\r\n");
    } else if (ending.version < 11) {
        text.append("Connection: keep-alive\r\n");
    }
}

} // namespace

bool mayHaveBody(unsigned status) {
    return status >= 200 && status != 204 && status != 304;
}

void appendHead(std::string& text, unsigned status, const Fields& fields, const Ending& ending) {
    text.append("HTTP/1.1 ");
    appendNumber(text, status, 10);
    text.append(" ").append(reasonOf(status)).append("\r\n");
    appendField(text, "Date", currentDate());
    for (const Field& field : fields) {
        appendField(text, field.name, field.value);
    }
    appendEnding(text, status, ending);
    text.append("\r\n");
}

void appendChunk(std::string& text, std::string_view data) {
    if (!data.empty()) {
        appendNumber(text, data.size(), 16);
        text.append("\r\n").append(data).append("\r\n");
    }
}

void appendLastChunk(std::string& text, const Fields& trailers) {
    text.append("0\r\n");
    for (const Field& trailer : trailers) {
        appendField(text, trailer.name, trailer.value);
    }
    text.append("\r\n");
}

} // namespace marlo::http

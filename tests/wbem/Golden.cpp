#include "tests/wbem/Golden.h"

#include <algorithm>
#include <array>
#include <cctype>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <optional>
#include <stdexcept>
#include <utility>

#include <poll.h>
#include <sys/socket.h>

namespace marlo::test {

namespace {

constexpr int longestSilence = 20000; ///< ms; the server's answer takes far less
constexpr std::string_view headEnd = "\r\n\r\n";
constexpr std::string_view lastChunk = "0\r\n\r\n";

std::string lower(std::string text) {
    std::transform(text.begin(), text.end(), text.begin(),
                   [](unsigned char c) { return static_cast<char>(std::tolower(c)); });
    return text;
}

/** The value of a field in a head, by its name in lower case. */
std::optional<std::string> fieldOf(const std::string& head, const std::string& name) {
    const std::string text = lower(head);
    const auto begin = text.find("\r\n" + name + ":");
    if (begin == std::string::npos) {
        return std::nullopt;
    }
    const auto value = text.find_first_not_of(" \t", begin + name.size() + 3);
    return text.substr(value, text.find("\r\n", value) - value);
}

/** Where the message at the beginning of a text ends; npos where it does not. `hasBody` is false for 1xx and such. */
std::size_t endOfMessage(const std::string& text, bool hasBody) {
    const auto end = text.find(headEnd);
    if (end == std::string::npos) {
        return end;
    }
    const std::size_t body = end + headEnd.size();
    const std::string head = text.substr(0, body);
    if (!hasBody) {
        return body;
    }
    if (fieldOf(head, "transfer-encoding")) {
        const auto last = text.find("\r\n" + std::string(lastChunk), body - 2);
        return last == std::string::npos ? last : last + 2 + lastChunk.size();
    }
    const auto length = fieldOf(head, "content-length");
    const std::size_t size = length ? std::stoul(*length) : 0;
    return text.size() < body + size ? std::string::npos : body + size;
}

/** False where the connection has ended or stays silent. */
bool receive(int descriptor, std::string& received) {
    pollfd polled{descriptor, POLLIN, 0};
    if (poll(&polled, 1, longestSilence) <= 0) {
        return false;
    }
    std::array<char, 65536> buffer{};
    const ssize_t count = recv(descriptor, buffer.data(), buffer.size(), 0);
    if (count > 0) {
        received.append(buffer.data(), static_cast<std::size_t>(count));
    }
    return count > 0;
}

/** One answer, interim or final; what came of it where the connection ended. */
std::string receiveOne(int descriptor, bool isHead, std::string& received) {
    while (true) {
        const bool hasBody = !isHead && !received.starts_with("HTTP/1.1 1");
        const auto end = endOfMessage(received, hasBody);
        if (end != std::string::npos) {
            std::string answer = received.substr(0, end);
            received.erase(0, end);
            return answer;
        }
        if (!receive(descriptor, received)) {
            return std::exchange(received, {});
        }
    }
}

void sendAll(int descriptor, const std::string& bytes) {
    for (std::size_t sent = 0; sent < bytes.size();) {
        const ssize_t count = send(descriptor, bytes.data() + sent, bytes.size() - sent, MSG_NOSIGNAL);
        if (count <= 0) {
            return; // refused before it was read; the answer tells
        }
        sent += static_cast<std::size_t>(count);
    }
}

/** The answer to a request. One that waits to be continued sends its body only then. */
std::string sendAndReceive(int descriptor, const std::string& request, std::string& received) {
    const std::size_t body = request.find(headEnd) + headEnd.size();
    const bool waits = fieldOf(request.substr(0, body), "expect").has_value();
    std::string interim;
    if (waits) {
        sendAll(descriptor, request.substr(0, body));
        interim = receiveOne(descriptor, false, received);
    }
    if (waits && !interim.starts_with("HTTP/1.1 1")) {
        return interim;
    }
    sendAll(descriptor, waits ? request.substr(body) : request);
    return interim + receiveOne(descriptor, request.starts_with("HEAD "), received);
}

void replaceAll(std::string& text, const std::string& what, const std::string& by) {
    for (auto at = text.find(what); at != std::string::npos; at = text.find(what, at + by.size())) {
        text.replace(at, what.size(), by);
    }
}

/** Takes Date and contexts out; `context` becomes the last one there is. */
std::string normalised(std::string answer, std::string& context) {
    const auto date = answer.find("\r\nDate: ");
    if (date != std::string::npos) {
        const auto end = answer.find("\r\n", date + 2);
        answer.replace(date, end - date, "\r\nDate: Sat, 01 Jan 2000 00:00:00 GMT");
    }
    const std::string opening = "NAME=\"EnumerationContext\" PARAMTYPE=\"string\"><VALUE>";
    const auto value = answer.find(opening);
    const std::size_t length = std::string_view(contextPlaceholder).size();
    if (value != std::string::npos && answer[value + opening.size()] != '<') {
        context = answer.substr(value + opening.size(), length);
        replaceAll(answer, context, contextPlaceholder);
    }
    return answer;
}

std::filesystem::path directory() {
    return GOLDEN_DIRECTORY;
}

} // namespace

std::vector<std::string> goldenNames() {
    std::vector<std::string> names;
    for (const auto& entry : std::filesystem::directory_iterator(directory())) {
        if (entry.path().extension() == ".request") {
            names.push_back(entry.path().stem().string());
        }
    }
    std::sort(names.begin(), names.end());
    return names;
}

std::string readGolden(const std::string& file) {
    std::ifstream stream(directory() / file, std::ios::binary);
    return {std::istreambuf_iterator<char>(stream), {}};
}

void writeGolden(const std::string& file, const std::string& text) {
    std::ofstream(directory() / file, std::ios::binary) << text;
}

std::string exchange(int descriptor, const std::string& requests) {
    std::string rest = requests;
    std::string received;
    std::string context;
    std::string answers;
    while (!rest.empty()) {
        const auto end = std::min(endOfMessage(rest, true), rest.size());
        std::string request = rest.substr(0, end);
        rest.erase(0, end);
        if (!context.empty()) {
            replaceAll(request, contextPlaceholder, context);
        }
        answers += normalised(sendAndReceive(descriptor, request, received), context);
    }
    return answers;
}

} // namespace marlo::test

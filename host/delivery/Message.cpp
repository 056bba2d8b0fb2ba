#include "host/delivery/Message.h"

#include "host/cimxml/Document.h"
#include "host/cimxml/Escape.h"
#include "host/cimxml/Writer.h"
#include "host/model/DateTimeText.h"

#include <algorithm>

namespace marlo::delivery {
namespace {

constexpr std::string_view contextName = "SequenceContext";
constexpr std::string_view numberName = "SequenceNumber";
constexpr std::size_t quotedBytes = 200; ///< of what a listener says, in logs and counters

/** What comes from outside goes into logs: one line, and not too long. */
std::string quoted(std::string_view text) {
    std::string result(text.substr(0, quotedBytes));
    std::ranges::replace_if(
        result, [](char letter) { return static_cast<unsigned char>(letter) < ' ' || letter == '\x7f'; }, ' ');
    return "\"" + result + "\"";
}

/** The one child, down to the answer of the method. */
std::string problemOfDocument(std::string_view body) {
    const cimxml::Limits limits;
    const cimxml::Document document = cimxml::Document::read(body, limits);
    const cimxml::Node response = document.root().onlyChild().onlyChild().onlyChild();
    if (!response.is("EXPMETHODRESPONSE")) {
        response.failMisplaced();
    }
    for (const cimxml::Node& child : response.children()) {
        if (child.is("ERROR")) {
            return "refused with status " + child.require("CODE") + ": " +
                   quoted(child.attribute("DESCRIPTION").value_or(""));
        }
    }
    return {};
}

NamedValue text(const char* name, std::string value) {
    return {name, Value::string(std::move(value))};
}

NamedValue number(const char* name, std::uint64_t value) {
    return {name, Value::uint(CMPI_uint16, value)};
}

} // namespace

std::string exportMessage(const std::string& messageId, const Instance& indication) {
    Instance plain = indication;
    std::erase_if(plain.properties, [](const NamedValue& property) {
        return equalNames(property.name, contextName) || equalNames(property.name, numberName);
    });
    std::string message;
    cimxml::Writer writer([&message](std::string_view piece) { message += piece; }, {});
    writer.exportIndication(messageId, plain);
    writer.finish();
    return message;
}

/** Texts within the message have no tags of their own: the last end of an instance is that of the indication. */
std::string inSequence(std::string_view message, std::string_view context, std::int64_t number) {
    const std::size_t end = std::min(message.rfind("</INSTANCE>"), message.size());
    std::string result;
    result.reserve(message.size() + 256);
    result = message.substr(0, end);
    result += R"(<PROPERTY NAME="SequenceContext" TYPE="string"><VALUE>)";
    cimxml::appendText(result, context);
    result += R"(</VALUE></PROPERTY><PROPERTY NAME="SequenceNumber" TYPE="sint64"><VALUE>)";
    result += std::to_string(number);
    result += "</VALUE></PROPERTY>";
    result += message.substr(end);
    return result;
}

Instance lossNotice(std::uint64_t count, std::int64_t first, std::int64_t last, std::int64_t now) {
    const std::string what = std::to_string(count) + " indications for this listener were lost, SequenceNumber " +
                             std::to_string(first) + " to " + std::to_string(last) +
                             ": the queue was full, and the oldest gave way";
    Instance notice;
    notice.path.className = "CIM_AlertIndication";
    const DateTime time{writeDateTime({static_cast<std::uint64_t>(now), false}).value_or("")};
    notice.properties = {{"IndicationTime", {CMPI_dateTime, time}},
                         number("PerceivedSeverity", 5), // major
                         text("Description", what),
                         number("AlertType", 4),      // processing error
                         number("ProbableCause", 40), // queue size exceeded
                         {"EventTime", {CMPI_dateTime, time}},
                         text("ProviderName", "marlo"),
                         text("OwningEntity", "marlo"),
                         text("MessageID", "lost"),
                         text("Message", what)};
    return notice;
}

/** Without Accept: there are listeners that take no other than the one type that they think of. */
std::string requestHead(const Url& url, std::size_t bodyBytes) {
    return "POST " + url.target + " HTTP/1.1\r\nHost: " + url.authority +
           "\r\nUser-Agent: marlo\r\nContent-Type: application/xml; charset=\"utf-8\"\r\n"
           "CIMExport: MethodRequest\r\nCIMExportMethod: ExportIndication\r\nContent-Length: " +
           std::to_string(bodyBytes) + "\r\n\r\n";
}

std::string problemOf(unsigned status, std::string_view cimError, std::string_view body) {
    if (status != 200 || !cimError.empty()) {
        return "answered HTTP " + std::to_string(status) +
               (cimError.empty() ? std::string() : ", CIMError " + quoted(cimError));
    }
    if (body.empty()) {
        return {};
    }
    try {
        return problemOfDocument(body);
    } catch (const cimxml::MessageError& error) {
        return std::string("answered with something else than the answer to an export: ") + error.what();
    }
}

} // namespace marlo::delivery

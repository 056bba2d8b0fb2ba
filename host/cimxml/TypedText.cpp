#include "host/cimxml/TypedText.h"

#include "host/model/DateTimeText.h"
#include "host/schema/Literals.h"
#include "host/schema/Utf8.h"

#include <charconv>
#include <cmath>
#include <limits>

namespace marlo::cimxml {

namespace {

std::string_view trimmed(std::string_view text) {
    constexpr std::string_view space = " \t\r\n";
    const std::size_t begin = std::min(text.find_first_not_of(space), text.size());
    return text.substr(begin, text.find_last_not_of(space) + 1 - begin);
}

/** An integer without its sign. */
std::optional<std::uint64_t> readMagnitude(std::string_view digits) {
    const bool isHexadecimal = digits.starts_with("0x") || digits.starts_with("0X");
    digits.remove_prefix(isHexadecimal ? 2 : 0);
    std::uint64_t magnitude = 0;
    const char* const end = digits.data() + digits.size();
    const auto result = std::from_chars(digits.data(), end, magnitude, isHexadecimal ? 16 : 10);
    return result.ec == std::errc() && result.ptr == end ? std::optional(magnitude) : std::nullopt;
}

/** Bits of an integer type: CMPI numbers the widths 8, 16, 32 and 64 in two bits of the type code. */
unsigned integerBits(CMPIType type) {
    return 8U << ((static_cast<unsigned>(type) >> 4U) & 3U);
}

std::optional<Value> readInteger(std::string_view text, CMPIType type) {
    const bool isSigned = (type & CMPI_SINT) == CMPI_SINT;
    const bool isNegative = text.starts_with('-');
    const auto magnitude = readMagnitude(text.substr(isNegative || text.starts_with('+') ? 1 : 0));
    const std::uint64_t most =
        std::numeric_limits<std::uint64_t>::max() >> (64U - integerBits(type) + (isSigned ? 1 : 0));
    const std::uint64_t least = isSigned ? most + 1 : 0; // magnitude of the smallest number
    if (!magnitude || *magnitude > (isNegative ? least : most)) {
        return std::nullopt;
    }
    const std::uint64_t number = isNegative ? ~*magnitude + 1 : *magnitude;
    return isSigned ? Value::sint(type, static_cast<std::int64_t>(number)) : Value::uint(type, number);
}

template <typename Real>
std::optional<Value> readDigits(std::string_view text, CMPIType type) {
    Real number = 0;
    const char* const end = text.data() + text.size();
    const auto result = std::from_chars(text.data(), end, number);
    return result.ec == std::errc() && result.ptr == end ? std::optional(Value{type, double{number}}) : std::nullopt;
}

std::optional<Value> readReal(std::string_view text, CMPIType type) {
    for (const auto& [name, number] : {std::pair("INF", HUGE_VAL), std::pair("-INF", -HUGE_VAL),
                                       std::pair("NaN", std::numeric_limits<double>::quiet_NaN())}) {
        if (text == name) {
            return Value{type, number};
        }
    }
    text.remove_prefix(text.starts_with('+') && !text.starts_with("+-") ? 1 : 0);
    if (text.find_first_not_of("0123456789+-.eE") != std::string_view::npos) { // "inf" and the like
        return std::nullopt;
    }
    return type == CMPI_real32 ? readDigits<float>(text, type) : readDigits<double>(text, type);
}

std::optional<Value> readBoolean(std::string_view text) {
    if (equalNames(text, "TRUE") || equalNames(text, "FALSE")) {
        return Value::boolean(equalNames(text, "TRUE"));
    }
    return std::nullopt;
}

/** One code point that UTF-16 has one unit for. */
std::optional<Value> readCharacter(std::string_view text) {
    const auto codePoint = takeUtf8(text);
    return codePoint && *codePoint <= 0xFFFF && text.empty()
               ? std::optional(Value{CMPI_char16, static_cast<char16_t>(*codePoint)})
               : std::nullopt;
}

} // namespace

CMPIType readType(const Node& node) {
    const std::string name = node.require("TYPE");
    const CMPIType type = mof::findType(name);
    if (type == CMPI_null) {
        node.fail("there is no type '" + name + "'");
    }
    return type;
}

Value readOrKeep(const std::string& text, CMPIType type) {
    return readValue(text, type).value_or(Value::string(text));
}

std::optional<Value> readValue(const std::string& text, CMPIType type) {
    const bool isPlain = (type & (CMPI_ARRAY | CMPI_ENC)) == 0;
    if (isPlain && (type & CMPI_INTEGER) != 0) {
        return readInteger(trimmed(text), type);
    }
    switch (type) {
    case CMPI_string:
        return Value::string(text);
    case CMPI_boolean:
        return readBoolean(trimmed(text));
    case CMPI_real32:
    case CMPI_real64:
        return readReal(trimmed(text), type);
    case CMPI_char16:
        return readCharacter(text);
    case CMPI_dateTime: {
        const std::string_view moment = trimmed(text);
        return readDateTime(moment) ? std::optional(Value{type, DateTime{std::string(moment)}}) : std::nullopt;
    }
    default:
        return std::nullopt;
    }
}

} // namespace marlo::cimxml

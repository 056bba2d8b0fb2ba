#include "host/cli/Assignments.h"

#include "host/cli/Options.h"

#include <algorithm>
#include <charconv>
#include <optional>

namespace marlo::cli {

namespace {

/** The whole text as a number of the type; nothing when it is none, or too large. */
template <typename Number>
std::optional<Number> readNumber(const std::string& text) {
    Number number{};
    const char* const end = text.data() + text.size();
    const auto [read, error] = std::from_chars(text.data(), end, number);
    return error == std::errc() && read == end ? std::optional(number) : std::nullopt;
}

std::optional<Value> readBoolean(const std::string& text) {
    const bool isTrue = equalNames(text, "true");
    return isTrue || equalNames(text, "false") ? std::optional(Value::boolean(isTrue)) : std::nullopt;
}

std::optional<Value> readInteger(const std::string& text) {
    if (const auto number = readNumber<std::uint64_t>(text)) {
        return Value::uint(CMPI_uint64, *number);
    }
    const auto number = readNumber<std::int64_t>(text);
    return number ? std::optional(Value::sint(CMPI_sint64, *number)) : std::nullopt;
}

/** Integers are of the widest type: the object manager knows whether they fit. */
Value readOne(const std::string& text, CMPIType type) {
    std::optional<Value> value;
    if (type == CMPI_boolean) {
        value = readBoolean(text);
    } else if (type == CMPI_real32 || type == CMPI_real64) {
        if (const auto number = readNumber<double>(text)) {
            value = Value{type, *number};
        }
    } else if ((type & CMPI_INTEGER) != 0 && (type & CMPI_ENC) == 0) {
        value = readInteger(text);
    }
    return value ? *value : Value::string(text);
}

void addElements(Value& array, const std::string& text, CMPIType type) {
    auto& elements = std::get<Value::Array>(array.data);
    for (std::size_t at = 0; !text.empty() && at <= text.size();) {
        const std::size_t comma = std::min(text.find(',', at), text.size());
        elements.push_back(readOne(text.substr(at, comma - at), type));
        at = comma + 1;
    }
}

} // namespace

std::vector<NamedValue> readAssignments(const std::vector<std::string>& words, const TypeOfName& typeOf) {
    std::vector<NamedValue> values;
    for (const std::string& word : words) {
        const std::size_t equals = word.find('=');
        if (equals == std::string::npos || equals == 0) {
            throw UsageError("expected NAME=VALUE, found \"" + word + "\"");
        }
        const std::string name = word.substr(0, equals);
        const std::string text = word.substr(equals + 1);
        const CMPIType type = typeOf(name);
        auto given = std::find_if(values.begin(), values.end(),
                                  [&name](const NamedValue& value) { return equalNames(value.name, name); });
        if ((type & CMPI_ARRAY) == 0) {
            if (given != values.end()) {
                throw UsageError(name + " is given twice, and is no array");
            }
            values.push_back({name, readOne(text, type)});
            continue;
        }
        if (given == values.end()) {
            given = values.insert(values.end(), {name, {type, Value::Array{}}});
        }
        addElements(given->value, text, static_cast<CMPIType>(type & ~CMPI_ARRAY));
    }
    return values;
}

} // namespace marlo::cli

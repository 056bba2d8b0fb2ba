#include "host/filter/Compare.h"

#include "host/model/DateTimeText.h"
#include "host/schema/Utf8.h"

#include <compare>
#include <limits>
#include <optional>

namespace marlo::filter {

namespace {

/** Wide enough for every 64-bit integer and every double. */
using Number = long double;
static_assert(std::numeric_limits<Number>::digits >= 64);

std::optional<Number> numberOf(const Value& value) {
    if (const auto* number = std::get_if<std::uint64_t>(&value.data)) {
        return static_cast<Number>(*number);
    }
    if (const auto* number = std::get_if<std::int64_t>(&value.data)) {
        return static_cast<Number>(*number);
    }
    if (const auto* number = std::get_if<double>(&value.data)) {
        return static_cast<Number>(*number);
    }
    return std::nullopt;
}

std::optional<std::string> textOf(const Value& value) {
    if (const auto* text = std::get_if<std::string>(&value.data)) {
        return *text;
    }
    if (const auto* character = std::get_if<char16_t>(&value.data)) {
        std::string text;
        appendUtf8(text, *character);
        return text;
    }
    return std::nullopt;
}

std::optional<DateTimeValue> dateTimeOf(const Value& value) {
    if (const auto* dateTime = std::get_if<DateTime>(&value.data)) {
        return readDateTime(dateTime->text);
    }
    const auto* text = std::get_if<std::string>(&value.data);
    return text == nullptr ? std::nullopt : readDateTime(*text);
}

using Order = std::partial_ordering;

Order orderDateTimes(const Value& left, const Value& right) {
    const auto one = dateTimeOf(left);
    const auto other = dateTimeOf(right);
    if (!one || !other || one->interval != other->interval) {
        return Order::unordered;
    }
    return one->microseconds <=> other->microseconds;
}

Order order(const Value& left, const Value& right) {
    const Family family = familyOf(left.type);
    if (family == Family::dateTime || familyOf(right.type) == Family::dateTime) {
        return orderDateTimes(left, right);
    }
    if (family == Family::number) {
        const auto one = numberOf(left);
        const auto other = numberOf(right);
        return one && other ? *one <=> *other : Order::unordered;
    }
    const auto* truth = std::get_if<bool>(&left.data);
    const auto* otherTruth = std::get_if<bool>(&right.data);
    if (truth != nullptr && otherTruth != nullptr) {
        return *truth <=> *otherTruth;
    }
    const auto one = textOf(left);
    const auto other = textOf(right);
    return one && other ? Order(one->compare(*other) <=> 0) : Order::unordered;
}

bool holds(Order order, Relation relation) {
    switch (relation) {
    case Relation::equal:
        return order == Order::equivalent;
    case Relation::notEqual:
        return order != Order::equivalent;
    case Relation::less:
        return order == Order::less;
    case Relation::lessOrEqual:
        return order != Order::greater;
    case Relation::greater:
        return order == Order::greater;
    case Relation::greaterOrEqual:
        return order != Order::less;
    }
    return false;
}

} // namespace

Family familyOf(CMPIType type) {
    switch (type) {
    case CMPI_boolean:
        return Family::truth;
    case CMPI_char16:
        return Family::character;
    case CMPI_string:
        return Family::text;
    case CMPI_dateTime:
        return Family::dateTime;
    case CMPI_real32:
    case CMPI_real64:
    case CMPI_uint8:
    case CMPI_uint16:
    case CMPI_uint32:
    case CMPI_uint64:
    case CMPI_sint8:
    case CMPI_sint16:
    case CMPI_sint32:
    case CMPI_sint64:
        return Family::number;
    default:
        return Family::none;
    }
}

Truth compare(const Value& left, Relation relation, const Value& right) {
    const Order found = order(left, right);
    if (found == Order::unordered) {
        return Truth::unknown;
    }
    return holds(found, relation) ? Truth::yes : Truth::no;
}

} // namespace marlo::filter

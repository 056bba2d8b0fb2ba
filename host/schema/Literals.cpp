#include "host/schema/Literals.h"

#include "host/model/Instance.h"

#include <algorithm>
#include <array>
#include <limits>
#include <stdexcept>

namespace marlo::mof {

namespace {

using Kind = Literal::Kind;

struct TypeName {
    std::string_view name;
    CMPIType type;
};

constexpr std::array<TypeName, 14> TypeNames = {{{"string", CMPI_string},
                                                 {"boolean", CMPI_boolean},
                                                 {"uint8", CMPI_uint8},
                                                 {"uint16", CMPI_uint16},
                                                 {"uint32", CMPI_uint32},
                                                 {"uint64", CMPI_uint64},
                                                 {"sint8", CMPI_sint8},
                                                 {"sint16", CMPI_sint16},
                                                 {"sint32", CMPI_sint32},
                                                 {"sint64", CMPI_sint64},
                                                 {"real32", CMPI_real32},
                                                 {"real64", CMPI_real64},
                                                 {"char16", CMPI_char16},
                                                 {"datetime", CMPI_dateTime}}};

std::string showKind(const Literal& literal) {
    switch (literal.kind) {
    case Kind::Null:
        return "NULL";
    case Kind::Boolean:
        return "a boolean";
    case Kind::Integer:
        return "an integer";
    case Kind::Real:
        return "a real number";
    case Kind::Character:
        return "a character";
    case Kind::String:
        break;
    }
    return "a string";
}

[[noreturn]] void failMismatch(CMPIType type, const Literal& literal, const std::string& what) {
    throw Error(literal.at, what + " is of type " + showType(type) + ", not " + showKind(literal));
}

void require(Kind kind, CMPIType type, const Literal& literal, const std::string& what) {
    if (literal.kind != kind) {
        failMismatch(type, literal, what);
    }
}

/** Bits of an integer type: CMPI numbers the widths 8, 16, 32 and 64 in two bits of the type code. */
unsigned integerBits(CMPIType type) {
    return 8U << ((static_cast<unsigned>(type) >> 4U) & 3U);
}

Value makeInteger(CMPIType type, const Literal& literal, const std::string& what) {
    require(Kind::Integer, type, literal, what);
    const bool isSigned = (type & CMPI_SINT) == CMPI_SINT;
    const unsigned bits = integerBits(type) - (isSigned ? 1 : 0);
    const std::uint64_t most = std::numeric_limits<std::uint64_t>::max() >> (64 - bits);
    const std::uint64_t least = isSigned ? most + 1 : 0; // magnitude of the smallest number
    if (literal.magnitude > (literal.negative ? least : most)) {
        throw Error(literal.at, what + " is out of the range of " + showType(type));
    }
    const std::uint64_t number = literal.negative ? ~literal.magnitude + 1 : literal.magnitude;
    return isSigned ? Value::sint(type, static_cast<std::int64_t>(number)) : Value::uint(type, number);
}

Value makeReal(CMPIType type, const Literal& literal, const std::string& what) {
    if (literal.kind == Kind::Integer) {
        const auto number = static_cast<double>(literal.magnitude);
        return {type, literal.negative ? -number : number};
    }
    require(Kind::Real, type, literal, what);
    return {type, literal.real};
}

/** The 25 characters of a date-time or an interval (DSP0004 5.2.4); stars stand for digits that are not known. */
bool isDateTime(std::string_view text) {
    constexpr std::size_t Length = 25;
    constexpr std::size_t Point = 14;
    constexpr std::size_t Sign = 21;
    if (text.size() != Length || text[Point] != '.') {
        return false;
    }
    if (std::string_view("+-:").find(text[Sign]) == std::string_view::npos) {
        return false;
    }
    for (std::size_t i = 0; i < Length; ++i) {
        const bool isField = (text[i] >= '0' && text[i] <= '9') || (text[i] == '*' && i < Sign);
        if (i != Point && i != Sign && !isField) {
            return false;
        }
    }
    return text[Sign] != ':' || text.substr(Sign + 1) == "000";
}

Value makeReference(const Literal& literal, const std::string& what) {
    require(Kind::String, CMPI_ref, literal, what);
    try {
        return {CMPI_ref, std::make_shared<const ObjectPath>(ObjectPath::parse(literal.text))};
    } catch (const std::invalid_argument& error) {
        throw Error(literal.at, what + " is no object path: " + error.what());
    }
}

Value makeScalar(CMPIType type, const Literal& literal, const std::string& what) {
    if (literal.kind == Kind::Null) {
        return Value::null(type);
    }
    if ((type & CMPI_UINT) != 0) {
        return makeInteger(type, literal, what);
    }
    switch (type) {
    case CMPI_boolean:
        require(Kind::Boolean, type, literal, what);
        return Value::boolean(literal.truth);
    case CMPI_real32:
    case CMPI_real64:
        return makeReal(type, literal, what);
    case CMPI_char16:
        require(Kind::Character, type, literal, what);
        return {type, static_cast<char16_t>(literal.magnitude)};
    case CMPI_ref:
        return makeReference(literal, what);
    case CMPI_dateTime:
        require(Kind::String, type, literal, what);
        if (!isDateTime(literal.text)) {
            throw Error(literal.at, what + " is no date-time: \"" + literal.text + "\"");
        }
        return {type, DateTime{literal.text}};
    default:
        require(Kind::String, type, literal, what);
        return Value::string(literal.text);
    }
}

} // namespace

CMPIType findType(std::string_view name) {
    const auto* const found = std::find_if(TypeNames.begin(), TypeNames.end(),
                                           [name](const TypeName& entry) { return equalNames(entry.name, name); });
    return found == TypeNames.end() ? CMPI_null : found->type;
}

std::string showType(CMPIType type) {
    const auto element = static_cast<CMPIType>(type & ~CMPI_ARRAY);
    const std::string name = element == CMPI_ref ? "reference" : typeName(element);
    return (type & CMPI_ARRAY) != 0 ? name + "[]" : name;
}

Value makeValue(CMPIType type, const Initializer& written, const std::string& what) {
    const bool isNull = !written.isArray && written.elements.front().kind == Kind::Null;
    if ((type & CMPI_ARRAY) == 0) {
        if (written.isArray) {
            throw Error(written.at, what + " is of type " + showType(type) + ", not an array");
        }
        return makeScalar(type, written.elements.front(), what);
    }
    if (isNull) {
        return Value::null(type);
    }
    if (!written.isArray) {
        throw Error(written.at, what + " is of type " + showType(type) + ": its values belong in braces");
    }
    Value::Array elements;
    for (const Literal& literal : written.elements) {
        elements.push_back(makeScalar(static_cast<CMPIType>(type & ~CMPI_ARRAY), literal, "an element of " + what));
    }
    return {type, std::move(elements)};
}

} // namespace marlo::mof

#include "host/broker/Message.h"

#include "host/broker/BrokerState.h"
#include "host/broker/Slot.h"

#include <cstdarg>

namespace marlo::broker {

namespace {

std::string textOrEmpty(const char* text) {
    return text == nullptr ? "" : text;
}

/** One insert, as the default argument promotions leave it. */
std::string readInsert(std::va_list& arguments) {
    const auto type = static_cast<CMPIType>(va_arg(arguments, int));
    switch (type) {
    case CMPI_chars:
        return textOrEmpty(va_arg(arguments, const char*));
    case CMPI_string: {
        const auto* string = objectOf<StringObject>(va_arg(arguments, const CMPIString*));
        return textOrEmpty(string == nullptr ? nullptr : string->characters());
    }
    case CMPI_boolean:
        return va_arg(arguments, int) != 0 ? "true" : "false";
    case CMPI_sint8:
    case CMPI_sint16:
    case CMPI_sint32:
        return std::to_string(va_arg(arguments, int));
    case CMPI_uint8:
    case CMPI_uint16:
    case CMPI_uint32:
        return std::to_string(va_arg(arguments, unsigned));
    case CMPI_sint64:
        return std::to_string(va_arg(arguments, long long));
    case CMPI_uint64:
        return std::to_string(va_arg(arguments, unsigned long long));
    case CMPI_real32:
    case CMPI_real64:
        return std::to_string(va_arg(arguments, double));
    default:
        return "";
    }
}

/** There are no message files: the text that the provider brings is the message. */
CMPIString* makeMessage(const CMPIBroker* handle, const char* text, CMPIStatus* status, CMPICount count,
                        std::va_list& arguments) {
    CMPIStatus own{};
    CMPIString* message = nullptr;
    try {
        if (objectOf<BrokerState>(handle) == nullptr) {
            own.rc = CMPI_RC_ERR_INVALID_HANDLE;
        } else {
            std::vector<std::string> inserts;
            for (CMPICount i = 0; i < count; ++i) {
                inserts.push_back(readInsert(arguments));
            }
            message = &StringObject::make(currentArena(), fillIn(textOrEmpty(text), inserts))->handle;
        }
    } catch (const std::exception&) {
        own.rc = CMPI_RC_ERR_FAILED;
    }
    if (status != nullptr) {
        *status = own;
    }
    return message;
}

} // namespace

std::string fillIn(std::string_view text, const std::vector<std::string>& inserts) {
    std::string filled;
    for (std::size_t i = 0; i < text.size(); ++i) {
        const char next = text[i] == '$' && i + 1 < text.size() ? text[i + 1] : '\0';
        const std::size_t number = next >= '1' && next <= '9' ? static_cast<std::size_t>(next - '0') : 0;
        if (number != 0 && number <= inserts.size()) {
            filled += inserts[number - 1];
            ++i;
        } else {
            filled += text[i];
            i += next == '$' ? 1 : 0;
        }
    }
    return filled;
}

// NOLINTNEXTLINE(cert-dcl50-cpp): the slot is variadic
CMPIString* getMessage(const CMPIBroker* broker, const char* /*id*/, const char* text, CMPIStatus* status,
                       CMPICount count, ...) {
    std::va_list arguments;
    va_start(arguments, count);
    CMPIString* message = makeMessage(broker, text, status, count, arguments);
    va_end(arguments);
    return message;
}

// NOLINTNEXTLINE(cert-dcl50-cpp): the slot is variadic
CMPIString* getMessage2(const CMPIBroker* broker, const char* /*id*/, CMPIMsgFileHandle /*file*/, const char* text,
                        CMPIStatus* status, CMPICount count, ...) {
    std::va_list arguments;
    va_start(arguments, count);
    CMPIString* message = makeMessage(broker, text, status, count, arguments);
    va_end(arguments);
    return message;
}

} // namespace marlo::broker

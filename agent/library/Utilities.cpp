#include "instrumentation/Utilities.h"

#include "agent/library/SystemName.h"

#include <algorithm>
#include <cstring>
#include <memory>

#include <cmpimacs.h>

namespace Orv {

namespace {

char lower(char character) {
    return character >= 'A' && character <= 'Z' ? static_cast<char>(character - 'A' + 'a') : character;
}

const char* charsOf(const CMPIString* string) {
    return string == nullptr ? nullptr : CMGetCharPtr(string);
}

bool isNull(const CMPIData& data) {
    return (data.state & CMPI_nullValue) != 0;
}

bool charsEqual(const char* left, const char* right) {
    return left == nullptr || right == nullptr ? left == right : std::strcmp(left, right) == 0;
}

/** Width in bytes of the values of a type that is held in the value itself; 0 for any other type. */
std::size_t widthOf(CMPIType type) {
    switch (type) {
    case CMPI_boolean:
    case CMPI_uint8:
    case CMPI_sint8:
        return 1;
    case CMPI_char16:
    case CMPI_uint16:
    case CMPI_sint16:
        return 2;
    case CMPI_uint32:
    case CMPI_sint32:
    case CMPI_real32:
        return 4;
    case CMPI_uint64:
    case CMPI_sint64:
    case CMPI_real64:
        return 8;
    default:
        return 0;
    }
}

bool dateTimesEqual(const CMPIDateTime* left, const CMPIDateTime* right) {
    if (left == nullptr || right == nullptr) {
        return left == right;
    }
    return charsEqual(charsOf(left->ft->getStringFormat(left, nullptr)),
                      charsOf(right->ft->getStringFormat(right, nullptr)));
}

/** Values of one key, both not NULL. Types that no key can have are never equal. */
bool valuesEqual(const CMPIData& left, const CMPIData& right) {
    switch (left.type) {
    case CMPI_string:
        return charsEqual(charsOf(left.value.string), charsOf(right.value.string));
    case CMPI_chars:
        return charsEqual(left.value.chars, right.value.chars);
    case CMPI_ref:
        return isObjPathsEqual(left.value.ref, right.value.ref, true);
    case CMPI_dateTime:
        return dateTimesEqual(left.value.dateTime, right.value.dateTime);
    default:
        break;
    }
    const std::size_t width = widthOf(left.type);
    return width != 0 && std::memcmp(&left.value, &right.value, width) == 0;
}

bool keysEqual(const CMPIData& left, const CMPIData& right) {
    return left.type == right.type && isNull(left) == isNull(right) && (isNull(left) || valuesEqual(left, right));
}

/** True when `path` has a key of this name, in any case, and this value. Brokers differ in how getKey compares. */
bool hasKey(const CMPIObjectPath* path, const char* name, const CMPIData& value) {
    const CMPICount count = CMGetKeyCount(path, nullptr);
    for (CMPICount index = 0; index < count; ++index) {
        CMPIString* other = nullptr;
        const CMPIData data = CMGetKeyAt(path, index, &other, nullptr);
        if (textEqual(name, charsOf(other))) {
            return keysEqual(value, data);
        }
    }
    return false;
}

bool allKeysIn(const CMPIObjectPath* path, const CMPIObjectPath* other) {
    const CMPICount count = CMGetKeyCount(path, nullptr);
    for (CMPICount index = 0; index < count; ++index) {
        CMPIString* name = nullptr;
        const CMPIData data = CMGetKeyAt(path, index, &name, nullptr);
        if (!hasKey(other, charsOf(name), data)) {
            return false;
        }
    }
    return true;
}

/** The CIM type of a data type code; CMPI_null for a code that there is not. */
CMPIType typeOf(DataType type) {
    switch (type) {
    case DATA_TYPE_UINT16:
        return CMPI_uint16;
    case DATA_TYPE_UINT64:
        return CMPI_uint64;
    case DATA_TYPE_BOOLEAN:
        return CMPI_boolean;
    case DATA_TYPE_STRING:
        return CMPI_string;
    }
    return CMPI_null;
}

/** The property of the instance in `source`, NULL when there is no such property or no instance. */
CMPIData propertyOf(const CMPIData& source, const char* name) {
    CMPIData absent{};
    absent.state = CMPI_nullValue;
    if (source.type != CMPI_instance || isNull(source) || source.value.inst == nullptr) {
        return absent;
    }
    CMPIStatus status{CMPI_RC_OK, nullptr};
    const CMPIData data = CMGetProperty(source.value.inst, name, &status);
    return status.rc == CMPI_RC_OK ? data : absent;
}

CMPIStatus copyProperty(const CMPIData& property, CMPIInstance* target, const char* name, CMPIType type) {
    const bool isAbsent = isNull(property) || (property.type == CMPI_string && property.value.string == nullptr);
    if (isAbsent) {
        return CMSetProperty(target, name, nullptr, type);
    }
    if (property.type != type) {
        return {CMPI_RC_ERR_TYPE_MISMATCH, nullptr};
    }
    return CMSetProperty(target, name, &property.value, type);
}

} // namespace

bool textEqual(const char* left, const char* right) {
    if (left == nullptr || right == nullptr) {
        return left == right;
    }
    while (*left != '\0' && lower(*left) == lower(*right)) {
        ++left;
        ++right;
    }
    return lower(*left) == lower(*right);
}

std::string stripSpaces(std::string text) {
    std::erase(text, ' ');
    return text;
}

std::string getSystemName() {
    using namespace std::chrono_literals;
    // Never destroyed: a look-up, or a provider's thread, may still run when static objects are.
    static auto* const name = std::make_unique<Agent::SystemName>(Agent::lookUpCanonicalName, 2s, 5min).release();
    return name->get(Agent::readHostName());
}

bool isObjPathsEqual(const CMPIObjectPath* left, const CMPIObjectPath* right, bool compareNameSpace) {
    if (left == nullptr || right == nullptr) {
        return false;
    }
    if (!textEqual(charsOf(CMGetClassName(left, nullptr)), charsOf(CMGetClassName(right, nullptr)))) {
        return false;
    }
    if (compareNameSpace &&
        !textEqual(charsOf(CMGetNameSpace(left, nullptr)), charsOf(CMGetNameSpace(right, nullptr)))) {
        return false;
    }
    return CMGetKeyCount(left, nullptr) == CMGetKeyCount(right, nullptr) && allKeysIn(left, right);
}

void mapProperty(CMPIData source, CMPIInstance* target, const char* name, DataType type, CMPIStatus* status) {
    const CMPIType cimType = typeOf(type);
    CMPIStatus result{CMPI_RC_ERR_INVALID_PARAMETER, nullptr};
    if (target != nullptr && name != nullptr && cimType != CMPI_null) {
        result = copyProperty(propertyOf(source, name), target, name, cimType);
    }
    if (status != nullptr) {
        *status = result;
    }
}

} // namespace Orv

#include "host/broker/Values.h"

#include "host/broker/Objects.h"

#include <cstring>

namespace marlo::broker {

namespace {

/** Bytes of a simple type's member, 0 for all others. Callers may pass a variable of just that size. */
std::size_t simpleSize(CMPIType type) {
    switch (type) {
    case CMPI_boolean:
    case CMPI_uint8:
    case CMPI_sint8:
        return 1;
    case CMPI_char16:
    case CMPI_uint16:
    case CMPI_sint16:
        return 2;
    case CMPI_real32:
    case CMPI_uint32:
    case CMPI_sint32:
        return 4;
    case CMPI_real64:
    case CMPI_uint64:
    case CMPI_sint64:
        return 8;
    default:
        return 0;
    }
}

/** Replaces the handle in `member` by that of a copy in `arena`. */
template <typename T>
CMPIrc copyHandle(Arena& arena, typename T::Handle*& member) {
    T* object = objectOf<T>(member);
    if (object == nullptr) {
        return member->hdl == nullptr ? CMPI_RC_ERR_INVALID_HANDLE : CMPI_RC_ERR_TYPE_MISMATCH;
    }
    member = &object->copyTo(arena)->handle;
    return CMPI_RC_OK;
}

CMPIrc copyArray(Arena& arena, CMPIArray*& member, CMPIType elementType) {
    const auto* array = objectOf<ArrayObject>(member);
    if (array == nullptr) {
        return member->hdl == nullptr ? CMPI_RC_ERR_INVALID_HANDLE : CMPI_RC_ERR_TYPE_MISMATCH;
    }
    if (array->elementType != elementType) {
        return CMPI_RC_ERR_TYPE_MISMATCH;
    }
    member = &array->copyTo(arena)->handle;
    return CMPI_RC_OK;
}

/** For a type whose value is a handle, which `data.value` holds and is not null. */
CMPIrc copyObject(Arena& arena, CMPIData& data) {
    if ((data.type & CMPI_ARRAY) != 0) {
        return copyArray(arena, data.value.array, static_cast<CMPIType>(data.type & ~CMPI_ARRAY));
    }
    switch (data.type) {
    case CMPI_string:
        return copyHandle<StringObject>(arena, data.value.string);
    case CMPI_dateTime:
        return copyHandle<DateTimeObject>(arena, data.value.dateTime);
    case CMPI_ref:
        return copyHandle<ObjectPathObject>(arena, data.value.ref);
    case CMPI_instance:
        return copyHandle<InstanceObject>(arena, data.value.inst);
    default:
        return CMPI_RC_ERR_INVALID_DATA_TYPE;
    }
}

void takeSimple(const CMPIValue* value, std::size_t size, CMPIData& data) {
    std::memcpy(&data.value, value, size);
    if (data.type == CMPI_boolean) {
        data.value.boolean = data.value.boolean != 0;
    }
}

CMPIrc takeObject(Arena& arena, const CMPIValue* value, CMPIData& data) {
    std::memcpy(&data.value, value, sizeof(void*));
    if (data.value.string == nullptr) {
        data = nullData(data.type);
        return CMPI_RC_OK;
    }
    return copyObject(arena, data);
}

} // namespace

CMPIType storedType(CMPIType type) {
    const auto plain = static_cast<CMPIType>(type & ~CMPI_ARRAY);
    return plain == CMPI_chars ? static_cast<CMPIType>((type & CMPI_ARRAY) | CMPI_string) : type;
}

bool isCimType(CMPIType type) {
    return simpleSize(type) != 0 || type == CMPI_string || type == CMPI_dateTime || type == CMPI_ref ||
           type == CMPI_instance;
}

CMPIrc takeValue(Arena& arena, const CMPIValue* value, CMPIType type, Accepted accepted, CMPIData& data) {
    const CMPIType stored = storedType(type);
    const bool pointer = type == CMPI_ptr || type == CMPI_charsptr;
    if (!isCimType(static_cast<CMPIType>(stored & ~CMPI_ARRAY)) && stored != CMPI_null &&
        !(pointer && accepted == Accepted::cimAndPointers)) {
        return CMPI_RC_ERR_INVALID_DATA_TYPE;
    }
    CMPIData taken = nullData(stored);
    if (value == nullptr || stored == CMPI_null) {
        data = taken;
        return CMPI_RC_OK;
    }
    taken.state = CMPI_goodValue;
    CMPIrc code = CMPI_RC_OK;
    if (type == CMPI_chars) {
        // The pointer is the text itself.
        const auto* text = static_cast<const char*>(static_cast<const void*>(value));
        taken.value.string = &StringObject::makeValue(arena, text)->handle;
    } else if (pointer) {
        taken.value.dataPtr = value->dataPtr;
    } else if (const std::size_t size = simpleSize(type); size != 0) {
        takeSimple(value, size, taken);
    } else {
        code = takeObject(arena, value, taken);
    }
    if (code == CMPI_RC_OK) {
        data = taken;
    }
    return code;
}

CMPIData copyData(Arena& arena, const CMPIData& data) {
    CMPIData copied = data;
    const bool object = (data.type & (CMPI_ARRAY | CMPI_ENC)) != 0;
    if (object && (data.state & CMPI_nullValue) == 0) {
        copyObject(arena, copied); // leaves bare pointers alone
    }
    return copied;
}

} // namespace marlo::broker

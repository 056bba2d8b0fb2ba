#include "host/model/Value.h"

#include "host/model/Instance.h"

#include <algorithm>
#include <array>
#include <utility>

namespace marlo {

namespace {

/** Compares what two shared objects are, not where they are. */
template <typename T>
bool equalObjects(const std::shared_ptr<const T>& left, const std::shared_ptr<const T>& right) {
    return left == right || (left && right && *left == *right);
}

constexpr std::array<std::pair<CMPIType, const char*>, 16> typeNames{{
    {CMPI_boolean, "boolean"},
    {CMPI_char16, "char16"},
    {CMPI_real32, "real32"},
    {CMPI_real64, "real64"},
    {CMPI_uint8, "uint8"},
    {CMPI_uint16, "uint16"},
    {CMPI_uint32, "uint32"},
    {CMPI_uint64, "uint64"},
    {CMPI_sint8, "sint8"},
    {CMPI_sint16, "sint16"},
    {CMPI_sint32, "sint32"},
    {CMPI_sint64, "sint64"},
    {CMPI_string, "string"},
    {CMPI_dateTime, "datetime"},
    {CMPI_ref, "reference"},
    {CMPI_instance, "instance"},
}};

} // namespace

bool Value::operator==(const Value& other) const {
    if (type != other.type || data.index() != other.data.index()) {
        return false;
    }
    if (const auto* path = std::get_if<std::shared_ptr<const ObjectPath>>(&data)) {
        return equalObjects(*path, std::get<std::shared_ptr<const ObjectPath>>(other.data));
    }
    if (const auto* instance = std::get_if<std::shared_ptr<const Instance>>(&data)) {
        return equalObjects(*instance, std::get<std::shared_ptr<const Instance>>(other.data));
    }
    return data == other.data;
}

std::string typeName(CMPIType type) {
    const auto plain = static_cast<CMPIType>(type & ~CMPI_ARRAY);
    const auto* entry = std::find_if(typeNames.begin(), typeNames.end(),
                                     [plain](const auto& candidate) { return candidate.first == plain; });
    return entry == typeNames.end() ? "" : entry->second;
}

} // namespace marlo

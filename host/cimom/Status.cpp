#include "host/cimom/ObjectManager.h"
#include "host/cimom/StatusCodes.h"

#include <algorithm>
#include <array>
#include <utility>

namespace marlo {

namespace {

constexpr std::array<std::pair<CMPIrc, const char*>, 20> statusNames{{
    {CMPI_RC_OK, "CIM_OK"},
    {CMPI_RC_ERR_FAILED, "CIM_ERR_FAILED"},
    {CMPI_RC_ERR_ACCESS_DENIED, "CIM_ERR_ACCESS_DENIED"},
    {CMPI_RC_ERR_INVALID_NAMESPACE, "CIM_ERR_INVALID_NAMESPACE"},
    {CMPI_RC_ERR_INVALID_PARAMETER, "CIM_ERR_INVALID_PARAMETER"},
    {CMPI_RC_ERR_INVALID_CLASS, "CIM_ERR_INVALID_CLASS"},
    {CMPI_RC_ERR_NOT_FOUND, "CIM_ERR_NOT_FOUND"},
    {CMPI_RC_ERR_NOT_SUPPORTED, "CIM_ERR_NOT_SUPPORTED"},
    {CMPI_RC_ERR_CLASS_HAS_CHILDREN, "CIM_ERR_CLASS_HAS_CHILDREN"},
    {CMPI_RC_ERR_CLASS_HAS_INSTANCES, "CIM_ERR_CLASS_HAS_INSTANCES"},
    {CMPI_RC_ERR_INVALID_SUPERCLASS, "CIM_ERR_INVALID_SUPERCLASS"},
    {CMPI_RC_ERR_ALREADY_EXISTS, "CIM_ERR_ALREADY_EXISTS"},
    {CMPI_RC_ERR_NO_SUCH_PROPERTY, "CIM_ERR_NO_SUCH_PROPERTY"},
    {CMPI_RC_ERR_TYPE_MISMATCH, "CIM_ERR_TYPE_MISMATCH"},
    {CMPI_RC_ERR_QUERY_LANGUAGE_NOT_SUPPORTED, "CIM_ERR_QUERY_LANGUAGE_NOT_SUPPORTED"},
    {CMPI_RC_ERR_INVALID_QUERY, "CIM_ERR_INVALID_QUERY"},
    {CMPI_RC_ERR_METHOD_NOT_AVAILABLE, "CIM_ERR_METHOD_NOT_AVAILABLE"},
    {CMPI_RC_ERR_METHOD_NOT_FOUND, "CIM_ERR_METHOD_NOT_FOUND"},
    {CMPI_RC_ERR_SERVER_LIMITS_EXCEEDED, "CIM_ERR_SERVER_LIMITS_EXCEEDED"},
    {CMPI_RC_ERR_QUERY_FEATURE_NOT_SUPPORTED, "CIM_ERR_QUERY_FEATURE_NOT_SUPPORTED"},
}};

} // namespace

std::string statusName(CMPIrc code) {
    const auto* found = std::find_if(statusNames.begin(), statusNames.end(),
                                     [code](const auto& entry) { return entry.first == code; });
    return found == statusNames.end() ? "status " + std::to_string(code) : found->second;
}

bool isCimStatus(CMPIrc code) {
    return std::any_of(statusNames.begin(), statusNames.end(),
                       [code](const auto& entry) { return entry.first == code; });
}

} // namespace marlo

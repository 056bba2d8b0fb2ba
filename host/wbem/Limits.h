/**
 * @file
 * What one client may have of the service.
 */
#pragma once

#include "host/cimxml/Message.h"

#include <chrono>
#include <cstddef>

namespace marlo::wbem {

struct Limits {
    cimxml::Limits xml;
    std::size_t enumerations = 128;                        ///< open at once, of all users
    std::size_t enumerationsPerUser = 32;                  ///< open at once, of one
    std::size_t heldBytes = std::size_t{48} * 1024 * 1024; ///< of all results that wait to be pulled
    std::chrono::seconds operationTimeout{60};             ///< of an enumeration whose client names none
    std::chrono::seconds longestOperationTimeout{15 * 60}; ///< that a client may name
};

} // namespace marlo::wbem

/**
 * @file
 * Which associations an operation follows.
 */
#pragma once

#include <string>

namespace marlo {

/** An empty name stands for any (DSP0200, Associators and References). */
struct AssociationFilter {
    std::string associationClass; ///< or one that derives from it
    std::string resultClass;      ///< of what is at the other end, or one above it; of `references`: unused
    std::string role;             ///< the reference of the association that points at the start
    std::string resultRole;       ///< the reference that points at the other end; of `references`: unused
};

} // namespace marlo

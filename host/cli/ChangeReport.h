/**
 * @file
 * What a command that changes adapters did and what has changed.
 */
#pragma once

#include "host/cimom/ObjectManager.h"

#include <string>
#include <vector>

namespace marlo::cli {

/** A method or a modification that was asked for. */
struct Call {
    std::string name;
    Status status;
    MethodAnswer answer; ///< of a method that was answered; the value of a modification is NULL of no type
};

/** A property of an adapter that is not what it was. */
struct Difference {
    std::string adapter;
    std::string property;
    Value before;
    Value after;
};

struct ChangeReport {
    std::vector<Call> calls;
    std::vector<Difference> differences;
};

/**
 * What distinguishes two readings of the same class, in the order of the adapters and of the class. What is in one of
 * them alone is NULL in the other.
 */
std::vector<Difference> compare(const Class& definition, const std::vector<Instance>& before,
                                const std::vector<Instance>& after);

/** A table with a row for each difference, for a terminal of that width. */
std::string showDifferences(const std::vector<Difference>& differences, std::size_t width, bool colours);

} // namespace marlo::cli

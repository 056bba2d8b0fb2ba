/**
 * @file
 * In whose name this thread works.
 */
#pragma once

#include <string>

namespace marlo {

/** The user that an ActingFor of this thread names, else the user that the process works for. */
std::string actingPrincipal();

} // namespace marlo

/**
 * @file
 * CIM's status codes among CMPI's return codes.
 */
#pragma once

#include <cmpidt.h>

namespace marlo {

/** True for the codes that a client may see; the others are between broker and provider. */
bool isCimStatus(CMPIrc code);

} // namespace marlo

/**
 * @file
 * Texts that claim to be of a type.
 */
#pragma once

#include "host/cimxml/Document.h"
#include "host/model/Value.h"

#include <string>

namespace marlo::cimxml {

/** The type that the attribute TYPE names; throws MessageError when it is none. */
CMPIType readType(const Node& node);

/** The text as a value of a type or, where it is none, as a text. */
Value readOrKeep(const std::string& text, CMPIType type);

} // namespace marlo::cimxml

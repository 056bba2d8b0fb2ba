/**
 * @file
 * The names of DSP0201.
 */
#pragma once

#include <string_view>

namespace marlo::cimxml {

/** The name of an element as it stands in a table that is never gone; empty for a name that is none. */
std::string_view findElementName(std::string_view name);

/** The same for the attributes that mean something here. Both spellings of EmbeddedObject become that one. */
std::string_view findAttributeName(std::string_view name);

/** Whether an element holds text. */
bool holdsText(std::string_view element);

} // namespace marlo::cimxml

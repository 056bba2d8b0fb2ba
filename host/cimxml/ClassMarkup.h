/**
 * @file
 * Classes and qualifiers as DSP0201's elements.
 */
#pragma once

#include "host/cimxml/Writer.h"

#include <string>

namespace marlo::cimxml {

void appendQualifiers(std::string& out, const Qualifiers& qualifiers);

void appendClass(std::string& out, const Class& definition, const Form& form);

void appendQualifierType(std::string& out, const QualifierType& type);

} // namespace marlo::cimxml

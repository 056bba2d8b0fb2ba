/**
 * @file
 * Elements that hold classes and qualifiers.
 */
#pragma once

#include "host/cimxml/ObjectReader.h"
#include "host/schema/Schema.h"

namespace marlo::cimxml {

/** A CLASS. Both throw MessageError for what DSP0201 does not allow. */
Class readClass(const Node& node, const Within& within);

/** A QUALIFIER.DECLARATION. */
QualifierType readQualifierType(const Node& node);

} // namespace marlo::cimxml

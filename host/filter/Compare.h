/**
 * @file
 * How values of filters compare.
 */
#pragma once

#include "host/filter/Filter.h"

namespace marlo::filter {

/** What can be compared with what: each family with itself, and texts with characters and date-times. */
enum class Family { none, number, truth, text, character, dateTime };

/** The family of a CIM type; none for arrays, references and embedded instances. */
Family familyOf(CMPIType type);

/**
 * Numbers by their exact values whatever their types, texts by their code points, date-times by the moment or the
 * length. Unknown when either side is NULL, when they are of families that do not compare, a text is no date-time, or
 * one date-time is a moment and the other an interval.
 */
Truth compare(const Value& left, Relation relation, const Value& right);

} // namespace marlo::filter

/**
 * @file
 * Associations as the schema has them, between classes: what associators and references of a class are (DSP0200).
 */
#pragma once

#include "host/cimom/ObjectManager.h"

#include <string>
#include <string_view>
#include <vector>

namespace marlo::wbem {

/**
 * The association classes with a reference that an instance of the class fits into; of `filter` the class of the
 * association and the role count.
 */
std::vector<const Class*> referencesOf(const Schema& schema, std::string_view nameSpace, std::string_view className,
                                       const AssociationFilter& filter);

/** The classes at the other ends of such associations, each once. */
std::vector<const Class*> associatorsOf(const Schema& schema, std::string_view nameSpace, std::string_view className,
                                        const AssociationFilter& filter);

} // namespace marlo::wbem

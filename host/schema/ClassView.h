/**
 * @file
 * Classes as a client asked to see them (DSP0200: GetClass, EnumerateClasses, EnumerateClassNames).
 */
#pragma once

#include "host/schema/Schema.h"

#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace marlo {

struct ClassFilter {
    bool localOnly = true; ///< only properties, methods and qualifiers that the class itself declares or overrides
    bool includeQualifiers = true;
    bool includeClassOrigin = false;
    std::optional<std::vector<std::string>> properties; ///< others are left out; methods stay
};

/**
 * A copy with what the filter leaves. Property names that the class does not have are overlooked. Without class
 * origins, `origin` is empty throughout; without qualifiers, there are none of parameters either.
 */
Class viewClass(const Class& definition, const ClassFilter& filter);

/**
 * Below a class: the direct subclasses, or all with `deep`. Where `className` is empty: the classes without a
 * superclass, or all. Each after its superclass; none for an unknown class.
 */
std::vector<const Class*> subclasses(const Schema& schema, std::string_view nameSpace, std::string_view className,
                                     bool deep);

} // namespace marlo

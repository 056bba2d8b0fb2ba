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

/** A copy with what the filter leaves. Names that the class does not have are overlooked. */
Class viewClass(const Schema& schema, std::string_view nameSpace, const Class& definition, const ClassFilter& filter);

/** Below a class, or below the roots where `className` is empty: the direct subclasses, or all with `deep`. */
std::vector<const Class*> subclasses(const Schema& schema, std::string_view nameSpace, std::string_view className,
                                     bool deep);

} // namespace marlo

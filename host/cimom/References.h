/**
 * @file
 * Namespaces and references as clients and providers write them, made comparable.
 */
#pragma once

#include "host/model/Instance.h"
#include "host/schema/Schema.h"

#include <string>
#include <string_view>

namespace marlo {

/**
 * A namespace as the schema spells it: case and slashes at either end do not matter, and "interop" is "root/interop",
 * since that is where clients look first (DSP1033). One that the schema does not have is returned without the
 * slashes.
 */
std::string spellNameSpace(const Schema& schema, std::string_view nameSpace);

/**
 * A path as the schema has it: namespace (`nameSpace` where it has none), class and keys spelled, keys typed and in
 * order. The host is dropped, since all that this object manager knows of is on its own; so is one that stands
 * before the namespace without slashes of its own, and both may stand in the name of the class. What the schema does
 * not know, stays as it is.
 */
ObjectPath spellPath(const Schema& schema, const std::string& nameSpace, const ObjectPath& written);

/** A value with all its references, and those in their keys, as spellPath has them. Any other is returned as it is.
 */
Value spellReferences(const Schema& schema, const std::string& nameSpace, Value value);

} // namespace marlo

/**
 * @file
 * Whether a change that a client asks for makes sense, as far as the schema tells.
 */
#pragma once

#include "host/cimom/ClassChecks.h"

#include <string>
#include <vector>

namespace marlo {

/** What a provider's modifyInstance is called with. */
struct Modification {
    Instance instance;              ///< every property of the class: the new values, NULL for all others
    std::vector<std::string> names; ///< the properties to be changed, as the schema spells them
};

/**
 * The modification of `modified`, whose path has been checked. With a property list those properties are to be
 * changed, to NULL where the instance lacks them; without one, those of the instance that can be written. Throws
 * RequestError for names that the class does not have or that cannot be written, for values of another type and for
 * a key that is not the path's.
 */
Modification requireModification(const Schema& schema, const Class& definition, const Instance& modified,
                                 const PropertyList& properties);

/**
 * What a provider's createInstance is called with: the path with those keys that properties or path give, the
 * properties that are given and those that have a default. Throws RequestError for a class that cannot have instances
 * of its own, for names that the class does not have or that are given twice, for values of another type and for keys
 * of the path that are others than those of the properties.
 */
Instance requireCreation(const Schema& schema, const Class& definition, const std::string& nameSpace,
                         const Instance& instance);

/** The method of that name. Throws RequestError for an unknown one. */
const Method& requireMethod(const Class& definition, const std::string& name);

/**
 * The path that a method is called on: all keys, as requireKeys has it, or, for a method that belongs to the class
 * (qualifier Static), none. Throws RequestError.
 */
ObjectPath requireMethodPath(const Schema& schema, const Class& definition, const Method& method,
                             const ObjectPath& path);

/**
 * The arguments as the schema spells and types them, in its order. Throws RequestError for one that the method does
 * not take, that is given twice, or that is of another type. A parameter that is not given is left out.
 */
std::vector<NamedValue> requireArguments(const Schema& schema, const std::string& nameSpace, const Method& method,
                                         const std::vector<NamedValue>& arguments);

/** A value as one of another type, an array element by element, NULL as NULL; nothing when it cannot be that. */
std::optional<Value> convertValue(const Value& value, CMPIType type);

/** "uint16" or "string[]". */
std::string fullTypeName(CMPIType type);

} // namespace marlo

/**
 * @file
 * Whether a request makes sense, as far as the schema tells.
 */
#pragma once

#include "host/cimom/ObjectManager.h"

#include <optional>
#include <string>
#include <vector>

namespace marlo {

/** A request that is refused before any provider sees it. */
class RequestError : public std::runtime_error {
  public:
    RequestError(CMPIrc code, const std::string& message) : std::runtime_error(message), _code(code) {}

    [[nodiscard]] CMPIrc code() const { return _code; }

  private:
    CMPIrc _code;
};

/** The class of a request. Throws RequestError for an unknown namespace or class. */
const Class& requireClass(const Schema& schema, const std::string& nameSpace, const std::string& className);

/** Throws RequestError for a name that neither the class nor a class derived from it has. */
void requireProperties(const Schema& schema, const std::string& nameSpace, const Class& definition,
                       const PropertyList& properties);

/**
 * The names to ask a provider of `definition` for: those of the list that the class has, as the schema spells them,
 * and the class's keys. No list asks for all.
 */
PropertyList namesToAsk(const Class& definition, const PropertyList& properties);

/**
 * The path of an instance of the class, spelled and typed as the schema has it, the keys in its order, references
 * among them as spellReferences has them. Throws RequestError for a key that is missing, unknown or of another type.
 */
ObjectPath requireKeys(const Schema& schema, const Class& definition, const std::string& nameSpace,
                       const ObjectPath& path);

/**
 * A value as one of another type: integers where their number fits, texts as date-times and paths where they are
 * such. Nothing when it cannot be that. A value of the type itself is returned as it is.
 */
std::optional<Value> convertKey(const Value& value, CMPIType type);

} // namespace marlo

/**
 * @file
 * What the broker asks of the schema.
 */
#pragma once

#include "host/model/Value.h"

#include <string>
#include <string_view>
#include <vector>

namespace marlo::broker {

/**
 * Class definitions as far as a broker needs them. Names are compared without case; what is returned lives as long as
 * the view. Called from any thread.
 */
class SchemaView {
  public:
    virtual ~SchemaView() = default;

    /** The names of a class's key properties; null for an unknown class. */
    [[nodiscard]] virtual const std::vector<std::string>* keys(std::string_view nameSpace,
                                                               std::string_view className) const = 0;
    /** True when the class is `ancestor` or derives from it. */
    [[nodiscard]] virtual bool isA(std::string_view nameSpace, std::string_view className,
                                   std::string_view ancestor) const = 0;

    /** Values of qualifiers; null for what does not exist. */
    [[nodiscard]] virtual const Value* classQualifier(std::string_view nameSpace, std::string_view className,
                                                      std::string_view qualifier) const = 0;
    [[nodiscard]] virtual const Value* propertyQualifier(std::string_view nameSpace, std::string_view className,
                                                         std::string_view property,
                                                         std::string_view qualifier) const = 0;
    [[nodiscard]] virtual const Value* methodQualifier(std::string_view nameSpace, std::string_view className,
                                                       std::string_view method, std::string_view qualifier) const = 0;
    [[nodiscard]] virtual const Value* parameterQualifier(std::string_view nameSpace, std::string_view className,
                                                          std::string_view method, std::string_view parameter,
                                                          std::string_view qualifier) const = 0;

  protected:
    SchemaView() = default;
    SchemaView(const SchemaView&) = default;
    SchemaView& operator=(const SchemaView&) = default;
};

} // namespace marlo::broker

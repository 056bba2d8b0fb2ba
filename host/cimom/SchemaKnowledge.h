/**
 * @file
 * The schema as brokers ask about it.
 */
#pragma once

#include "host/broker/SchemaView.h"
#include "host/schema/Schema.h"

#include <unordered_map>

namespace marlo {

/** A view of a schema, which must outlive it. */
class SchemaKnowledge final : public broker::SchemaView {
  public:
    explicit SchemaKnowledge(const Schema& schema);

    [[nodiscard]] const std::vector<std::string>* keys(std::string_view nameSpace,
                                                       std::string_view className) const override;
    [[nodiscard]] bool isA(std::string_view nameSpace, std::string_view className,
                           std::string_view ancestor) const override;
    [[nodiscard]] const Value* classQualifier(std::string_view nameSpace, std::string_view className,
                                              std::string_view qualifier) const override;
    [[nodiscard]] const Value* propertyQualifier(std::string_view nameSpace, std::string_view className,
                                                 std::string_view property,
                                                 std::string_view qualifier) const override;
    [[nodiscard]] const Value* methodQualifier(std::string_view nameSpace, std::string_view className,
                                               std::string_view method, std::string_view qualifier) const override;
    [[nodiscard]] const Value* parameterQualifier(std::string_view nameSpace, std::string_view className,
                                                  std::string_view method, std::string_view parameter,
                                                  std::string_view qualifier) const override;

  private:
    const Schema& _schema;
    std::unordered_map<const Class*, std::vector<std::string>> _keys;
};

} // namespace marlo

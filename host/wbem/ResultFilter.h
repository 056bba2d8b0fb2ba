/**
 * @file
 * FilterQuery and FilterQueryLanguage of the operations that open an enumeration.
 */
#pragma once

#include "host/cimom/SchemaKnowledge.h"
#include "host/filter/Filter.h"
#include "host/wbem/Arguments.h"

#include <optional>
#include <string>

namespace marlo::wbem {

/** Which results of an enumeration its client wants. */
class ResultFilter {
  public:
    /**
     * The two parameters come together or not at all. Throws RequestError for a language that there is not (14) and
     * for a query that is wrong or asks for what the schema does not have. `schema` outlives this.
     */
    ResultFilter(const Schema& schema, const std::string& nameSpace, const Arguments& arguments);

    [[nodiscard]] bool isGiven() const { return _filter.has_value(); }

    /** True where no filter is given; what is selected does not count, only the condition and the class. */
    [[nodiscard]] bool matches(const Instance& instance) const;

  private:
    std::optional<filter::Filter> _filter;
    std::optional<SchemaKnowledge> _knowledge;
};

} // namespace marlo::wbem

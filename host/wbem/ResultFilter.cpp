#include "host/wbem/ResultFilter.h"

#include "host/broker/InstanceSubject.h"

namespace marlo::wbem {

ResultFilter::ResultFilter(const Schema& schema, const std::string& nameSpace, const Arguments& arguments) {
    if (!arguments.has("FilterQuery") && !arguments.has("FilterQueryLanguage")) {
        return;
    }
    const std::string name = arguments.text("FilterQueryLanguage");
    const std::string query = arguments.text("FilterQuery");
    const auto language = filter::readLanguage(name);
    if (!language) {
        throw RequestError(CMPI_RC_ERR_QUERY_LANGUAGE_NOT_SUPPORTED,
                           "the query language '" + name + "' is not supported, but WQL and DMTF:CQL");
    }
    try {
        _filter = filter::Filter::parse(query, *language);
        _filter->check(schema, nameSpace);
    } catch (const filter::Error& error) {
        throw RequestError(error.code(), error.what());
    }
    _knowledge.emplace(schema);
}

bool ResultFilter::matches(const Instance& instance) const {
    return !_filter || _filter->matches(broker::InstanceSubject(instance, *_knowledge));
}

} // namespace marlo::wbem

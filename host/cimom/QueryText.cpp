#include "host/cimom/QueryText.h"

#include "host/cimom/ClassChecks.h"

#include <utility>

namespace marlo {

filter::Filter readQuery(const Schema& schema, const std::string& nameSpace, const std::string& text,
                         const std::string& language, const std::string& what) {
    if (!schema.hasNameSpace(nameSpace)) {
        requireClass(schema, nameSpace, ""); // says which namespaces there are
    }
    const auto known = filter::readLanguage(language);
    if (!known) {
        throw RequestError(CMPI_RC_ERR_QUERY_LANGUAGE_NOT_SUPPORTED,
                           "unknown query language '" + language + "', known are WQL and CQL");
    }
    try {
        filter::Filter parsed = filter::Filter::parse(text, *known);
        parsed.check(schema, nameSpace);
        return parsed;
    } catch (const filter::Error& error) {
        throw RequestError(error.code(), what + " is refused: " + error.what());
    }
}

} // namespace marlo

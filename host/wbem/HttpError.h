/**
 * @file
 * A request that is refused by an HTTP status, before CIM has a say.
 */
#pragma once

#include "host/http/Message.h"

#include <stdexcept>
#include <string>
#include <utility>

namespace marlo::wbem {

class HttpError : public std::runtime_error {
  public:
    /** `cimError` is the word for the field CIMError (DSP0200), empty for none; `what` becomes the body. */
    HttpError(unsigned status, std::string cimError, const std::string& what, http::Fields fields = {})
        : std::runtime_error(what), _status(status), _cimError(std::move(cimError)), _fields(std::move(fields)) {}

    [[nodiscard]] unsigned status() const { return _status; }

    [[nodiscard]] const std::string& cimError() const { return _cimError; }

    /** More fields of the answer. */
    [[nodiscard]] const http::Fields& fields() const { return _fields; }

  private:
    unsigned _status;
    std::string _cimError;
    http::Fields _fields;
};

} // namespace marlo::wbem

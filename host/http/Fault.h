/**
 * @file
 * What is no request.
 */
#pragma once

#include <stdexcept>
#include <string>

namespace marlo::http {

/** What came is no HTTP, or too much of it. The connection cannot be used any further. */
class Fault : public std::runtime_error {
  public:
    Fault(unsigned status, const std::string& reason) : std::runtime_error(reason), _status(status) {}

    /** Of the answer: 400, 413, 431, 501 or 505. */
    [[nodiscard]] unsigned status() const { return _status; }

  private:
    unsigned _status;
};

} // namespace marlo::http

/**
 * @file
 * Why a filter is refused.
 */
#pragma once

#include <cstddef>
#include <stdexcept>
#include <string>
#include <string_view>

#include <cmpidt.h>

namespace marlo::filter {

/**
 * What is wrong with a filter, and where. `what()` is "line L, column C: REASON"; lines and columns count from 1,
 * columns in characters.
 */
class Error : public std::runtime_error {
  public:
    /** `offset` counts the bytes of `text` before the place. */
    Error(CMPIrc code, std::string_view text, std::size_t offset, const std::string& reason);

    /**
     * CMPI_RC_ERR_INVALID_QUERY; CMPI_RC_ERR_INVALID_CLASS when the class of FROM is unknown;
     * CMPI_RC_ERR_QUERY_FEATURE_NOT_SUPPORTED for what the language has and this does not.
     */
    [[nodiscard]] CMPIrc code() const { return _code; }

    [[nodiscard]] std::size_t offset() const { return _offset; }

  private:
    CMPIrc _code;
    std::size_t _offset;
};

} // namespace marlo::filter

/**
 * @file
 * Standard output and standard error of the program.
 */
#pragma once

#include <cstddef>
#include <stdexcept>
#include <string_view>

namespace marlo::cli {

/** Standard output did not take what was written. */
class OutputError : public std::runtime_error {
  public:
    explicit OutputError(int error);

    /** True when the reader has gone away, which is no mistake of anybody's. */
    [[nodiscard]] bool readerIsGone() const { return _readerIsGone; }

  private:
    bool _readerIsGone;
};

/**
 * Standard output. `write` never throws, so that it may be called below a provider's frames; what went wrong is kept,
 * and reported by `finish`.
 */
class Output {
  public:
    void write(std::string_view text) noexcept;

    /** Hands over what is buffered; throws OutputError when anything that was written has been lost. */
    void finish();

    [[nodiscard]] bool failed() const { return _error != 0; }

  private:
    int _error = 0;
};

/** Columns of the terminal on standard output; 0 when it is none. */
std::size_t terminalWidth();

/** Whether standard output shows colours: a terminal, not a dumb one, and NO_COLOR is not set. */
bool showsColours();

/** A line "marlo: ..." on standard error. */
void complain(std::string_view text);

} // namespace marlo::cli

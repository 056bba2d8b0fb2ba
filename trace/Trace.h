/**
 * @file
 * How the providers report what they do: line formats, entry and exit marks, and their one exception type.
 *
 * Every event goes twice to LumLog, once to the log and once to the trace, with the same text, place and level.
 */
#pragma once

#include "instrumentation/LumLog.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <cstddef>
#include <cstring>
#include <exception>
#include <limits>
#include <string>
#include <string_view>
#include <utility>

namespace Orv {

/** Line kind of the first `trace` formatter. */
enum MessageType : int {
    TRACE_ENTERING = 0,
    TRACE_EXITING = 1,
    TRACE_METHOD = 2,
    TRACE_MESSAGE = 3,
};

/** Levels of the lines that the providers write. */
enum TraceLevel : int {
    LEVEL_FILTERED = 3000, ///< an element that is left out on purpose
    LEVEL_FLOW = 4000,     ///< routine flow and variables
    LEVEL_FAILURE = 6000,
};

/** Size of each formatter's buffer; longer lines are cut. */
inline constexpr std::size_t TRACE_BUFFER_SIZE = 512;
using TraceBuffer = std::array<char, TRACE_BUFFER_SIZE>;

/** Fills a buffer piece by piece; what does not fit before its last byte, which stays zero, is cut. */
class TraceLine {
  public:
    /** Clears `buffer`, which must outlive this. */
    explicit TraceLine(TraceBuffer& buffer) : _next(buffer.data()), _end(buffer.data() + buffer.size() - 1) {
        buffer.fill('\0');
    }

    TraceLine& operator<<(std::string_view text) {
        const std::size_t length = std::min(text.size(), static_cast<std::size_t>(_end - _next));
        std::memcpy(_next, text.data(), length);
        _next += length;
        return *this;
    }

    /** A null text shows as "(null)". */
    TraceLine& operator<<(const char* text) { return *this << std::string_view(text != nullptr ? text : "(null)"); }

    /** The number shows signed: 4294967295 reads -1. */
    TraceLine& operator<<(unsigned number) {
        std::array<char, std::numeric_limits<int>::digits10 + 2> digits;
        const auto end = std::to_chars(digits.begin(), digits.end(), static_cast<int>(number)).ptr;
        return *this << std::string_view(digits.begin(), static_cast<std::size_t>(end - digits.begin()));
    }

  private:
    char* _next;
    char* _end;
};

/*
 * Each formatter owns one static buffer that all its callers share, on all threads and without a lock: a line is
 * handed to the logger at once, and two threads that format at the same time may mix their texts. The last byte is
 * never anything but zero, so that even a mixed text ends inside the buffer.
 *
 * A provider call writes dozens of lines for each adapter, and nearly all of them are discarded by their level after
 * they were formatted: putting the pieces together costs a fraction of what printf takes to interpret a format.
 */

/**
 * Formats a line of a kind: `function` is the function's name, or the message text for TRACE_MESSAGE. Returns the
 * buffer, which holds an empty text for any other `type`. The text is good until the next call.
 */
inline char* trace(const char* file, const char* function, unsigned line, MessageType type) {
    static TraceBuffer buffer;
    TraceLine text(buffer);
    switch (type) {
    case TRACE_ENTERING:
        text << "ENTERING: " << function << "() in " << file << " [Line: " << line << "]";
        break;
    case TRACE_EXITING:
        text << "EXITING: " << function << "() in " << file << " [Line: " << line << "]";
        break;
    case TRACE_METHOD:
        text << "METHOD: " << function << "() was invoked in " << file << " [Line: " << line << "]";
        break;
    case TRACE_MESSAGE:
        text << "MESSAGE [File: " << file << ", Line: " << line << "]: " << function;
        break;
    }
    return buffer.data();
}

/** Formats the line of a variable with a text. Returns the buffer; the text is good until the next call. */
inline char* trace(const char* name, const char* file, unsigned line, const char* value) {
    static TraceBuffer buffer;
    TraceLine(buffer) << "VARIABLE: '" << name << "' has Value '" << value << "' at line " << line << " in " << file;
    return buffer.data();
}

/** Formats the line of a variable with a number. Returns the buffer; the text is good until the next call. */
inline char* trace(const char* name, const char* file, unsigned line, unsigned value) {
    static TraceBuffer buffer;
    TraceLine(buffer) << "VARIABLE: '" << name << "' has Value '" << value << "' at line " << line << " in " << file;
    return buffer.data();
}

/**
 * The place that logs: one object per function, made with the unit's logger name, the unit's bare name and
 * `__func__`. All three must outlive it. Every operation writes one line to the log and the same line to the trace;
 * `line` is the caller's own unless told otherwise.
 */
class ProviderLog {
  public:
    ProviderLog(const std::string& logger, const char* file, const char* function)
        : _logger(logger), _file(file), _function(function) {}

    void entering(unsigned line = __builtin_LINE()) const {
        write(LEVEL_FLOW, line, [&] { return trace(_file, _function, line, TRACE_ENTERING); });
    }

    void exiting(unsigned line = __builtin_LINE()) const {
        write(LEVEL_FLOW, line, [&] { return trace(_file, _function, line, TRACE_EXITING); });
    }

    void variable(const char* name, const std::string& value, unsigned line = __builtin_LINE()) const {
        write(LEVEL_FLOW, line, [&] { return trace(name, _file, line, value.c_str()); });
    }

    void variable(const char* name, unsigned value, unsigned line = __builtin_LINE()) const {
        write(LEVEL_FLOW, line, [&] { return trace(name, _file, line, value); });
    }

    void message(int level, const char* text, unsigned line = __builtin_LINE()) const {
        write(level, line, [&] { return trace(_file, text, line, TRACE_MESSAGE); });
    }

    /** Writes what `format` returns; it is called for the log and again for the trace. */
    template <typename Format>
    void write(int level, unsigned line, Format format) const {
        const int place = static_cast<int>(line);
        LumLog::LumMessageBuffer buffer;
        buffer << format();
        LumLog::LumLogger::logLevelMessage(_function, _file, place, _logger, level, nullptr, 0, 0,
                                           buffer.str(buffer));
        buffer << format();
        LumLog::LumLogger::traceLevelMessage(_function, _file, place, _logger, level, nullptr, 0, 0,
                                             buffer.str(buffer));
    }

  private:
    const std::string& _logger;
    const char* _file;
    const char* _function;
};

/** Separates the lines of one provider call from those of the next. */
inline constexpr const char* TRACE_BANNER =
    "==============================================================================";

/** Opens a provider call: a banner, then the ENTERING line of `function`. */
inline void markProviderEntry(const std::string& logger, const char* file, const char* function, unsigned line) {
    const ProviderLog log(logger, "Trace", __func__);
    log.write(LEVEL_FLOW, __LINE__, [] { return TRACE_BANNER; });
    log.write(LEVEL_FLOW, __LINE__, [&] { return trace(file, function, line, TRACE_ENTERING); });
}

/** Closes a provider call: the EXITING line of `function`, then a banner. */
inline void markProviderExit(const std::string& logger, const char* file, const char* function, unsigned line) {
    const ProviderLog log(logger, "Trace", __func__);
    log.write(LEVEL_FLOW, __LINE__, [&] { return trace(file, function, line, TRACE_EXITING); });
    log.write(LEVEL_FLOW, __LINE__, [] { return TRACE_BANNER; });
}

/** What the providers themselves throw: one message. */
class ProviderException : public std::exception {
  public:
    explicit ProviderException(std::string message) : _message(std::move(message)) {}

    [[nodiscard]] const char* what() const noexcept override { return _message.c_str(); }

  private:
    std::string _message;
};

} // namespace Orv

/**
 * @file
 * The agent's logging library.
 *
 * A line carries a level: 3000 for a filtered element, 4000 for routine flow and variables, 6000 for failures. The
 * agent decides by its configuration which levels are kept and where they go; the callers configure nothing.
 */
#pragma once

#include "instrumentation/Export.h"

#include <string>

namespace LumLog {

/** A text under construction on the caller's stack. Not shared between threads. */
class ORV_API LumMessageBuffer {
  public:
    LumMessageBuffer();
    ~LumMessageBuffer();
    LumMessageBuffer(const LumMessageBuffer&) = delete;
    LumMessageBuffer& operator=(const LumMessageBuffer&) = delete;

    /** Appends a zero-terminated text; null appends nothing. */
    LumMessageBuffer& operator<<(const char* text);

    /** Takes the text out of `buffer`, which is empty afterwards. */
    std::string str(LumMessageBuffer& buffer);

  private:
    struct State;
    State* _state;
};

/** Where lines go. Both operations may be called from any thread and never throw. */
class ORV_API LumLogger {
  public:
    /**
     * Writes a line to the log: what happened, for administrators.
     *
     * `function`, `file` and `line` are the place that logs, `logger` is the name it logs under, `level` the level.
     * The three arguments before the text are reserved: null, 0 and 0.
     */
    static void logLevelMessage(const char* function, const char* file, int line, const std::string& logger,
                                int level, char* reserved, int reserved1, int reserved2, const std::string& message);

    /** Writes a line to the trace: how it came about, for engineers. The same arguments. */
    static void traceLevelMessage(const char* function, const char* file, int line, const std::string& logger,
                                  int level, char* reserved, int reserved1, int reserved2,
                                  const std::string& message);
};

} // namespace LumLog

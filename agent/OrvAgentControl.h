/**
 * @file
 * What a process that hosts providers may ask of the agent library beside the providers' own view of it.
 *
 * C functions, to be found with dlsym: an agent library without them is a good agent library all the same.
 */
#ifndef ORV_AGENT_CONTROL_H
#define ORV_AGENT_CONTROL_H

#include "instrumentation/Export.h"

#ifdef __cplusplus
extern "C" {
#endif

/** Receives a logged line on the thread that logs it. Must not log and must not throw. */
// NOLINTNEXTLINE(modernize-use-using): C reads it too
typedef void (*OrvAgentLogObserver)(int level, const char* logger, const char* message, void* context);

/**
 * Has every line of at least `level` that is given to the log (not the trace) shown to `observer`, whatever the
 * configured threshold; null ends it. One observer at a time. May be called from any thread; a call of the former
 * observer that is already under way on another thread may end after the function has returned.
 *
 * A line that the observer is shown is not written to the log's sink "stderr" as well: the process that owns that
 * stream decides then what people read there, and would show it twice. All other sinks get it as ever.
 */
ORV_API void OrvAgent_observeLog(int level, OrvAgentLogObserver observer, void* context);

#ifdef __cplusplus
}
#endif

#endif

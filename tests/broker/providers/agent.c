/**
 * @file
 * An agent library that does nothing but log, as the agent does, to whoever observes it.
 */
#include "agent/OrvAgentControl.h"

#include <stddef.h>

#define EXPORTED __attribute__((visibility("default")))

static OrvAgentLogObserver observer;
static void* observer_context;
static int observed_level;

EXPORTED void OrvAgent_observeLog(int level, OrvAgentLogObserver function, void* context) {
    observed_level = level;
    observer_context = context;
    observer = function;
}

EXPORTED void log_line(int level, const char* message);

EXPORTED void log_line(int level, const char* message) {
    if (observer != NULL && level >= observed_level) {
        observer(level, "agent", message, observer_context);
    }
}

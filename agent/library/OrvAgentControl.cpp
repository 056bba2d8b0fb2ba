#include "agent/OrvAgentControl.h"

#include "agent/library/Log.h"

void OrvAgent_observeLog(int level, OrvAgentLogObserver observer, void* context) {
    Orv::Agent::Log::instance().observe(level, observer, context);
}

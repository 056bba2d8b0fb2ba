/**
 * @file
 * Everything that a broker offers, called from C through the standard's macros.
 */
#ifndef TESTS_BROKER_PROVIDERS_EXERCISE_H
#define TESTS_BROKER_PROVIDERS_EXERCISE_H

#include <cmpift.h>

/** Returns the first expectation that does not hold, as text, or null. `path` has the keys Id and Number. */
const char* exercise_broker(const CMPIBroker* broker, const CMPIContext* context, const CMPIObjectPath* path);

#endif

/**
 * @file
 * Providers of indications that do what a test says: `FirstAlerts` and `SecondAlerts`.
 */
#ifndef TESTS_BROKER_PROVIDERS_ALERTS_H
#define TESTS_BROKER_PROVIDERS_ALERTS_H

#ifdef __cplusplus
extern "C" {
#endif

/** What both were called for since the last time, a line each; lives until the next call of this. */
const char* alerts_takeCalls(void);

/**
 * Lets one function of a provider fail from now on: it answers CMPI_RC_ERR_ACCESS_DENIED, or throws where `mode` is
 * 2; 0 ends that. `deliver` as the function: activateFilter delivers one indication before it returns.
 */
void alerts_misbehave(const char* provider, const char* function, int mode);

/**
 * Delivers an indication on this thread, attached as CMPI has it; the result is the return code, or -1 when it could
 * not be made. `number` becomes the property Number; a text `extra` "Name=value" is set as a further text property.
 */
int alerts_deliver(const char* nameSpace, const char* className, unsigned number, const char* extra);

/** Starts a detached thread of the broker for each of `count` indications, numbered from 0. */
void alerts_burst(const char* className, unsigned count);

/** Threads of a burst wait before they deliver while this is held. */
void alerts_hold(int held);

/** Threads of bursts that have come to their end, and how many deliveries of theirs failed. */
unsigned alerts_ended(void);
unsigned alerts_failed(void);

#ifdef __cplusplus
}
#endif

#endif

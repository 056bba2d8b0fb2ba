/**
 * @file
 * CMPI 2.0 (The Open Group, C061): platform types.
 *
 * The threads, mutexes and condition variables of the broker's extended function table are opaque pointers; a thread
 * function and a thread's exit value are plain `void *`.
 */
#ifndef CMPI_CMPIOS_H
#define CMPI_CMPIOS_H

#include <time.h> /* struct timespec, the absolute end of CMPIBrokerExtFT.timedCondWait */

#define CMPI_THREAD_TYPE void*
#define CMPI_THREAD_RETURN void*
#define CMPI_THREAD_CDECL
#define CMPI_THREAD_KEY_TYPE unsigned int
#define CMPI_MUTEX_TYPE void*
#define CMPI_COND_TYPE void*

/** C linkage and default visibility: what an exported provider factory needs. */
#if defined(__cplusplus)
#define CMPI_EXTERN_C extern "C" __attribute__((visibility("default")))
#else
#define CMPI_EXTERN_C extern __attribute__((visibility("default")))
#endif

#endif

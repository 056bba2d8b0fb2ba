#pragma once

#include <cmpimacs.h>

#ifdef __cplusplus
extern "C" {
#endif

/* A status that CMReturn filled, and a function table that C initialised. */
CMPIStatus statusReturnedInC(void);
const CMPIInstanceMIFT* tableBuiltInC(void);

#ifdef __cplusplus
}
#endif

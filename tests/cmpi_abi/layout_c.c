/* The header definitions as C11 sees them; what the compiler cannot say at compile time is asked by the test. */
#include "tests/cmpi_abi/layout_c.h"

#include "tests/cmpi_abi/layout.h"

static CMPIStatus fillsStatus(void) {
    CMReturn(CMPI_RC_ERR_NOT_FOUND);
}

CMPIStatus statusReturnedInC(void) {
    return fillsStatus();
}

static CMPIStatus noCleanup(CMPIInstanceMI* mi, const CMPIContext* context, CMPIBoolean terminating) {
    (void)mi;
    (void)context;
    (void)terminating;
    CMReturn(CMPI_RC_OK);
}

const CMPIInstanceMIFT* tableBuiltInC(void) {
    static const CMPIInstanceMIFT table = {
        CMPI_VERSION, CMPI_VERSION, "instanceBuiltInC", noCleanup, NULL, NULL, NULL, NULL, NULL, NULL, NULL};
    return &table;
}

/**
 * @file
 * A provider whose agent logs: routine, one failure twice and another once, then a failure of what it asks another
 * provider for.
 */
#include <cmpimacs.h>

void log_line(int level, const char* message);

static const CMPIBroker* broker;

static CMPIStatus cleanup(CMPIInstanceMI* mi, const CMPIContext* context, CMPIBoolean terminating) {
    (void)mi;
    (void)context;
    (void)terminating;
    CMReturn(CMPI_RC_OK);
}

static CMPIStatus names(CMPIInstanceMI* mi, const CMPIContext* context, const CMPIResult* result,
                        const CMPIObjectPath* reference) {
    (void)mi;
    (void)context;
    (void)result;
    (void)reference;
    log_line(6000, "within");
    CMReturn(CMPI_RC_OK);
}

static CMPIStatus instances(CMPIInstanceMI* mi, const CMPIContext* context, const CMPIResult* result,
                            const CMPIObjectPath* reference, const char** properties) {
    (void)mi;
    (void)result;
    (void)properties;
    log_line(4000, "routine");
    log_line(6000, "failure");
    log_line(6000, "failure");
    log_line(6000, "other failure");
    CBEnumInstanceNames(broker, context, reference, NULL);
    CMReturn(CMPI_RC_OK);
}

static CMPIStatus create(CMPIInstanceMI* mi, const CMPIContext* context, const CMPIResult* result,
                         const CMPIObjectPath* reference, const CMPIInstance* instance) {
    (void)instance;
    return names(mi, context, result, reference);
}

static CMPIStatus modify(CMPIInstanceMI* mi, const CMPIContext* context, const CMPIResult* result,
                         const CMPIObjectPath* reference, const CMPIInstance* instance, const char** properties) {
    (void)instance;
    (void)properties;
    return names(mi, context, result, reference);
}

static CMPIStatus query(CMPIInstanceMI* mi, const CMPIContext* context, const CMPIResult* result,
                        const CMPIObjectPath* reference, const char* text, const char* language) {
    (void)text;
    (void)language;
    return names(mi, context, result, reference);
}

static const CMPIInstanceMIFT table = {
    CMPI_VERSION, CMPI_VERSION, "instanceLogging", cleanup, names, instances, instances, create, modify, names, query,
};

static CMPIInstanceMI interface = {NULL, &table};

CMPI_EXTERN_C CMPIInstanceMI* Logging_Create_InstanceMI(const CMPIBroker* mb, const CMPIContext* context,
                                                        CMPIStatus* status) {
    (void)context;
    (void)status;
    broker = mb;
    return &interface;
}

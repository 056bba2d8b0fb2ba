/**
 * @file
 * A well-behaved provider in C: two instances of whatever class it is asked for, and, under the identity "exercise",
 * a walk through everything that a broker offers.
 */
#include "tests/broker/providers/exercise.h"

#include <cmpimacs.h>
#include <string.h>

static const CMPIBroker* broker;

static int is_asked(const char** properties, const char* name) {
    if (properties == NULL) {
        return 1;
    }
    for (; *properties != NULL; ++properties) {
        if (strcmp(*properties, name) == 0) {
            return 1;
        }
    }
    return 0;
}

/* The names of the property list as an array: what the object manager asked for. */
static CMPIArray* list_of(const char** properties) {
    CMPICount count = 0;
    while (properties != NULL && properties[count] != NULL) {
        ++count;
    }
    CMPIArray* array = CMNewArray(broker, count, CMPI_string, NULL);
    for (CMPICount i = 0; i < count; ++i) {
        CMSetArrayElementAt(array, i, properties[i], CMPI_chars);
    }
    return array;
}

static CMPIInstance* make_thing(const CMPIObjectPath* reference, const char** properties, const char* id,
                                CMPIUint16 number) {
    const char* name_space = CMGetCharPtr(CMGetNameSpace(reference, NULL));
    const char* class_name = CMGetCharPtr(CMGetClassName(reference, NULL));
    CMPIObjectPath* path = CMNewObjectPath(broker, name_space, class_name, NULL);
    CMSetHostname(path, "thing.example");
    CMPIInstance* thing = CMNewInstance(broker, path, NULL);
    if (is_asked(properties, "Id")) {
        CMSetProperty(thing, "Id", id, CMPI_chars);
    }
    if (is_asked(properties, "Number")) {
        CMSetProperty(thing, "Number", &number, CMPI_uint16);
    }
    CMPIArray* list = list_of(properties);
    CMSetProperty(thing, "List", &list, CMPI_stringA);
    CMSetProperty(thing, "note", class_name, CMPI_chars); /* spelled its own way */
    return thing;
}

static CMPIStatus cleanup(CMPIInstanceMI* mi, const CMPIContext* context, CMPIBoolean terminating) {
    (void)mi;
    (void)context;
    (void)terminating;
    CMReturn(CMPI_RC_OK);
}

static CMPIStatus enumerate_instances(CMPIInstanceMI* mi, const CMPIContext* context, const CMPIResult* result,
                                      const CMPIObjectPath* reference, const char** properties) {
    (void)mi;
    (void)context;
    CMReturnInstance(result, make_thing(reference, properties, "a", 1));
    CMReturnInstance(result, make_thing(reference, properties, "b", 2));
    CMReturnDone(result);
    CMReturn(CMPI_RC_OK);
}

static CMPIStatus enumerate_instance_names(CMPIInstanceMI* mi, const CMPIContext* context, const CMPIResult* result,
                                           const CMPIObjectPath* reference) {
    (void)mi;
    (void)context;
    CMReturnObjectPath(result, CMGetObjectPath(make_thing(reference, NULL, "a", 1), NULL));
    CMReturnObjectPath(result, CMGetObjectPath(make_thing(reference, NULL, "b", 2), NULL));
    CMReturn(CMPI_RC_OK); /* without CMReturnDone, which nobody must need */
}

static CMPIStatus get_instance(CMPIInstanceMI* mi, const CMPIContext* context, const CMPIResult* result,
                               const CMPIObjectPath* reference, const char** properties) {
    (void)mi;
    const char* id = CMGetCharPtr(CMGetKey(reference, "Id", NULL).value.string);
    const CMPIUint16 number = CMGetKey(reference, "Number", NULL).value.uint16;
    if (strcmp(id, "exercise") == 0) {
        CMPIInstance* report = make_thing(reference, properties, id, number);
        const char* failure = exercise_broker(broker, context, reference);
        CMSetProperty(report, "Note", failure == NULL ? "good" : failure, CMPI_chars);
        CMReturnInstance(result, report);
    } else if (number == 1 && strcmp(id, "a") == 0) {
        CMReturnInstance(result, make_thing(reference, properties, id, number));
    }
    CMReturnDone(result);
    CMReturn(CMPI_RC_OK);
}

static CMPIStatus create_instance(CMPIInstanceMI* mi, const CMPIContext* context, const CMPIResult* result,
                                  const CMPIObjectPath* reference, const CMPIInstance* instance) {
    (void)mi;
    (void)context;
    (void)result;
    (void)reference;
    (void)instance;
    CMReturn(CMPI_RC_ERR_NOT_SUPPORTED);
}

static CMPIStatus modify_instance(CMPIInstanceMI* mi, const CMPIContext* context, const CMPIResult* result,
                                  const CMPIObjectPath* reference, const CMPIInstance* instance,
                                  const char** properties) {
    (void)properties;
    return create_instance(mi, context, result, reference, instance);
}

static CMPIStatus delete_instance(CMPIInstanceMI* mi, const CMPIContext* context, const CMPIResult* result,
                                  const CMPIObjectPath* reference) {
    return create_instance(mi, context, result, reference, NULL);
}

static CMPIStatus exec_query(CMPIInstanceMI* mi, const CMPIContext* context, const CMPIResult* result,
                             const CMPIObjectPath* reference, const char* query, const char* language) {
    (void)query;
    (void)language;
    return create_instance(mi, context, result, reference, NULL);
}

static const CMPIInstanceMIFT table = {
    CMPI_VERSION,        CMPI_VERSION, "instanceThingProvider", cleanup,         enumerate_instance_names,
    enumerate_instances, get_instance, create_instance,         modify_instance, delete_instance,
    exec_query,
};

static CMPIInstanceMI interface = {NULL, &table};

CMPI_EXTERN_C CMPIInstanceMI* ThingProvider_Create_InstanceMI(const CMPIBroker* mb, const CMPIContext* context,
                                                              CMPIStatus* status) {
    (void)context;
    broker = mb;
    CMSetStatus(status, CMPI_RC_OK);
    return &interface;
}

CMPI_EXTERN_C CMPIInstanceMI* SubThingProvider_Create_InstanceMI(const CMPIBroker* mb, const CMPIContext* context,
                                                                 CMPIStatus* status) {
    return ThingProvider_Create_InstanceMI(mb, context, status);
}

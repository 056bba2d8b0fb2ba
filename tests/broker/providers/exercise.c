#include "tests/broker/providers/exercise.h"

#include <cmpimacs.h>
#include <string.h>

#define EXPECT(condition)                                                                                            \
    do {                                                                                                             \
        if (!(condition)) {                                                                                          \
            return #condition;                                                                                       \
        }                                                                                                            \
    } while (0)

static int same(const CMPIString* string, const char* text) {
    return string != NULL && strcmp(CMGetCharPtr(string), text) == 0;
}

static const char* exercise_path(const CMPIBroker* broker, const CMPIObjectPath* path) {
    CMPIStatus status;
    EXPECT(CMGetKeyCount(path, &status) == 2 && status.rc == CMPI_RC_OK);
    const CMPIData id = CMGetKey(path, "ID", &status);
    EXPECT(status.rc == CMPI_RC_OK && (id.state & CMPI_nullValue) == 0 && id.type == CMPI_string);
    const CMPIData number = CMGetKey(path, "Number", &status);
    EXPECT(number.type == CMPI_uint16 && number.value.uint16 == 65535);
    EXPECT(same(CMGetNameSpace(path, NULL), "root/test"));
    EXPECT(same(path->ft->getPropertyQualifier(path, "Id", "Description", &status).value.string, "first"));
    EXPECT(CMClassPathIsA(broker, path, "Test_Base", &status));
    CMPIObjectPath* clone = CMClone(path, &status);
    EXPECT(clone != NULL && clone->hdl != path->hdl);
    CMSetNameSpace(clone, "root/clone");
    EXPECT(same(CMGetNameSpace(clone, NULL), "root/clone") && same(CMGetNameSpace(path, NULL), "root/test"));
    EXPECT(CMRelease(clone).rc == CMPI_RC_OK);
    return NULL;
}

static const char* exercise_instance(const CMPIBroker* broker, const CMPIObjectPath* path) {
    CMPIStatus status;
    CMPIInstance* instance = CMNewInstance(broker, path, &status);
    EXPECT(instance != NULL && status.rc == CMPI_RC_OK);
    const CMPIBoolean flag = 1;
    EXPECT(CMSetProperty(instance, "Flag", &flag, CMPI_boolean).rc == CMPI_RC_OK);
    EXPECT(CMGetProperty(instance, "flag", &status).value.boolean == 1);
    CMGetProperty(instance, "Absent", &status);
    EXPECT(status.rc == CMPI_RC_ERR_NO_SUCH_PROPERTY);
    CMPIArray* array = CMNewArray(broker, 1, CMPI_string, &status);
    CMPIString* string = CMNewString(broker, "element", &status);
    EXPECT(CMSetArrayElementAt(array, 0, &string, CMPI_string).rc == CMPI_RC_OK);
    EXPECT(CMSetProperty(instance, "Array", &array, CMPI_stringA).rc == CMPI_RC_OK);
    const CMPIData data = CMGetProperty(instance, "Array", &status);
    EXPECT(data.type == CMPI_stringA && CMGetArrayCount(data.value.array, NULL) == 1);
    EXPECT(same(CMGetArrayElementAt(data.value.array, 0, NULL).value.string, "element"));
    EXPECT(CMGetPropertyCount(instance, NULL) == 2);
    CMPIDateTime* time = CMNewDateTimeFromBinary(broker, 1000001, 0, &status);
    EXPECT(same(time->ft->getStringFormat(time, NULL), "19700101000001.000001+000"));
    return NULL;
}

static const char* exercise_calls(const CMPIBroker* broker, const CMPIContext* context) {
    CMPIStatus status;
    CMPIArgs* args = CMNewArgs(broker, &status);
    EXPECT(CMAddArg(args, "A", "text", CMPI_chars).rc == CMPI_RC_OK);
    EXPECT(same(CMGetArg(args, "a", NULL).value.string, "text") && CMGetArgCount(args, NULL) == 1);
    EXPECT(CMGetContextEntry(context, CMPIInvocationFlags, &status).type == CMPI_uint32);
    EXPECT(CMGetContextEntry(context, CMPIPrincipal, &status).type == CMPI_string && status.rc == CMPI_RC_OK);
    EXPECT(same(CMGetContextEntry(context, CMPIInitNameSpace, NULL).value.string, "root/test"));
    CMPIObjectPath* things = CMNewObjectPath(broker, "root/test", "Test_Thing", NULL);
    const char* names[] = {"Note", NULL};
    CMPIEnumeration* all = CBEnumInstances(broker, context, things, names, &status);
    EXPECT(all != NULL && status.rc == CMPI_RC_OK);
    int count = 0;
    while (CMHasNext(all, NULL)) {
        const CMPIData data = CMGetNext(all, NULL);
        EXPECT(CMGetPropertyCount(data.value.inst, NULL) == 1);
        EXPECT(CMGetKeyCount(CMGetObjectPath(data.value.inst, NULL), NULL) == 2);
        ++count;
    }
    EXPECT(count == 4); /* of the class and of its subclass */
    CMPIEnumeration* paths = CBEnumInstanceNames(broker, context, things, &status);
    EXPECT(paths != NULL && CMHasNext(paths, NULL));
    EXPECT(CBGetInstance(broker, context, CMGetNext(paths, NULL).value.ref, NULL, &status) != NULL);
    return NULL;
}

static void* run(void* argument) {
    *(int*)argument += 1;
    return NULL;
}

static const char* exercise_services(const CMPIBroker* broker, const CMPIContext* context) {
    CMPIStatus status;
    int number = 0;
    void* thread = broker->xft->newThread(run, &number, 0);
    EXPECT(thread != NULL && broker->xft->joinThread(thread, NULL) == 0 && number == 1);
    CMPIContext* prepared = CBPrepareAttachThread(broker, context);
    EXPECT(prepared != NULL && CBAttachThread(broker, prepared).rc == CMPI_RC_OK);
    EXPECT(same(CMNewString(broker, "attached", NULL), "attached"));
    EXPECT(CBDetachThread(broker, prepared).rc == CMPI_RC_OK);
    CMPIGcStat* mark = broker->mft->mark(broker, &status);
    EXPECT(mark != NULL && broker->mft->cmpiMalloc(broker, 10) != NULL);
    EXPECT(broker->mft->release(broker, mark).rc == CMPI_RC_OK);
    CMPIString* message =
        broker->eft->getMessage(broker, "id", "$1 and $2", &status, 2, CMPI_chars, "one", CMPI_sint32, 2);
    EXPECT(same(message, "one and 2"));
    EXPECT(CMLogMessage(broker, CMPI_SEV_INFO, "exercise", "logged", NULL).rc == CMPI_RC_OK);
    EXPECT(CMTraceMessage(broker, CMPI_LEV_INFO, "exercise", "traced", NULL).rc == CMPI_RC_OK);
    EXPECT(CMNewSelectExp(broker, "SELECT * FROM Test_Thing", "WQL", NULL, &status) != NULL);
    EXPECT(CMNewSelectExp(broker, "no query", "WQL", NULL, &status) == NULL &&
           status.rc == CMPI_RC_ERR_INVALID_QUERY);
    return NULL;
}

const char* exercise_broker(const CMPIBroker* broker, const CMPIContext* context, const CMPIObjectPath* path) {
    const char* failure = exercise_path(broker, path);
    failure = failure != NULL ? failure : exercise_instance(broker, path);
    failure = failure != NULL ? failure : exercise_calls(broker, context);
    return failure != NULL ? failure : exercise_services(broker, context);
}

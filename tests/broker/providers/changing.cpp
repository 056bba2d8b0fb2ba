/**
 * @file
 * A provider of instances that can be changed and of methods. It logs what it is called with; the identity of the
 * instance, or the argument What, says how it ends. It stands on the agent library that logs.
 */
#include <stdexcept>
#include <string>

#include <cmpimacs.h>

extern "C" void log_line(int level, const char* message);

namespace {

const CMPIBroker* broker;

std::string textOf(const CMPIString* text) {
    return text == nullptr ? "NULL" : CMGetCharPtr(text);
}

std::string shown(const CMPIData& data) {
    if ((data.state & CMPI_nullValue) != 0) {
        return "NULL";
    }
    if ((data.type & CMPI_ARRAY) != 0) {
        std::string text = "{";
        for (CMPICount i = 0; i < CMGetArrayCount(data.value.array, nullptr); ++i) {
            text += (i == 0 ? "" : ",") + shown(CMGetArrayElementAt(data.value.array, i, nullptr));
        }
        return text + "}";
    }
    return data.type == CMPI_string   ? '"' + textOf(data.value.string) + '"'
           : data.type == CMPI_uint16 ? std::to_string(data.value.uint16)
                                      : "type " + std::to_string(data.type);
}

void note(const std::string& text) {
    CMLogMessage(broker, CMPI_SEV_INFO, "changing", text.c_str(), nullptr);
}

std::string identity(const CMPIObjectPath* path) {
    const CMPIData key = CMGetKey(path, "Id", nullptr);
    return (key.state & CMPI_nullValue) != 0 ? "" : textOf(key.value.string);
}

CMPIStatus cleanup(CMPIInstanceMI*, const CMPIContext*, CMPIBoolean) {
    return {CMPI_RC_OK, nullptr};
}

CMPIStatus names(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*, const CMPIObjectPath*) {
    return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
}

CMPIStatus instances(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*, const CMPIObjectPath*, const char**) {
    return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
}

CMPIStatus create(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*, const CMPIObjectPath*,
                  const CMPIInstance*) {
    return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
}

CMPIStatus query(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*, const CMPIObjectPath*, const char*,
                 const char*) {
    return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
}

/** Ends a call as `how` says; true when it is to be answered after all. */
bool goesOn(const std::string& how, CMPIStatus& status) {
    if (how == "refused") {
        status = {CMPI_RC_ERR_ACCESS_DENIED, CMNewString(broker, "no such thing today", nullptr)};
    } else if (how == "throws") {
        throw std::runtime_error("the text of the exception");
    } else if (how == "logs") {
        log_line(6000, "the cause");
        log_line(6000, "what came of it");
    } else if (how != "silent") {
        return true;
    }
    return false;
}

CMPIStatus modify(CMPIInstanceMI*, const CMPIContext*, const CMPIResult* result, const CMPIObjectPath* path,
                  const CMPIInstance* instance, const char** properties) {
    std::string text = "modify " + textOf(CMObjectPathToString(path, nullptr)) + " names";
    for (; properties != nullptr && *properties != nullptr; ++properties) {
        text += std::string(" ") + *properties;
    }
    text += " of";
    for (CMPICount i = 0; i < CMGetPropertyCount(instance, nullptr); ++i) {
        CMPIString* name = nullptr;
        const CMPIData data = CMGetPropertyAt(instance, i, &name, nullptr);
        text += " " + textOf(name) + "=" + shown(data);
    }
    note(text);
    CMPIStatus status = {CMPI_RC_OK, nullptr};
    if (goesOn(identity(path), status)) {
        CMReturnDone(result);
    }
    return status;
}

CMPIStatus endMethods(CMPIMethodMI*, const CMPIContext*, CMPIBoolean) {
    note("the methods' end");
    return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
}

void giveBack(CMPIArgs* out) {
    const CMPIUint16 number = 7;
    CMAddArg(out, "both", &number, CMPI_uint16);
    CMAddArg(out, "Back", "given back", CMPI_chars);
    CMAddArg(out, "Text", "not to be given back", CMPI_chars);
    CMAddArg(out, "Unheard", "x", CMPI_chars);
}

void answer(const CMPIResult* result, const std::string& how) {
    const CMPIUint32 zero = 0;
    if (how == "text") {
        CMReturnData(result, "zero", CMPI_chars);
    } else if (how == "null") {
        CMReturnData(result, static_cast<const char*>(nullptr), CMPI_uint32);
    } else if (how == "small") {
        const CMPIUint16 small = 3;
        CMReturnData(result, &small, CMPI_uint16);
    } else if (how != "nothing") {
        CMReturnData(result, &zero, CMPI_uint32);
    }
    CMReturnDone(result);
}

CMPIStatus invoke(CMPIMethodMI*, const CMPIContext*, const CMPIResult* result, const CMPIObjectPath* path,
                  const char* method, const CMPIArgs* in, CMPIArgs* out) {
    std::string text = "invoke " + textOf(CMObjectPathToString(path, nullptr)) + " " + method;
    for (CMPICount i = 0; i < CMGetArgCount(in, nullptr); ++i) {
        CMPIString* name = nullptr;
        const CMPIData data = CMGetArgAt(in, i, &name, nullptr);
        text += " " + textOf(name) + "=" + shown(data);
    }
    note(text);
    const CMPIData what = CMGetArg(in, "Text", nullptr);
    const std::string how = (what.state & CMPI_nullValue) != 0 ? "" : textOf(what.value.string);
    CMPIStatus status = {CMPI_RC_OK, nullptr};
    if (goesOn(how, status)) {
        giveBack(out);
        answer(result, how);
    }
    return status;
}

const CMPIInstanceMIFT instanceTable = {
    CMPI_VERSION,
    CMPI_VERSION,
    "instanceChanging",
    cleanup,
    names,
    instances,
    instances,
    create,
    modify,
    [](CMPIInstanceMI*, const CMPIContext*, const CMPIResult*, const CMPIObjectPath*) -> CMPIStatus {
        return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
    },
    query,
};

const CMPIMethodMIFT methodTable = {CMPI_VERSION, CMPI_VERSION, "methodChanging", endMethods, invoke};

} // namespace

extern "C" __attribute__((visibility("default"))) CMPIInstanceMI*
Changing_Create_InstanceMI(const CMPIBroker* mb, const CMPIContext*, CMPIStatus*) {
    static CMPIInstanceMI mi = {nullptr, &instanceTable};
    broker = mb;
    return &mi;
}

extern "C" __attribute__((visibility("default"))) CMPIMethodMI*
Changing_Create_MethodMI(const CMPIBroker* mb, const CMPIContext*, CMPIStatus*) {
    static CMPIMethodMI mi = {nullptr, &methodTable};
    broker = mb;
    return &mi;
}

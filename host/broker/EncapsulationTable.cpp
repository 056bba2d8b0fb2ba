/**
 * @file
 * The broker's factories, type queries, log and trace.
 */
#include "host/broker/BrokerState.h"
#include "host/broker/Convert.h"
#include "host/broker/Message.h"
#include "host/broker/Slot.h"
#include "host/broker/Unsupported.h"
#include "host/broker/Values.h"
#include "host/filter/Filter.h"
#include "host/model/DateTimeText.h"

#include <chrono>

namespace marlo::broker {

namespace {

/** Far above any array of CIM, far below what a mistaken count can take from the whole process. */
constexpr CMPICount maxArrayElements = 1U << 20;

CMPIInstance* newInstance(CMPIStatus& status, BrokerState& /*broker*/, const CMPIObjectPath* handle) {
    const auto* path = objectOf<ObjectPathObject>(handle);
    if (path == nullptr) {
        status.rc = CMPI_RC_ERR_INVALID_HANDLE;
        return nullptr;
    }
    return &InstanceObject::make(currentArena(), *path)->handle;
}

CMPIObjectPath* newObjectPath(CMPIStatus& status, BrokerState& broker, const char* nameSpace, const char* className) {
    if (className == nullptr) {
        status.rc = CMPI_RC_ERR_INVALID_PARAMETER;
        return nullptr;
    }
    return &ObjectPathObject::make(currentArena(), broker, nameSpace == nullptr ? "" : nameSpace, className)->handle;
}

CMPIArgs* newArgs(CMPIStatus& /*status*/, BrokerState& /*broker*/) {
    return &ArgsObject::make(currentArena())->handle;
}

CMPIString* newString(CMPIStatus& status, BrokerState& /*broker*/, const char* text) {
    if (text == nullptr) {
        status.rc = CMPI_RC_ERR_INVALID_PARAMETER;
        return nullptr;
    }
    return &StringObject::makeValue(currentArena(), text)->handle;
}

CMPIArray* newArray(CMPIStatus& status, BrokerState& /*broker*/, CMPICount count, CMPIType type) {
    if (!isCimType(storedType(type))) {
        status.rc = CMPI_RC_ERR_INVALID_DATA_TYPE;
        return nullptr;
    }
    if (count > maxArrayElements) {
        status.rc = CMPI_RC_ERR_SERVER_LIMITS_EXCEEDED;
        return nullptr;
    }
    return &ArrayObject::make(currentArena(), count, type)->handle;
}

CMPIDateTime* newDateTimeFromBinary(CMPIStatus& status, BrokerState& /*broker*/, CMPIUint64 microseconds,
                                    CMPIBoolean interval) {
    const auto text = writeDateTime({microseconds, interval != 0});
    if (!text) {
        status.rc = CMPI_RC_ERR_INVALID_PARAMETER;
        return nullptr;
    }
    return &DateTimeObject::make(currentArena(), *text, microseconds, interval != 0)->handle;
}

CMPIDateTime* newDateTime(CMPIStatus& status, BrokerState& broker) {
    const auto now = std::chrono::system_clock::now().time_since_epoch();
    const auto microseconds = std::chrono::duration_cast<std::chrono::microseconds>(now).count();
    return newDateTimeFromBinary(status, broker, static_cast<CMPIUint64>(microseconds), 0);
}

CMPIDateTime* newDateTimeFromChars(CMPIStatus& status, BrokerState& /*broker*/, const char* text) {
    const auto value = text == nullptr ? std::nullopt : readDateTime(text);
    if (!value) {
        status.rc = CMPI_RC_ERR_INVALID_PARAMETER;
        return nullptr;
    }
    return &DateTimeObject::make(currentArena(), text, value->microseconds, value->interval)->handle;
}

/** The names behind SELECT as an array of texts; null where all are asked for. */
CMPIArray* projectionOf(const filter::Filter& filter) {
    if (filter.properties().empty()) {
        return nullptr;
    }
    auto* array = ArrayObject::make(currentArena(), static_cast<CMPICount>(filter.properties().size()), CMPI_string);
    for (CMPICount i = 0; i < array->count; ++i) {
        array->elements[i].state = CMPI_goodValue;
        array->elements[i].value.string = &StringObject::make(currentArena(), filter.properties()[i])->handle;
    }
    return &array->handle;
}

/** A filter that is not compared with the schema: there is no namespace to look its class up in. */
CMPISelectExp* newSelectExp(CMPIStatus& status, BrokerState& broker, const char* query, const char* language,
                            CMPIArray** projection) {
    if (query == nullptr || language == nullptr) {
        status.rc = CMPI_RC_ERR_INVALID_PARAMETER;
        return nullptr;
    }
    const auto known = filter::readLanguage(language);
    if (!known) {
        status.rc = CMPI_RC_ERR_QUERY_LANGUAGE_NOT_SUPPORTED;
        return nullptr;
    }
    try {
        auto filter = std::make_shared<const filter::Filter>(filter::Filter::parse(query, *known));
        if (projection != nullptr) {
            *projection = projectionOf(*filter);
        }
        return &SelectExpObject::make(currentArena(), broker, std::move(filter))->handle;
    } catch (const filter::Error& error) {
        status.rc = error.code();
        status.msg = &StringObject::make(currentArena(), error.what())->handle;
        return nullptr;
    }
}

CMPIBoolean classPathIsA(CMPIStatus& status, BrokerState& broker, const CMPIObjectPath* handle,
                         const char* className) {
    const auto* path = objectOf<ObjectPathObject>(handle);
    if (path == nullptr) {
        status.rc = CMPI_RC_ERR_INVALID_HANDLE;
        return 0;
    }
    if (className == nullptr) {
        status.rc = CMPI_RC_ERR_INVALID_PARAMETER;
        return 0;
    }
    const bool isA = equalNames(path->className->text(), className) ||
                     broker.schema().isA(path->nameSpace->text(), path->className->text(), className);
    return isA ? 1 : 0;
}

/** The name of an object's CMPI type; null when there is no object. */
const char* typeOf(const void* handle) {
    const ObjectBase* object = ObjectBase::of(handle);
    if (object == nullptr) {
        return nullptr;
    }
    switch (object->kind()) {
    case Kind::string:
        return "CMPIString";
    case Kind::array:
        return "CMPIArray";
    case Kind::dateTime:
        return "CMPIDateTime";
    case Kind::objectPath:
        return "CMPIObjectPath";
    case Kind::instance:
        return "CMPIInstance";
    case Kind::args:
        return "CMPIArgs";
    case Kind::context:
        return "CMPIContext";
    case Kind::enumeration:
        return "CMPIEnumeration";
    case Kind::result:
        return "CMPIResult";
    case Kind::error:
        return "CMPIError";
    case Kind::broker:
        return "CMPIBroker";
    case Kind::selectExp:
        return "CMPISelectExp";
    }
    return nullptr;
}

std::string instanceText(const InstanceObject& object) {
    const Instance instance = toModel(object);
    std::string text = "instance of " + instance.path.className + " {\n";
    for (const NamedValue& property : instance.properties) {
        text += "    " + property.name + " = " + toText(property.value) + ";\n";
    }
    return text + "};\n";
}

std::string arrayText(const ArrayObject& array) {
    std::string text = "{";
    for (CMPICount i = 0; i < array.count; ++i) {
        text += (i == 0 ? "" : ",") + toText(toModel(array.elements[i]));
    }
    return text + '}';
}

/** For people to read: what the object holds, or its type where that says nothing. */
std::string describe(const ObjectBase& object, const char* type) {
    switch (object.kind()) {
    case Kind::string:
        return std::string(static_cast<const StringObject&>(object).text());
    case Kind::dateTime:
        return std::string(static_cast<const DateTimeObject&>(object).text());
    case Kind::array:
        return arrayText(static_cast<const ArrayObject&>(object));
    case Kind::objectPath:
        return toModel(static_cast<const ObjectPathObject&>(object)).toString();
    case Kind::instance:
        return instanceText(static_cast<const InstanceObject&>(object));
    case Kind::selectExp:
        return static_cast<const SelectExpObject&>(object).filter->text();
    default:
        return type;
    }
}

CMPIString* toString(CMPIStatus& status, BrokerState& /*broker*/, const void* handle) {
    const char* type = typeOf(handle);
    if (type == nullptr) {
        status.rc = CMPI_RC_ERR_INVALID_HANDLE;
        return nullptr;
    }
    return &StringObject::make(currentArena(), describe(*ObjectBase::of(handle), type))->handle;
}

CMPIBoolean isOfType(CMPIStatus& status, BrokerState& /*broker*/, const void* handle, const char* name) {
    const char* type = typeOf(handle);
    if (type == nullptr) {
        status.rc = CMPI_RC_ERR_INVALID_HANDLE;
        return 0;
    }
    return name != nullptr && std::string_view(name) == type ? 1 : 0;
}

CMPIString* getType(CMPIStatus& status, BrokerState& /*broker*/, const void* handle) {
    const char* type = typeOf(handle);
    if (type == nullptr) {
        status.rc = CMPI_RC_ERR_INVALID_HANDLE;
        return nullptr;
    }
    return &StringObject::make(currentArena(), type)->handle;
}

CMPIrc writeLine(const BrokerState& broker, bool trace, int level, const char* component, const char* text,
                 const CMPIString* string) {
    const auto* object = objectOf<StringObject>(string);
    if (text == nullptr && object == nullptr) {
        return CMPI_RC_ERR_INVALID_PARAMETER;
    }
    broker.log({trace, level, component == nullptr ? "" : component, text != nullptr ? text : object->characters()});
    return CMPI_RC_OK;
}

CMPIrc logMessage(BrokerState& broker, CMPISeverity severity, const char* id, const char* text,
                  const CMPIString* string) {
    return writeLine(broker, false, severity, id, text, string);
}

CMPIrc trace(BrokerState& broker, CMPILevel level, const char* component, const char* text,
             const CMPIString* string) {
    return writeLine(broker, true, level, component, text, string);
}

StringObject* stringOrNull(const char* text) {
    return text == nullptr ? nullptr : StringObject::make(currentArena(), text);
}

CMPIError* newCMPIError(CMPIStatus& /*status*/, BrokerState& /*broker*/, const char* owner, const char* messageId,
                        const char* message, CMPIErrorSeverity severity, CMPIErrorProbableCause cause, CMPIrc code) {
    ErrorObject* error = ErrorObject::make(currentArena());
    error->owningEntity = stringOrNull(owner);
    error->messageId = stringOrNull(messageId);
    error->message = stringOrNull(message);
    error->severity = severity;
    error->cause = cause;
    error->code = code;
    return &error->handle;
}

} // namespace

const CMPIBrokerEncFT encapsulationTable = {
    CMPI_VERSION,
    slot<newInstance>,
    slot<newObjectPath>,
    slot<newArgs>,
    slot<newString>,
    slot<newArray>,
    slot<newDateTime>,
    slot<newDateTimeFromBinary>,
    slot<newDateTimeFromChars>,
    slot<newSelectExp>,
    slot<classPathIsA>,
    slot<toString>,
    slot<isOfType>,
    slot<getType>,
    getMessage,
    slot<logMessage>,
    slot<trace>,
    slot<newCMPIError>,
    unsupported<decltype(CMPIBrokerEncFT::openMessageFile)>,
    unsupported<decltype(CMPIBrokerEncFT::closeMessageFile)>,
    getMessage2,
};

} // namespace marlo::broker

#include "host/broker/BrokerState.h"
#include "host/broker/Convert.h"
#include "host/broker/ListSlots.h"
#include "host/broker/SchemaView.h"

namespace marlo::broker {

namespace {

std::string_view textOf(const StringObject* string) {
    return string == nullptr ? std::string_view() : string->text();
}

CMPIrc setText(ObjectPathObject& path, StringObject*& member, const char* text) {
    if (text == nullptr) {
        return CMPI_RC_ERR_INVALID_PARAMETER;
    }
    // What a caller read before stays as it was: the string is replaced, not changed.
    if (textOf(member) != text) {
        member = StringObject::makeName(path.arena(), text);
    }
    return CMPI_RC_OK;
}

CMPIrc setNameSpace(ObjectPathObject& path, const char* nameSpace) {
    return setText(path, path.nameSpace, nameSpace);
}

CMPIString* getNameSpace(CMPIStatus&, ObjectPathObject& path) {
    return &path.nameSpace->handle;
}

CMPIrc setHostname(ObjectPathObject& path, const char* host) {
    return setText(path, path.host, host);
}

CMPIString* getHostname(CMPIStatus&, ObjectPathObject& path) {
    return path.host != nullptr ? &path.host->handle : &StringObject::make(currentArena(), "")->handle;
}

CMPIrc setClassName(ObjectPathObject& path, const char* className) {
    return setText(path, path.className, className);
}

CMPIString* getClassName(CMPIStatus&, ObjectPathObject& path) {
    return &path.className->handle;
}

CMPIrc addKey(ObjectPathObject& path, const char* name, const CMPIValue* value, CMPIType type) {
    if ((type & CMPI_ARRAY) != 0) {
        return CMPI_RC_ERR_INVALID_DATA_TYPE;
    }
    if (name == nullptr) {
        return CMPI_RC_ERR_INVALID_PARAMETER;
    }
    CMPIData key;
    const CMPIrc code = takeValue(path.arena(), value, type, Accepted::cim, key);
    if (code == CMPI_RC_OK) {
        key.state = static_cast<CMPIValueState>(key.state | CMPI_keyValue);
        path.keys.set(name, key);
    }
    return code;
}

CMPIData getKey(CMPIStatus& status, ObjectPathObject& path, const char* name) {
    return getNamed(status, path.keys, name, CMPI_RC_ERR_NOT_FOUND);
}

CMPIData getKeyAt(CMPIStatus& status, ObjectPathObject& path, CMPICount index, CMPIString** name) {
    return getNamedAt(status, path.keys, index, name, CMPI_RC_ERR_NOT_FOUND);
}

CMPICount getKeyCount(CMPIStatus&, ObjectPathObject& path) {
    return path.keys.size();
}

CMPIrc setNameSpaceFromObjectPath(ObjectPathObject& path, const CMPIObjectPath* source) {
    const auto* other = objectOf<ObjectPathObject>(source);
    return other == nullptr ? CMPI_RC_ERR_INVALID_HANDLE
                            : setText(path, path.nameSpace, other->nameSpace->characters());
}

CMPIrc setHostAndNameSpaceFromObjectPath(ObjectPathObject& path, const CMPIObjectPath* source) {
    const auto* other = objectOf<ObjectPathObject>(source);
    if (other == nullptr) {
        return CMPI_RC_ERR_INVALID_HANDLE;
    }
    setText(path, path.host, other->host == nullptr ? "" : other->host->characters());
    return setText(path, path.nameSpace, other->nameSpace->characters());
}

/** The value of a qualifier that the schema has, in the caller's memory. */
CMPIData qualifierData(CMPIStatus& status, const ObjectPathObject& path, const Value* value) {
    if (value == nullptr) {
        status.rc = CMPI_RC_ERR_NOT_FOUND;
        return noData();
    }
    return toData(currentArena(), *path.broker, *value);
}

const char* orEmpty(const char* text) {
    return text == nullptr ? "" : text;
}

CMPIData getClassQualifier(CMPIStatus& status, ObjectPathObject& path, const char* name) {
    return qualifierData(
        status, path,
        path.broker->schema().classQualifier(path.nameSpace->text(), path.className->text(), orEmpty(name)));
}

CMPIData getPropertyQualifier(CMPIStatus& status, ObjectPathObject& path, const char* property, const char* name) {
    return qualifierData(status, path,
                         path.broker->schema().propertyQualifier(path.nameSpace->text(), path.className->text(),
                                                                 orEmpty(property), orEmpty(name)));
}

CMPIData getMethodQualifier(CMPIStatus& status, ObjectPathObject& path, const char* method, const char* name) {
    return qualifierData(status, path,
                         path.broker->schema().methodQualifier(path.nameSpace->text(), path.className->text(),
                                                               orEmpty(method), orEmpty(name)));
}

CMPIData getParameterQualifier(CMPIStatus& status, ObjectPathObject& path, const char* method, const char* parameter,
                               const char* name) {
    return qualifierData(status, path,
                         path.broker->schema().parameterQualifier(path.nameSpace->text(), path.className->text(),
                                                                  orEmpty(method), orEmpty(parameter),
                                                                  orEmpty(name)));
}

CMPIString* toString(CMPIStatus&, ObjectPathObject& path) {
    return &StringObject::make(currentArena(), toModel(path).toString())->handle;
}

} // namespace

ObjectPathObject* ObjectPathObject::make(Arena& arena, const BrokerState& broker, std::string_view nameSpace,
                                         std::string_view className) {
    auto* path = arena.make<ObjectPathObject>(arena, broker);
    path->nameSpace = StringObject::makeName(arena, nameSpace);
    path->className = StringObject::makeName(arena, className);
    return path;
}

ObjectPathObject* ObjectPathObject::copyTo(Arena& target) const {
    auto* copied = target.make<ObjectPathObject>(target, *broker);
    copied->host = host == nullptr ? nullptr : host->copyTo(target);
    copied->nameSpace = nameSpace->copyTo(target);
    copied->className = className->copyTo(target);
    keys.copyTo(copied->keys);
    return copied;
}

const CMPIObjectPathFT objectPathTable = {
    CMPI_VERSION,
    releaseSlot<ObjectPathObject>,
    slot<cloneOperation<ObjectPathObject>>,
    slot<setNameSpace>,
    slot<getNameSpace>,
    slot<setHostname>,
    slot<getHostname>,
    slot<setClassName>,
    slot<getClassName>,
    slot<addKey>,
    slot<getKey>,
    slot<getKeyAt>,
    slot<getKeyCount>,
    slot<setNameSpaceFromObjectPath>,
    slot<setHostAndNameSpaceFromObjectPath>,
    slot<getClassQualifier>,
    slot<getPropertyQualifier>,
    slot<getMethodQualifier>,
    slot<getParameterQualifier>,
    slot<toString>,
};

} // namespace marlo::broker

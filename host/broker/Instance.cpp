#include "host/broker/BrokerState.h"
#include "host/broker/ListSlots.h"
#include "host/broker/SchemaView.h"

namespace marlo::broker {

namespace {

CMPIData getProperty(CMPIStatus& status, InstanceObject& instance, const char* name) {
    return getNamed(status, instance.properties, name, CMPI_RC_ERR_NO_SUCH_PROPERTY);
}

CMPIData getPropertyAt(CMPIStatus& status, InstanceObject& instance, CMPICount index, CMPIString** name) {
    return getNamedAt(status, instance.properties, index, name, CMPI_RC_ERR_NO_SUCH_PROPERTY);
}

CMPICount getPropertyCount(CMPIStatus&, InstanceObject& instance) {
    return instance.properties.size();
}

CMPIrc setProperty(InstanceObject& instance, const char* name, const CMPIValue* value, CMPIType type) {
    if (instance.filtered && name != nullptr && instance.filter.find(name) == nullptr) {
        return CMPI_RC_OK;
    }
    return setNamed(instance.arena(), instance.properties, name, value, type, Accepted::cim);
}

/** Class origins are the schema's knowledge; the argument tells nothing new. */
CMPIrc setPropertyWithOrigin(InstanceObject& instance, const char* name, const CMPIValue* value, CMPIType type,
                             const char* /*origin*/) {
    return setProperty(instance, name, value, type);
}

/** A copy, so that a caller who changes the path does not change the instance. */
CMPIObjectPath* getObjectPath(CMPIStatus&, InstanceObject& instance) {
    return &instance.completePath(currentArena())->handle;
}

CMPIrc setObjectPath(InstanceObject& instance, const CMPIObjectPath* handle) {
    const auto* path = objectOf<ObjectPathObject>(handle);
    if (path == nullptr) {
        return CMPI_RC_ERR_INVALID_HANDLE;
    }
    instance.path = path->copyTo(instance.arena());
    return CMPI_RC_OK;
}

void addNames(NamedList& list, const char** names) {
    for (; names != nullptr && *names != nullptr; ++names) {
        list.set(*names, noData());
    }
}

/** From now on only properties of the list, and keys, are taken; no list takes all. */
CMPIrc setPropertyFilter(InstanceObject& instance, const char** names, const char** keys) {
    instance.filter = NamedList(instance.arena());
    instance.filtered = names != nullptr;
    addNames(instance.filter, names);
    addNames(instance.filter, keys);
    return CMPI_RC_OK;
}

} // namespace

InstanceObject* InstanceObject::make(Arena& arena, const ObjectPathObject& path) {
    auto* instance = arena.make<InstanceObject>(arena);
    instance->path = path.copyTo(arena);
    return instance;
}

InstanceObject* InstanceObject::copyTo(Arena& target) const {
    InstanceObject* copied = make(target, *path);
    properties.copyTo(copied->properties);
    filter.copyTo(copied->filter);
    copied->filtered = filtered;
    return copied;
}

ObjectPathObject* InstanceObject::completePath(Arena& target) const {
    ObjectPathObject* complete = path->copyTo(target);
    const SchemaView& schema = path->broker->schema();
    const auto* names = schema.keys(path->nameSpace->text(), path->className->text());
    if (names == nullptr) {
        return complete;
    }
    for (const std::string& name : *names) {
        const NamedData* property = properties.find(name);
        if (property != nullptr && complete->keys.find(name) == nullptr && canBeKey(property->data)) {
            CMPIData key = copyData(target, property->data);
            key.state = CMPI_keyValue;
            complete->keys.set(name, key);
        }
    }
    return complete;
}

const CMPIInstanceFT instanceTable = {
    CMPI_VERSION,        releaseSlot<InstanceObject>, slot<cloneOperation<InstanceObject>>,
    slot<getProperty>,   slot<getPropertyAt>,         slot<getPropertyCount>,
    slot<setProperty>,   slot<getObjectPath>,         slot<setPropertyFilter>,
    slot<setObjectPath>, slot<setPropertyWithOrigin>,
};

} // namespace marlo::broker

#include "host/cimom/BuiltIn.h"

namespace marlo {

namespace {

Status notSupported(const std::string& what, const Class& definition) {
    return {CMPI_RC_ERR_NOT_SUPPORTED, what + " is not supported for " + definition.name, {}};
}

} // namespace

Status BuiltIn::get(const Class& definition, const ObjectPath& /*path*/, const ObjectManager::InstanceSink& sink) {
    return enumerate(definition, sink);
}

Status BuiltIn::create(const Class& definition, const Instance& /*instance*/, ObjectPath& /*created*/) {
    return notSupported("creation", definition);
}

Status BuiltIn::modify(const Class& definition, const Instance& /*instance*/,
                       const std::vector<std::string>& /*names*/) {
    return notSupported("modification", definition);
}

Status BuiltIn::remove(const Class& definition, const ObjectPath& /*path*/) {
    return notSupported("deletion", definition);
}

Status BuiltIn::invoke(const Class& definition, const ObjectPath& /*path*/, const Method& method,
                       const std::vector<NamedValue>& /*arguments*/, MethodAnswer& /*answer*/) {
    return notSupported(method.name, definition);
}

} // namespace marlo

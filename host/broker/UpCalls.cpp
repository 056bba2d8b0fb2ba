/** @file What an object manager answers to providers' requests that it does not know. */
#include "host/broker/Broker.h"

namespace marlo::broker {

namespace {

Outcome notSupported() {
    return {CMPI_RC_ERR_NOT_SUPPORTED, ""};
}

} // namespace

Outcome UpCalls::createInstance(const Instance& /*instance*/, ObjectPath& /*created*/) {
    return notSupported();
}

Outcome UpCalls::modifyInstance(const Instance& /*instance*/, const PropertyNames& /*properties*/) {
    return notSupported();
}

Outcome UpCalls::deleteInstance(const ObjectPath& /*path*/) {
    return notSupported();
}

Outcome UpCalls::execQuery(const std::string& /*nameSpace*/, const std::string& /*query*/,
                           const std::string& /*language*/, const InstanceSink& /*sink*/) {
    return notSupported();
}

Outcome UpCalls::invokeMethod(const ObjectPath& /*path*/, const std::string& /*method*/,
                              const std::vector<NamedValue>& /*arguments*/, Value& /*returned*/,
                              std::vector<NamedValue>& /*out*/) {
    return notSupported();
}

Outcome UpCalls::associators(const ObjectPath& /*path*/, const AssociationFilter& /*filter*/,
                             const PropertyNames& /*properties*/, const InstanceSink& /*sink*/) {
    return notSupported();
}

Outcome UpCalls::associatorNames(const ObjectPath& /*path*/, const AssociationFilter& /*filter*/,
                                 const PathSink& /*sink*/) {
    return notSupported();
}

Outcome UpCalls::references(const ObjectPath& /*path*/, const AssociationFilter& /*filter*/,
                            const PropertyNames& /*properties*/, const InstanceSink& /*sink*/) {
    return notSupported();
}

Outcome UpCalls::referenceNames(const ObjectPath& /*path*/, const AssociationFilter& /*filter*/,
                                const PathSink& /*sink*/) {
    return notSupported();
}

} // namespace marlo::broker

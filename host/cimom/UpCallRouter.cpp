#include "host/cimom/UpCallRouter.h"

#include <utility>

namespace marlo {

using broker::Outcome;

void UpCallRouter::connect(Operations& operations, Subscriptions& subscriptions) {
    _operations = &operations;
    _subscriptions = &subscriptions;
}

Outcome UpCallRouter::run(const std::function<Status(Operations&)>& operation) const {
    if (_ended) {
        return {CMPI_RC_ERR_FAILED, "the object manager has ended"};
    }
    const Status status = runOperation([&] { return operation(*_operations); });
    return {status.code, status.message};
}

Outcome UpCallRouter::enumerateInstances(const ObjectPath& classPath, const PropertyNames& properties,
                                         const InstanceSink& sink) {
    return run([&](Operations& operations) {
        return operations.enumerate(classPath.nameSpace, classPath.className, properties, sink);
    });
}

Outcome UpCallRouter::enumerateInstanceNames(const ObjectPath& classPath, const PathSink& sink) {
    return run([&](Operations& operations) {
        return operations.enumerateNames(classPath.nameSpace, classPath.className, sink);
    });
}

Outcome UpCallRouter::getInstance(const ObjectPath& path, const PropertyNames& properties, const InstanceSink& sink) {
    return run([&](Operations& operations) { return operations.get(path, properties, sink); });
}

Outcome UpCallRouter::deliverIndication(const std::string& nameSpace, Instance&& indication) {
    return _subscriptions->deliver(nameSpace, std::move(indication));
}

Outcome UpCallRouter::createInstance(const Instance& instance, ObjectPath& created) {
    return run([&](Operations& operations) { return operations.create(instance, created); });
}

Outcome UpCallRouter::modifyInstance(const Instance& instance, const PropertyNames& properties) {
    return run([&](Operations& operations) { return operations.modify(instance, properties); });
}

Outcome UpCallRouter::deleteInstance(const ObjectPath& path) {
    return run([&](Operations& operations) { return operations.remove(path); });
}

Outcome UpCallRouter::execQuery(const std::string& nameSpace, const std::string& query, const std::string& language,
                                const InstanceSink& sink) {
    return run([&](Operations& operations) { return operations.query(nameSpace, query, language, sink); });
}

Outcome UpCallRouter::invokeMethod(const ObjectPath& path, const std::string& method,
                                   const std::vector<NamedValue>& arguments, Value& returned,
                                   std::vector<NamedValue>& out) {
    return run([&](Operations& operations) {
        MethodAnswer answer;
        Status status = operations.invoke(path, method, arguments, answer);
        returned = std::move(answer.returned);
        out = std::move(answer.out);
        return status;
    });
}

Outcome UpCallRouter::associators(const ObjectPath& path, const AssociationFilter& filter,
                                  const PropertyNames& properties, const InstanceSink& sink) {
    return run([&](Operations& operations) { return operations.associators(path, filter, properties, sink); });
}

Outcome UpCallRouter::associatorNames(const ObjectPath& path, const AssociationFilter& filter, const PathSink& sink) {
    return run([&](Operations& operations) { return operations.associatorNames(path, filter, sink); });
}

Outcome UpCallRouter::references(const ObjectPath& path, const AssociationFilter& filter,
                                 const PropertyNames& properties, const InstanceSink& sink) {
    return run([&](Operations& operations) { return operations.references(path, filter, properties, sink); });
}

Outcome UpCallRouter::referenceNames(const ObjectPath& path, const AssociationFilter& filter, const PathSink& sink) {
    return run([&](Operations& operations) { return operations.referenceNames(path, filter, sink); });
}

} // namespace marlo

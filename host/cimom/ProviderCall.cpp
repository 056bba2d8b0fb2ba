#include "host/cimom/ProviderCall.h"

#include "host/cimom/CallContext.h"

#include <optional>
#include <utility>

namespace marlo {

namespace {

/** Takes over what a provider returns and remembers an error that it gives in place of a status. */
class Collector final : public broker::ResultSink {
  public:
    Collector() = default;

    explicit Collector(const ProviderCall::InstanceSink& instances) : _instances(&instances) {}

    explicit Collector(const ProviderCall::PathSink& paths) : _paths(&paths) {}

    void instance(const CMPIInstance& instance) override {
        if (_instances != nullptr) {
            (*_instances)(broker::Broker::toModel(instance));
        }
    }

    void path(const CMPIObjectPath& path) override {
        if (_paths != nullptr) {
            (*_paths)(broker::Broker::toModel(path));
        }
    }

    void data(const CMPIData& data) override { value = broker::Broker::toModel(data); }

    void error(CMPIrc code, const std::string& message) override { _error = {code, message, {}}; }

    /** The status of the call, or the error that was returned in its place. */
    [[nodiscard]] Status statusOf(const Status& status) const { return status.ok() ? _error : status; }

    std::optional<Value> value; ///< the last one that was returned

  private:
    const ProviderCall::InstanceSink* _instances = nullptr;
    const ProviderCall::PathSink* _paths = nullptr;
    Status _error;
};

} // namespace

/** What every MI function takes. */
struct ProviderCall::Arguments {
    const CMPIContext* context;
    const CMPIResult* result;
    const CMPIObjectPath* path;
    const char** properties; ///< null asks for all
};

Status ProviderCall::call(const ObjectPath& path, const PropertyList& properties, broker::ResultSink& sink,
                          const Function& function, bool* isDone) {
    const broker::CallScope scope;
    const std::string& provider = _provider.registration().name;
    CMPIContext* context = newCallContext(_broker, _principal, path.nameSpace);
    std::vector<const char*> names;
    if (properties) {
        for (const std::string& name : *properties) {
            names.push_back(name.c_str());
        }
        names.push_back(nullptr);
    }
    const broker::Result result(sink);
    const Arguments arguments{context, result.handle(), _broker.newObjectPath(path),
                              properties ? names.data() : nullptr};
    Status status;
    try {
        status = statusOf(function(arguments), provider);
    } catch (const LoadError& error) {
        status = {CMPI_RC_ERR_FAILED, error.what(), {}};
    } catch (...) {
        status = statusOfException(provider);
    }
    result.rethrow();
    if (isDone != nullptr) {
        *isDone = result.isDone();
    }
    return status;
}

Status ProviderCall::enumerateInstances(const ObjectPath& classPath, const PropertyList& properties,
                                        const InstanceSink& sink) {
    Collector collector(sink);
    return collector.statusOf(call(classPath, properties, collector, [this](const Arguments& arguments) {
        CMPIInstanceMI& mi = _provider.instanceMI(*arguments.context);
        return callSlot(mi.ft->enumerateInstances, mi, arguments.context, arguments.result, arguments.path,
                        arguments.properties);
    }));
}

Status ProviderCall::enumerateInstanceNames(const ObjectPath& classPath, const PathSink& sink) {
    Collector collector(sink);
    return collector.statusOf(call(classPath, std::nullopt, collector, [this](const Arguments& arguments) {
        CMPIInstanceMI& mi = _provider.instanceMI(*arguments.context);
        return callSlot(mi.ft->enumerateInstanceNames, mi, arguments.context, arguments.result, arguments.path);
    }));
}

Status ProviderCall::getInstance(const ObjectPath& path, const PropertyList& properties, const InstanceSink& sink) {
    Collector collector(sink);
    return collector.statusOf(call(path, properties, collector, [this](const Arguments& arguments) {
        CMPIInstanceMI& mi = _provider.instanceMI(*arguments.context);
        return callSlot(mi.ft->getInstance, mi, arguments.context, arguments.result, arguments.path,
                        arguments.properties);
    }));
}

Status ProviderCall::createInstance(const Instance& instance, ObjectPath& created) {
    const PathSink sink = [&created](ObjectPath&& path) { created = std::move(path); };
    Collector collector(sink);
    return collector.statusOf(call(instance.path, std::nullopt, collector, [&](const Arguments& arguments) {
        CMPIInstanceMI& mi = _provider.instanceMI(*arguments.context);
        return callSlot(mi.ft->createInstance, mi, arguments.context, arguments.result, arguments.path,
                        _broker.newInstance(instance));
    }));
}

Status ProviderCall::deleteInstance(const ObjectPath& path) {
    Collector collector;
    return collector.statusOf(call(path, std::nullopt, collector, [this](const Arguments& arguments) {
        CMPIInstanceMI& mi = _provider.instanceMI(*arguments.context);
        return callSlot(mi.ft->deleteInstance, mi, arguments.context, arguments.result, arguments.path);
    }));
}

Status ProviderCall::modifyInstance(const Instance& instance, const std::vector<std::string>& names) {
    Collector collector;
    bool isDone = false;
    const Status status = collector.statusOf(call(
        instance.path, names, collector,
        [&](const Arguments& arguments) {
            CMPIInstanceMI& mi = _provider.instanceMI(*arguments.context);
            return callSlot(mi.ft->modifyInstance, mi, arguments.context, arguments.result, arguments.path,
                            _broker.newInstance(instance), arguments.properties);
        },
        &isDone));
    return status.ok() && !isDone ? Status{CMPI_RC_ERR_FAILED, "", {}} : status;
}

Status ProviderCall::invokeMethod(const ObjectPath& path, const std::string& method,
                                  const std::vector<NamedValue>& arguments, MethodAnswer& answer) {
    Collector collector;
    bool isDone = false;
    Status status = collector.statusOf(call(
        path, std::nullopt, collector,
        [&](const Arguments& prepared) {
            CMPIMethodMI& mi = _provider.methodMI(*prepared.context);
            CMPIArgs* out = _broker.newArgs({});
            const CMPIStatus answered = callSlot(mi.ft->invokeMethod, mi, prepared.context, prepared.result,
                                                 prepared.path, method.c_str(), _broker.newArgs(arguments), out);
            answer.out = broker::Broker::toModel(*out);
            return answered;
        },
        &isDone));
    if (!status.ok() || (isDone && collector.value)) {
        answer.returned = std::move(collector.value).value_or(Value{});
        return status;
    }
    return {CMPI_RC_ERR_FAILED, "", {}};
}

} // namespace marlo

#include "host/cimom/ProviderCall.h"

#include "host/cimom/StatusCodes.h"

#include <utility>

namespace marlo {

namespace {

/** Takes over what a provider returns and remembers an error that it gives in place of a status. */
class Collector final : public broker::ResultSink {
  public:
    Collector(const ProviderCall::InstanceSink* instances, const ProviderCall::PathSink* paths)
        : _instances(instances), _paths(paths) {}

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

    void data(const CMPIData& /*data*/) override {}

    void error(CMPIrc code, const std::string& message) override { _error = {code, message, {}}; }

    [[nodiscard]] const Status& error() const { return _error; }

  private:
    const ProviderCall::InstanceSink* _instances;
    const ProviderCall::PathSink* _paths;
    Status _error;
};

} // namespace

/** What every MI function of instances takes. */
struct ProviderCall::Arguments {
    const CMPIContext* context;
    const CMPIResult* result;
    const CMPIObjectPath* path;
    const char** properties; ///< null asks for all
};

Status ProviderCall::statusOf(const CMPIStatus& answered) const {
    if (answered.rc == CMPI_RC_OK) {
        return {};
    }
    const std::string& name = _provider.registration().name;
    std::string message = broker::messageOf(answered);
    if (message.empty()) {
        message = "provider " + name + " gave no reason";
    }
    if (isCimStatus(answered.rc)) {
        return {answered.rc, std::move(message), {}};
    }
    return {CMPI_RC_ERR_FAILED, message + " (CMPI return code " + std::to_string(answered.rc) + ")", {}};
}

Status ProviderCall::call(const ObjectPath& path, const PropertyList& properties, broker::ResultSink& sink,
                          const Function& function) {
    const broker::CallScope scope;
    CMPIContext* context = _broker.newContext();
    _broker.addEntry(context, CMPIInvocationFlags, Value::uint(CMPI_uint32, 0));
    _broker.addEntry(context, CMPIPrincipal, Value::string(_principal));
    _broker.addEntry(context, CMPIInitNameSpace, Value::string(path.nameSpace));
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
        CMPIInstanceMI& mi = _provider.instanceMI(*context);
        status = statusOf(function(mi, arguments));
    } catch (const LoadError& error) {
        status = {CMPI_RC_ERR_FAILED, error.what(), {}};
    } catch (...) {
        status = {CMPI_RC_ERR_FAILED,
                  "provider " + _provider.registration().name + " threw: " + currentExceptionText(),
                  {}};
    }
    result.rethrow();
    return status;
}

Status ProviderCall::enumerateInstances(const ObjectPath& classPath, const PropertyList& properties,
                                        const InstanceSink& sink) {
    Collector collector(&sink, nullptr);
    const Status status = call(classPath, properties, collector, [](CMPIInstanceMI& mi, const Arguments& arguments) {
        return mi.ft->enumerateInstances(&mi, arguments.context, arguments.result, arguments.path,
                                         arguments.properties);
    });
    return status.ok() ? collector.error() : status;
}

Status ProviderCall::enumerateInstanceNames(const ObjectPath& classPath, const PathSink& sink) {
    Collector collector(nullptr, &sink);
    const Status status =
        call(classPath, std::nullopt, collector, [](CMPIInstanceMI& mi, const Arguments& arguments) {
            return mi.ft->enumerateInstanceNames(&mi, arguments.context, arguments.result, arguments.path);
        });
    return status.ok() ? collector.error() : status;
}

Status ProviderCall::getInstance(const ObjectPath& path, const PropertyList& properties, const InstanceSink& sink) {
    Collector collector(&sink, nullptr);
    const Status status = call(path, properties, collector, [](CMPIInstanceMI& mi, const Arguments& arguments) {
        return mi.ft->getInstance(&mi, arguments.context, arguments.result, arguments.path, arguments.properties);
    });
    return status.ok() ? collector.error() : status;
}

} // namespace marlo

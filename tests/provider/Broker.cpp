#include "tests/provider/Broker.h"

#include <algorithm>

namespace provider_test {

using marlo::Instance;
using marlo::ObjectPath;
using marlo::Value;

const std::vector<std::string>* Keys::keys(Name nameSpace, Name className) const {
    const auto found = _keys.find(className);
    return nameSpace == NAMESPACE && found != _keys.end() ? &found->second : nullptr;
}

Platform::Outcome Platform::enumerateInstances(const ObjectPath& classPath, const PropertyNames& properties,
                                               const InstanceSink& sink) {
    {
        const std::lock_guard lock(_mutex);
        enumerations.emplace_back(classPath.nameSpace + ":" + classPath.className, properties.has_value());
    }
    if (outcome.code != CMPI_RC_OK) {
        return outcome;
    }
    for (Instance instance : classPath.className == "TAVIS_NetworkCard" ? cards : ports) {
        sink(std::move(instance));
    }
    return outcome;
}

Platform::Outcome Platform::deliverIndication(const std::string& nameSpace, Instance&& indication) {
    const std::lock_guard lock(_mutex);
    _delivered.emplace_back(nameSpace, std::move(indication));
    return deliveryOutcome;
}

Platform::Delivered Platform::delivered() const {
    const std::lock_guard lock(_mutex);
    return _delivered;
}

namespace {

Instance platformInstance(const std::string& className, const std::vector<std::string>& texts) {
    Instance instance;
    instance.path.nameSpace = "root/quarn";
    instance.path.className = className;
    for (const std::string& name : texts) {
        set(instance, name, Value::string(name + " text"));
    }
    return instance;
}

} // namespace

Instance card(const std::string& name) {
    Instance instance =
        platformInstance("TAVIS_NetworkCard", {"Status", "ElementName", "Description", "Name", "SerialNumber"});
    set(instance, "Name", Value::string(name));
    set(instance, "PackageType", Value::uint(CMPI_uint16, 9));
    set(instance, "Tag", Value::string("the platform's own tag"));
    set(instance, "Model", Value::string("never copied"));
    return instance;
}

Instance port(const std::string& deviceID, const std::string& systemCreationClassName) {
    Instance instance = platformInstance("TAVIS_NetworkPort", {"Status", "SystemName", "DeviceID", "ElementName",
                                                               "Caption", "Description", "Name", "PermanentAddress"});
    set(instance, "DeviceID", Value::string(deviceID));
    set(instance, "SystemCreationClassName", Value::string(systemCreationClassName));
    set(instance, "Speed", Value::uint(CMPI_uint64, 10'000'000'000));
    set(instance, "MaxSpeed", Value::uint(CMPI_uint64, 25'000'000'000));
    set(instance, "RequestedSpeed", Value::uint(CMPI_uint64, 10'000'000'001));
    set(instance, "PortType", Value::uint(CMPI_uint16, 53));
    set(instance, "PortNumber", Value::uint(CMPI_uint16, 4));
    set(instance, "FullDuplex", Value::boolean(true));
    set(instance, "AutoSense", Value::boolean(false));
    set(instance, "LinkTechnology", Value::uint(CMPI_uint16, 2));
    set(instance, "OtherPortType", Value::string("never copied"));
    return instance;
}

void set(Instance& instance, const std::string& name, Value value) {
    const auto found = std::find_if(instance.properties.begin(), instance.properties.end(),
                                    [&](const marlo::NamedValue& property) { return property.name == name; });
    if (found != instance.properties.end()) {
        found->value = std::move(value);
    } else {
        instance.properties.push_back({name, std::move(value)});
    }
}

Value get(const Instance& instance, const std::string& name) {
    const marlo::NamedValue* found = marlo::findName(instance.properties, name);
    return found != nullptr ? found->value : Value::null(CMPI_null);
}

std::vector<std::string> names(const Instance& instance) {
    std::vector<std::string> found;
    for (const marlo::NamedValue& property : instance.properties) {
        found.push_back(property.name);
    }
    return found;
}

Value strings(const std::vector<std::string>& elements) {
    Value::Array array;
    for (const std::string& element : elements) {
        array.push_back(Value::string(element));
    }
    return {CMPI_stringA, array};
}

ObjectPath instancePath(const std::string& className, const std::vector<std::pair<std::string, std::string>>& keys) {
    ObjectPath path = classPath(className);
    for (const auto& [name, value] : keys) {
        path.keys.push_back({name, Value::string(value)});
    }
    return path;
}

namespace {

class Collector final : public marlo::broker::ResultSink {
  public:
    explicit Collector(Answer& answer) : _answer(answer) {}

    void instance(const CMPIInstance& instance) override {
        _answer.instances.push_back(marlo::broker::Broker::toModel(instance));
    }

    void path(const CMPIObjectPath& path) override { _answer.paths.push_back(marlo::broker::Broker::toModel(path)); }

    void data(const CMPIData& data) override { _answer.values.push_back(marlo::broker::Broker::toModel(data)); }

    void error(CMPIrc, const std::string&) override {}

  private:
    Answer& _answer;
};

} // namespace

Answer BrokerSetup::call(const ObjectPath& reference, const Call& function, bool viaFaulty) {
    const marlo::broker::CallScope scope;
    Answer answer;
    Collector sink(answer);
    const marlo::broker::Result result(sink);
    const CMPIContext* context = real.newContext();
    CMPIObjectPath* path = real.newObjectPath(reference);
    const CMPIResult* handle = result.handle();
    const CMPIStatus status =
        viaFaulty ? function(context, faulty.adopt(handle), faulty.adopt(path)) : function(context, handle, path);
    answer.code = status.rc;
    answer.hasMessage = status.msg != nullptr;
    answer.message = marlo::broker::messageOf(status);
    answer.done = result.isDone();
    return answer;
}

} // namespace provider_test

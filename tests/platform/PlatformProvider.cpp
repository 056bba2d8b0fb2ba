#include "tests/platform/PlatformProvider.h"

#include <algorithm>
#include <cstdlib>
#include <fstream>
#include <stdexcept>

#include <dlfcn.h>
#include <unistd.h>

namespace marlo::test {

namespace {

using Factory = CMPIInstanceMI* (*)(const CMPIBroker*, const CMPIContext*, CMPIStatus*);

Factory findFactory(const std::string& className) {
    void* library = dlopen(PLATFORM_LIBRARY, RTLD_NOW | RTLD_LOCAL);
    if (library == nullptr) {
        throw std::runtime_error(dlerror());
    }
    // TAVIS_NetworkCard is provided by TavisNetworkCardProvider.
    const std::string symbol = "Tavis" + className.substr(className.find('_') + 1) + "Provider_Create_InstanceMI";
    void* factory = dlsym(library, symbol.c_str());
    if (factory == nullptr) {
        throw std::runtime_error(dlerror());
    }
    return reinterpret_cast<Factory>(factory);
}

class Collector final : public broker::ResultSink {
  public:
    explicit Collector(Answer& answer) : _answer(answer) {}

    void instance(const CMPIInstance& instance) override {
        _answer.instances.push_back(broker::Broker::toModel(instance));
    }

    void path(const CMPIObjectPath& path) override { _answer.paths.push_back(broker::Broker::toModel(path)); }

    void data(const CMPIData& /*data*/) override { throw std::logic_error("data from an instance provider"); }

    void error(CMPIrc /*code*/, const std::string& message) override { throw std::logic_error(message); }

  private:
    Answer& _answer;
};

std::vector<const char*> terminated(const Properties& properties) {
    auto list = properties.value_or(std::vector<const char*>());
    list.push_back(nullptr);
    return list;
}

} // namespace

const broker::Broker& PlatformProvider::sharedBroker() {
    static const EmptySchema schema;
    static const broker::Broker broker(schema);
    return broker;
}

PlatformProvider::PlatformProvider(std::string className, const CMPIBroker* handle)
    : _className(std::move(className)) {
    CMPIStatus status{CMPI_RC_OK, nullptr};
    const broker::CallScope scope;
    _mi = findFactory(_className)(handle == nullptr ? _broker.handle() : handle, _broker.newContext(), &status);
}

template <class Operation>
Answer PlatformProvider::call(const ObjectPath& path, const Operation& operation) const {
    const broker::CallScope scope;
    Answer answer;
    Collector collector(answer);
    const broker::Result result(collector);
    const CMPIStatus status = operation(_broker.newContext(), result.handle(), _broker.newObjectPath(path));
    result.rethrow();
    answer.code = status.rc;
    answer.message = broker::messageOf(status);
    answer.done = result.isDone();
    return answer;
}

Answer PlatformProvider::names() const {
    return call({"", "root/quarn", _className, {}}, [&](auto* context, auto* result, auto* path) {
        return _mi->ft->enumerateInstanceNames(_mi, context, result, path);
    });
}

Answer PlatformProvider::instances(const Properties& properties) const {
    auto list = terminated(properties);
    return call({"", "root/quarn", _className, {}}, [&](auto* context, auto* result, auto* path) {
        return _mi->ft->enumerateInstances(_mi, context, result, path, properties ? list.data() : nullptr);
    });
}

Answer PlatformProvider::get(const ObjectPath& path, const Properties& properties) const {
    auto list = terminated(properties);
    return call(path, [&](auto* context, auto* result, auto* reference) {
        return _mi->ft->getInstance(_mi, context, result, reference, properties ? list.data() : nullptr);
    });
}

const Instance* findInstance(const Answer& answer, const std::string& key, const std::string& value) {
    const auto found = std::find_if(answer.instances.begin(), answer.instances.end(),
                                    [&](const Instance& instance) { return textOf(instance, key) == value; });
    return found == answer.instances.end() ? nullptr : &*found;
}

std::optional<std::string> textOf(const Instance& instance, const std::string& name) {
    const NamedValue* property = findName(instance.properties, name);
    const auto* text = property == nullptr ? nullptr : std::get_if<std::string>(&property->value.data);
    return text == nullptr ? std::nullopt : std::optional(*text);
}

DescribedHost::DescribedHost(const std::string& toml) {
    _file = (std::filesystem::temp_directory_path() / "platform-XXXXXX").string();
    const int descriptor = mkstemp(_file.data());
    if (descriptor < 0) {
        throw std::runtime_error("no temporary file " + _file);
    }
    close(descriptor);
    std::ofstream(_file) << toml;
    setenv("ORV_AGENT_TREE", _file.c_str(), 1);
}

DescribedHost::~DescribedHost() {
    unsetenv("ORV_AGENT_TREE");
    std::filesystem::remove(_file);
}

} // namespace marlo::test

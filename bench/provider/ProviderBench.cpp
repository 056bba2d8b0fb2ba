#include "bench/provider/ProviderBench.h"

#include <stdexcept>

#include <dlfcn.h>

namespace marlo::bench {

namespace {

/** One class with one key is all that the configuration provider needs. */
class ConfigurationSchema final : public broker::SchemaView {
  public:
    [[nodiscard]] const std::vector<std::string>* keys(std::string_view /*nameSpace*/,
                                                       std::string_view /*className*/) const override {
        return &_keys;
    }

    [[nodiscard]] bool isA(std::string_view /*nameSpace*/, std::string_view /*className*/,
                           std::string_view /*ancestor*/) const override {
        return false;
    }

    [[nodiscard]] const Value* classQualifier(std::string_view /*nameSpace*/, std::string_view /*className*/,
                                              std::string_view /*qualifier*/) const override {
        return nullptr;
    }

    [[nodiscard]] const Value* propertyQualifier(std::string_view /*nameSpace*/, std::string_view /*className*/,
                                                 std::string_view /*property*/,
                                                 std::string_view /*qualifier*/) const override {
        return nullptr;
    }

    [[nodiscard]] const Value* methodQualifier(std::string_view /*nameSpace*/, std::string_view /*className*/,
                                               std::string_view /*method*/,
                                               std::string_view /*qualifier*/) const override {
        return nullptr;
    }

    [[nodiscard]] const Value* parameterQualifier(std::string_view /*nameSpace*/, std::string_view /*className*/,
                                                  std::string_view /*method*/, std::string_view /*parameter*/,
                                                  std::string_view /*qualifier*/) const override {
        return nullptr;
    }

  private:
    std::vector<std::string> _keys{"SettingID"};
};

/** What the factory of this name in the provider library makes. */
template <typename MI>
MI* createMI(const char* name) {
    void* library = ::dlopen(MARLO_PROVIDER_LIBRARY, RTLD_NOW | RTLD_LOCAL);
    if (library == nullptr) {
        throw std::runtime_error(::dlerror());
    }
    using Factory = MI* (*)(const CMPIBroker*, const CMPIContext*, CMPIStatus*);
    const auto factory = reinterpret_cast<Factory>(::dlsym(library, name));
    if (factory == nullptr) {
        throw std::runtime_error(::dlerror());
    }
    CMPIStatus status{CMPI_RC_OK, nullptr};
    return factory(sharedBroker().handle(), nullptr, &status);
}

} // namespace

const broker::Broker& sharedBroker() {
    static const ConfigurationSchema schema;
    static const broker::Broker instance(schema);
    return instance;
}

CMPIInstanceMI* configurationProvider() {
    return createMI<CMPIInstanceMI>("NetworkAdapterProvider_Create_InstanceMI");
}

CMPIMethodMI* configurationMethods() {
    return createMI<CMPIMethodMI>("NetworkAdapterProvider_Create_MethodMI");
}

} // namespace marlo::bench

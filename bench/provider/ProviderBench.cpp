#include "bench/provider/ProviderBench.h"

#include "instrumentation/Instrumentation.h"

#include <cstdlib>
#include <fstream>
#include <stdexcept>

#include <dlfcn.h>
#include <unistd.h>

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

std::string descriptionFile() {
    return "/tmp/marlo-bench-" + std::to_string(::getpid()) + ".toml";
}

void removeDescription() {
    (void)::unlink(descriptionFile().c_str());
}

} // namespace

void describeHost(int adapters) {
    const std::string path = descriptionFile();
    static const int atExit = std::atexit(removeDescription);
    (void)atExit;
    std::ofstream file(path, std::ios::trunc);
    for (int i = 0; i < adapters; ++i) {
        file << "[[adapter]]\nidentity = \"eth" << i << "\"\nstatus = 1\ndhcp = 3\nip_support = 3\n"
             << "ipv4_address = \"10." << i / 62500 << '.' << i / 250 % 250 << '.' << i % 250 + 1 << "\"\n"
             << "ipv4_subnet_mask = \"255.0.0.0\"\nipv6_address = \"2001:db8::" << std::hex << i + 1 << std::dec
             << "\"\ndefault_gateway = \"10.255.255.254\"\ndns_servers = [\"192.0.2.53\", \"198.51.100.53\"]\n"
             << "dns_suffixes = [\"example.com\", \"example.net\"]\ndns_hostname = \"host\"\n"
             << "dns_domain = \"example.com\"\nmac_address = \"02:00:00:00:00:01\"\n";
    }
    file.close();
    if (!file) {
        throw std::runtime_error("cannot write " + path);
    }
    (void)::setenv("ORV_AGENT_TREE", path.c_str(), 1);
    const Orv::Instrumentation warm;
}

const broker::Broker& sharedBroker() {
    static const ConfigurationSchema schema;
    static const broker::Broker instance(schema);
    return instance;
}

CMPIInstanceMI* configurationProvider() {
    void* library = ::dlopen(MARLO_PROVIDER_LIBRARY, RTLD_NOW | RTLD_LOCAL);
    if (library == nullptr) {
        throw std::runtime_error(::dlerror());
    }
    using Factory = CMPIInstanceMI* (*)(const CMPIBroker*, const CMPIContext*, CMPIStatus*);
    const auto factory = reinterpret_cast<Factory>(::dlsym(library, "NetworkAdapterProvider_Create_InstanceMI"));
    if (factory == nullptr) {
        throw std::runtime_error(::dlerror());
    }
    CMPIStatus status{CMPI_RC_OK, nullptr};
    return factory(sharedBroker().handle(), nullptr, &status);
}

} // namespace marlo::bench

#include "agent/file/FileBackEnd.h"
#include "tests/agent/backend_contract.h"

#include <algorithm>

namespace Orv::Test {
namespace {

/** A host that is a tree file, written anew for every change. */
class FileHost {
  public:
    static void require(std::string& /*whyNot*/) {}

    FileHost() { write(); }

    Agent::BackEnd& backEnd() { return *_backEnd; }

    void add(const AdapterSetup& adapter) {
        _adapters.push_back(adapter);
        write();
    }

    void remove(const std::string& name) {
        std::erase_if(_adapters, [&](const AdapterSetup& adapter) { return adapter.name == name; });
        write();
    }

    void change(const AdapterSetup& adapter) {
        std::replace_if(
            _adapters.begin(), _adapters.end(), [&](const AdapterSetup& known) { return known.name == adapter.name; },
            adapter);
        write();
    }

    void resolve(const ResolverSetup& resolver) {
        _resolver = resolver;
        write();
    }

  private:
    static std::string key(const std::string& name, const std::optional<std::string>& value) {
        return value ? name + " = \"" + *value + "\"\n" : "";
    }

    static std::string key(const std::string& name, const std::vector<std::string>& values) {
        std::string text;
        for (const std::string& value : values) {
            text += (text.empty() ? "\"" : ", \"") + value + '"';
        }
        return values.empty() ? "" : name + " = [" + text + "]\n";
    }

    static std::string statusOf(AdapterSetup::State state) {
        return state == AdapterSetup::State::running ? "1" : state == AdapterSetup::State::stopped ? "5" : "12";
    }

    std::string describe(const AdapterSetup& adapter) const {
        std::string text = "[[adapter]]\nstatus = " + statusOf(adapter.state) + '\n';
        text += key("identity", std::optional(adapter.name)) + key("mac_address", std::optional(adapter.mac));
        text += key("ipv4_address", adapter.ipv4) + key("ipv6_address", adapter.ipv6);
        text += key("default_gateway", adapter.gateway);
        if (adapter.ipv4) {
            text += "ipv4_subnet_mask = \"255.255.255.0\"\ndhcp = ";
            text += adapter.leased ? "1\n" : "3\n";
        }
        text += key("dns_servers", _resolver.servers) + key("dns_suffixes", _resolver.suffixes);
        if (!_resolver.suffixes.empty()) {
            text += key("dns_domain", std::optional(_resolver.suffixes.front()));
        }
        return text;
    }

    void write() const {
        std::string text;
        for (const AdapterSetup& adapter : _adapters) {
            text += describe(adapter);
        }
        _file.replace(text);
    }

    TemporaryFile _file;
    std::unique_ptr<Agent::BackEnd> _backEnd = Agent::makeFileBackEnd(_file.path());
    std::vector<AdapterSetup> _adapters;
    ResolverSetup _resolver;
};

INSTANTIATE_TYPED_TEST_SUITE_P(File, BackEndContract, FileHost);

} // namespace
} // namespace Orv::Test

/**
 * @file
 * A host that is not there, on which a writer works: every step is recorded, and fails where it is told to.
 */
#pragma once

#include "agent/write/HostWriter.h"
#include "tests/linux/TemporaryHost.h"

#include <fstream>
#include <functional>
#include <iterator>
#include <map>
#include <memory>
#include <mutex>
#include <set>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

namespace Orv::Test {

/**
 * Interfaces with the properties of their adapters, one file that all share, and the record of what was done. Each
 * interface has a line "NAME MODE ADDRESS GATEWAY" in the file.
 */
class ScriptedHost {
  public:
    using Properties = Agent::PropertyMap;

    static constexpr const char* file = "/etc/interfaces";

    ScriptedHost() { files.write(file, "# made by hand\n"); }

    Agent::Linux::WriterParts parts();

    void add(int index, const std::string& name, unsigned mode, const std::string& address, const std::string& mask,
             const std::string& gateway);

    /** Notes a step, and throws when it is to fail. */
    void step(const std::string& name);

    [[nodiscard]] std::string fileText() const {
        std::ifstream stream(files.at(file));
        return {std::istreambuf_iterator<char>(stream), {}};
    }

    [[nodiscard]] std::vector<std::string> takeSteps() {
        const std::lock_guard lock(mutex);
        return std::exchange(steps, {});
    }

    std::mutex mutex;                                           ///< guards what follows
    std::map<std::string, Agent::Linux::AdapterFacts> adapters; ///< by path, which is the name
    std::vector<std::string> steps;
    std::set<std::string> failing;                       ///< steps that throw
    std::set<std::string> clients;                       ///< interfaces with a DHCP client
    std::function<void(const std::string& step)> during; ///< called in each step, without the mutex
    TemporaryHost files;
};

/** What the file says of an interface when these settings hold. */
inline std::string lineOf(const std::string& name, const Agent::Ipv4Settings& ipv4) {
    return name + (ipv4.mode == Agent::AddressMode::leased ? " dhcp" : " static") +
           (ipv4.address ? " " + ipv4.address->text() : "") + (ipv4.gateway ? " via " + ipv4.gateway->text() : "") +
           "\n";
}

class ScriptedManager : public Agent::Persistence::Manager {
  public:
    using Facts = Agent::Linux::InterfaceFacts;
    using FileEdits = Agent::Persistence::FileEdits;

    explicit ScriptedManager(ScriptedHost& host) : _host(host) {}

    [[nodiscard]] std::string name() const override { return "scripted"; }

    [[nodiscard]] FileEdits plan(const Facts& interface, const Agent::AdapterSettings& wanted) const override {
        _host.step("plan " + interface.name);
        const std::string before = _host.fileText();
        if (!wanted.ipv4) {
            return {};
        }
        std::string after = before;
        const std::size_t begin = before.find("\n" + interface.name + " ");
        if (begin != std::string::npos) {
            after.erase(begin + 1, before.find('\n', begin + 1) - begin);
        }
        after += lineOf(interface.name, *wanted.ipv4);
        if (_host.failing.count("file") != 0) {
            return {{_host.files.at(ScriptedHost::file).string(), "something else", after}};
        }
        return {{_host.files.at(ScriptedHost::file).string(), before, after}};
    }

    bool stopDhcp(const Facts& interface) override {
        _host.step("stop " + interface.name);
        const std::lock_guard lock(_host.mutex);
        return _host.clients.erase(interface.name) != 0;
    }

    void activate(const Facts& interface, const Agent::AdapterSettings& /*wanted*/) override {
        _host.step("activate " + interface.name);
    }

    void startDhcp(const Facts& interface) override {
        _host.step("start " + interface.name);
        const std::lock_guard lock(_host.mutex);
        _host.clients.insert(interface.name);
    }

  private:
    ScriptedHost& _host;
};

class ScriptedNameService : public Agent::Persistence::NameService {
  public:
    explicit ScriptedNameService(ScriptedHost& host) : _host(host) {}

    [[nodiscard]] std::string name() const override { return "scripted"; }

    [[nodiscard]] Agent::Persistence::FileEdits plan(const Agent::NameSettings& /*wanted*/) const override {
        _host.step("plan names");
        return {};
    }

    void apply(const Agent::Linux::InterfaceFacts& interface, const Agent::NameSettings& whole) override {
        std::string servers;
        for (const std::string& server : whole.servers.value_or(std::vector<std::string>())) {
            servers += " " + server;
        }
        _host.step("names " + interface.name + servers);
    }

  private:
    ScriptedHost& _host;
};

class ScriptedKernel : public Agent::Linux::LiveIpv4 {
  public:
    using Tables = Agent::Linux::InterfaceTables;

    explicit ScriptedKernel(ScriptedHost& host) : _host(host) {}

    [[nodiscard]] Tables read(int index) override {
        _host.step("read");
        return {index, {}, {}};
    }

    Tables write(const Tables& before, const Agent::Ipv4Settings& wanted, Leases /*leases*/) override {
        _host.step("write" + lineOf("", wanted).substr(0, lineOf("", wanted).size() - 1));
        return before;
    }

    void welcomeLease(const Tables& /*wanted*/) override { _host.step("welcome"); }

    void restore(const Tables& /*before*/) override { _host.step("restore"); }

  private:
    ScriptedHost& _host;
};

inline void ScriptedHost::step(const std::string& name) {
    if (during) {
        during(name);
    }
    const std::lock_guard lock(mutex);
    steps.push_back(name);
    if (failing.count(name) != 0) {
        throw std::runtime_error(name + " failed");
    }
}

inline void ScriptedHost::add(int index, const std::string& name, unsigned mode, const std::string& address,
                              const std::string& mask, const std::string& gateway) {
    using namespace NodeLexicon;
    Properties properties{{PROP_NODE_STRING, name},
                          {PROP_DHCP_ENABLED, mode},
                          {PROP_DNS_SERVERS, std::vector<std::string>{"192.0.2.53"}}};
    for (const auto& [property, text] : std::map<NodeLexicon::Properties, std::string>{
             {PROP_IPV4_ADDRESS, address}, {PROP_IPV4_SUBNET_MASK, mask}, {PROP_DEFAULT_GATEWAY, gateway}}) {
        if (!text.empty()) {
            properties.emplace(property, text);
        }
    }
    const std::lock_guard lock(mutex);
    adapters[name] = {{index, name, "", "", "", true}, properties, {}};
}

inline Agent::Linux::WriterParts ScriptedHost::parts() {
    return {[this](const std::string& path) -> std::optional<int> {
                const std::lock_guard lock(mutex);
                const auto found = adapters.find(path);
                return found == adapters.end() ? std::nullopt : std::optional(found->second.interface.index);
            },
            [this](const std::string& path) -> std::optional<Agent::Linux::AdapterFacts> {
                const std::lock_guard lock(mutex);
                const auto found = adapters.find(path);
                return found == adapters.end() ? std::nullopt : std::optional(found->second);
            },
            [this](int index) {
                const std::lock_guard lock(mutex);
                return std::any_of(adapters.begin(), adapters.end(),
                                   [&](const auto& known) { return known.second.interface.index == index; });
            },
            [this](const auto&) { return std::make_unique<ScriptedManager>(*this); },
            [this](const auto&) { return std::make_unique<ScriptedNameService>(*this); },
            std::make_unique<ScriptedKernel>(*this)};
}

} // namespace Orv::Test

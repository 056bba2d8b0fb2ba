/**
 * @file
 * A host with three adapters, one card and one port each, and the three read operations on it.
 */
#pragma once

#include "tests/provider/ProviderCalls.h"
#include "tests/provider/Tree.h"

#include <ostream>
#include <stdexcept>
#include <string>
#include <vector>

namespace provider_test {

inline void addAdapters(BrokerSetup& setup) {
    for (const char* name : {"eth0", "eth1", "eth2"}) {
        addFullAdapter(name);
        setup.platform.cards.push_back(card(name));
        setup.platform.ports.push_back(port(name));
    }
}

/** The path by which a provider's instance of an adapter of the scene is found. */
inline marlo::ObjectPath pathOf(const Subject& subject, const std::string& adapter) {
    if (subject.className == CONFIGURATION) {
        return instancePath(CONFIGURATION, {{"SettingID", adapter}});
    }
    if (subject.className == PHYSICAL) {
        return instancePath(PHYSICAL, {{"CreationClassName", PHYSICAL}, {"Tag", adapter}});
    }
    return instancePath(LOGICAL, {{"SystemCreationClassName", "MARLO_ComputerSystem"},
                                  {"SystemName", "SystemName text"},
                                  {"CreationClassName", LOGICAL},
                                  {"DeviceID", adapter}});
}

/** One of the nine functions. */
struct ReadCall {
    Subject subject;
    std::string operation;

    [[nodiscard]] std::string name() const { return subject.prefix + "_" + operation; }

    Answer run(ProviderCalls& calls) const {
        if (operation == "GetInstance") {
            return calls.getInstance(subject, pathOf(subject, "eth1"));
        }
        return operation == "EnumInstances" ? calls.enumInstances(subject) : calls.enumInstanceNames(subject);
    }

    friend std::ostream& operator<<(std::ostream& stream, const ReadCall& call) { return stream << call.name(); }
};

inline std::vector<ReadCall> allReadCalls() {
    std::vector<ReadCall> all;
    for (const Subject& subject : allProviders()) {
        for (const char* operation : {"GetInstance", "EnumInstanceNames", "EnumInstances"}) {
            all.push_back({subject, operation});
        }
    }
    return all;
}

inline const std::string BANNER(78, '=');

/** The scene, called through a broker whose calls are counted. */
class ReadBase {
  protected:
    ReadBase() {
        scripted_agent::reset();
        addAdapters(setup);
    }

    static bool hasExitMark() {
        const std::vector<std::string> lines = scripted_agent::recorded("log");
        return lines.size() > 1 && lines.back().ends_with(BANNER) &&
               lines[lines.size() - 2].find("markProviderExit | EXITING") != std::string::npos;
    }

    int count(const std::string& slot) {
        const auto counts = setup.faulty.counts();
        const auto found = counts.find(slot);
        return found != counts.end() ? found->second : 0;
    }

    /** The broker makes the second instance of a call without a handle. */
    void loseHandleOfSecondInstance() {
        static CMPIBrokerEncFT table;
        static CMPIInstance* (*real)(const CMPIBroker*, const CMPIObjectPath*, CMPIStatus*);
        static int made;
        made = 0;
        table = *setup.faulty.handle()->eft;
        real = table.newInstance;
        table.newInstance = [](const CMPIBroker* broker, const CMPIObjectPath* path, CMPIStatus* status) {
            CMPIInstance* instance = real(broker, path, status);
            if (++made == 2) {
                instance->hdl = nullptr;
            }
            return instance;
        };
        setup.faulty.changeable().eft = &table;
    }

    BrokerSetup setup;
    ProviderCalls calls{setup};
};

} // namespace provider_test

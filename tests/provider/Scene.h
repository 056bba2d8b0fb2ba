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

} // namespace provider_test

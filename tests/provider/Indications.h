/**
 * @file
 * The indication side of the provider, its globals in sight, on the scripted agent and the object manager's broker.
 */
#pragma once

#include "indication/NetworkIndication.h"
#include "tests/provider/AlertThreads.h"
#include "tests/provider/Broker.h"
#include "tests/provider/Tree.h"

#include <algorithm>
#include <memory>
#include <stdexcept>
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace provider_test {

inline const std::string INDICATION_LOGGER = "Hearth.NetworkAdapterProvider";

inline constexpr Orv::DateTime::Fields EVENT_TIME{2009, 3, 7, 5, 4, 9, 250, 1};

/** The globals as they are when the library has just been loaded. */
inline void resetIndicationGlobals() {
    using namespace Orv::NetworkAdapterComposite;
    _alertBroker = nullptr;
    _alertContext = nullptr;
    _alertContextAvailable = false;
    _enabledNetwork = false;
    OnlineSubscribeCount = OfflineSubscribeCount = SwitchoverSubscribeCount = SwitchbackSubscribeCount = 0;
    indicationNetworkData = {};
    ind_thread_id = nullptr;
}

/** The texts of the agent's five messages. */
inline void addMessages() {
    for (const wchar_t* event : {L"OFFLINE", L"ONLINE", L"SWITCHOVER", L"SWITCHBACK", L"FAILED"}) {
        scripted_agent::script().messages[std::wstring(L"MSGID_NAI_NIC_") + event] =
            std::wstring(L"Text of ") + event;
    }
}

/** A node that an event's path selects. */
inline scripted_agent::Node& addEventNode(const std::string& path, unsigned int status,
                                          const std::string& identity = "eth0") {
    scripted_agent::Node node{.path = path, .description = "Adapter " + identity};
    node.texts[Orv::NodeLexicon::PROP_NODE_STRING] = identity;
    node.numbers[Orv::NodeLexicon::PROP_STATUS] = status;
    scripted_agent::script().nodes.push_back(node);
    return scripted_agent::script().nodes.back();
}

/** A line of the log by a function of the unit. */
inline std::string logged(const std::string& function, const std::string& text, int level = 4000) {
    return line("log", level, INDICATION_LOGGER, "NetworkIndication", function, text);
}

inline std::string entering(const std::string& function) {
    return logged(function, "ENTERING: " + function + "() in NetworkIndication [Line: N]");
}

inline std::string exiting(const std::string& function) {
    return logged(function, "EXITING: " + function + "() in NetworkIndication [Line: N]");
}

inline std::string variable(const std::string& function, const std::string& name, const std::string& value) {
    return logged(function, "VARIABLE: '" + name + "' has Value '" + value + "' at line N in NetworkIndication");
}

inline std::string message(const std::string& function, const std::string& text, int level = 4000) {
    return logged(function, "MESSAGE [File: NetworkIndication, Line: N]: " + text, level);
}

class Indications : public testing::Test {
  protected:
    Indications() {
        scripted_agent::reset();
        resetIndicationGlobals();
        addMessages();
    }

    ~Indications() override { resetIndicationGlobals(); }

    /** The lines of the log so far. */
    static std::vector<std::string> log() { return normalised(scripted_agent::recorded("log ")); }

    /** Everything recorded so far but for the trace, which repeats the log, and the building of lines. */
    static std::vector<std::string> steps() {
        std::vector<std::string> lines = normalised(scripted_agent::record());
        std::erase_if(lines, [](const std::string& text) {
            return text.starts_with("trace ") || text.starts_with("buffer") || text == "~buffer()";
        });
        return lines;
    }

    /** The agent's calls so far. */
    static std::vector<std::string> agentCalls() { return scripted_agent::recorded("cursor "); }

    /** Calls of the broker show among the steps. */
    void noteBrokerCalls() {
        setup.faulty.before = [](const std::string& call) { scripted_agent::note("broker: " + call); };
    }

    /** Has the provider's own threads use the test's broker, as an activation would. */
    void saveContext() {
        Orv::NetworkAdapterComposite::_alertBroker = setup.faulty.handle();
        Orv::NetworkAdapterComposite::_alertContext = setup.real.newContext();
        Orv::NetworkAdapterComposite::_alertContextAvailable = true;
    }

    /** The calls of the broker so far, without those on the objects that it made. */
    [[nodiscard]] std::vector<std::string> brokerCalls() const {
        std::vector<std::string> found = setup.faulty.calls();
        std::erase_if(found, [](const std::string& call) { return call.find('.') != std::string::npos; });
        return found;
    }

    BrokerSetup setup;
    marlo::broker::CallScope scope; ///< for what the test makes itself
};

} // namespace provider_test

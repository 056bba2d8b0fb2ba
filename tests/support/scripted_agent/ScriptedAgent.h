/**
 * @file
 * The control side of the scripted agent library.
 *
 * A script says which nodes there are and which calls fail; every call of an instrumentation, utility or log
 * operation is recorded as one line, in order:
 *
 *     cursor 1: Instrumentation()
 *     cursor 1: selectNode(NODE_NETWORK_ADAPTER)
 *     cursor 1: bool = true
 *     cursor 1: getProperty(PROP_STATUS) = 1
 *     cursor 1: getProperty(PROP_MAC_ADDRESS) over "stale" = absent
 *     stripSpaces("OK") = "OK"
 *     buffer << "..."
 *     log 4000 Hearth.NetworkAdapterProvider NetworkAdapterConfiguration:57 getNicStatus | text
 *
 * The `over` part is there when the caller's variable was not empty.
 *
 * A script is set up while no provider call is running; recording and monitoring are safe from any thread.
 */
#pragma once

#include "instrumentation/Instrumentation.h"
#include "instrumentation/Utilities.h"

#include <functional>
#include <map>
#include <string>
#include <string_view>
#include <vector>

namespace scripted_agent {

/** A node has exactly the properties that are named here. */
struct Node {
    Orv::NodeLexicon::NodeType type = Orv::NodeLexicon::NODE_NETWORK_ADAPTER;
    std::string path{};
    std::string parent{}; ///< path of the parent
    std::string description{};
    std::map<Orv::NodeLexicon::Properties, std::string> texts{};
    std::map<Orv::NodeLexicon::Properties, unsigned int> numbers{};
    std::map<Orv::NodeLexicon::Properties, std::vector<std::string>> lists{};
};

/** A monitoring that was started and not stopped. */
struct Monitoring {
    Orv::NodeLexicon::NodeType type;
    Orv::Instrumentation::MonitoringCallback callback;
    const void* context;
    bool operator==(const Monitoring&) const = default;
};

/** What the callbacks of monitorings are called with. */
struct Event {
    unsigned int code = 0;
    Orv::DateTime::Fields time{};
    std::string path{};
};

struct Script {
    std::vector<Node> nodes; ///< selections have them in this order; of several with one path the first is found
    bool recording = true;
    std::string systemName = "host.example.org";

    /** Called with every call, as recorded but without cursor and result, before it does its work. May throw. */
    std::function<void(std::string_view call)> before;

    /* What stands in for a utility; by default each does what its declaration says. */
    std::function<bool(const char*, const char*)> textEqual;
    std::function<std::string(std::string)> stripSpaces;
    std::function<bool(const CMPIObjectPath*, const CMPIObjectPath*, bool)> isObjPathsEqual;
    std::function<void(CMPIData, CMPIInstance*, const char*, Orv::DataType, CMPIStatus*)> mapProperty;

    unsigned int languageId = 7;
    std::map<std::wstring, std::wstring> messages; ///< texts by resource id; all that there are
    std::wstring uid = L"4c4c4544-0042";
};

/** The script in force. */
ORV_API Script& script();

/** An empty script and an empty record. */
ORV_API void reset();

/** Empties the record only; cursors are numbered from 1 again. */
ORV_API void clearRecord();

/** Everything recorded so far. */
ORV_API std::vector<std::string> record();

/** The recorded lines that begin with `prefix`. */
ORV_API std::vector<std::string> recorded(std::string_view prefix);

/** Adds a line of the test's own, to show what happened between the agent's calls. */
ORV_API void note(std::string line);

/** Every startMonitoring that was not stopped, in order, even those that repeat each other. */
ORV_API std::vector<Monitoring> monitorings();

enum class PickUp {
    ignored, ///< the next event follows at once
    awaited, ///< the next event follows when a cursor has selected the path of this one
};

/**
 * Calls the callback of every monitoring of adapters, once for those that repeat each other, for each event in turn
 * on a thread of the agent's own. Returns when the last has been handed over (and picked up).
 */
ORV_API void fire(const std::vector<Event>& events, PickUp pickUp = PickUp::ignored);

/** Has the `nth` (from 1) call that begins with `call` run `failure`, which throws what it likes. */
ORV_API void failAt(std::string call, int nth, std::function<void()> failure);

} // namespace scripted_agent

/**
 * @file
 * The cursor over the agent's instrumentation tree.
 */
#pragma once

#include "instrumentation/DateTime.h"
#include "instrumentation/Export.h"
#include "instrumentation/NodeLexicon.h"

#include <string>
#include <vector>

namespace Orv {

/**
 * One cursor with one current selection of nodes.
 *
 * The tree holds a node per network interface (NODE_NETWORK_ADAPTER) and per port (NODE_NETWORK_PORT), with parents
 * above them. A cursor is local to one thread; different threads use cursors of their own at the same time. Every
 * operation may throw an exception derived from `std::exception` when the agent cannot do what was asked; the text of
 * a failed write names the node, the property, the value and the cause. Texts that come out of a cursor are valid
 * UTF-8 without control characters.
 */
class ORV_API Instrumentation {
  public:
    /**
     * Called by the agent, on a thread of its own, for every event on a node of the monitored type.
     *
     * Arguments: an event code (0 = the node's status changed), the time of the event, a path that selects the node
     * as it was at that event, and the context given to startMonitoring.
     */
    using MonitoringCallback = void (*)(unsigned int, DateTime, std::string, const void*);

    /** A cursor without a selection. Throws when the agent cannot be reached. */
    Instrumentation();
    ~Instrumentation();
    Instrumentation(const Instrumentation&) = delete;
    Instrumentation& operator=(const Instrumentation&) = delete;

    /** Selects all nodes of a type and stands on the first of them; on none when there is none. */
    void selectNode(NodeLexicon::NodeType type);

    /** Selects the one node at a path that getPathToParentNode gave; none when there is no such node. */
    void selectNode(const std::string& path);

    /** True while the cursor stands on a node of its selection. */
    explicit operator bool() const;

    /** Moves to the next node of the selection; past the last one the cursor is false. */
    Instrumentation& operator++();

    /** Reads a property of the node under the cursor. False, and `value` left alone, when the node lacks it. */
    bool getProperty(NodeLexicon::Properties property, std::string& value);
    bool getProperty(NodeLexicon::Properties property, unsigned int& value);
    bool getProperty(NodeLexicon::Properties property, std::vector<std::string>& value);

    /** Writes a property of the node under the cursor; the agent applies it to the system before it returns. */
    void setProperty(NodeLexicon::Properties property, std::string& value);
    void setProperty(NodeLexicon::Properties property, unsigned int& value);
    void setProperty(NodeLexicon::Properties property, std::vector<std::string> value);

    /** A short name of the node under the cursor, such as "BMC" for the management controller's node. */
    std::string getNodeDescription();

    /** The path of the parent of the node under the cursor, opaque; empty at the root. */
    std::string getPathToParentNode();

    /** Asks for `callback` to be called with `context` for every event on a node of `type`, until stopMonitoring. */
    void startMonitoring(NodeLexicon::NodeType type, MonitoringCallback callback, const void* context);

    /** Ends a monitoring that was started with the same arguments. */
    void stopMonitoring(NodeLexicon::NodeType type, MonitoringCallback callback, const void* context);

  private:
    struct State;
    State* _state;
};

} // namespace Orv

/**
 * @file
 * What happened to an adapter, and how a back end tells of it.
 */
#pragma once

#include "agent/tree/Tree.h"

#include <chrono>
#include <string>
#include <vector>

namespace Orv::Agent {

/** The event code that a monitoring callback gets. */
enum class EventCode : unsigned int {
    status = 0,  ///< the adapter's status is another, or a bond or team has moved to another member
    address = 1, ///< an IP address, the IPv4 mask or the link-layer address is another
    name = 2     ///< the adapter's name is another
};

/** PROP_STATUS of an event that is no state of the adapter: a bond or team works before and after it. */
enum class FailOver : unsigned int {
    switchOver = 32, ///< it moved to a backup member
    switchBack = 33  ///< it returned to its primary member
};

/** One difference between two consecutive states of the tree. */
struct Event {
    EventCode code = EventCode::status;
    std::chrono::system_clock::time_point time;
    Tree::NodePointer node;                   ///< as it was at the event, never null; its status is the event's own
    std::vector<Tree::NodePointer> ancestors; ///< what was above it
};

/** Takes events. */
class EventSink {
  public:
    EventSink() = default;
    virtual ~EventSink() = default;
    EventSink(const EventSink&) = delete;
    EventSink& operator=(const EventSink&) = delete;

    /** Any thread; the caller may hold locks of its back end, so nothing is asked of the back end in here. */
    virtual void post(Event event) = 0;

    /** A line for the log, about what could not be made an event. Likewise. */
    virtual void report(const std::string& text) = 0;
};

/** A back end's reporting of events, from its beginning to its end, which is the object's. */
class EventWatch {
  public:
    EventWatch() = default;
    virtual ~EventWatch() = default;
    EventWatch(const EventWatch&) = delete;
    EventWatch& operator=(const EventWatch&) = delete;

    /** Becomes readable when there is something to collect. */
    [[nodiscard]] virtual int descriptor() const = 0;

    /** Posts what has happened so far, in order, without waiting for more. Throws std::exception. */
    virtual void collect() = 0;
};

} // namespace Orv::Agent

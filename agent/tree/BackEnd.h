/**
 * @file
 * What stands behind the tree: the kernel of this host, or a file.
 */
#pragma once

#include "agent/events/EventRecords.h"
#include "agent/tree/Tree.h"

#include <memory>
#include <stdexcept>
#include <string>

namespace Orv::Agent {

/** A source of trees. Every operation may be called from any thread; failures are thrown as std::exception. */
class BackEnd {
  public:
    BackEnd() = default;
    virtual ~BackEnd() = default;
    BackEnd(const BackEnd&) = delete;
    BackEnd& operator=(const BackEnd&) = delete;

    /**
     * The tree as it is now: every change that was complete before the call is in it. Costs no full read when nothing
     * has changed since the last one.
     */
    virtual std::shared_ptr<const Tree> snapshot() = 0;

    /** Writes one property of the node at `path`, live and persistent, or throws and leaves everything as it was. */
    virtual void setProperty(const std::string& path, NodeLexicon::Properties property,
                             const PropertyValue& value) = 0;

    /**
     * Has the differences between consecutive states of the tree posted to `sink`, from the present state on, until
     * the watch is destroyed. One watch at a time; neither it nor the sink may outlive the back end.
     */
    virtual std::unique_ptr<EventWatch> watch(EventSink& /*sink*/) {
        throw std::runtime_error("this back end does not report events");
    }

    /** The events that were handed out as paths. */
    EventRecords& events() { return _events; }

  private:
    EventRecords _events;
};

} // namespace Orv::Agent

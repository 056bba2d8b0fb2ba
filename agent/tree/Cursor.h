/**
 * @file
 * A selection of nodes in one snapshot of a back end's tree.
 */
#pragma once

#include "agent/tree/BackEnd.h"

#include <memory>
#include <span>
#include <string>

namespace Orv::Agent {

/**
 * What an instrumentation cursor is made of. For one thread at a time.
 *
 * A selection by type takes a new snapshot. A selection by path is a look-up in the snapshot that the path came from
 * as long as a cursor of this thread holds it: a climb costs no snapshot of its own, and finds the parents of a node
 * that has vanished from the host meanwhile. The path of an event selects the node as it was at the event, and picks
 * the event up (see EventRecords). Any other path is looked up in a new snapshot.
 */
class Cursor {
  public:
    /** The back end must outlive the cursor. */
    explicit Cursor(BackEnd& backEnd) : _backEnd(backEnd) {}

    Cursor(const Cursor&) = delete;
    Cursor& operator=(const Cursor&) = delete;

    /** Both throw what BackEnd::snapshot throws; nothing is selected then. */
    void select(NodeLexicon::NodeType type);
    void select(const std::string& path);

    /** The node under the cursor, or null. It lives as long as the selection. */
    [[nodiscard]] const Node* node() const { return _selection.empty() ? nullptr : _selection.front().get(); }

    /** Moves on; past the last node there is none. */
    void advance();

    /** The path of the parent of the node under the cursor; empty at the root and without a node. */
    [[nodiscard]] std::string parentPath() const;

    /** False, with `value` left alone, without a node, without the property, or when it is of another type. */
    template <typename Value>
    bool get(NodeLexicon::Properties property, Value& value) const {
        const PropertyValue* found = find(property);
        const Value* typed = found == nullptr ? nullptr : std::get_if<Value>(found);
        if (typed != nullptr) {
            value = *typed;
        }
        return typed != nullptr;
    }

    /** Throws std::runtime_error without a node, else what BackEnd::setProperty throws. */
    void set(NodeLexicon::Properties property, const PropertyValue& value);

  private:
    struct View;

    [[nodiscard]] const PropertyValue* find(NodeLexicon::Properties property) const;
    [[nodiscard]] std::shared_ptr<const View> takeView() const;
    bool selectIn(std::shared_ptr<const View> view, const std::string& path);

    static std::weak_ptr<const View>& viewOfLastPath();

    BackEnd& _backEnd;
    std::shared_ptr<const View> _view;
    std::span<const Tree::NodePointer> _selection; ///< from the node under the cursor on; in the tree of _view
};

} // namespace Orv::Agent

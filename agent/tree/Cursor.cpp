#include "agent/tree/Cursor.h"

#include <stdexcept>
#include <utility>

namespace Orv::Agent {

/** A snapshot as cursors hold it: it ends with the last of them, though the back end may keep the tree itself. */
struct Cursor::View {
    std::shared_ptr<const Tree> tree;
    const BackEnd* source;
};

std::weak_ptr<const Cursor::View>& Cursor::viewOfLastPath() {
    thread_local std::weak_ptr<const View> view;
    return view;
}

std::shared_ptr<const Cursor::View> Cursor::takeView() const {
    return std::make_shared<const View>(View{_backEnd.snapshot(), &_backEnd});
}

void Cursor::select(NodeLexicon::NodeType type) {
    _selection = {};
    _view = takeView();
    _selection = _view->tree->nodesOfType(type);
}

bool Cursor::selectIn(std::shared_ptr<const View> view, const std::string& path) {
    if (view == nullptr || view->source != &_backEnd) {
        return false;
    }
    const Tree::NodePointer& found = view->tree->find(path);
    if (found == nullptr) {
        return false;
    }
    _selection = {&found, 1};
    _view = std::move(view);
    return true;
}

void Cursor::select(const std::string& path) {
    _selection = {};
    if (const auto moment = _backEnd.events().pickUp(path)) {
        selectIn(std::make_shared<const View>(View{moment->tree, &_backEnd}), moment->path);
        return;
    }
    const std::string live(EventRecords::livePath(path));
    if (!live.empty() && !selectIn(viewOfLastPath().lock(), live)) {
        selectIn(takeView(), live);
    }
}

void Cursor::advance() {
    if (!_selection.empty()) {
        _selection = _selection.subspan(1);
    }
}

std::string Cursor::parentPath() const {
    if (node() == nullptr) {
        return {};
    }
    viewOfLastPath() = _view;
    return node()->parentPath;
}

const PropertyValue* Cursor::find(NodeLexicon::Properties property) const {
    if (node() == nullptr) {
        return nullptr;
    }
    const auto found = node()->properties.find(property);
    return found == node()->properties.end() ? nullptr : &found->second;
}

void Cursor::set(NodeLexicon::Properties property, const PropertyValue& value) {
    if (node() == nullptr) {
        throw std::runtime_error("a property cannot be written: the cursor stands on no node");
    }
    _backEnd.setProperty(node()->path, property, value);
}

} // namespace Orv::Agent

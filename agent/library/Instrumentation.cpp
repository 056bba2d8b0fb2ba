#include "instrumentation/Instrumentation.h"

#include "agent/library/BackEndHolder.h"
#include "agent/tree/Cursor.h"

#include <memory>
#include <stdexcept>
#include <utility>

namespace Orv {

using Agent::reported;

struct Instrumentation::State {
    Agent::Cursor cursor;

    State() : cursor(Agent::processBackEnd()) {}
};

Instrumentation::Instrumentation()
    : _state(reported("Instrumentation", [] { return std::make_unique<State>(); }).release()) {}

Instrumentation::~Instrumentation() {
    const std::unique_ptr<State> state(_state);
}

void Instrumentation::selectNode(NodeLexicon::NodeType type) {
    reported("selectNode", [&] { _state->cursor.select(type); });
}

void Instrumentation::selectNode(const std::string& path) {
    reported("selectNode", [&] { _state->cursor.select(path); });
}

Instrumentation::operator bool() const {
    return _state->cursor.node() != nullptr;
}

Instrumentation& Instrumentation::operator++() {
    _state->cursor.advance();
    return *this;
}

bool Instrumentation::getProperty(NodeLexicon::Properties property, std::string& value) {
    return _state->cursor.get(property, value);
}

bool Instrumentation::getProperty(NodeLexicon::Properties property, unsigned int& value) {
    return _state->cursor.get(property, value);
}

bool Instrumentation::getProperty(NodeLexicon::Properties property, std::vector<std::string>& value) {
    return _state->cursor.get(property, value);
}

void Instrumentation::setProperty(NodeLexicon::Properties property, std::string& value) {
    reported("setProperty", [&] { _state->cursor.set(property, value); });
}

void Instrumentation::setProperty(NodeLexicon::Properties property, unsigned int& value) {
    reported("setProperty", [&] { _state->cursor.set(property, value); });
}

void Instrumentation::setProperty(NodeLexicon::Properties property, std::vector<std::string> value) {
    reported("setProperty", [&] { _state->cursor.set(property, std::move(value)); });
}

std::string Instrumentation::getNodeDescription() {
    const Agent::Node* node = _state->cursor.node();
    return node == nullptr ? std::string() : node->description;
}

std::string Instrumentation::getPathToParentNode() {
    return _state->cursor.parentPath();
}

void Instrumentation::startMonitoring(NodeLexicon::NodeType /*type*/, MonitoringCallback /*callback*/,
                                      const void* /*context*/) {
    reported("startMonitoring", [] { throw std::runtime_error("this agent does not monitor nodes yet"); });
}

void Instrumentation::stopMonitoring(NodeLexicon::NodeType /*type*/, MonitoringCallback /*callback*/,
                                     const void* /*context*/) {
    reported("stopMonitoring", [] { throw std::runtime_error("this agent does not monitor nodes yet"); });
}

} // namespace Orv

#include "instrumentation/Instrumentation.h"

#include "agent/library/BackEndHolder.h"
#include "agent/library/Monitoring.h"
#include "agent/tree/Cursor.h"

#include <cstdint>
#include <memory>
#include <stdexcept>
#include <utility>

namespace Orv {

using Agent::reported;

namespace {

Agent::Monitor::Key keyOf(NodeLexicon::NodeType type, Instrumentation::MonitoringCallback callback,
                          const void* context) {
    return {type, reinterpret_cast<std::uintptr_t>(callback), context};
}

} // namespace

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

void Instrumentation::startMonitoring(NodeLexicon::NodeType type, MonitoringCallback callback, const void* context) {
    reported("startMonitoring", [&] {
        if (callback == nullptr) {
            throw std::invalid_argument("nothing can be monitored without a callback");
        }
        Agent::processMonitor().start(keyOf(type, callback, context), [=](const Agent::Handover::Delivery& delivery) {
            callback(static_cast<unsigned int>(delivery.code), DateTime(Agent::localTime(delivery.time)),
                     delivery.path, context);
        });
    });
}

void Instrumentation::stopMonitoring(NodeLexicon::NodeType type, MonitoringCallback callback, const void* context) {
    reported("stopMonitoring", [&] { Agent::processMonitor().stop(keyOf(type, callback, context)); });
}

} // namespace Orv

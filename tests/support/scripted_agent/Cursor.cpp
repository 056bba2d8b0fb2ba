#include "instrumentation/DateTime.h"
#include "tests/support/scripted_agent/Recorder.h"
#include "tests/support/scripted_agent/ScriptedAgent.h"

#include <algorithm>
#include <mutex>
#include <optional>
#include <stdexcept>

using scripted_agent::add;
using scripted_agent::announced;
using scripted_agent::Node;
using scripted_agent::quoted;
using scripted_agent::script;

namespace {

std::string nameOf(Orv::NodeLexicon::NodeType type) {
    return type == Orv::NodeLexicon::NODE_NETWORK_ADAPTER ? "NODE_NETWORK_ADAPTER"
           : type == Orv::NodeLexicon::NODE_NETWORK_PORT  ? "NODE_NETWORK_PORT"
                                                          : std::to_string(type);
}

std::string nameOf(Orv::NodeLexicon::Properties property) {
    using namespace Orv::NodeLexicon;
    static const std::map<Properties, std::string> names{
        {PROP_DHCP_ENABLED, "PROP_DHCP_ENABLED"},
        {PROP_IPV4_ADDRESS, "PROP_IPV4_ADDRESS"},
        {PROP_IPV4_SUBNET_MASK, "PROP_IPV4_SUBNET_MASK"},
        {PROP_IPV6_ADDRESS, "PROP_IPV6_ADDRESS"},
        {PROP_DNS_SERVERS, "PROP_DNS_SERVERS"},
        {PROP_IP_SUPPORT, "PROP_IP_SUPPORT"},
        {PROP_DNS_HOSTNAME, "PROP_DNS_HOSTNAME"},
        {PROP_DNS_DOMAIN, "PROP_DNS_DOMAIN"},
        {PROP_DNS_SUFFIXES, "PROP_DNS_SUFFIXES"},
        {PROP_DEFAULT_GATEWAY, "PROP_DEFAULT_GATEWAY"},
        {PROP_NODE_STRING, "PROP_NODE_STRING"},
        {PROP_MAC_ADDRESS, "PROP_MAC_ADDRESS"},
        {PROP_STATUS, "PROP_STATUS"},
    };
    const auto found = names.find(property);
    return found != names.end() ? found->second : std::to_string(property);
}

std::string shown(const std::string& value) {
    return quoted(value.c_str());
}

std::string shown(unsigned int value) {
    return std::to_string(value);
}

std::string shown(const std::vector<std::string>& values) {
    std::string text = "[";
    for (const std::string& value : values) {
        text += (text.size() > 1 ? ", " : "") + shown(value);
    }
    return text + "]";
}

std::map<Orv::NodeLexicon::Properties, std::string>& propertiesOf(Node& node, const std::string&) {
    return node.texts;
}

std::map<Orv::NodeLexicon::Properties, unsigned int>& propertiesOf(Node& node, unsigned int) {
    return node.numbers;
}

std::map<Orv::NodeLexicon::Properties, std::vector<std::string>>& propertiesOf(Node& node,
                                                                               const std::vector<std::string>&) {
    return node.lists;
}

} // namespace

namespace Orv {

struct Instrumentation::State {
    int number;
    std::vector<Node*> selection;
    std::size_t position = 0;

    /** A call that has no result. */
    template <typename Describe>
    void called(const Describe& describe) const {
        told(announced(describe));
    }

    void told(const std::string& call) const {
        if (scripted_agent::watched()) {
            add("cursor " + std::to_string(number) + ": " + call);
        }
    }

    template <typename Describe>
    void told(const std::string& call, const Describe& result) const {
        if (scripted_agent::watched()) {
            told(call + " = " + result());
        }
    }

    [[nodiscard]] bool stands() const { return position < selection.size(); }

    Node& node() const {
        if (!stands()) {
            throw std::logic_error("the cursor stands on no node");
        }
        return *selection[position];
    }

    /** Guards the properties of all nodes: provider calls may write them from several threads. */
    static std::mutex& properties() {
        static std::mutex mutex;
        return mutex;
    }

    template <typename Value>
    std::optional<Value> find(NodeLexicon::Properties property, const Value& value) const {
        const std::lock_guard lock(properties());
        const auto& all = propertiesOf(node(), value);
        const auto found = all.find(property);
        return found != all.end() ? std::optional<Value>(found->second) : std::nullopt;
    }

    template <typename Value>
    bool read(NodeLexicon::Properties property, Value& value) const {
        const std::string call = announced([&] {
            return "getProperty(" + nameOf(property) + ")" + (value == Value{} ? "" : " over " + shown(value));
        });
        const std::optional<Value> found = find(property, value);
        told(call, [&] { return found ? shown(*found) : "absent"; });
        if (found) {
            value = *found;
        }
        return found.has_value();
    }

    template <typename Value>
    void write(NodeLexicon::Properties property, const Value& value) const {
        called([&] { return "setProperty(" + nameOf(property) + ", " + shown(value) + ")"; });
        const std::lock_guard lock(properties());
        propertiesOf(node(), value)[property] = value;
    }
};

Instrumentation::Instrumentation() : _state(nullptr) {
    const std::string call = announced([] { return std::string("Instrumentation()"); });
    _state = new State{scripted_agent::nextCursor(), {}};
    _state->told(call);
}

Instrumentation::~Instrumentation() {
    _state->told("~Instrumentation()");
    delete _state;
}

void Instrumentation::selectNode(NodeLexicon::NodeType type) {
    _state->called([&] { return "selectNode(" + nameOf(type) + ")"; });
    _state->selection.clear();
    _state->position = 0;
    for (Node& node : script().nodes) {
        if (node.type == type) {
            _state->selection.push_back(&node);
        }
    }
}

void Instrumentation::selectNode(const std::string& path) {
    _state->called([&] { return "selectNode(" + shown(path) + ")"; });
    _state->selection.clear();
    _state->position = 0;
    const auto found =
        std::find_if(script().nodes.begin(), script().nodes.end(), [&](Node& node) { return node.path == path; });
    if (found != script().nodes.end()) {
        _state->selection.push_back(&*found);
    }
    scripted_agent::pickUp(path);
}

Instrumentation::operator bool() const {
    const std::string call = announced([] { return std::string("bool"); });
    _state->told(call, [&] { return _state->stands() ? "true" : "false"; });
    return _state->stands();
}

Instrumentation& Instrumentation::operator++() {
    _state->called([&] { return std::string("++"); });
    ++_state->position;
    return *this;
}

bool Instrumentation::getProperty(NodeLexicon::Properties property, std::string& value) {
    return _state->read(property, value);
}

bool Instrumentation::getProperty(NodeLexicon::Properties property, unsigned int& value) {
    return _state->read(property, value);
}

bool Instrumentation::getProperty(NodeLexicon::Properties property, std::vector<std::string>& value) {
    return _state->read(property, value);
}

void Instrumentation::setProperty(NodeLexicon::Properties property, std::string& value) {
    _state->write(property, value);
}

void Instrumentation::setProperty(NodeLexicon::Properties property, unsigned int& value) {
    _state->write(property, value);
}

void Instrumentation::setProperty(NodeLexicon::Properties property, std::vector<std::string> value) {
    _state->write(property, value);
}

std::string Instrumentation::getNodeDescription() {
    const std::string call = announced([] { return std::string("getNodeDescription()"); });
    std::string description = _state->node().description;
    _state->told(call, [&] { return shown(description); });
    return description;
}

std::string Instrumentation::getPathToParentNode() {
    const std::string call = announced([] { return std::string("getPathToParentNode()"); });
    std::string parent = _state->node().parent;
    _state->told(call, [&] { return shown(parent); });
    return parent;
}

void Instrumentation::startMonitoring(NodeLexicon::NodeType type, MonitoringCallback callback, const void* context) {
    _state->called(
        [&] { return "startMonitoring(" + nameOf(type) + (context == nullptr ? ", null)" : ", context)"); });
    scripted_agent::addMonitoring({type, callback, context});
}

void Instrumentation::stopMonitoring(NodeLexicon::NodeType type, MonitoringCallback callback, const void* context) {
    _state->called(
        [&] { return "stopMonitoring(" + nameOf(type) + (context == nullptr ? ", null)" : ", context)"); });
    scripted_agent::removeMonitoring({type, callback, context});
}

struct DateTime::State {
    Fields fields;
};

DateTime::DateTime() : DateTime(Fields{}) {}

DateTime::DateTime(const Fields& fields) : _state(new State{fields}) {}

DateTime::DateTime(const DateTime& other) : DateTime(other._state->fields) {}

DateTime& DateTime::operator=(const DateTime& other) {
    *_state = *other._state;
    return *this;
}

DateTime::~DateTime() {
    delete _state;
}

unsigned short DateTime::getYear() const {
    return _state->fields.year;
}

unsigned short DateTime::getMonth() const {
    return _state->fields.month;
}

unsigned short DateTime::getDay() const {
    return _state->fields.day;
}

unsigned short DateTime::getHour() const {
    return _state->fields.hour;
}

unsigned short DateTime::getMinute() const {
    return _state->fields.minute;
}

unsigned short DateTime::getSecond() const {
    return _state->fields.second;
}

unsigned short DateTime::getMillisecond() const {
    return _state->fields.millisecond;
}

short DateTime::getOffset() const {
    return _state->fields.offset;
}

} // namespace Orv

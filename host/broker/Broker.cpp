#include "host/broker/BrokerState.h"
#include "host/broker/Convert.h"
#include "host/filter/Filter.h"

#include <iostream>
#include <sstream>
#include <utility>

namespace marlo::broker {

BrokerState::BrokerState(const SchemaView& schema, UpCalls* upCalls, LogSink log)
    : ObjectBase(Kind::broker, nullptr),
      handle{static_cast<const ObjectBase*>(this), &operationTable, &encapsulationTable, &threadTable, &memoryTable},
      _schema(schema),
      _upCalls(upCalls),
      _log(std::move(log)) {}

void BrokerState::log(const LogLine& line) const {
    if (_log) {
        _log(line);
    }
}

ContextObject& BrokerState::prepare(const ContextObject& context) {
    auto arena = std::make_unique<Arena>(Arena::Use::clone);
    ContextObject* prepared = context.copyTo(*arena);
    prepared->preparedBy = this;
    const std::lock_guard lock(_mutex);
    _prepared[prepared].arena = std::move(arena);
    return *prepared;
}

void BrokerState::attach(const ContextObject& context) {
    openScope(&context);
    const std::lock_guard lock(_mutex);
    if (const auto found = _prepared.find(&context); found != _prepared.end()) {
        ++found->second.attached;
    }
}

bool BrokerState::detach(const ContextObject& context) {
    if (!closeScope(&context, false)) {
        return false;
    }
    const std::lock_guard lock(_mutex);
    const auto found = _prepared.find(&context);
    if (found != _prepared.end() && --found->second.attached == 0) {
        _prepared.erase(found);
    }
    return true;
}

void BrokerState::releasePrepared(const ContextObject& context) {
    const std::lock_guard lock(_mutex);
    const auto found = _prepared.find(&context);
    if (found != _prepared.end() && found->second.attached == 0) {
        _prepared.erase(found);
    }
}

void logToStandardError(const LogLine& line) {
    if (!line.trace) {
        std::ostringstream text; // one write per line: threads log concurrently
        text << line.component << ": " << line.text << '\n';
        std::cerr << text.str();
    }
}

Broker::Broker(const SchemaView& schema, UpCalls* upCalls, LogSink log)
    : _state(std::make_unique<BrokerState>(schema, upCalls, std::move(log))) {}

Broker::~Broker() = default;

const CMPIBroker* Broker::handle() const {
    return &_state->handle;
}

CMPIContext* Broker::newContext() const {
    return &ContextObject::make(currentArena())->handle;
}

CMPIObjectPath* Broker::newObjectPath(const ObjectPath& path) const {
    return &toObject(currentArena(), *_state, path)->handle;
}

CMPIInstance* Broker::newInstance(const Instance& instance) const {
    return &toObject(currentArena(), *_state, instance)->handle;
}

CMPIArgs* Broker::newArgs(const std::vector<NamedValue>& arguments) const {
    Arena& arena = currentArena();
    auto* object = ArgsObject::make(arena);
    for (const NamedValue& argument : arguments) {
        object->values.set(argument.name, toData(arena, *_state, argument.value));
    }
    return &object->handle;
}

CMPISelectExp* Broker::newSelectExp(const filter::Filter& filter) const {
    return &SelectExpObject::make(currentArena(), *_state, std::make_shared<const filter::Filter>(filter))->handle;
}

void Broker::addEntry(CMPIContext* context, const std::string& name, const Value& value) const {
    auto* object = objectOf<ContextObject>(context);
    object->entries.set(name, toData(object->arena(), *_state, value));
}

ObjectPath Broker::toModel(const CMPIObjectPath& path) {
    return broker::toModel(*objectOf<ObjectPathObject>(&path));
}

Instance Broker::toModel(const CMPIInstance& instance) {
    return broker::toModel(*objectOf<InstanceObject>(&instance));
}

std::vector<NamedValue> Broker::toModel(const CMPIArgs& arguments) {
    return broker::toModel(objectOf<ArgsObject>(&arguments)->values);
}

Value Broker::toModel(const CMPIData& data) {
    return broker::toModel(data);
}

std::string messageOf(const CMPIStatus& status) {
    const auto* message = objectOf<StringObject>(status.msg);
    return std::string(message == nullptr ? std::string_view() : message->text());
}

} // namespace marlo::broker

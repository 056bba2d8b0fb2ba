/**
 * @file
 * What the slots of the broker's tables work on.
 */
#pragma once

#include "host/broker/Broker.h"
#include "host/broker/Objects.h"

#include <map>
#include <memory>
#include <mutex>

namespace marlo::broker {

extern const CMPIBrokerFT operationTable;
extern const CMPIBrokerEncFT encapsulationTable;
extern const CMPIBrokerExtFT threadTable;
extern const CMPIBrokerMemFT memoryTable;

class BrokerState final : public ObjectBase {
  public:
    using Handle = CMPIBroker;
    static constexpr Kind kindValue = Kind::broker;

    BrokerState(const SchemaView& schema, UpCalls* upCalls, LogSink log);

    CMPIBroker handle;

    [[nodiscard]] const SchemaView& schema() const { return _schema; }

    /** Null where there are none. */
    [[nodiscard]] UpCalls* upCalls() const { return _upCalls; }

    void log(const LogLine& line) const;

    /** A copy of a context for another thread. The broker owns it until it is detached or released. */
    ContextObject& prepare(const ContextObject& context);
    void attach(const ContextObject& context);
    /** False when this thread has not attached the context. */
    bool detach(const ContextObject& context);
    void releasePrepared(const ContextObject& context);

  private:
    struct Prepared {
        std::unique_ptr<Arena> arena;
        int attached = 0; ///< threads that have attached it
    };

    const SchemaView& _schema;
    UpCalls* _upCalls;
    LogSink _log;
    std::mutex _mutex; ///< guards _prepared
    std::map<const ContextObject*, Prepared> _prepared;
};

} // namespace marlo::broker

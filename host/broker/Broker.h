/**
 * @file
 * The object manager as a provider sees it through CMPI.
 */
#pragma once

#include "host/broker/Result.h"
#include "host/broker/SchemaView.h"
#include "host/broker/Scope.h"
#include "host/model/AssociationFilter.h"
#include "host/model/Instance.h"

#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include <cmpift.h>

namespace marlo::filter {
class Filter;
}

namespace marlo::broker {

/** How an operation that a provider asked for ended. */
struct Outcome {
    CMPIrc code = CMPI_RC_OK;
    std::string message;
};

/**
 * What a provider may ask of others through the broker. Called on the provider's thread; results go to the sinks
 * before the function returns. What is not overridden is answered CMPI_RC_ERR_NOT_SUPPORTED. Properties are got and
 * set through getInstance and modifyInstance.
 */
class UpCalls {
  public:
    using PropertyNames = std::optional<std::vector<std::string>>; ///< none means all
    using InstanceSink = std::function<void(Instance&&)>;
    using PathSink = std::function<void(ObjectPath&&)>;

    virtual ~UpCalls() = default;
    UpCalls(const UpCalls&) = delete;
    UpCalls& operator=(const UpCalls&) = delete;

    virtual Outcome enumerateInstances(const ObjectPath& classPath, const PropertyNames& properties,
                                       const InstanceSink& sink) = 0;
    virtual Outcome enumerateInstanceNames(const ObjectPath& classPath, const PathSink& sink) = 0;
    virtual Outcome getInstance(const ObjectPath& path, const PropertyNames& properties,
                                const InstanceSink& sink) = 0;
    virtual Outcome deliverIndication(const std::string& nameSpace, Instance&& indication) = 0;

    virtual Outcome createInstance(const Instance& instance, ObjectPath& created);
    /** Without a list, what `instance` has is changed. */
    virtual Outcome modifyInstance(const Instance& instance, const PropertyNames& properties);
    virtual Outcome deleteInstance(const ObjectPath& path);
    virtual Outcome execQuery(const std::string& nameSpace, const std::string& query, const std::string& language,
                              const InstanceSink& sink);
    virtual Outcome invokeMethod(const ObjectPath& path, const std::string& method,
                                 const std::vector<NamedValue>& arguments, Value& returned,
                                 std::vector<NamedValue>& out);
    virtual Outcome associators(const ObjectPath& path, const AssociationFilter& filter,
                                const PropertyNames& properties, const InstanceSink& sink);
    virtual Outcome associatorNames(const ObjectPath& path, const AssociationFilter& filter, const PathSink& sink);
    virtual Outcome references(const ObjectPath& path, const AssociationFilter& filter,
                               const PropertyNames& properties, const InstanceSink& sink);
    virtual Outcome referenceNames(const ObjectPath& path, const AssociationFilter& filter, const PathSink& sink);

  protected:
    UpCalls() = default;
};

/** A line that a provider gave to the broker's logMessage or trace. */
struct LogLine {
    bool trace;
    int level;             ///< CMPISeverity, or CMPILevel of a trace
    std::string component; ///< or the message id
    std::string text;
};

/** Receives log lines on the provider's thread. Must not throw. */
using LogSink = std::function<void(const LogLine&)>;

/** Writes messages to stderr; traces nothing. */
void logToStandardError(const LogLine& line);

class BrokerState;

/**
 * A complete broker. The tables that its handle points at may be copied and changed slot by slot: slots find the
 * broker and the objects through `hdl` alone, so that a provider can be given a handle of its own making that keeps
 * this one's `hdl`. Lives longer than every object and thread that uses it.
 */
class Broker {
  public:
    /** Schema and up-calls live as long as the broker; without up-calls they are answered not supported. */
    explicit Broker(const SchemaView& schema, UpCalls* upCalls = nullptr, LogSink log = logToStandardError);
    ~Broker();
    Broker(const Broker&) = delete;
    Broker& operator=(const Broker&) = delete;

    [[nodiscard]] const CMPIBroker* handle() const;

    /** New objects in the innermost scope of this thread. */
    [[nodiscard]] CMPIContext* newContext() const;
    [[nodiscard]] CMPIObjectPath* newObjectPath(const ObjectPath& path) const;
    [[nodiscard]] CMPIInstance* newInstance(const Instance& instance) const;
    [[nodiscard]] CMPIArgs* newArgs(const std::vector<NamedValue>& arguments) const;
    [[nodiscard]] CMPISelectExp* newSelectExp(const filter::Filter& filter) const;
    /** Sets an entry of a context. */
    void addEntry(CMPIContext* context, const std::string& name, const Value& value) const;

    /** What a good handle holds. */
    [[nodiscard]] static ObjectPath toModel(const CMPIObjectPath& path);
    [[nodiscard]] static Instance toModel(const CMPIInstance& instance);
    [[nodiscard]] static std::vector<NamedValue> toModel(const CMPIArgs& arguments);
    [[nodiscard]] static Value toModel(const CMPIData& data);

  private:
    std::unique_ptr<BrokerState> _state;
};

/** The text of a status; empty where it has none. */
std::string messageOf(const CMPIStatus& status);

} // namespace marlo::broker

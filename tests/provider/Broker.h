/**
 * @file
 * The object manager's own broker round a provider: its classes' keys, the platform's instances, and a call's frame.
 */
#pragma once

#include "host/broker/Broker.h"
#include "tests/support/FaultyBroker.h"

#include <array>
#include <functional>
#include <map>
#include <mutex>
#include <string>
#include <vector>

namespace provider_test {

inline const std::string CONFIGURATION = "MARLO_NetworkAdapterConfiguration";
inline const std::string PHYSICAL = "MARLO_PhysicalNetworkAdapter";
inline const std::string LOGICAL = "MARLO_LogicalNetworkAdapter";
inline const std::string NAMESPACE = "root/tavis";

/** The keys of the three classes, and nothing else of a schema. */
class Keys final : public marlo::broker::SchemaView {
  public:
    using Name = std::string_view;

    [[nodiscard]] const std::vector<std::string>* keys(Name nameSpace, Name className) const override;

    [[nodiscard]] bool isA(Name, Name className, Name ancestor) const override { return className == ancestor; }

    [[nodiscard]] const marlo::Value* classQualifier(Name, Name, Name) const override { return nullptr; }

    [[nodiscard]] const marlo::Value* propertyQualifier(Name, Name, Name, Name) const override { return nullptr; }

    [[nodiscard]] const marlo::Value* methodQualifier(Name, Name, Name, Name) const override { return nullptr; }

    [[nodiscard]] const marlo::Value* parameterQualifier(Name, Name, Name, Name, Name) const override {
        return nullptr;
    }

  private:
    std::map<std::string, std::vector<std::string>, std::less<>> _keys{
        {CONFIGURATION, {"SettingID"}},
        {PHYSICAL, {"CreationClassName", "Tag"}},
        {LOGICAL, {"SystemCreationClassName", "SystemName", "CreationClassName", "DeviceID"}},
    };
};

/** The platform's classes, as other providers would serve them. */
class Platform final : public marlo::broker::UpCalls {
  public:
    using Outcome = marlo::broker::Outcome;

    std::vector<marlo::Instance> cards;
    std::vector<marlo::Instance> ports;
    Outcome outcome;         ///< how enumerations end
    Outcome deliveryOutcome; ///< how deliveries end
    /** Paths asked for, and whether a property list was given; kept in order while calls come one at a time. */
    std::vector<std::pair<std::string, bool>> enumerations;

    Outcome enumerateInstances(const marlo::ObjectPath& classPath, const PropertyNames& properties,
                               const InstanceSink& sink) override;

    Outcome enumerateInstanceNames(const marlo::ObjectPath&, const PathSink&) override {
        return {CMPI_RC_ERR_NOT_SUPPORTED, {}};
    }

    Outcome getInstance(const marlo::ObjectPath&, const PropertyNames&, const InstanceSink&) override {
        return {CMPI_RC_ERR_NOT_SUPPORTED, {}};
    }

    Outcome deliverIndication(const std::string& nameSpace, marlo::Instance&& indication) override;

    /** Namespace and instance of every delivery so far, failed ones too. */
    using Delivered = std::vector<std::pair<std::string, marlo::Instance>>;
    [[nodiscard]] Delivered delivered() const;

  private:
    mutable std::mutex _mutex; ///< guards enumerations and what is delivered while calls come from several threads
    Delivered _delivered;
};

/** An instance of TAVIS_NetworkCard with every property that is copied from it. */
marlo::Instance card(const std::string& name);

/** An instance of TAVIS_NetworkPort with every property that is copied from it. */
marlo::Instance port(const std::string& deviceID, const std::string& systemCreationClassName = "CIM_ComputerSystem");

/** Sets or replaces a property. */
void set(marlo::Instance& instance, const std::string& name, marlo::Value value);

/** A property's value; a NULL of type CMPI_null when there is none. */
marlo::Value get(const marlo::Instance& instance, const std::string& name);

/** The names of an instance's properties, in order. */
std::vector<std::string> names(const marlo::Instance& instance);

/** A string array. */
marlo::Value strings(const std::vector<std::string>& elements);

/** What a provider answered to one call. */
struct Answer {
    CMPIrc code = CMPI_RC_OK;
    bool hasMessage = false;
    std::string message;
    std::vector<marlo::Instance> instances;
    std::vector<marlo::ObjectPath> paths;
    std::vector<marlo::Value> values; ///< a method's own results
    bool done = false;                ///< the provider ended its answer with returnDone
};

/** One broker, whose slots may be made to fail. */
class BrokerSetup {
  public:
    Keys schema;
    Platform platform;
    std::vector<marlo::broker::LogLine> brokerLog;
    marlo::broker::Broker real{schema, &platform,
                               [this](const marlo::broker::LogLine& line) { brokerLog.push_back(line); }};
    marlo::test::FaultyBroker faulty{real};

    using Call = std::function<CMPIStatus(const CMPIContext*, const CMPIResult*, const CMPIObjectPath*)>;

    /** Makes a call as an object manager does, in a scope of its own. `viaFaulty` has its handles pass the faults. */
    Answer call(const marlo::ObjectPath& reference, const Call& function, bool viaFaulty = true);
};

/** A property list as CMPI has it: null-terminated; null for no list. */
class PropertyList {
  public:
    PropertyList() = default;

    explicit PropertyList(std::vector<const char*> list) : _list(std::move(list)), _given(true) {
        _list.push_back(nullptr);
    }

    const char** get() { return _given ? _list.data() : nullptr; }

  private:
    std::vector<const char*> _list;
    bool _given = false;
};

/** The path of a class in the providers' namespace. */
inline marlo::ObjectPath classPath(const std::string& className) {
    marlo::ObjectPath path;
    path.nameSpace = NAMESPACE;
    path.className = className;
    return path;
}

/** The path of an instance by keys that are strings. */
marlo::ObjectPath instancePath(const std::string& className,
                               const std::vector<std::pair<std::string, std::string>>& keys);

} // namespace provider_test

#include "host/subscriptions/Presence.h"

#include "host/cimom/Interop.h"

#include <cstdlib>

namespace marlo::subscriptions {

namespace {

constexpr const char* serviceClass = "CIM_IndicationService";
constexpr const char* capabilitiesClass = "CIM_IndicationServiceCapabilities";
constexpr const char* statisticsClass = "MARLO_DeliveryStatistics";

NamedValue text(const char* name, std::string value) {
    return {name, Value::string(std::move(value))};
}

std::vector<NamedValue> serviceKeys() {
    return {text("SystemCreationClassName", "CIM_ComputerSystem"), text("SystemName", systemName()),
            text("CreationClassName", serviceClass), text("Name", "marlo:indications")};
}

ObjectPath servicePath() {
    return {"", interop, serviceClass, serviceKeys()};
}

ObjectPath capabilitiesPath() {
    return {"", interop, capabilitiesClass, {text("InstanceID", "marlo:indications")}};
}

ObjectPath statisticsPath(const std::string& key) {
    return {"", interop, statisticsClass, {text("InstanceID", "marlo:destination:" + key)}};
}

/** Tries go on for as long as the subscription's policy lets them: there is no higher number to say it with. */
Instance makeService() {
    constexpr std::uint64_t mostAttempts = 65535;
    Instance made{{}, serviceKeys()};
    set(made, "ElementName", Value::string("Indications"));
    set(made, "Description", Value::string("Sends indications to their subscribers, kept on disk until they answer"));
    set(made, "EnabledState", number16(2));
    set(made, "RequestedState", number16(12));
    set(made, "Started", Value::boolean(true));
    set(made, "FilterCreationEnabled", Value::boolean(true));
    set(made, "DeliveryRetryAttempts", number16(mostAttempts));
    set(made, "DeliveryRetryInterval", Value::uint(CMPI_uint32, 1));
    set(made, "SubscriptionRemovalAction", number16(4)); // none but the subscription's own policy
    return made;
}

Instance makeCapabilities() {
    Instance made{{}, capabilitiesPath().keys};
    set(made, "ElementName", Value::string("Indications"));
    for (const char* name :
         {"FilterCreationEnabledIsSettable", "DeliveryRetryAttemptsIsSettable", "DeliveryRetryIntervalIsSettable",
          "SubscriptionRemovalActionIsSettable", "SubscriptionRemovalTimeIntervalIsSettable"}) {
        set(made, name, Value::boolean(false));
    }
    set(made, "MaxListenerDestinations", Value::uint(CMPI_uint32, mostDestinations));
    set(made, "MaxActiveSubscriptions", Value::uint(CMPI_uint32, mostSubscriptions));
    set(made, "SubscriptionsPersisted", Value::boolean(true));
    return made;
}

/** CIM_ServiceAffectsElement. */
std::vector<Instance> makeEffects(const Registry& registry) {
    constexpr std::uint64_t manages = 5;
    std::vector<Instance> effects;
    for (const Kind kind : {Kind::filter, Kind::destination}) {
        for (const ObjectPointer& each : registry.all(kind)) {
            effects.push_back({{},
                               {{"AffectedElement", reference(each->instance.path)},
                                {"AffectingElement", reference(servicePath())},
                                {"ElementEffects", {CMPI_uint16A, Value::Array{number16(manages)}}}}});
        }
    }
    return effects;
}

void setTime(Instance& instance, const char* name, const std::optional<Time>& time) {
    if (time) {
        set(instance, name, timeValue(*time));
    }
}

Instance makeStatistics(const delivery::Counters& counters, const Object& destination, Time start) {
    Instance made{{}, statisticsPath(counters.destination).keys};
    set(made, "ElementName", Value::string(textOf(destination.instance, "Name")));
    set(made, "Destination", Value::string(counters.url));
    set(made, "SequenceContext", Value::string(counters.sequenceContext));
    set(made, "Queued", number64(counters.queued));
    set(made, "QueuedBytes", number64(counters.queuedBytes));
    set(made, "Sent", number64(counters.sent));
    set(made, "Retried", number64(counters.retried));
    set(made, "Dropped", number64(counters.dropped));
    if (!counters.lastError.empty()) {
        set(made, "LastError", Value::string(counters.lastError));
    }
    setTime(made, "TimeOfLastError", counters.lastErrorTime);
    setTime(made, "FailingSince", counters.failingSince);
    setTime(made, "OldestQueued", counters.oldestQueued);
    set(made, "MedianLatency", number64(static_cast<std::uint64_t>(counters.latencyMedian.count())));
    set(made, "HighLatency", number64(static_cast<std::uint64_t>(counters.latency99.count())));
    setTime(made, "StartStatisticTime", start);
    setTime(made, "StatisticTime", std::chrono::system_clock::now());
    return made;
}

/** MARLO_DeliveryStatistics, or what associates them with destinations. */
std::vector<Instance> makeAllStatistics(const Registry& registry, const std::vector<delivery::Counters>& counters,
                                        Time start, bool associations) {
    std::vector<Instance> all;
    for (const delivery::Counters& each : counters) {
        const ObjectPointer destination = registry.find(std::strtoll(each.destination.c_str(), nullptr, 10));
        if (destination == nullptr) { // removed meanwhile
            continue;
        }
        all.push_back(associations ? Instance{{},
                                              {{"ManagedElement", reference(destination->instance.path)},
                                               {"Stats", reference(statisticsPath(each.destination))}}}
                                   : makeStatistics(each, *destination, start));
    }
    return all;
}

} // namespace

std::vector<std::string> presenceClasses() {
    return {serviceClass,    capabilitiesClass,           "CIM_ElementCapabilities", "CIM_ServiceAffectsElement",
            statisticsClass, "CIM_ElementStatisticalData"};
}

std::vector<Instance> presence(const std::string& className, const Registry& registry,
                               const std::vector<delivery::Counters>& counters, Time start) {
    if (className == serviceClass) {
        return {makeService()};
    }
    if (className == capabilitiesClass) {
        return {makeCapabilities()};
    }
    if (className == "CIM_ElementCapabilities") {
        return {
            {{}, {{"ManagedElement", reference(servicePath())}, {"Capabilities", reference(capabilitiesPath())}}}};
    }
    if (className == "CIM_ServiceAffectsElement") {
        return makeEffects(registry);
    }
    return makeAllStatistics(registry, counters, start, className != statisticsClass);
}

} // namespace marlo::subscriptions

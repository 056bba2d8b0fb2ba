/**
 * @file
 * The operations of the loaded provider library, called as an object manager calls them.
 */
#pragma once

#include "tests/provider/Broker.h"
#include "tests/provider/ProviderLibrary.h"

#include <array>
#include <ostream>
#include <string>

namespace provider_test {

/** One of the three instance providers. */
struct Subject {
    std::string prefix; ///< of its functions, its unit and its factory
    std::string className;
    std::string logger;
    std::vector<std::string> keys;

    [[nodiscard]] std::string unit() const { return prefix + "Provider"; }

    friend std::ostream& operator<<(std::ostream& stream, const Subject& subject) { return stream << subject.prefix; }
};

inline const Subject& logicalProvider() {
    static const Subject subject{"LogicalNetworkAdapter",
                                 LOGICAL,
                                 "Hearth.LogicalNetworkAdapterProvider",
                                 {"SystemCreationClassName", "SystemName", "CreationClassName", "DeviceID"}};
    return subject;
}

inline const Subject& physicalProvider() {
    static const Subject subject{
        "PhysicalNetworkAdapter", PHYSICAL, "Hearth.NetworkAdapterProvider", {"CreationClassName", "Tag"}};
    return subject;
}

inline const Subject& configurationProvider() {
    static const Subject subject{"NetworkAdapter", CONFIGURATION, "Hearth.NetworkAdapterProvider", {"SettingID"}};
    return subject;
}

inline std::array<Subject, 3> allProviders() {
    return {logicalProvider(), physicalProvider(), configurationProvider()};
}

/** Calls providers with one broker; `viaFaulty` false keeps the faults out, and calls may then run concurrently. */
class ProviderCalls {
  public:
    explicit ProviderCalls(BrokerSetup& setup, bool viaFaulty = true) : _setup(setup), _viaFaulty(viaFaulty) {}

    Answer enumInstances(const Subject& subject, PropertyList properties = {}) {
        return enumInstances(subject, classPath(subject.className), std::move(properties));
    }

    Answer enumInstances(const Subject& subject, const marlo::ObjectPath& reference, PropertyList properties = {}) {
        CMPIInstanceMI* mi = instanceMI(subject);
        return call(reference, [&](const CMPIContext* context, const CMPIResult* result, const CMPIObjectPath* path) {
            return mi->ft->enumerateInstances(mi, context, result, path, properties.get());
        });
    }

    Answer enumInstanceNames(const Subject& subject) {
        return enumInstanceNames(subject, classPath(subject.className));
    }

    Answer enumInstanceNames(const Subject& subject, const marlo::ObjectPath& reference) {
        CMPIInstanceMI* mi = instanceMI(subject);
        return call(reference, [&](const CMPIContext* context, const CMPIResult* result, const CMPIObjectPath* path) {
            return mi->ft->enumerateInstanceNames(mi, context, result, path);
        });
    }

    Answer getInstance(const Subject& subject, const marlo::ObjectPath& reference, PropertyList properties = {}) {
        CMPIInstanceMI* mi = instanceMI(subject);
        return call(reference, [&](const CMPIContext* context, const CMPIResult* result, const CMPIObjectPath* path) {
            return mi->ft->getInstance(mi, context, result, path, properties.get());
        });
    }

    /** Of the configuration class unless the path names another. */
    Answer modifyInstance(const marlo::ObjectPath& reference, const marlo::Instance& changed,
                          PropertyList properties = {}) {
        CMPIInstanceMI* mi = instanceMI(configurationProvider());
        return call(reference, [&](const CMPIContext* context, const CMPIResult* result, const CMPIObjectPath* path) {
            return mi->ft->modifyInstance(mi, context, result, path, adopted(_setup.real.newInstance(changed)),
                                          properties.get());
        });
    }

    Answer invokeMethod(const marlo::ObjectPath& reference, const std::string& method,
                        const std::vector<marlo::NamedValue>& arguments = {}) {
        CMPIMethodMI* mi = createMethodMI(broker());
        return call(reference, [&](const CMPIContext* context, const CMPIResult* result, const CMPIObjectPath* path) {
            CMPIArgs* out = adopted(_setup.real.newArgs({}));
            const CMPIStatus status = mi->ft->invokeMethod(mi, context, result, path, method.c_str(),
                                                           adopted(_setup.real.newArgs(arguments)), out);
            outArguments = marlo::broker::Broker::toModel(*out);
            return status;
        });
    }

    /** What the last method wrote to its out arguments. */
    std::vector<marlo::NamedValue> outArguments;

    CMPIInstanceMI* instanceMI(const Subject& subject) { return createInstanceMI(subject.unit(), broker()); }

  private:
    [[nodiscard]] const CMPIBroker* broker() const {
        return _viaFaulty ? _setup.faulty.handle() : _setup.real.handle();
    }

    template <typename Handle>
    Handle* adopted(Handle* handle) {
        return _viaFaulty ? _setup.faulty.adopt(handle) : handle;
    }

    Answer call(const marlo::ObjectPath& reference, const BrokerSetup::Call& function) {
        return _setup.call(reference, function, _viaFaulty);
    }

    BrokerSetup& _setup;
    bool _viaFaulty;
};

} // namespace provider_test

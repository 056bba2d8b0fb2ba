/**
 * @file
 * The provider's indication interface, called as an object manager calls it.
 */
#pragma once

#include "tests/provider/AlertThreads.h"
#include "tests/provider/Broker.h"

#include <array>
#include <string>

namespace provider_test {

inline const std::array<std::string, 4> INDICATION_CLASSES{
    "MARLO_NetworkAdapterOnlineEvent", "MARLO_NetworkAdapterOfflineEvent", "MARLO_NetworkAdapterSwitchOverEvent",
    "MARLO_NetworkAdapterSwitchBackEvent"};

/**
 * Calls through a broker handle of its own, whose tables the test may change. Stops delivery and monitoring at its
 * end, and waits for the threads that are still at work.
 */
class IndicationInterface {
  public:
    using Factory = CMPIIndicationMI* (*)(const CMPIBroker*, const CMPIContext*, CMPIStatus*);

    IndicationInterface(Factory factory, BrokerSetup& setup, const CMPIBroker& handle, AlertThreads::Mode mode)
        : _setup(setup), _handle(handle), _threads(_handle, mode), _mi(factory(&_handle, nullptr, nullptr)) {}

    ~IndicationInterface() { disable(); }

    IndicationInterface(const IndicationInterface&) = delete;
    IndicationInterface& operator=(const IndicationInterface&) = delete;

    CMPIrc activate(const std::string& className) { return filter(className, _mi->ft->activateFilter); }

    CMPIrc deactivate(const std::string& className) { return filter(className, _mi->ft->deActivateFilter); }

    void activateAll() {
        for (const std::string& className : INDICATION_CLASSES) {
            activate(className);
        }
    }

    void enable() { (void)_mi->ft->enableIndications(_mi, nullptr); }

    void disable() { (void)_mi->ft->disableIndications(_mi, nullptr); }

    AlertThreads& threads() { return _threads; }

  private:
    using Filter = CMPIStatus (*)(CMPIIndicationMI*, const CMPIContext*, const CMPISelectExp*, const char*,
                                  const CMPIObjectPath*, CMPIBoolean);

    CMPIrc filter(const std::string& className, Filter function) {
        const marlo::broker::CallScope scope;
        return function(_mi, _setup.real.newContext(), nullptr, className.c_str(),
                        _setup.real.newObjectPath(classPath(className)), 1)
            .rc;
    }

    BrokerSetup& _setup;
    CMPIBroker _handle;
    AlertThreads _threads;
    CMPIIndicationMI* _mi;
};

} // namespace provider_test

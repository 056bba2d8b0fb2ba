/**
 * @file
 * Calls of one provider's indication interface.
 */
#pragma once

#include "host/broker/Broker.h"
#include "host/cimom/ObjectManager.h"
#include "host/cimom/Principal.h"
#include "host/cimom/Provider.h"

#include <functional>

namespace marlo {

/**
 * Each function calls the one of the interface (CMPI 2.0, indication MI) in a scope of its own, in the name of the
 * user that acts when this is made. A failure's message begins with the function, the provider and the class; what a
 * provider throws is one. A provider whose table has no authorizeFilter, mustPoll, enableIndications or
 * disableIndications has no objection.
 */
class IndicationCall {
  public:
    /** `filter` is what the provider is given as such; `fromClass` the class that the filter names, in the schema's
     * spelling, `className` the one of this provider that is concerned. All outlive this. */
    IndicationCall(const broker::Broker& broker, Provider& provider, const CMPISelectExp* filter,
                   const std::string& nameSpace, const std::string& fromClass, const std::string& className)
        : _broker(broker),
          _provider(provider),
          _principal(actingPrincipal()),
          _filter(filter),
          _nameSpace(nameSpace),
          _fromClass(fromClass),
          _className(className) {}

    /** Asks whether this user may use the filter. */
    Status authorize();
    /**
     * Tells the provider that nothing is polled here. CMPI has it answer whether it wanted that, so that only what it
     * throws is a failure.
     */
    Status askWhetherToPoll();
    /** `first` and `last`: of all filters of this class at this provider. */
    Status activate(bool first);
    Status deactivate(bool last);
    Status enable();
    Status disable();

  private:
    struct Arguments {
        CMPIIndicationMI* mi;
        const CMPIContext* context;
        const CMPIObjectPath* classPath;
    };

    Status call(const std::string& function, const std::function<CMPIStatus(const Arguments&)>& slot);

    const broker::Broker& _broker;
    Provider& _provider;
    const std::string _principal;
    const CMPISelectExp* _filter;
    const std::string& _nameSpace;
    const std::string& _fromClass;
    const std::string& _className;
};

} // namespace marlo

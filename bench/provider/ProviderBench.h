/**
 * @file
 * The two sides of the provider's benchmark: the provider library behind a broker, and the floor.
 */
#pragma once

#include "host/broker/Broker.h"

#include <memory>
#include <string>

#include <cmpift.h>

namespace marlo::bench {

/** The broker that both sides of the comparison use, without classes of other providers. */
const broker::Broker& sharedBroker();

/** The instance MI of the configuration provider, loaded as an object manager loads it. */
CMPIInstanceMI* configurationProvider();

/** Its method MI. */
CMPIMethodMI* configurationMethods();

/** Counts what is returned and keeps nothing. */
class CountingSink final : public broker::ResultSink {
  public:
    void instance(const CMPIInstance& /*instance*/) override { ++count; }

    void path(const CMPIObjectPath& /*path*/) override { ++count; }

    void data(const CMPIData& /*data*/) override { ++count; }

    void error(CMPIrc /*code*/, const std::string& /*message*/) override {}

    long count = 0;
};

/**
 * The floor: makes the calls of one EnumInstances of the configuration class to the broker, the agent and the log, in
 * a flat loop over the adapters, with nothing around them and ready-made log lines.
 */
void enumerateFlat(const CMPIBroker* broker, const CMPIResult* result, const CMPIObjectPath* reference);

} // namespace marlo::bench

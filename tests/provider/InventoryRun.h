/**
 * @file
 * The scan of the scripted agent's tree.
 */
#pragma once

#include "configuration/ConfigurationInventory.h"
#include "tests/support/scripted_agent/ScriptedAgent.h"

#include <string>

#include <gtest/gtest.h>

namespace provider_test {

/** Scans into `map`, with what goes to the standard error stream in `errors`. */
class InventoryRun {
  protected:
    InventoryRun() { scripted_agent::reset(); }

    unsigned short run() {
        testing::internal::CaptureStderr();
        const unsigned short result = Orv::NetworkAdapterComposite::getNetworkAdapterConfigurationInstances(map);
        errors = testing::internal::GetCapturedStderr();
        return result;
    }

    Orv::NetworkAdapterComposite::NetworkAdapterConfigurationMap map;
    std::string errors;
};

} // namespace provider_test

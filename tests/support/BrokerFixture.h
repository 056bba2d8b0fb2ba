/**
 * @file
 * A broker over a static schema, with a call scope, for tests of what it hands out.
 */
#pragma once

#include "host/broker/Broker.h"
#include "tests/support/StaticSchema.h"

#include <string>
#include <vector>

#include <cmpimacs.h>
#include <gtest/gtest.h>

namespace marlo::test {

class BrokerFixture : public testing::Test {
  protected:
    /** The text of a string handle; "(null)" for a null one. */
    static std::string text(const CMPIString* string) { return string == nullptr ? "(null)" : CMGetCharPtr(string); }

    CMPIString* string(const char* characters) { return CMNewString(mb, characters, nullptr); }

    CMPIObjectPath* path(const char* className = "Thing") {
        return CMNewObjectPath(mb, "root/test", className, nullptr);
    }

    CMPIInstance* instance(const char* className = "Thing") { return CMNewInstance(mb, path(className), nullptr); }

    StaticSchema schema;
    std::vector<broker::LogLine> log;
    broker::Broker broker{schema, nullptr, [this](const broker::LogLine& line) { log.push_back(line); }};
    const CMPIBroker* mb = broker.handle();
    broker::CallScope scope;
    CMPIStatus status{};
};

} // namespace marlo::test

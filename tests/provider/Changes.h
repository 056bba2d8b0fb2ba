/**
 * @file
 * The scene for calls that change an adapter: what they write, and what they say.
 */
#pragma once

#include "tests/provider/Scene.h"

#include <string>
#include <vector>

#include <gmock/gmock.h>

namespace provider_test {

class ChangeBase : public ReadBase {
  protected:
    /** The path of an adapter's configuration. */
    static marlo::ObjectPath eth(const std::string& settingId) { return pathOf(configurationProvider(), settingId); }

    /** The writes of the last call, in order, without the cursor. */
    static std::vector<std::string> writes() {
        std::vector<std::string> found;
        for (const std::string& call : scripted_agent::recorded("cursor")) {
            if (const auto at = call.find("setProperty"); at != std::string::npos) {
                found.push_back(call.substr(at));
            }
        }
        return found;
    }

    /** The texts of the log at a level, each written to the trace as well. */
    static std::vector<std::string> texts(int level) {
        std::vector<std::string> found;
        for (const std::string& each : normalised(scripted_agent::recorded("log " + std::to_string(level)))) {
            found.push_back(each.substr(each.find(" | ") + 3));
        }
        EXPECT_THAT(scripted_agent::recorded("trace " + std::to_string(level)), testing::SizeIs(found.size()));
        return found;
    }
};

} // namespace provider_test

/**
 * @file
 * Lists as configuration files write them.
 */
#pragma once

#include <string>
#include <vector>

namespace Orv::Agent::Persistence {

/** The words with a blank between each. */
inline std::string joined(const std::vector<std::string>& words) {
    std::string text;
    for (const std::string& word : words) {
        text += (text.empty() ? "" : " ") + word;
    }
    return text;
}

} // namespace Orv::Agent::Persistence

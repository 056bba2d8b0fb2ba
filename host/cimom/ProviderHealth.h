/**
 * @file
 * What has become of a registered provider.
 */
#pragma once

#include <string>

namespace marlo {

struct ProviderHealth {
    std::string name;
    std::string library;
    bool isLoaded = false; ///< by a request: nobody is loaded before the first one
    std::string failure;   ///< why it could not be loaded when that was tried last; empty: it could, or was not tried
};

} // namespace marlo

/**
 * @file
 * What a provider call says to people: names and paths out of the broker's handles.
 */
#pragma once

#include <string>

#include <cmpimacs.h>

namespace Orv::NetworkAdapterComposite {

/** The characters of a broker's string; null for no string. Good until the provider call ends. */
inline const char* characters(const CMPIString* text, CMPIStatus* status) {
    return text != nullptr ? CMGetCharsPtr(text, status) : nullptr;
}

/** The same as a text; empty for no string. */
inline std::string textOf(const CMPIString* text, CMPIStatus* status) {
    const char* found = characters(text, status);
    return found != nullptr ? found : "";
}

} // namespace Orv::NetworkAdapterComposite

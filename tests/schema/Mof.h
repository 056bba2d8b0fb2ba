/**
 * @file
 * Short MOF texts for tests.
 */
#pragma once

#include "host/schema/Schema.h"

#include <stdexcept>
#include <string>

namespace marlo::test {

/** One line of qualifier types, so that texts behind it begin at line 2. */
inline const std::string Qualifiers =
    "Qualifier Key : boolean = false, Scope(property, reference), Flavor(DisableOverride); "
    "Qualifier Override : string, Scope(property, method, reference), Flavor(Restricted); "
    "Qualifier Abstract : boolean = false, Scope(class, association, indication), Flavor(Restricted); "
    "Qualifier Association : boolean = false, Scope(association), Flavor(DisableOverride); "
    "Qualifier Description : string, Scope(any), Flavor(Translatable); "
    "Qualifier MaxLen : uint32, Scope(property, method, parameter); "
    "Qualifier Values : string[], Scope(property, method, parameter), Flavor(Translatable); "
    "Qualifier In : boolean = true, Scope(parameter), Flavor(DisableOverride); "
    "Qualifier Out : boolean = false, Scope(parameter), Flavor(DisableOverride); "
    "#pragma namespace (\"root/test\")\n";

/** A schema of these qualifier types and a text, all of it in root/test. */
inline Schema read(const std::string& text) {
    return Schema::readText(Qualifiers + text, "t.mof");
}

/** What reading a text says; empty when it succeeds. */
inline std::string readError(const std::string& text) {
    try {
        Schema::readText(text, "t.mof");
    } catch (const std::runtime_error& error) {
        return error.what();
    }
    return "";
}

} // namespace marlo::test

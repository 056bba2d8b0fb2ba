/**
 * @file
 * A change of an adapter as an edit of its stanza. Pure.
 */
#pragma once

#include "agent/change/AdapterSettings.h"
#include "agent/persistence/InterfacesFile.h"

#include <optional>
#include <string>

namespace Orv::Agent::Persistence {

/**
 * The text of the file with the change in this stanza of it, an `iface` stanza with a family and a method. dns-*
 * options that the stanza does not have are added only when `namesAreRead`.
 *
 * None when the text, taken apart again, would not say what was put into it: it ends in the middle of a line that
 * goes on, for one. What cannot be read back as it was meant is better not written.
 */
std::optional<std::string> changedStanza(const InterfacesFile& file, const InterfacesFile::Stanza& stanza,
                                         const AdapterSettings& wanted, bool namesAreRead);

} // namespace Orv::Agent::Persistence

/**
 * @file
 * A change of an adapter as a change of keys in its description.
 */
#pragma once

#include "agent/change/AdapterSettings.h"
#include "agent/file/DescriptionEditor.h"

#include <vector>

namespace Orv::Agent {

/**
 * The keys that must change for an adapter with these properties to become what is wanted; none when it is so
 * already. A list that shall be empty is left out, as one that is not known.
 */
std::vector<KeyEdit> keyEdits(const PropertyMap& properties, const AdapterSettings& wanted);

} // namespace Orv::Agent

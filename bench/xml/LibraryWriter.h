/**
 * @file
 * The answer to EnumerateInstances as the XML library writes it, element by element: the yardstick for our writer.
 */
#pragma once

#include "host/model/Instance.h"

#include <string>
#include <vector>

namespace marlo::bench {

/**
 * Writes the very bytes that cimxml::Writer writes of these instances, which hold texts, integers, booleans,
 * date-times and arrays of texts, with xmlTextWriter. The document is made in memory and returned.
 */
std::string writeByLibrary(const std::vector<Instance>& instances);

} // namespace marlo::bench

/**
 * @file
 * What `ip` says of a namespace, in the terms of the tree: the other opinion that the back end is compared with.
 */
#pragma once

#include "agent/tree/Tree.h"
#include "tests/support/Namespace.h"

#include <map>
#include <string>

namespace Orv::Test {

/** Properties by interface name. */
using Report = std::map<std::string, std::map<NodeLexicon::Properties, Agent::PropertyValue>>;

/** The properties that `ip` knows of each interface but the loopback, by name; what it does not know is absent. */
Report ipReport(const Namespace& space);

/** The same properties out of a tree. */
Report kernelProperties(const Agent::Tree& tree);

/** A report as text, for the message of a failed comparison. */
std::string toText(const Report& report);

} // namespace Orv::Test

/**
 * @file
 * What is thrown when a property cannot be written.
 */
#pragma once

#include "agent/tree/PropertyMap.h"

#include <stdexcept>
#include <string>

namespace Orv::Agent {

/** The name under which management clients know a property: "IPv4Address"; "property 7" of one that they do not. */
std::string propertyName(NodeLexicon::Properties property);

/** A value as it is shown in messages: numbers bare, texts in quotes and clean, lists in brackets; cut when long. */
std::string shownValue(const PropertyValue& value);

/**
 * A write that was refused or could not be applied. Its text is one line that names the interface, the property, the
 * value and the cause:
 *
 *     eth0: SubnetMask cannot be set to "255.0.255.0": the address 255.0.255.0 is of class E, which is reserved
 */
class ChangeError : public std::runtime_error {
  public:
    ChangeError(const std::string& interface, NodeLexicon::Properties property, const PropertyValue& value,
                const std::string& reason);
};

} // namespace Orv::Agent

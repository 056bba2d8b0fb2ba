/**
 * @file
 * What an independent parser says of a document.
 */
#pragma once

#include <string>

namespace marlo::test {

/** Why a document is not valid as cim.dtd has it; empty where it is. */
std::string invalidity(const std::string& document);

/** The text of the first element of a name, as a parser gives it. */
std::string textOf(const std::string& document, const std::string& element);

/** The value of an attribute of the first element of a name. */
std::string attributeOf(const std::string& document, const std::string& element, const std::string& attribute);

} // namespace marlo::test

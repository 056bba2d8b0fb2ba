/**
 * @file
 * Values and paths as DSP0201's elements.
 */
#pragma once

#include "host/cimxml/Writer.h"
#include "host/model/Instance.h"

#include <string>

namespace marlo::cimxml {

/** VALUE, VALUE.ARRAY, VALUE.REFERENCE or VALUE.REFARRAY; nothing for NULL. Embedded instances are texts. */
void appendValue(std::string& out, const Value& value);

/** The text of a value that is neither an array nor a reference. */
void appendValueText(std::string& out, const Value& value);

/** A path; `host` stands in those forms that have one. */
void appendPath(std::string& out, const ObjectPath& path, PathWrap wrap, const std::string& host);

void appendClassName(std::string& out, const std::string& name); ///< CLASSNAME

/** CLASSPATH. */
void appendClassPath(std::string& out, const std::string& host, const std::string& nameSpace,
                     const std::string& name);

/** The name of a type for TYPE and PARAMTYPE; embedded instances are texts there, references "reference". */
std::string typeAttribute(CMPIType type);

} // namespace marlo::cimxml

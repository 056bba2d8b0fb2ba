/**
 * @file
 * Elements that name things: namespaces, classes, instances and references.
 */
#pragma once

#include "host/cimxml/Document.h"
#include "host/model/Instance.h"

#include <string>

namespace marlo::cimxml {

/** "root/cimv2" of a LOCALNAMESPACEPATH. */
std::string readNameSpace(const Node& node);

/** An INSTANCENAME. All of these throw MessageError for what DSP0201 does not allow. */
ObjectPath readInstanceName(const Node& node, const Limits& limits);

/**
 * INSTANCENAME, LOCALINSTANCEPATH, INSTANCEPATH, CLASSNAME, LOCALCLASSPATH, CLASSPATH: what a VALUE.REFERENCE may
 * hold. Of classes the path has no keys.
 */
ObjectPath readPath(const Node& node, const Limits& limits);

} // namespace marlo::cimxml

#include "host/cimxml/Names.h"

#include <algorithm>
#include <iterator>

namespace marlo::cimxml {

namespace {

constexpr std::string_view elementNames[] = {
    "CIM",
    "CLASS",
    "CLASSNAME",
    "CLASSPATH",
    "CORRELATOR",
    "DECLARATION",
    "DECLGROUP",
    "DECLGROUP.WITHNAME",
    "DECLGROUP.WITHPATH",
    "ERROR",
    "EXPMETHODCALL",
    "EXPMETHODRESPONSE",
    "EXPPARAMVALUE",
    "HOST",
    "IMETHODCALL",
    "IMETHODRESPONSE",
    "INSTANCE",
    "INSTANCENAME",
    "INSTANCEPATH",
    "IPARAMVALUE",
    "IRETURNVALUE",
    "KEYBINDING",
    "KEYVALUE",
    "LOCALCLASSPATH",
    "LOCALINSTANCEPATH",
    "LOCALNAMESPACEPATH",
    "MESSAGE",
    "METHOD",
    "METHODCALL",
    "METHODRESPONSE",
    "MULTIEXPREQ",
    "MULTIEXPRSP",
    "MULTIREQ",
    "MULTIRSP",
    "NAMESPACE",
    "NAMESPACEPATH",
    "OBJECTPATH",
    "PARAMETER",
    "PARAMETER.ARRAY",
    "PARAMETER.REFARRAY",
    "PARAMETER.REFERENCE",
    "PARAMVALUE",
    "PROPERTY",
    "PROPERTY.ARRAY",
    "PROPERTY.REFERENCE",
    "QUALIFIER",
    "QUALIFIER.DECLARATION",
    "RETURNVALUE",
    "SCOPE",
    "SIMPLEEXPREQ",
    "SIMPLEEXPRSP",
    "SIMPLEREQ",
    "SIMPLERSP",
    "VALUE",
    "VALUE.ARRAY",
    "VALUE.INSTANCEWITHPATH",
    "VALUE.NAMEDINSTANCE",
    "VALUE.NAMEDOBJECT",
    "VALUE.NULL",
    "VALUE.OBJECT",
    "VALUE.OBJECTWITHLOCALPATH",
    "VALUE.OBJECTWITHPATH",
    "VALUE.REFARRAY",
    "VALUE.REFERENCE",
};

constexpr std::string_view attributeNames[] = {
    "ASSOCIATION", "CIMVERSION",     "CLASS",        "CLASSNAME",  "CLASSORIGIN",     "CODE",      "DESCRIPTION",
    "DTDVERSION",  "EmbeddedObject", "ID",           "INDICATION", "ISARRAY",         "METHOD",    "NAME",
    "OVERRIDABLE", "PARAMETER",      "PROPAGATED",   "PROPERTY",   "PROTOCOLVERSION", "REFERENCE", "REFERENCECLASS",
    "SUPERCLASS",  "TOSUBCLASS",     "TRANSLATABLE", "TYPE",       "VALUETYPE",
};

static_assert(std::is_sorted(std::begin(elementNames), std::end(elementNames)));
static_assert(std::is_sorted(std::begin(attributeNames), std::end(attributeNames)));

template <typename Names>
std::string_view find(const Names& names, std::string_view name) {
    const auto* found = std::lower_bound(std::begin(names), std::end(names), name);
    return found != std::end(names) && *found == name ? *found : std::string_view();
}

} // namespace

std::string_view findElementName(std::string_view name) {
    return find(elementNames, name);
}

std::string_view findAttributeName(std::string_view name) {
    return find(attributeNames, name == "EMBEDDEDOBJECT" ? "EmbeddedObject" : name);
}

bool holdsText(std::string_view element) {
    return element == "VALUE" || element == "KEYVALUE" || element == "HOST" || element == "ERROR";
}

} // namespace marlo::cimxml

/**
 * @file
 * What the units of the object factory share.
 */
#pragma once

#include "instrumentation/Utilities.h"
#include "trace/Trace.h"

#include <functional>
#include <string>
#include <string_view>

#include <cmpimacs.h>

namespace Orv::NetworkAdapterComposite {

/** Logger name of the factory's units. */
extern const std::string loggerNetworkObjFactory;

/** The name under which the factory's units appear in log lines. */
inline constexpr const char* FACTORY_UNIT = "NetworkAdapterObjectFactory";

inline constexpr const char* CLASS_CONFIGURATION = "MARLO_NetworkAdapterConfiguration";
inline constexpr const char* CLASS_PHYSICAL = "MARLO_PhysicalNetworkAdapter";
inline constexpr const char* CLASS_LOGICAL = "MARLO_LogicalNetworkAdapter";

/** Where the platform's own classes are asked for. */
inline constexpr const char* PLATFORM_NAMESPACE = "root/quarn";

inline constexpr const char* NO_INSTANCE_FOUND = "***No instance found***";

/** A property that is copied from a platform instance under its own name. */
struct CopiedProperty {
    const char* name;
    DataType type;
};

/** The characters of a broker's string; null for no string. Good until the provider call ends. */
const char* characters(const CMPIString* text);

/** The same as a text; empty for no string. */
std::string textOf(const CMPIString* text);

/** The text of a string value; empty for NULL and for a value of another type. */
std::string textOf(const CMPIData& data);

/** The path as the broker writes it; empty for no path. */
std::string pathText(const CMPIObjectPath* path, CMPIStatus* status);

/** The text of an element of an array of strings; empty for one that is NULL or not there. */
std::string elementOf(const CMPIArray* array, CMPICount index, CMPIStatus* status);

/**
 * A path of `className` in the namespace of `reference` on this system, without keys; null when the broker could not
 * make one. A path whose handle is null counts as none.
 */
CMPIObjectPath* makeObjectPath(const CMPIBroker* broker, const CMPIObjectPath* reference, const char* className);

/** A class of the platform, and which of its instances belong to the service processor. */
struct PlatformClass {
    const char* name;
    const char* successMessage;
    const char* filterProperty;
    std::string_view filteredValue; ///< compared byte for byte; a NULL property filters nothing
};

/** Makes something of one platform instance; also given is its filter property's text, empty when NULL. */
using Republish = std::function<void(const CMPIData& element, const std::string& filterValue)>;

/**
 * Gives every instance of a platform class but the service processor's to `republish`, in the broker's order. When
 * the broker refuses the enumeration, its status stays in `status` and nothing else happens.
 */
void forEachPlatformInstance(const CMPIBroker* broker, const CMPIContext* context, const PlatformClass& source,
                             const ProviderLog& log, CMPIStatus* status, const Republish& republish);

/** Sets a text property, whose value CMPI takes as the characters themselves. */
void setText(CMPIInstance* instance, const char* name, const char* value);

} // namespace Orv::NetworkAdapterComposite

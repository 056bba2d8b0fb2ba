/**
 * @file
 * The slots by which providers ask for operations on what others serve.
 */
#pragma once

#include "host/broker/BrokerState.h"

#include <optional>
#include <string>

namespace marlo::broker {

/** The path that an up-call is about, or nothing and the status that says why there can be none. */
std::optional<ObjectPath> targetOf(CMPIStatus& status, const BrokerState& broker, const CMPIObjectPath* handle);

/** The same with the properties of an instance. */
std::optional<Instance> targetOf(CMPIStatus& status, const BrokerState& broker, const CMPIObjectPath* handle,
                                 const CMPIInstance* instance);

/** Takes an outcome over into a status; true when it was good. */
bool report(CMPIStatus& status, const Outcome& outcome);

/** A null list asks for all. */
UpCalls::PropertyNames namesOf(const char** list);

/** A text that may be null. */
std::string textOf(const char* text);

// Results belong to the scope of the caller; failures are in the status, and what is returned is then null.

CMPIEnumeration* enumerateInstances(CMPIStatus& status, BrokerState& broker, const CMPIContext* context,
                                    const CMPIObjectPath* path, const char** properties);
CMPIEnumeration* enumerateInstanceNames(CMPIStatus& status, BrokerState& broker, const CMPIContext* context,
                                        const CMPIObjectPath* path);
CMPIInstance* getInstance(CMPIStatus& status, BrokerState& broker, const CMPIContext* context,
                          const CMPIObjectPath* path, const char** properties);
/** The path gives the namespace. */
CMPIEnumeration* execQuery(CMPIStatus& status, BrokerState& broker, const CMPIContext* context,
                           const CMPIObjectPath* path, const char* query, const char* language);
CMPIEnumeration* associators(CMPIStatus& status, BrokerState& broker, const CMPIContext* context,
                             const CMPIObjectPath* path, const char* associationClass, const char* resultClass,
                             const char* role, const char* resultRole, const char** properties);
CMPIEnumeration* associatorNames(CMPIStatus& status, BrokerState& broker, const CMPIContext* context,
                                 const CMPIObjectPath* path, const char* associationClass, const char* resultClass,
                                 const char* role, const char* resultRole);
CMPIEnumeration* references(CMPIStatus& status, BrokerState& broker, const CMPIContext* context,
                            const CMPIObjectPath* path, const char* resultClass, const char* role,
                            const char** properties);
CMPIEnumeration* referenceNames(CMPIStatus& status, BrokerState& broker, const CMPIContext* context,
                                const CMPIObjectPath* path, const char* resultClass, const char* role);

CMPIObjectPath* createInstance(CMPIStatus& status, BrokerState& broker, const CMPIContext* context,
                               const CMPIObjectPath* path, const CMPIInstance* instance);
CMPIData invokeMethod(CMPIStatus& status, BrokerState& broker, const CMPIContext* context, const CMPIObjectPath* path,
                      const char* method, const CMPIArgs* in, CMPIArgs* out);
CMPIData getProperty(CMPIStatus& status, BrokerState& broker, const CMPIContext* context, const CMPIObjectPath* path,
                     const char* name);

CMPIStatus modifyInstance(const CMPIBroker* handle, const CMPIContext* context, const CMPIObjectPath* path,
                          const CMPIInstance* instance, const char** properties);
CMPIStatus deleteInstance(const CMPIBroker* handle, const CMPIContext* context, const CMPIObjectPath* path);
CMPIStatus setProperty(const CMPIBroker* handle, const CMPIContext* context, const CMPIObjectPath* path,
                       const char* name, const CMPIValue* value, CMPIType type);

} // namespace marlo::broker

/**
 * @file
 * Builds the CMPI instances of the three adapter classes for one request.
 */
#pragma once

#include "configuration/ConfigurationInventory.h"

#include <cstdint>
#include <optional>
#include <vector>

#include <cmpift.h>

namespace Orv {
class ProviderLog;
}

namespace Orv::NetworkAdapterComposite {

/**
 * Made on the stack of a provider call from the class name of its request, and gone with it; nothing is kept from one
 * request to the next. For the configuration and the physical class the constructor reads the configuration
 * inventory, whose failures are reported by nobody here: the map holds what could be read.
 *
 * The getAll operations append to `instances` and never clear it; the instances belong to the broker. They return 0
 * when they ran and 1 when `className` is not the class they produce. `status` must not be null and ends as the last
 * CMPI call left it. The make operations return null when the broker could not make a path or an instance; their
 * `status` may be null. Exceptions that the broker throws pass through all of them.
 */
class NetworkAdapterObjectFactory {
  public:
    explicit NetworkAdapterObjectFactory(const char* className);
    NetworkAdapterObjectFactory(const NetworkAdapterObjectFactory&) = delete;
    NetworkAdapterObjectFactory& operator=(const NetworkAdapterObjectFactory&) = delete;

    /** How many configuration records were read: a hint for reserving room, and nothing more. Logs it. */
    [[nodiscard]] std::uint32_t getNumberOfInstances() const;

    /**
     * The platform's network cards as MARLO_PhysicalNetworkAdapter, in the order of the broker's enumeration, without
     * the service processor's. All properties are always set. An enumeration that the broker refuses ends with 0, no
     * instances and the broker's status.
     */
    int getAllPhysicalNetworkAdapterCMPIInstances(const CMPIBroker* broker, const CMPIContext* context,
                                                  const CMPIObjectPath* reference, const char* className,
                                                  const char** properties, bool flag,
                                                  std::vector<CMPIInstance*>& instances, CMPIStatus* status);

    /** An instance with no property but CreationClassName. `properties` and `flag` change nothing. */
    CMPIInstance* makePhysicalNetworkAdapterCMPIInstance(const CMPIBroker* broker, const CMPIObjectPath* reference,
                                                         const char** properties, bool flag, CMPIStatus* status);

    /** The platform's network ports as MARLO_LogicalNetworkAdapter; otherwise as for the cards. */
    int getAllLogicalNetworkAdapterCMPIInstances(const CMPIBroker* broker, const CMPIContext* context,
                                                 const CMPIObjectPath* reference, const char* className,
                                                 const char** properties, bool flag,
                                                 std::vector<CMPIInstance*>& instances, CMPIStatus* status);

    /** An instance without properties. `properties` and `flag` change nothing. */
    CMPIInstance* makeLogicalNetworkAdapterInstance(const CMPIBroker* broker, const CMPIObjectPath* reference,
                                                    const char** properties, bool flag, CMPIStatus* status);

    /**
     * One MARLO_NetworkAdapterConfiguration per record, in the order of the map. A record whose instance could not be
     * made yields a null element.
     */
    int getAllNetworkAdapterCMPIInstances(const CMPIBroker* broker, const CMPIContext* context,
                                          const CMPIObjectPath* reference, const char* className,
                                          const char** properties, bool flag, std::vector<CMPIInstance*>& instances,
                                          CMPIStatus* status);

    /**
     * An instance with those properties of `record` that `properties` (null-terminated, compared exactly) names. A
     * null list asks for all of them, or for none when `flag` is true. An array that cannot be made for one of the
     * three list properties ends the instance there, with CMPI_RC_ERR_FAILED and a message in `status`.
     */
    CMPIInstance* makeNetworkAdapterConfigurationInstance(const CMPIBroker* broker, const CMPIObjectPath* reference,
                                                          NetworkAdapterConfiguration record, const char** properties,
                                                          bool flag, CMPIStatus* status);

    /**
     * Writes IPv4Address, SubnetMask and DefaultIPGateway (the first element of each array counts) and DNSDomain of
     * `instance` to the adapter that the key SettingID of `reference` names. A property that is missing, NULL or
     * empty changes nothing; `properties` restricts nothing. Returns 0 for success and 1 when the values could not be
     * written. `status` ends as the last call on the instance left it, which is the reading of DNSDomain.
     */
    int modifyNetworkAdapterCMPIInstance(const CMPIBroker* broker, const CMPIContext* context,
                                         const CMPIObjectPath* reference, const char** properties, bool flag,
                                         const CMPIInstance* instance, CMPIStatus* status);

    /*
     * The methods of MARLO_NetworkAdapterConfiguration. `settingID` is looked up among the keys of the inventory,
     * byte for byte; what is changed is a copy of the record found there and, through it, the adapter. They return 0
     * for success and 1 for a failure, which is logged. An argument of another type than the method has counts as not
     * given.
     */

    /** Has the adapter take its address from a DHCP server. */
    int executeDHCPChanges(std::string settingID);
    /**
     * Sets the first elements of the string arrays IPAddress and SubnetMask. The two go to the record in the order
     * mask, address: which of them is which is told by their values.
     */
    int executeStaticChanges(std::string settingID, const CMPIArgs* args);
    /** Sets the first element of the string array DefaultIPGateway. */
    int executeGatewayChanges(std::string settingID, const CMPIArgs* args);
    /**
     * For a known adapter sets the text DNSDomain when the method is SetDNSDomain, and an empty domain, which changes
     * nothing, for any other. Without a known adapter sets the lists: the string array DNSServerSearchOrder for
     * SetDNSServerSearchOrder, DNSDomainSuffixSearchOrder for SetDNSSuffixSearchOrder. No arguments are a failure.
     */
    int executeDNSChanges(std::string settingID, const CMPIArgs* args, const char* methodName);
    /** Restarts the host's networking and waits for it. Always 0: a restart that cannot be begun is only logged. */
    int executeRestartNetwork();

  private:
    /** The record under a SettingID; none, and why in the log, when there is none. */
    [[nodiscard]] std::optional<NetworkAdapterConfiguration>
    copyOfRecord(const ProviderLog& log, const std::string& settingID, const char* unknown) const;

    std::uint32_t numberOfInstances = 0;
    NetworkAdapterConfigurationMap _networkAdapterConfigurationMap;
};

} // namespace Orv::NetworkAdapterComposite

/**
 * @file
 * The IP configuration of one network adapter, as read from one node of the instrumentation tree.
 */
#pragma once

#include <string>
#include <vector>

namespace Orv::NetworkAdapterComposite {

/** Logger name of the units of this room. */
extern const std::string loggerNetworkAdapterConfiguration;

/** The name under which the units of this room appear in log lines. */
inline constexpr const char* CONFIGURATION_UNIT = "NetworkAdapterConfiguration";

/**
 * A value: fourteen fields that are copied and assigned one by one. Texts and lists start empty, flags false.
 *
 * Getters return copies. Setters return true for success; only setSettingID and setStatus can fail. None of them
 * throws of its own or logs.
 */
class NetworkAdapterConfiguration {
  public:
    [[nodiscard]] std::string getSettingID() const;
    [[nodiscard]] std::string getIPv4Address() const;
    [[nodiscard]] std::string getIPv6Address() const;
    [[nodiscard]] std::string getIPv4SubnetMask() const;
    [[nodiscard]] std::string getDNSHostname() const;
    [[nodiscard]] std::string getDNSDomainName() const;
    [[nodiscard]] std::string getDescription() const;
    [[nodiscard]] std::string getMACAddress() const;
    [[nodiscard]] std::string getStatus() const;
    [[nodiscard]] std::vector<std::string> getDefaultIPGateway() const;
    [[nodiscard]] std::vector<std::string> getDnsServerSearchOrder() const;
    [[nodiscard]] std::vector<std::string> getDNSSuffixesToAppend() const;
    [[nodiscard]] bool getIPEnabled() const;
    [[nodiscard]] bool getDHCPEnabled() const;

    /** Stores the value without its spaces; false when nothing is left of it. */
    bool setSettingID(std::string value);
    /** Stores the value without its spaces; false when nothing is left of it. */
    bool setStatus(std::string value);
    /** Stores "Ethernet", whatever the node calls itself: every adapter is reported as that. */
    bool setDescription(std::string value);
    bool setIPv4Address(std::string value);
    bool setIPv6Address(std::string value);
    bool setIPv4SubnetMask(std::string value);
    bool setDNSHostname(std::string value);
    bool setDNSDomainName(std::string value);
    bool setMACAddress(std::string value);
    /** Appends one gateway. */
    bool setDefaultIPGateway(std::string value);
    /** Appends the servers in order; what was there stays. */
    bool setDnsServerSearchOrder(std::vector<std::string> value);
    /** Appends the suffixes in order; what was there stays. */
    bool setDNSSuffixesToAppend(std::vector<std::string> value);
    /** True for 1, the status code of an adapter that is up and running; false for any other. */
    bool setIPEnabled(unsigned short value);
    /** True for 1, DHCP; false for any other assignment mode. */
    bool setDHCPEnabled(unsigned short value);
    /** Accepts the code and keeps nothing: no class reports it. */
    bool setIPSupport(unsigned short value);

    /*
     * Changes: each writes to the adapter's node in the instrumentation tree, which the agent applies to the host,
     * and then into this record. Node and argument are compared byte for byte, so that a node whose identity has
     * spaces is out of reach of a SettingID, which has none; of several nodes with one identity the first is changed.
     * All return 0 when they ran to their end, whether or not there was such a node, and 1 when the agent threw: what
     * had been written until then stays, here and there. None of them throws anything derived from `std::exception`.
     */

    /** Has the adapter take its address from a DHCP server. */
    int executeDHCPChanges(std::string settingID);
    /** Switches the adapter to a fixed address, and writes those of address and mask that are not empty. */
    int executeStaticChanges(std::string settingID, std::string ipAddress, std::string subnetMask);
    /** Makes `gateway` the only default gateway; nothing happens when it is empty. */
    int executeGatewayChanges(std::string settingID, std::string gateway);
    /** Sets the DNS domain; nothing happens when it is empty. */
    int executeDNSDomainChanges(std::string settingID, std::string dnsDomain);
    /**
     * Writes those of the two lists that are not empty, to the first adapter that is not the management controller's:
     * the name service is the host's, whatever record this is. The lists are appended to the record's own, which
     * shows the former entries as well until it is read anew.
     */
    int executeDNSChanges(std::vector<std::string> dnsServers, std::vector<std::string> dnsSuffixes);

  private:
    std::string _settingID;
    std::string _ipv4Address;
    std::string _ipv6Address;
    std::string _ipv4SubnetMask;
    std::string _dnsHostname;
    std::string _dnsDomainName;
    std::string _description;
    std::string _macAddress;
    std::string _status;
    std::vector<std::string> _defaultIPGateway;
    std::vector<std::string> _dnsServerSearchOrder;
    std::vector<std::string> _dnsSuffixesToAppend;
    bool _ipEnabled = false;
    bool _dhcpEnabled = false;
};

/**
 * The text of an adapter's status code, compared in its full 32 bits: 1 "OK", 5 "Stopped", 12 and every other
 * "Lost Comm". `text` is where it is built.
 */
std::string getNicStatus(unsigned int code, std::string text);

} // namespace Orv::NetworkAdapterComposite

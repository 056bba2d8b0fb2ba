#include "configuration/AdapterNodes.h"
#include "configuration/NetworkAdapterConfiguration.h"
#include "trace/Trace.h"

#include <exception>

namespace Orv::NetworkAdapterComposite {

namespace {

using namespace NodeLexicon;

// The positions under which those who read the logs know these lines. They are names, and stay when the text moves.
enum Position : unsigned {
    DHCP_CAUGHT = 606,
    STATIC_CAUGHT = 652,
    DOMAIN_ENTERING = 661,
    DOMAIN_NAME = 674,
    DOMAIN_SETTING_ID = 675,
    DOMAIN_VALUE = 678,
    DOMAIN_CALLING = 682,
    DOMAIN_CAUGHT = 695,
    DOMAIN_EXITING = 698,
    DNS_ENTERING = 704,
    DNS_ANCESTOR = 719,
    DNS_CAUGHT = 740,
    DNS_EXITING = 743,
    GATEWAY_ENTERING = 749,
    GATEWAY_CAUGHT = 779,
    GATEWAY_EXITING = 782,
};

/** Runs a change. 1, and a line at `position`, when the agent ends it with an exception; else 0. */
template <typename Change>
int attempt(const ProviderLog& log, Position position, const Change& change) {
    try {
        change();
        return 0;
    } catch (const std::exception&) {
        log.message(LEVEL_FAILURE, "Caught Exception", position);
        return 1;
    }
}

/**
 * Moves a new cursor to the first adapter of an identity; false when there is none. `seen` is called for each adapter
 * that has an identity before it is compared.
 */
template <typename Seen>
bool findAdapter(Instrumentation& node, const std::string& settingID, const Seen& seen) {
    node.selectNode(NODE_NETWORK_ADAPTER);
    while (node) {
        std::string identity;
        if (node.getProperty(PROP_NODE_STRING, identity)) {
            seen(identity);
            if (identity == settingID) {
                return true;
            }
        }
        ++node;
    }
    return false;
}

bool findAdapter(Instrumentation& node, const std::string& settingID) {
    return findAdapter(node, settingID, [](const std::string&) {});
}

void setAssignment(Instrumentation& node, unsigned int assignment) {
    node.setProperty(PROP_DHCP_ENABLED, assignment);
}

/** Moves a new cursor to the first adapter that is the host's own; false when there is none. */
bool findHostsAdapter(Instrumentation& node, const ProviderLog& log) {
    node.selectNode(NODE_NETWORK_ADAPTER);
    while (node) {
        const std::string description = grandparentDescription(node);
        log.variable("nodeString", description, DNS_ANCESTOR);
        if (description != MANAGEMENT_CONTROLLER) {
            return true;
        }
        ++node;
    }
    return false;
}

} // namespace

int NetworkAdapterConfiguration::executeDHCPChanges(std::string settingID) {
    const ProviderLog log(loggerNetworkAdapterConfiguration, CONFIGURATION_UNIT, __func__);
    return attempt(log, DHCP_CAUGHT, [&] {
        Instrumentation node;
        if (findAdapter(node, settingID)) {
            setAssignment(node, ASSIGNMENT_DHCP);
            _dhcpEnabled = true;
        }
    });
}

int NetworkAdapterConfiguration::executeStaticChanges(std::string settingID, std::string ipAddress,
                                                      std::string subnetMask) {
    const ProviderLog log(loggerNetworkAdapterConfiguration, CONFIGURATION_UNIT, __func__);
    return attempt(log, STATIC_CAUGHT, [&] {
        Instrumentation node;
        if (!findAdapter(node, settingID)) {
            return;
        }
        setAssignment(node, ASSIGNMENT_STATIC);
        _dhcpEnabled = false;
        if (!ipAddress.empty()) {
            node.setProperty(PROP_IPV4_ADDRESS, ipAddress);
            _ipv4Address = ipAddress;
        }
        if (!subnetMask.empty()) {
            node.setProperty(PROP_IPV4_SUBNET_MASK, subnetMask);
            _ipv4SubnetMask = subnetMask;
        }
    });
}

int NetworkAdapterConfiguration::executeGatewayChanges(std::string settingID, std::string gateway) {
    const ProviderLog log(loggerNetworkAdapterConfiguration, CONFIGURATION_UNIT, __func__);
    const int result = attempt(log, GATEWAY_CAUGHT, [&] {
        log.entering(GATEWAY_ENTERING);
        Instrumentation node;
        if (findAdapter(node, settingID) && !gateway.empty()) {
            node.setProperty(PROP_DEFAULT_GATEWAY, gateway);
            _defaultIPGateway = {gateway};
        }
    });
    if (result == 0) {
        log.exiting(GATEWAY_EXITING);
    }
    return result;
}

int NetworkAdapterConfiguration::executeDNSDomainChanges(std::string settingID, std::string dnsDomain) {
    const ProviderLog log(loggerNetworkAdapterConfiguration, CONFIGURATION_UNIT, __func__);
    const int result = attempt(log, DOMAIN_CAUGHT, [&] {
        log.entering(DOMAIN_ENTERING);
        Instrumentation node;
        const bool found = findAdapter(node, settingID, [&](const std::string& identity) {
            log.variable("name", identity, DOMAIN_NAME);
            log.variable("SettingId", settingID, DOMAIN_SETTING_ID);
        });
        if (!found) {
            return;
        }
        log.variable("dnsDomain", dnsDomain, DOMAIN_VALUE);
        if (!dnsDomain.empty()) {
            log.message(LEVEL_FLOW, "Calling SetProperty", DOMAIN_CALLING);
            node.setProperty(PROP_DNS_DOMAIN, dnsDomain);
            _dnsDomainName = dnsDomain;
        }
    });
    if (result == 0) {
        log.exiting(DOMAIN_EXITING);
    }
    return result;
}

int NetworkAdapterConfiguration::executeDNSChanges(std::vector<std::string> dnsServers,
                                                   std::vector<std::string> dnsSuffixes) {
    const ProviderLog log(loggerNetworkAdapterConfiguration, CONFIGURATION_UNIT, __func__);
    const int result = attempt(log, DNS_CAUGHT, [&] {
        log.entering(DNS_ENTERING);
        Instrumentation node;
        if (!findHostsAdapter(node, log)) {
            return;
        }
        if (!dnsServers.empty()) {
            node.setProperty(PROP_DNS_SERVERS, dnsServers);
            setDnsServerSearchOrder(dnsServers);
        }
        if (!dnsSuffixes.empty()) {
            node.setProperty(PROP_DNS_SUFFIXES, dnsSuffixes);
            setDNSSuffixesToAppend(dnsSuffixes);
        }
    });
    if (result == 0) {
        log.exiting(DNS_EXITING);
    }
    return result;
}

} // namespace Orv::NetworkAdapterComposite

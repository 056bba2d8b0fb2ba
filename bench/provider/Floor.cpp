#include "bench/provider/ProviderBench.h"
#include "instrumentation/Instrumentation.h"
#include "instrumentation/Utilities.h"
#include "trace/Trace.h"

#include <cmpimacs.h>

namespace marlo::bench {

namespace {

using namespace Orv;
using namespace Orv::NodeLexicon;

const std::string logger = "Hearth.NetworkAdapterProvider";
constexpr const char* CLASS = "MARLO_NetworkAdapterConfiguration";

/** One event as the provider logs it: formatted and handed over twice, once for the log and once for the trace. */
void logEvent() {
    static const ProviderLog log(logger, "NetworkAdapterObjectFactory", "makeNetworkAdapterConfigurationInstance");
    log.variable("ipAddress", "10.0.0.1");
}

void logEvents(int count) {
    for (int i = 0; i < count; ++i) {
        logEvent();
    }
}

/** What is read of one adapter. */
struct Facts {
    std::string identity, gateway, ipv4, ipv6, mask, hostname, domain, mac;
    std::vector<std::string> servers, suffixes;
    unsigned int status = 0, support = 0, dhcp = 0;
};

void climb(Instrumentation& node) {
    Instrumentation ancestor;
    ancestor.selectNode(node.getPathToParentNode());
    ancestor.selectNode(ancestor.getPathToParentNode());
    (void)ancestor.getNodeDescription();
}

void read(Instrumentation& node, Facts& facts) {
    (void)node.getProperty(PROP_STATUS, facts.status);
    (void)stripSpaces("OK");
    (void)node.getProperty(PROP_NODE_STRING, facts.identity);
    (void)stripSpaces(facts.identity);
    climb(node);
    logEvent();
    (void)node.getNodeDescription();
    (void)node.getProperty(PROP_DEFAULT_GATEWAY, facts.gateway);
    (void)node.getProperty(PROP_DNS_SERVERS, facts.servers);
    (void)node.getProperty(PROP_IPV4_ADDRESS, facts.ipv4);
    (void)node.getProperty(PROP_IPV6_ADDRESS, facts.ipv6);
    logEvent();
    (void)node.getProperty(PROP_IPV4_SUBNET_MASK, facts.mask);
    (void)node.getProperty(PROP_IP_SUPPORT, facts.support);
    (void)node.getProperty(PROP_DHCP_ENABLED, facts.dhcp);
    (void)node.getProperty(PROP_STATUS, facts.status);
    (void)node.getProperty(PROP_DNS_HOSTNAME, facts.hostname);
    (void)node.getProperty(PROP_DNS_DOMAIN, facts.domain);
    (void)node.getProperty(PROP_DNS_SUFFIXES, facts.suffixes);
    (void)node.getProperty(PROP_MAC_ADDRESS, facts.mac);
}

void setText(CMPIInstance* instance, const char* name, const std::string& value) {
    (void)CMSetProperty(instance, name, value.c_str(), CMPI_chars);
}

void setList(const CMPIBroker* broker, CMPIInstance* instance, const char* name,
             const std::vector<std::string>& values) {
    CMPIStatus status{CMPI_RC_OK, nullptr};
    CMPIArray* array = CMNewArray(broker, static_cast<CMPICount>(values.size()), CMPI_string, &status);
    CMPICount index = 0;
    for (const std::string& value : values) {
        CMPIString* text = CMNewString(broker, value.c_str(), &status);
        (void)CMSetArrayElementAt(array, index, &text, CMPI_string);
        ++index;
    }
    (void)CMSetProperty(instance, name, &array, CMPI_stringA);
}

CMPIInstance* build(const CMPIBroker* broker, const CMPIObjectPath* reference, const Facts& facts) {
    // Entering, both addresses, index, both address messages, mask, mask message, two servers, exiting.
    logEvents(11);
    CMPIObjectPath* path = CMNewObjectPath(broker, CMGetCharPtr(CMGetNameSpace(reference, nullptr)), CLASS, nullptr);
    (void)CMSetNameSpace(path, CMGetCharPtr(CMGetNameSpace(reference, nullptr)));
    (void)CMSetHostname(path, getSystemName().c_str());
    CMPIInstance* instance = CMNewInstance(broker, path, nullptr);
    setText(instance, "SettingID", facts.identity);
    setText(instance, "Description", "Ethernet");
    setList(broker, instance, "IPAddress", {facts.ipv4, facts.ipv6});
    setList(broker, instance, "IPSubnet", {facts.mask});
    setText(instance, "DNSHostName", facts.hostname);
    setText(instance, "DNSDomain", facts.domain);
    setText(instance, "MACAddress", facts.mac);
    const CMPIBoolean dhcp = facts.dhcp == 1 ? 1 : 0;
    (void)CMSetProperty(instance, "DHCPEnabled", &dhcp, CMPI_boolean);
    const CMPIBoolean enabled = facts.status == 1 ? 1 : 0;
    (void)CMSetProperty(instance, "IPEnabled", &enabled, CMPI_boolean);
    setList(broker, instance, "DNSDomainSuffixSearchOrder", facts.suffixes);
    setList(broker, instance, "DefaultIPGateway", {facts.gateway});
    setList(broker, instance, "DNSServerSearchOrder", facts.servers);
    return instance;
}

} // namespace

void enumerateFlat(const CMPIBroker* broker, const CMPIResult* result, const CMPIObjectPath* reference) {
    logEvents(9); // entry and exit marks, the factory's own lines
    Instrumentation node;
    node.selectNode(NODE_NETWORK_ADAPTER);
    for (; node; ++node) {
        Facts facts;
        read(node, facts);
        (void)CMReturnInstance(result, build(broker, reference, facts));
    }
    (void)CMReturnDone(result);
}

} // namespace marlo::bench

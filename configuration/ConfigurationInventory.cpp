#include "configuration/ConfigurationInventory.h"

#include "configuration/AdapterNodes.h"
#include "trace/Trace.h"

#include <iostream>

namespace Orv::NetworkAdapterComposite {

const std::string loggerNetworkAdapterConfiguration = "Hearth.NetworkAdapterProvider";

namespace {

using Record = NetworkAdapterConfiguration;
using TextSetter = bool (Record::*)(std::string);
using ListSetter = bool (Record::*)(std::vector<std::string>);
using NumberSetter = bool (Record::*)(unsigned short);

/**
 * Carries the properties of the node under a cursor into a record. The scratch text and list are emptied before each
 * read, so that nothing of an earlier property is taken for a later one.
 */
class NodeReader {
  public:
    NodeReader(Instrumentation& node, Record& record, const ProviderLog& log)
        : _node(node), _record(record), _log(log) {}

    /** True when the record accepted the property or the node does not have it. */
    bool text(NodeLexicon::Properties property, TextSetter setter) {
        return !readText(property) || (_record.*setter)(_text);
    }

    /** As text(), with the value in the log. */
    bool loggedText(NodeLexicon::Properties property, const char* name, TextSetter setter) {
        if (!readText(property)) {
            return true;
        }
        _log.variable(name, _text);
        return (_record.*setter)(_text);
    }

    bool list(NodeLexicon::Properties property, ListSetter setter) {
        _list.clear();
        return !_node.getProperty(property, _list) || (_record.*setter)(_list);
    }

    /** The setters know the low 16 bits of a number only. */
    bool number(NodeLexicon::Properties property, NumberSetter setter) {
        unsigned int value = 0;
        return !_node.getProperty(property, value) || (_record.*setter)(static_cast<unsigned short>(value));
    }

  private:
    bool readText(NodeLexicon::Properties property) {
        _text.clear();
        return _node.getProperty(property, _text);
    }

    Instrumentation& _node;
    Record& _record;
    const ProviderLog& _log;
    std::string _text;
    std::vector<std::string> _list;
};

/** Ends the scan: the record of this node is lost. */
void require(bool accepted, const char* failure) {
    if (!accepted) {
        throw ProviderException(failure);
    }
}

/** Logs a failure that costs the record one field only. */
void expect(bool accepted, const char* failure, const ProviderLog& log, unsigned line = __builtin_LINE()) {
    if (!accepted) {
        log.message(LEVEL_FLOW, failure, line);
    }
}

void readStatus(Instrumentation& node, Record& record) {
    unsigned int code = 0;
    if (node.getProperty(NodeLexicon::PROP_STATUS, code)) {
        require(record.setStatus(getNicStatus(code, {})), "Failed while setting Status.");
    }
}

/** False for a node of the management controller. A node without identity belongs to nobody and is kept. */
bool readIdentity(Instrumentation& node, Record& record, std::string& key, const ProviderLog& log) {
    if (!node.getProperty(NodeLexicon::PROP_NODE_STRING, key)) {
        return true;
    }
    require(record.setSettingID(key), "Failed while setting SettingID.");
    const std::string description = grandparentDescription(node);
    log.variable("nodeString", description);
    return description != MANAGEMENT_CONTROLLER;
}

void readAddresses(NodeReader& reader) {
    using namespace NodeLexicon;
    require(reader.text(PROP_DEFAULT_GATEWAY, &Record::setDefaultIPGateway),
            "Failed while setting DefaultIPGateway.");
    require(reader.list(PROP_DNS_SERVERS, &Record::setDnsServerSearchOrder),
            "Failed while setting Dns Server Search Order.");
    require(reader.text(PROP_IPV4_ADDRESS, &Record::setIPv4Address), "Failed while setting IPv4 Address.");
    require(reader.loggedText(PROP_IPV6_ADDRESS, "string", &Record::setIPv6Address),
            "Failed while setting IPv6 Address.");
    require(reader.text(PROP_IPV4_SUBNET_MASK, &Record::setIPv4SubnetMask), "Failed while setting IPv4 Subnet Mask.");
}

/** The three modes share one failure text. */
void readModes(NodeReader& reader) {
    using namespace NodeLexicon;
    constexpr const char* failure = "Failed while setting IPSupport.";
    require(reader.number(PROP_IP_SUPPORT, &Record::setIPSupport), failure);
    require(reader.number(PROP_DHCP_ENABLED, &Record::setDHCPEnabled), failure);
    require(reader.number(PROP_STATUS, &Record::setIPEnabled), failure);
}

void readNames(NodeReader& reader, const ProviderLog& log) {
    using namespace NodeLexicon;
    expect(reader.text(PROP_DNS_HOSTNAME, &Record::setDNSHostname), "Failed while setting IP Host Name.", log);
    expect(reader.text(PROP_DNS_DOMAIN, &Record::setDNSDomainName), "Failed while setting Domain Name.", log);
    expect(reader.list(PROP_DNS_SUFFIXES, &Record::setDNSSuffixesToAppend),
           "Failed while setting DNSSuffixesToAppend", log);
    expect(reader.text(PROP_MAC_ADDRESS, &Record::setMACAddress), "Failed while setting MACAddress", log);
}

void readNode(Instrumentation& node, NetworkAdapterConfigurationMap& configurations, const ProviderLog& log) {
    Record record;
    std::string key;
    readStatus(node, record);
    if (!readIdentity(node, record, key, log)) {
        return;
    }
    require(record.setDescription(node.getNodeDescription()), "Failed while setting Description.");
    NodeReader reader(node, record, log);
    readAddresses(reader);
    readModes(reader);
    readNames(reader, log);
    configurations[key] = record;
}

} // namespace

unsigned short getNetworkAdapterConfigurationInstances(NetworkAdapterConfigurationMap& configurations) {
    const ProviderLog log(loggerNetworkAdapterConfiguration, CONFIGURATION_UNIT, __func__);
    try {
        Instrumentation node;
        node.selectNode(NodeLexicon::NODE_NETWORK_ADAPTER);
        if (!node) {
            return 1;
        }
        while (node) {
            readNode(node, configurations, log);
            ++node;
        }
        return 0;
    } catch (const std::exception& failure) {
        std::cerr << failure.what() << '\n';
        return 1;
    }
}

bool getMacAddressFromNetworkPort(std::string portString, std::string& macAddress) {
    const ProviderLog log(loggerNetworkAdapterConfiguration, CONFIGURATION_UNIT, __func__);
    log.entering();
    bool found = false;
    try {
        Instrumentation port;
        port.selectNode(NodeLexicon::NODE_NETWORK_PORT);
        while (port) {
            std::string identity;
            if (port.getProperty(NodeLexicon::PROP_NODE_STRING, identity) && identity == portString &&
                port.getProperty(NodeLexicon::PROP_MAC_ADDRESS, macAddress)) {
                found = true;
            }
            ++port;
        }
    } catch (const std::exception&) {
        log.message(LEVEL_FAILURE, "Caught Exception");
        return found;
    }
    log.exiting();
    return found;
}

} // namespace Orv::NetworkAdapterComposite

#include "configuration/NetworkAdapterConfiguration.h"

#include "configuration/AdapterNodes.h"
#include "instrumentation/Utilities.h"

#include <utility>

namespace Orv::NetworkAdapterComposite {

namespace {

// Codes of the instrumentation tree.
constexpr unsigned int STATUS_OK = 1;
constexpr unsigned int STATUS_STOPPED = 5;
constexpr unsigned int STATUS_LOST_COMMUNICATION = 12;

void append(std::vector<std::string>& list, const std::vector<std::string>& more) {
    list.insert(list.end(), more.begin(), more.end());
}

} // namespace

std::string NetworkAdapterConfiguration::getSettingID() const {
    return _settingID;
}

std::string NetworkAdapterConfiguration::getIPv4Address() const {
    return _ipv4Address;
}

std::string NetworkAdapterConfiguration::getIPv6Address() const {
    return _ipv6Address;
}

std::string NetworkAdapterConfiguration::getIPv4SubnetMask() const {
    return _ipv4SubnetMask;
}

std::string NetworkAdapterConfiguration::getDNSHostname() const {
    return _dnsHostname;
}

std::string NetworkAdapterConfiguration::getDNSDomainName() const {
    return _dnsDomainName;
}

std::string NetworkAdapterConfiguration::getDescription() const {
    return _description;
}

std::string NetworkAdapterConfiguration::getMACAddress() const {
    return _macAddress;
}

std::string NetworkAdapterConfiguration::getStatus() const {
    return _status;
}

std::vector<std::string> NetworkAdapterConfiguration::getDefaultIPGateway() const {
    return _defaultIPGateway;
}

std::vector<std::string> NetworkAdapterConfiguration::getDnsServerSearchOrder() const {
    return _dnsServerSearchOrder;
}

std::vector<std::string> NetworkAdapterConfiguration::getDNSSuffixesToAppend() const {
    return _dnsSuffixesToAppend;
}

bool NetworkAdapterConfiguration::getIPEnabled() const {
    return _ipEnabled;
}

bool NetworkAdapterConfiguration::getDHCPEnabled() const {
    return _dhcpEnabled;
}

bool NetworkAdapterConfiguration::setSettingID(std::string value) {
    _settingID = stripSpaces(std::move(value));
    return !_settingID.empty();
}

bool NetworkAdapterConfiguration::setStatus(std::string value) {
    _status = stripSpaces(std::move(value));
    return !_status.empty();
}

bool NetworkAdapterConfiguration::setDescription(std::string /*value*/) {
    _description = "Ethernet";
    return !_description.empty();
}

bool NetworkAdapterConfiguration::setIPv4Address(std::string value) {
    _ipv4Address = std::move(value);
    return true;
}

bool NetworkAdapterConfiguration::setIPv6Address(std::string value) {
    _ipv6Address = std::move(value);
    return true;
}

bool NetworkAdapterConfiguration::setIPv4SubnetMask(std::string value) {
    _ipv4SubnetMask = std::move(value);
    return true;
}

bool NetworkAdapterConfiguration::setDNSHostname(std::string value) {
    _dnsHostname = std::move(value);
    return true;
}

bool NetworkAdapterConfiguration::setDNSDomainName(std::string value) {
    _dnsDomainName = std::move(value);
    return true;
}

bool NetworkAdapterConfiguration::setMACAddress(std::string value) {
    _macAddress = std::move(value);
    return true;
}

bool NetworkAdapterConfiguration::setDefaultIPGateway(std::string value) {
    _defaultIPGateway.push_back(std::move(value));
    return true;
}

bool NetworkAdapterConfiguration::setDnsServerSearchOrder(std::vector<std::string> value) {
    append(_dnsServerSearchOrder, value);
    return true;
}

bool NetworkAdapterConfiguration::setDNSSuffixesToAppend(std::vector<std::string> value) {
    append(_dnsSuffixesToAppend, value);
    return true;
}

bool NetworkAdapterConfiguration::setIPEnabled(unsigned short value) {
    _ipEnabled = value == STATUS_OK;
    return true;
}

bool NetworkAdapterConfiguration::setDHCPEnabled(unsigned short value) {
    _dhcpEnabled = value == ASSIGNMENT_DHCP;
    return true;
}

bool NetworkAdapterConfiguration::setIPSupport(unsigned short /*value*/) {
    return true;
}

std::string getNicStatus(unsigned int code, std::string text) {
    switch (code) {
    case STATUS_OK:
        text = "OK";
        break;
    case STATUS_STOPPED:
        text = "Stopped";
        break;
    case STATUS_LOST_COMMUNICATION:
    default:
        text = "Lost Comm";
        break;
    }
    return text;
}

} // namespace Orv::NetworkAdapterComposite

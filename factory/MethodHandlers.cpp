#include "factory/FactoryParts.h"
#include "factory/NetworkAdapterObjectFactory.h"

#include <cstdio>

namespace Orv::NetworkAdapterComposite {

namespace {

constexpr const char* MAP_IS_EMPTY = "_networkAdapterConfigurationMap is Empty";
constexpr const char* NO_ADAPTER = "No Adapter Found for Setting ID";
/** One text for three handlers. */
constexpr const char* STATIC_FAILED = "Failed to Execute Static Configuration";

constexpr const char* RESTART_COMMAND = "/etc/init.d/network restart ";

/** Logs a failure and is its result. */
int fail(const ProviderLog& log, const char* text) {
    log.message(LEVEL_FAILURE, text);
    return 1;
}

/** Ends a handler whose record operation returned `result`. */
int finish(const ProviderLog& log, int result, const char* failure) {
    if (result != 0) {
        return fail(log, failure);
    }
    log.exiting();
    return 0;
}

/** The first element of an argument that is a string array, logged as `variable`; empty where it is not given. */
std::string firstOf(const ProviderLog& log, const CMPIArgs* args, const char* name, const char* variable) {
    const CMPIData data = CMGetArg(args, name, nullptr);
    if (data.type != CMPI_stringA || (data.state & CMPI_nullValue) != 0) {
        return {};
    }
    std::string first = elementOf(data.value.array, 0, nullptr);
    log.variable(variable, first);
    return first;
}

/** All elements of an argument that is an array, their number logged as `variable`; none where it is not given. */
std::vector<std::string> allOf(const ProviderLog& log, const CMPIArgs* args, const char* name, const char* variable) {
    std::vector<std::string> all;
    const CMPIData data = CMGetArg(args, name, nullptr);
    if ((data.state & CMPI_nullValue) != 0 || (data.type & CMPI_ARRAY) == 0) {
        return all;
    }
    const CMPIArray* array = data.value.array;
    const CMPICount count = array != nullptr ? CMGetArrayCount(array, nullptr) : 0;
    for (CMPICount i = 0; i < count; ++i) {
        all.push_back(elementOf(array, i, nullptr));
    }
    log.variable(variable, static_cast<unsigned>(all.size()));
    return all;
}

int changeDomain(const ProviderLog& log, NetworkAdapterConfiguration record, const std::string& settingID,
                 const CMPIArgs* args, const char* methodName) {
    std::string dnsDomain;
    if (textEqual(methodName, "SetDNSDomain")) {
        const CMPIData data = CMGetArg(args, "DNSDomain", nullptr);
        if ((data.state & CMPI_nullValue) == 0) {
            dnsDomain = textOf(data);
            log.variable("dnsDomain", dnsDomain);
        }
    }
    return record.executeDNSDomainChanges(settingID, dnsDomain);
}

int changeLists(const ProviderLog& log, NetworkAdapterConfiguration record, const CMPIArgs* args,
                const char* methodName) {
    std::vector<std::string> servers;
    std::vector<std::string> suffixes;
    if (textEqual(methodName, "SetDNSServerSearchOrder")) {
        servers = allOf(log, args, "DNSServerSearchOrder", "dns_Servers.size()");
    } else if (textEqual(methodName, "SetDNSSuffixSearchOrder")) {
        suffixes = allOf(log, args, "DNSDomainSuffixSearchOrder", "dns_Suffixes.size()");
    }
    return record.executeDNSChanges(servers, suffixes);
}

} // namespace

std::optional<NetworkAdapterConfiguration> NetworkAdapterObjectFactory::copyOfRecord(const ProviderLog& log,
                                                                                     const std::string& settingID,
                                                                                     const char* unknown) const {
    if (_networkAdapterConfigurationMap.empty()) {
        log.message(LEVEL_FAILURE, MAP_IS_EMPTY);
        return std::nullopt;
    }
    const auto found = _networkAdapterConfigurationMap.find(settingID);
    if (found == _networkAdapterConfigurationMap.end()) {
        log.message(LEVEL_FAILURE, unknown);
        return std::nullopt;
    }
    return found->second;
}

int NetworkAdapterObjectFactory::executeDHCPChanges(std::string settingID) {
    const ProviderLog log(loggerNetworkObjFactory, FACTORY_UNIT, __func__);
    log.entering();
    auto record = copyOfRecord(log, settingID, "Failed to find the SettingID in the Map");
    return record ? finish(log, record->executeDHCPChanges(settingID), "Failed to Execute DHCP Changes") : 1;
}

int NetworkAdapterObjectFactory::executeStaticChanges(std::string settingID, const CMPIArgs* args) {
    const ProviderLog log(loggerNetworkObjFactory, FACTORY_UNIT, __func__);
    log.entering();
    auto record = copyOfRecord(log, settingID, NO_ADAPTER);
    if (!record) {
        return 1;
    }
    std::string ipAddress;
    std::string subnetMask;
    if (CMGetArgCount(args, nullptr) != 0) {
        ipAddress = firstOf(log, args, "IPAddress", "ipAddr");
        subnetMask = firstOf(log, args, "SubnetMask", "subnet_mask");
    }
    // The mask goes where the address is expected. The agent tells the two apart by their values, and clients that
    // give them in either order have come to rely on it.
    return finish(log, record->executeStaticChanges(settingID, subnetMask, ipAddress), STATIC_FAILED);
}

int NetworkAdapterObjectFactory::executeGatewayChanges(std::string settingID, const CMPIArgs* args) {
    const ProviderLog log(loggerNetworkObjFactory, FACTORY_UNIT, __func__);
    log.entering();
    auto record = copyOfRecord(log, settingID, NO_ADAPTER);
    if (!record) {
        return 1;
    }
    std::string gateway;
    if (CMGetArgCount(args, nullptr) != 0) {
        gateway = firstOf(log, args, "DefaultIPGateway", "ipGateway");
    }
    return finish(log, record->executeGatewayChanges(settingID, gateway), STATIC_FAILED);
}

int NetworkAdapterObjectFactory::executeDNSChanges(std::string settingID, const CMPIArgs* args,
                                                   const char* methodName) {
    const ProviderLog log(loggerNetworkObjFactory, FACTORY_UNIT, __func__);
    log.entering();
    if (CMGetArgCount(args, nullptr) == 0) {
        return fail(log, "No Arguments Passed is Empty");
    }
    if (_networkAdapterConfigurationMap.empty()) {
        log.exiting(); // a host without adapters has nothing to change, and that is no failure here
        return 0;
    }
    const auto found = _networkAdapterConfigurationMap.find(settingID);
    const int result = found != _networkAdapterConfigurationMap.end()
                           ? changeDomain(log, found->second, settingID, args, methodName)
                           : changeLists(log, _networkAdapterConfigurationMap.begin()->second, args, methodName);
    return finish(log, result, STATIC_FAILED);
}

int NetworkAdapterObjectFactory::executeRestartNetwork() {
    const ProviderLog log(loggerNetworkObjFactory, FACTORY_UNIT, __func__);
    log.entering();
    // What the command prints is nobody's; a command that goes on printing ends by SIGPIPE.
    if (std::FILE* pipe = popen(RESTART_COMMAND, "r"); pipe != nullptr) { // NOLINT(cert-env33-c): a fixed command
        (void)pclose(pipe);
        return 0;
    }
    log.message(LEVEL_FAILURE, "Failed to Restart Network");
    log.exiting();
    return 0;
}

} // namespace Orv::NetworkAdapterComposite

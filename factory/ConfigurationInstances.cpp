#include "factory/FactoryParts.h"
#include "factory/NetworkAdapterObjectFactory.h"

#include <set>

namespace Orv::NetworkAdapterComposite {

namespace {

/** Which properties a client asked for. */
class RequestedProperties {
  public:
    RequestedProperties(const char** properties, bool flag) : _all(properties == nullptr && !flag) {
        for (const char** name = properties; name != nullptr && *name != nullptr; ++name) {
            _names.emplace(*name);
        }
    }

    [[nodiscard]] bool contains(const char* name) const { return _all || _names.contains(name); }

  private:
    bool _all;
    std::set<std::string, std::less<>> _names;
};

/**
 * Sets the properties of one record's instance.
 *
 * `status` is shared with everything that the request calls: an error in it, even an earlier one that the broker did
 * not take back, leaves the array at hand out.
 */
class Builder {
  public:
    Builder(const CMPIBroker* broker, CMPIInstance* instance, const RequestedProperties& requested,
            const ProviderLog& log, CMPIStatus* status)
        : _broker(broker), _instance(instance), _requested(requested), _log(log), _status(status) {}

    [[nodiscard]] bool wants(const char* name) const { return _requested.contains(name); }

    void text(const char* name, const std::string& value) {
        if (wants(name)) {
            setText(_instance, name, value.c_str());
        }
    }

    void textUnlessEmpty(const char* name, const std::string& value) {
        if (!value.empty()) {
            text(name, value);
        }
    }

    /** The instance has the low eight bits of the record's flag. */
    void flag(const char* name, unsigned short value) {
        if (wants(name)) {
            const auto low = static_cast<CMPIBoolean>(value);
            (void)CMSetProperty(_instance, name, &low, CMPI_boolean);
        }
    }

    void addresses(const std::string& ipAddress, const std::string& ipv6Address);
    void subnet(const NetworkAdapterConfiguration& record);

    /**
     * Sets a list property of one element per text, each logged when `variable` names it. False, with `failure` in
     * the status and the log, when there is no array to be had.
     */
    bool list(const char* name, std::size_t size, const std::vector<std::string>& values, const char* failure,
              const char* variable = nullptr);

  private:
    [[nodiscard]] bool failed() const { return _status != nullptr && _status->rc != CMPI_RC_OK; }

    void keep(CMPIStatus status) {
        if (_status != nullptr) {
            *_status = status;
        }
    }

    void setArray(const char* name, CMPIArray* array) { (void)CMSetProperty(_instance, name, &array, CMPI_stringA); }

    const CMPIBroker* _broker;
    CMPIInstance* _instance;
    const RequestedProperties& _requested;
    const ProviderLog& _log;
    CMPIStatus* _status;
};

void Builder::addresses(const std::string& ipAddress, const std::string& ipv6Address) {
    _log.variable("ipv6Address", ipv6Address);
    _log.variable("ipAddress", ipAddress);
    const auto size = static_cast<CMPICount>(!ipAddress.empty()) + static_cast<CMPICount>(!ipv6Address.empty());
    if (size == 0) {
        return;
    }
    CMPIArray* array = CMNewArray(_broker, size, CMPI_string, _status);
    if (array == nullptr || failed()) {
        return;
    }
    CMPICount index = 0;
    if (!ipAddress.empty()) {
        CMPIString* text = CMNewString(_broker, ipAddress.c_str(), _status);
        if (text != nullptr && !failed()) {
            keep(CMSetArrayElementAt(array, 0, &text, CMPI_string));
            index = 1;
        }
    }
    _log.variable("index", index);
    if (!ipv6Address.empty()) {
        CMPIString* text = CMNewString(_broker, ipv6Address.c_str(), _status);
        if (text != nullptr && !failed()) {
            (void)CMSetArrayElementAt(array, index, &text, CMPI_string);
            _log.message(LEVEL_FLOW, " Setting IP Address Array set ");
        }
    }
    setArray("IPAddress", array);
    _log.message(LEVEL_FLOW, " IP Address Array set ");
}

void Builder::subnet(const NetworkAdapterConfiguration& record) {
    CMPIArray* array = CMNewArray(_broker, 1, CMPI_string, _status);
    if (array == nullptr || failed()) {
        return;
    }
    const std::string mask = record.getIPv4SubnetMask();
    _log.variable("ipsubnet", mask);
    if (!mask.empty()) {
        CMPIString* text = CMNewString(_broker, mask.c_str(), _status);
        if (text != nullptr && !failed()) {
            keep(CMSetArrayElementAt(array, 0, &text, CMPI_string));
        }
    }
    setArray("IPSubnet", array);
    _log.message(LEVEL_FLOW, "IP IPSubnet Array set");
}

bool Builder::list(const char* name, std::size_t size, const std::vector<std::string>& values, const char* failure,
                   const char* variable) {
    const auto count = static_cast<std::uint16_t>(size); // longer lists wrap
    CMPIArray* array = CMNewArray(_broker, count, CMPI_string, _status);
    if (array == nullptr) {
        CMSetStatusWithChars(_broker, _status, CMPI_RC_ERR_FAILED, failure);
        _log.message(LEVEL_FAILURE, failure);
        return false;
    }
    for (std::uint16_t i = 0; i < count; ++i) {
        if (variable != nullptr) {
            _log.variable(variable, values[i]);
        }
        CMPIString* text = CMNewString(_broker, values[i].c_str(), _status);
        if (text != nullptr && !failed()) {
            (void)CMSetArrayElementAt(array, i, &text, CMPI_string);
        }
    }
    setArray(name, array);
    return true;
}

/** The three list properties, the last of the instance. False when one of them ended it. */
bool setLists(Builder& builder, const NetworkAdapterConfiguration& record) {
    if (builder.wants("DNSDomainSuffixSearchOrder")) {
        const std::vector<std::string> suffixes = record.getDNSSuffixesToAppend();
        if (!suffixes.empty() && !builder.list("DNSDomainSuffixSearchOrder", suffixes.size(), suffixes,
                                               "Create Array for Property DNSSuffixesToAppend failed.")) {
            return false;
        }
    }
    // The count and the elements of the other two come from a reading of their own each.
    if (builder.wants("DefaultIPGateway")) {
        const std::size_t size = record.getDefaultIPGateway().size();
        if (size != 0 && !builder.list("DefaultIPGateway", size, record.getDefaultIPGateway(),
                                       "Create Array for Property DefaultIPGateway failed.")) {
            return false;
        }
    }
    if (builder.wants("DNSServerSearchOrder")) {
        const std::size_t size = record.getDnsServerSearchOrder().size();
        if (size != 0 && !builder.list("DNSServerSearchOrder", size, record.getDnsServerSearchOrder(),
                                       "Create Array for Property DNSServerSearchOrder failed.", "searchOr")) {
            return false;
        }
    }
    return true;
}

bool setAll(Builder& builder, const NetworkAdapterConfiguration& record) {
    builder.text("SettingID", record.getSettingID());
    builder.text("Description", record.getDescription());
    if (builder.wants("IPAddress")) {
        builder.addresses(record.getIPv4Address(), record.getIPv6Address());
    }
    if (builder.wants("IPSubnet")) {
        builder.subnet(record);
    }
    builder.textUnlessEmpty("DNSHostName", record.getDNSHostname());
    builder.textUnlessEmpty("DNSDomain", record.getDNSDomainName());
    builder.textUnlessEmpty("MACAddress", record.getMACAddress());
    builder.flag("DHCPEnabled", record.getDHCPEnabled());
    builder.flag("IPEnabled", record.getIPEnabled());
    return setLists(builder, record);
}

} // namespace

CMPIInstance* NetworkAdapterObjectFactory::makeNetworkAdapterConfigurationInstance(const CMPIBroker* broker,
                                                                                   const CMPIObjectPath* reference,
                                                                                   NetworkAdapterConfiguration record,
                                                                                   const char** properties, bool flag,
                                                                                   CMPIStatus* status) {
    const ProviderLog log(loggerNetworkObjFactory, FACTORY_UNIT, __func__);
    log.entering();
    const RequestedProperties requested(properties, flag);
    CMPIObjectPath* path = makeObjectPath(broker, reference, CLASS_CONFIGURATION);
    CMPIInstance* instance = path != nullptr ? CMNewInstance(broker, path, nullptr) : nullptr;
    if (instance != nullptr) {
        Builder builder(broker, instance, requested, log, status);
        if (!setAll(builder, record)) {
            return instance;
        }
    }
    log.exiting();
    return instance;
}

int NetworkAdapterObjectFactory::getAllNetworkAdapterCMPIInstances(
    const CMPIBroker* broker, const CMPIContext* /*context*/, const CMPIObjectPath* reference, const char* className,
    const char** properties, bool flag, std::vector<CMPIInstance*>& instances, CMPIStatus* status) {
    const ProviderLog log(loggerNetworkObjFactory, FACTORY_UNIT, __func__);
    log.entering();
    if (!textEqual(className, CLASS_CONFIGURATION)) {
        (void)CMTraceMessage(broker, CMPI_LEV_WARNING, "NetworkAdapterProvider", NO_INSTANCE_FOUND, nullptr);
        return 1;
    }
    for (const auto& [identity, record] : _networkAdapterConfigurationMap) {
        instances.push_back(
            makeNetworkAdapterConfigurationInstance(broker, reference, record, properties, flag, status));
    }
    log.exiting();
    return 0;
}

} // namespace Orv::NetworkAdapterComposite

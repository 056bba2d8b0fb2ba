#include "indication/NetworkIndication.h"
#include "instrumentation/Localisation.h"
#include "trace/Trace.h"

#include <algorithm>
#include <array>
#include <cstdio>
#include <cwchar>

#include <cmpimacs.h>
#include <unistd.h>

namespace Orv::NetworkAdapterComposite {

namespace {

constexpr const char* CLASS_ALERTING_ELEMENT = "MARLO_PhysicalNetworkAdapter";

/** The agent's number for the messages of network adapters. */
constexpr unsigned int MESSAGE_COMPONENT = 1;

/* Values of CIM_AlertIndication. */
constexpr CMPIUint16 FORMAT_OBJECT_PATH = 2;
constexpr CMPIUint16 ALERT_TYPE = 3;
constexpr CMPIUint16 PROBABLE_CAUSE = 1;

/** The longest host name and a zero; one more is kept zero whatever gethostname writes. */
using HostName = std::array<char, 1025>;

/** What is said of an event. */
struct EventMessage {
    const char* eventWord;
    CMPIUint16 severity;
    const wchar_t* resourceId;
    int number;
};

constexpr std::array MESSAGES{
    EventMessage{"Offline", 3, L"MSGID_NAI_NIC_OFFLINE", 10817},
    EventMessage{"Online", 2, L"MSGID_NAI_NIC_ONLINE", 10816},
    EventMessage{"SwitchOver", 3, L"MSGID_NAI_NIC_SWITCHOVER", 10820},
    EventMessage{"SwitchBack", 2, L"MSGID_NAI_NIC_SWITCHBACK", 10819},
    EventMessage{"Failed", 6, L"MSGID_NAI_NIC_FAILED", 10818},
};

/** An event's message in the administrator's language. Longer texts are cut. */
struct Message {
    CMPIUint16 severity = 0;
    std::array<wchar_t, 512> text{};
    std::array<char, 16> number{};
};

Message messageOf(const std::string& eventWord) {
    Message message;
    const auto* known = std::find_if(MESSAGES.begin(), MESSAGES.end(),
                                     [&](const EventMessage& event) { return eventWord == event.eventWord; });
    if (known != MESSAGES.end()) {
        message.severity = known->severity;
        const std::wstring text =
            ResourceString(Locale::getResourceLibrary(MESSAGE_COMPONENT, Locale::getLanguageId()), known->resourceId);
        (void)std::swprintf(message.text.data(), message.text.size(), text.c_str());
        (void)std::snprintf(message.number.data(), message.number.size(), "%d", known->number);
    }
    return message;
}

const char* characters(const CMPIString* text) {
    return text != nullptr ? CMGetCharPtr(text) : nullptr;
}

void setText(const CMPIInstance* instance, const char* property, const char* text) {
    (void)CMSetProperty(instance, property, text, CMPI_chars);
}

void setNumber(const CMPIInstance* instance, const char* property, CMPIUint16 number) {
    (void)CMSetProperty(instance, property, &number, CMPI_uint16);
}

void setTimes(const CMPIInstance* instance, const DateTime& time, const ProviderLog& log) {
    const std::string datTime = convertCIMDateTime(time);
    log.variable("datTime", datTime);
    CMPIStatus status = {CMPI_RC_OK, nullptr};
    const CMPIDateTime* value = CMNewDateTimeFromChars(_alertBroker, datTime.c_str(), &status);
    (void)CMSetProperty(instance, "IndicationTime", &value, CMPI_dateTime);
    (void)CMSetProperty(instance, "EventTime", &value, CMPI_dateTime);
}

/** Names the adapter that the indication is about. False when its path cannot be made. */
bool setAlertingElement(const CMPIInstance* instance, const HostName& hostName, const std::string& name,
                        const ProviderLog& log) {
    CMPIStatus status = {CMPI_RC_OK, nullptr};
    const CMPIObjectPath* path = CMNewObjectPath(_alertBroker, INDICATION_NAMESPACE, CLASS_ALERTING_ELEMENT, &status);
    if (path == nullptr || path->hdl == nullptr) {
        log.message(LEVEL_FAILURE, "Failed to create ObjectPath for Alerting Managed Element");
        return false;
    }
    (void)CMSetNameSpace(path, characters(CMGetNameSpace(path, &status)));
    (void)CMSetHostname(path, hostName.data());
    (void)CMAddKey(path, "CreationClassName", CLASS_ALERTING_ELEMENT, CMPI_chars);
    (void)CMAddKey(path, "Tag", name.c_str(), CMPI_chars);
    log.message(LEVEL_FLOW, "Before AME");
    setText(instance, "AlertingManagedElement", characters(CMObjectPathToString(path, &status)));
    return true;
}

void setNoCorrelatedIndications(const CMPIInstance* instance) {
    CMPIStatus status = {CMPI_RC_OK, nullptr};
    const CMPIArray* none = CMNewArray(_alertBroker, 0, CMPI_string, &status);
    (void)CMSetProperty(instance, "CorrelatedIndications", &none, CMPI_stringA);
}

void setMessage(const CMPIInstance* instance, const std::string& eventWord) {
    const Message message = messageOf(eventWord);
    setNumber(instance, "PerceivedSeverity", message.severity);
    setText(instance, "Description", make_string(message.text.data()).c_str());
    setText(instance, "Message", make_string(message.text.data()).c_str());
    setText(instance, "MessageID", message.number.data());
}

void setOrigin(const CMPIInstance* instance, const HostName& hostName) {
    setNumber(instance, "AlertingElementFormat", FORMAT_OBJECT_PATH);
    setNumber(instance, "AlertType", ALERT_TYPE);
    setNumber(instance, "ProbableCause", PROBABLE_CAUSE);
    setText(instance, "SystemCreationClassName", "TAVIS_ComputerSystem");
    setText(instance, "SystemName", hostName.data());
    setText(instance, "UniqueSystemID", make_string(Product::getUid()).c_str());
    setText(instance, "OwningEntity", "Ostrel");
    setText(instance, "ProviderName", "NetworkAdapterProvider");
}

/** An indication without properties; null, or what the broker gave instead, when it cannot be made. */
CMPIInstance* makeInstance(const std::string& className, HostName& hostName, const ProviderLog& log) {
    CMPIStatus status = {CMPI_RC_OK, nullptr};
    const CMPIObjectPath* path = CMNewObjectPath(_alertBroker, INDICATION_NAMESPACE, className.c_str(), &status);
    if (path == nullptr || path->hdl == nullptr) {
        log.message(LEVEL_FAILURE, "Failed to create ObjectPath");
        return nullptr;
    }
    log.message(LEVEL_FLOW, "Before systemname");
    (void)CMSetNameSpace(path, INDICATION_NAMESPACE);
    (void)gethostname(hostName.data(), hostName.size() - 1);
    (void)CMSetHostname(path, hostName.data());
    log.message(LEVEL_FLOW, "Before Created instance");
    CMPIInstance* instance = CMNewInstance(_alertBroker, path, &status);
    if (instance == nullptr || instance->hdl == nullptr) {
        log.message(LEVEL_FAILURE, "instance is NULL");
    }
    return instance;
}

} // namespace

CMPIInstance* createNetworkAdapterIndicationInstance(std::string indicationClassName, std::string description,
                                                     Orv::DateTime time, std::string eventWord, std::string name) {
    const ProviderLog log(loggerNetworkIndication, INDICATION_UNIT, __func__);
    log.entering();
    try {
        HostName hostName{};
        CMPIInstance* instance = makeInstance(indicationClassName, hostName, log);
        if (instance == nullptr || instance->hdl == nullptr) {
            return instance;
        }
        const std::string identifier = "NetworkPort:" + description + eventWord;
        setText(instance, "IndicationIdentifier", identifier.c_str());
        setText(instance, "EventID", identifier.c_str());
        setTimes(instance, time, log);
        if (!setAlertingElement(instance, hostName, name, log)) {
            return nullptr;
        }
        setNoCorrelatedIndications(instance);
        setMessage(instance, eventWord);
        setOrigin(instance, hostName);
        return instance;
    } catch (...) {
        log.message(LEVEL_FAILURE, "Caught Exception");
        return nullptr;
    }
}

} // namespace Orv::NetworkAdapterComposite

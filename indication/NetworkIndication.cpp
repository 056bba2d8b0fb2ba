#include "indication/NetworkIndication.h"

#include "instrumentation/Instrumentation.h"
#include "trace/Trace.h"

#include <array>
#include <string_view>

namespace Orv::NetworkAdapterComposite {

const std::string loggerNetworkIndication = "Hearth.NetworkAdapterProvider";

const CMPIBroker* _alertBroker = nullptr;
const CMPIContext* _alertContext = nullptr;
bool _alertContextAvailable = false;
bool _enabledNetwork = false;
int OnlineSubscribeCount = 0;
int OfflineSubscribeCount = 0;
int SwitchoverSubscribeCount = 0;
int SwitchbackSubscribeCount = 0;

namespace {

struct IndicationClass {
    std::string_view name;
    IndicationId id;
};

constexpr std::array CLASSES{
    IndicationClass{CLASS_ONLINE_EVENT, INDICATION_ONLINE},
    IndicationClass{CLASS_OFFLINE_EVENT, INDICATION_OFFLINE},
    IndicationClass{CLASS_SWITCHOVER_EVENT, INDICATION_SWITCHOVER},
    IndicationClass{CLASS_SWITCHBACK_EVENT, INDICATION_SWITCHBACK},
};

/** Nobody waits for the result: an agent that cannot monitor is seen in the log alone. */
void startMonitoring(const ProviderLog& log) {
    try {
        Instrumentation agent;
        agent.startMonitoring(NodeLexicon::NODE_NETWORK_ADAPTER, NetworkAdapterHandler, nullptr);
    } catch (const std::exception&) {
        log.message(LEVEL_FAILURE, "Caught Exception");
    }
}

void stopMonitoring(const ProviderLog& log) {
    try {
        Instrumentation agent;
        agent.stopMonitoring(NodeLexicon::NODE_NETWORK_ADAPTER, NetworkAdapterHandler, nullptr);
    } catch (const std::exception&) {
        log.message(LEVEL_FAILURE, "Caught Exception");
    }
}

/** Counts an activation. The first of a pair, which nobody else has activated either, starts monitoring. */
void countUp(int& own, int partner, const ProviderLog& log) {
    ++own;
    if (own == 1 && partner == 0) {
        startMonitoring(log);
    }
}

void countDown(int& own) {
    --own;
    if (own == 0) {
        own = 1;
    }
}

} // namespace

bool getNetworkIndicationId(const char* classname, unsigned short& indicationClassId) {
    const ProviderLog log(loggerNetworkIndication, INDICATION_UNIT, __func__);
    log.entering();
    log.variable("classname", classname);
    indicationClassId = INDICATION_NONE;
    for (const IndicationClass& known : CLASSES) {
        if (known.name == classname) {
            indicationClassId = known.id;
            break;
        }
    }
    log.variable("indicationClassId", indicationClassId);
    return indicationClassId != INDICATION_NONE;
}

void subscribeforEvent(unsigned short id) {
    const ProviderLog log(loggerNetworkIndication, INDICATION_UNIT, __func__);
    log.entering();
    switch (id) {
    case INDICATION_ONLINE:
        countUp(OnlineSubscribeCount, OfflineSubscribeCount, log);
        break;
    case INDICATION_OFFLINE:
        countUp(OfflineSubscribeCount, OnlineSubscribeCount, log);
        break;
    case INDICATION_SWITCHOVER:
        countUp(SwitchoverSubscribeCount, SwitchbackSubscribeCount, log);
        break;
    case INDICATION_SWITCHBACK:
        countUp(SwitchbackSubscribeCount, SwitchoverSubscribeCount, log);
        break;
    default:
        break;
    }
}

void UnsubscribeforEvent(unsigned short id) {
    const ProviderLog log(loggerNetworkIndication, INDICATION_UNIT, __func__);
    log.entering();
    switch (id) {
    case INDICATION_ONLINE:
        countDown(OnlineSubscribeCount);
        return; // an online subscription never takes the context along
    case INDICATION_OFFLINE:
        countDown(OfflineSubscribeCount);
        break;
    case INDICATION_SWITCHOVER:
        countDown(SwitchoverSubscribeCount);
        break;
    case INDICATION_SWITCHBACK:
        countDown(SwitchbackSubscribeCount);
        break;
    default:
        break;
    }
    if (OnlineSubscribeCount == 0 && OfflineSubscribeCount == 0 && SwitchoverSubscribeCount == 0 &&
        SwitchbackSubscribeCount == 0) {
        clearIndicationContext();
    }
}

void saveIndicationContext(const CMPIBroker* broker, const CMPIContext* ctx) {
    const ProviderLog log(loggerNetworkIndication, INDICATION_UNIT, __func__);
    log.entering();
    _alertContextAvailable = true;
    _alertBroker = broker;
    _alertContext = ctx;
}

void clearIndicationContext() {
    const ProviderLog log(loggerNetworkIndication, INDICATION_UNIT, __func__);
    log.entering();
    _alertBroker = nullptr;
    _alertContext = nullptr;
    _alertContextAvailable = false;
}

void setNetworkEnable() {
    const ProviderLog log(loggerNetworkIndication, INDICATION_UNIT, __func__);
    log.entering();
    _enabledNetwork = true;
    log.variable("_enabledNetwork", _enabledNetwork ? 1U : 0U);
    log.exiting();
}

void disableNetworkIndication() {
    const ProviderLog log(loggerNetworkIndication, INDICATION_UNIT, __func__);
    log.entering();
    _enabledNetwork = false;
    if (OnlineSubscribeCount == 1 && OfflineSubscribeCount == 1) {
        OnlineSubscribeCount = 0;
        stopMonitoring(log);
    }
    log.exiting();
}

} // namespace Orv::NetworkAdapterComposite

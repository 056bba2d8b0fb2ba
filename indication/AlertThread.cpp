#include "indication/NetworkIndication.h"
#include "instrumentation/Instrumentation.h"
#include "trace/Trace.h"

#include <algorithm>
#include <array>

#include <cmpimacs.h>

namespace Orv::NetworkAdapterComposite {

NetworkIndicationData indicationNetworkData;
CMPI_THREAD_TYPE ind_thread_id = nullptr;

namespace {

constexpr const char* DELIVERY_FAILED = "Could not send the Indication";

/** What a status of an adapter's node is to its subscribers. */
struct StatusMeaning {
    unsigned int status;
    const char* eventWord;
    const char* className;
};

constexpr std::array MEANINGS{
    StatusMeaning{1, "Online", CLASS_ONLINE_EVENT},          StatusMeaning{5, "Offline", CLASS_OFFLINE_EVENT},
    StatusMeaning{12, "Offline", CLASS_OFFLINE_EVENT},       StatusMeaning{32, "SwitchOver", CLASS_SWITCHOVER_EVENT},
    StatusMeaning{33, "SwitchBack", CLASS_SWITCHBACK_EVENT},
};

/*
 * The only two places that touch the record. The callback writes it while the thread of an earlier event may still be
 * copying it; the agent holds the next event back until that thread has selected its node, which comes after.
 */
__attribute__((noinline)) void storeIndicationNetworkData(const DateTime& time, const std::string& nodeString) {
    indicationNetworkData.nodeString = nodeString;
    indicationNetworkData.eventTime = time;
    indicationNetworkData.userData = 0;
}

__attribute__((noinline)) void copyIndicationNetworkData(DateTime& time, std::string& nodeString) {
    nodeString = indicationNetworkData.nodeString;
    time = indicationNetworkData.eventTime;
}

/** A context for the calling thread. The saved one may have been replaced by another thread just now. */
__attribute__((noinline)) const CMPIContext* prepareFromAlertContext() {
    return CBPrepareAttachThread(_alertBroker, _alertContext);
}

/** False, with the word "Failed", for a status that is no event. */
bool interpret(unsigned int status, std::string& indicationClassName, std::string& eventWord,
               const ProviderLog& log) {
    const auto* meaning = std::find_if(MEANINGS.begin(), MEANINGS.end(),
                                       [status](const StatusMeaning& known) { return known.status == status; });
    if (meaning == MEANINGS.end()) {
        eventWord = "Failed";
        log.message(LEVEL_FAILURE, "Status is Failed");
        return false;
    }
    eventWord = meaning->eventWord;
    indicationClassName = meaning->className;
    return true;
}

void deliver(const CMPIContext* context, const CMPIInstance* instance, const ProviderLog& log) {
    log.message(LEVEL_FLOW, "processNetworkIndication : Calling CB Deliver Indication ");
    const CMPIStatus status = CBDeliverIndication(_alertBroker, context, INDICATION_NAMESPACE, instance);
    if (status.rc != CMPI_RC_OK && _alertBroker != nullptr) {
        (void)CMNewString(_alertBroker, DELIVERY_FAILED, nullptr);
        (void)CMTraceMessage(_alertBroker, CMPI_LEV_INFO, "NetworkAdapterProvider", DELIVERY_FAILED, nullptr);
    }
    log.message(LEVEL_FLOW, "processNetworkIndication : CB Deliver Indication done");
}

} // namespace

void NetworkAdapterHandler(unsigned int indicationClass, Orv::DateTime time, std::string nodeString,
                           const void* /*data*/) {
    const ProviderLog log(loggerNetworkIndication, INDICATION_UNIT, __func__);
    log.entering();
    log.variable("indicationClass", indicationClass);
    log.variable("_enabledNetwork", _enabledNetwork ? 1U : 0U);
    if (_enabledNetwork && indicationClass == 0) {
        storeIndicationNetworkData(time, nodeString);
        const CMPIContext* context = prepareFromAlertContext();
        (void)CBAttachThread(_alertBroker, context);
        ind_thread_id = _alertBroker->xft->newThread(NetworkAlertThread, nullptr, 1);
        (void)CBDetachThread(_alertBroker, context);
        if (ind_thread_id == nullptr) {
            log.message(LEVEL_FAILURE, "Error creating thread");
        }
    }
    log.exiting();
}

void* NetworkAlertThread(void* /*parm*/) {
    const ProviderLog log(loggerNetworkIndication, INDICATION_UNIT, __func__);
    log.entering();
    DateTime time;
    std::string nodeString;
    copyIndicationNetworkData(time, nodeString);
    processNetworkIndication(time, nodeString);
    log.exiting();
    return nullptr;
}

void processNetworkIndication(Orv::DateTime time, std::string nodeString) {
    const ProviderLog log(loggerNetworkIndication, INDICATION_UNIT, __func__);
    log.entering();
    std::string indicationClassName;
    std::string eventWord;
    std::string description;
    std::string name;
    if (!getNetworkProperties(nodeString, indicationClassName, eventWord, description, name) ||
        !_alertContextAvailable) {
        log.exiting();
        return;
    }
    const CMPIContext* context = prepareFromAlertContext();
    if (CBAttachThread(_alertBroker, context).rc != CMPI_RC_OK) {
        log.exiting();
        return;
    }
    const CMPIInstance* instance =
        createNetworkAdapterIndicationInstance(indicationClassName, description, time, eventWord, name);
    if (instance != nullptr && instance->hdl != nullptr) {
        deliver(context, instance, log);
    }
    (void)CBDetachThread(_alertBroker, context);
    log.exiting();
}

bool getNetworkProperties(std::string nodeString, std::string& indicationClassName, std::string& eventWord,
                          std::string& description, std::string& name) {
    const ProviderLog log(loggerNetworkIndication, INDICATION_UNIT, __func__);
    log.entering();
    try {
        Instrumentation node;
        node.selectNode(nodeString);
        bool means = true;
        if (node) {
            unsigned int status = 0;
            (void)node.getProperty(NodeLexicon::PROP_STATUS, status);
            description = node.getNodeDescription();
            (void)node.getProperty(NodeLexicon::PROP_NODE_STRING, name);
            log.variable("name", name);
            log.variable("newStatus", status);
            means = interpret(status, indicationClassName, eventWord, log);
        }
        log.exiting();
        return means;
    } catch (const std::exception&) {
        log.message(LEVEL_FAILURE, "Caught Exception");
        return false;
    }
}

} // namespace Orv::NetworkAdapterComposite

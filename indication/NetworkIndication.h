/**
 * @file
 * Indications of adapters that go online or offline, or switch over to a backup and back.
 *
 * The object manager's calls count subscriptions and have the agent monitor the adapters. The agent calls back for
 * every event; the callback keeps the event in one record and starts one detached thread of the broker's, which reads
 * the adapter's node, builds one indication and delivers it.
 *
 * All state is in plain globals for the life of the library: nothing is locked and nothing is atomic. The MI
 * functions, the agent's callback and the alert threads read and write them as they come.
 */
#pragma once

#include "instrumentation/DateTime.h"

#include <cstdint>
#include <string>

#include <cmpift.h>

namespace Orv::NetworkAdapterComposite {

/** The name that all sources of this room log under, and the source that they name. */
extern const std::string loggerNetworkIndication;
inline constexpr const char* INDICATION_UNIT = "NetworkIndication";

/** Where the indications and what they are about live. */
inline constexpr const char* INDICATION_NAMESPACE = "root/tavis";

inline constexpr const char* CLASS_ONLINE_EVENT = "MARLO_NetworkAdapterOnlineEvent";
inline constexpr const char* CLASS_OFFLINE_EVENT = "MARLO_NetworkAdapterOfflineEvent";
inline constexpr const char* CLASS_SWITCHOVER_EVENT = "MARLO_NetworkAdapterSwitchOverEvent";
inline constexpr const char* CLASS_SWITCHBACK_EVENT = "MARLO_NetworkAdapterSwitchBackEvent";

/* Subscription (NetworkIndication.cpp). */

enum IndicationId : unsigned short {
    INDICATION_ONLINE = 1,
    INDICATION_OFFLINE = 2,
    INDICATION_SWITCHOVER = 3,
    INDICATION_SWITCHBACK = 4,
    INDICATION_NONE = 15, ///< not a class of this provider
};

/** Broker and prepared context of the latest activation, for threads of the provider's own. */
extern const CMPIBroker* _alertBroker;
extern const CMPIContext* _alertContext;
extern bool _alertContextAvailable;

/** Whether events are delivered; they are dropped while it is false. */
extern bool _enabledNetwork;

/** Activations by id. They decide when monitoring starts and stops, and never which events are delivered. */
extern int OnlineSubscribeCount;
extern int OfflineSubscribeCount;
extern int SwitchoverSubscribeCount;
extern int SwitchbackSubscribeCount;

/** The id of a class name, which is compared byte for byte. False, and INDICATION_NONE, when there is none. */
bool getNetworkIndicationId(const char* classname, unsigned short& indicationClassId);

/**
 * Counts an activation and starts monitoring with the first of its pair: online with offline, switch-over with
 * switch-back. Each pair starts it by itself; the agent calls a callback that is registered twice only once.
 */
void subscribeforEvent(unsigned short id);

/**
 * Counts an activation less, down to 1 and no further: once activated, an id keeps its monitoring and its context
 * until indications are disabled. One that was never activated goes below zero. Any other id changes no count.
 */
void UnsubscribeforEvent(unsigned short id);

/** Replaces broker and context. The former context is not released: an alert thread may be copying from it. */
void saveIndicationContext(const CMPIBroker* broker, const CMPIContext* ctx);
void clearIndicationContext();

void setNetworkEnable();

/**
 * Stops delivery. Monitoring stops as well when exactly one online and one offline subscription are counted; the
 * online one is then forgotten and the offline one is not, so that neither of them starts monitoring again. In every
 * other case monitoring goes on and its events are dropped.
 */
void disableNetworkIndication();

/* Events (AlertThread.cpp). */

/** The one event between the callback and its thread; a later event replaces one that has not been read yet. */
struct NetworkIndicationData {
    std::string nodeString; ///< path of the node as it was at the event
    Orv::DateTime eventTime;
    std::uint32_t userData = 0; ///< reserved: 0 at every event
};

extern NetworkIndicationData indicationNetworkData;

/** The thread of the latest event, as the broker named it; null when it could not be created. */
extern CMPI_THREAD_TYPE ind_thread_id;

/** The agent's callback: starts a thread for an event of code 0 while delivery is enabled, and drops all others. */
void NetworkAdapterHandler(unsigned int indicationClass, Orv::DateTime time, std::string nodeString,
                           const void* data);

/** Body of the thread of one event. The argument is not looked at; returns null. */
void* NetworkAlertThread(void* parm);

/** Builds and delivers the indication of one event, if it means one. The thread is attached to the broker meanwhile.
 */
void processNetworkIndication(Orv::DateTime time, std::string nodeString);

/**
 * What the node's status means: class name and event word, with the node's description and identity. False when
 * nothing is to be sent: for a status that means no event (the event word is then "Failed"), or when the agent fails.
 * A path that selects no node leaves all four texts alone and is no reason not to send.
 */
bool getNetworkProperties(std::string nodeString, std::string& indicationClassName, std::string& eventWord,
                          std::string& description, std::string& name);

/* What is sent (IndicationInstance.cpp, DateTimeText.cpp). */

/**
 * An indication with all its properties, made by _alertBroker in the scope of the attached thread. Null, or what the
 * broker gave instead, when one of its paths or itself cannot be made. `name` is the identity of the adapter's node.
 * An event word without a message gives severity 0 and empty texts. Nothing is thrown.
 */
CMPIInstance* createNetworkAdapterIndicationInstance(std::string indicationClassName, std::string description,
                                                     Orv::DateTime time, std::string eventWord, std::string name);

/**
 * A time as yyyymmddhhmmss.mmmmmmsutc (DSP0004), the way the consumers of these indications have always met it: the
 * six digits after the point are milliseconds, the year has no leading zeros, and a minus sign counts among the three
 * characters of the offset, so that one hour west of UTC is "-60".
 */
std::string convertCIMDateTime(Orv::DateTime time);

/** `count` zeros. */
std::string addZero(unsigned char count);

} // namespace Orv::NetworkAdapterComposite

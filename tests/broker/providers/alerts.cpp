#include "tests/broker/providers/alerts.h"

#include <atomic>
#include <map>
#include <mutex>
#include <stdexcept>
#include <string>

#include <cmpimacs.h>

namespace {

std::mutex mutex; // guards calls and misbehaviour
std::string calls;
std::map<std::string, int> misbehaviour;

const CMPIBroker* broker = nullptr;
std::atomic<const CMPIContext*> savedContext{nullptr}; // prepared at the latest activation
std::atomic<bool> isHeld{false};
std::atomic<unsigned> nextNumber{0};
std::atomic<unsigned> ended{0};
std::atomic<unsigned> failed{0};
std::string burstClass; // set before the threads start

enum class Provider { first, second };

template <Provider P>
constexpr const char* name = P == Provider::first ? "FirstAlerts" : "SecondAlerts";

std::string textOf(const CMPIString* string) {
    return string == nullptr ? "(null)" : CMGetCharPtr(string);
}

int misbehaviourOf(const std::string& key) {
    const std::lock_guard lock(mutex);
    const auto found = misbehaviour.find(key);
    return found == misbehaviour.end() ? 0 : found->second;
}

CMPIStatus record(const char* provider, const char* function, const std::string& arguments) {
    {
        const std::lock_guard lock(mutex);
        calls += std::string(provider) + " " + function + arguments + "\n";
    }
    switch (misbehaviourOf(std::string(provider) + "." + function)) {
    case 1: {
        CMPIStatus status{};
        CMSetStatusWithChars(broker, &status, CMPI_RC_ERR_ACCESS_DENIED, "not for you");
        return status;
    }
    case 2:
        throw std::runtime_error("the provider's text");
    default:
        return {CMPI_RC_OK, nullptr};
    }
}

std::string describe(const CMPISelectExp* filter, const char* className, const CMPIObjectPath* path) {
    return " [" + textOf(filter->ft->getString(filter, nullptr)) + "] " + className + " " +
           textOf(CMGetNameSpace(path, nullptr)) + ":" + textOf(CMGetClassName(path, nullptr)) + "." +
           std::to_string(CMGetKeyCount(path, nullptr));
}

int deliverHere(const CMPIContext* context, const char* nameSpace, const char* className, unsigned number,
                const std::string& extra) {
    CMPIObjectPath* path = CMNewObjectPath(broker, nameSpace, className, nullptr);
    CMPIInstance* instance = CMNewInstance(broker, path, nullptr);
    if (instance == nullptr) {
        return -1;
    }
    CMSetProperty(instance, "Number", &number, CMPI_uint32);
    CMSetProperty(instance, "Text", "text", CMPI_chars);
    if (const std::size_t at = extra.find('='); at != std::string::npos) {
        CMSetProperty(instance, extra.substr(0, at).c_str(), extra.substr(at + 1).c_str(), CMPI_chars);
    }
    return CBDeliverIndication(broker, context, nameSpace, instance).rc;
}

CMPIStatus cleanup(CMPIIndicationMI*, const CMPIContext*, CMPIBoolean) {
    return {CMPI_RC_OK, nullptr};
}

template <Provider P>
CMPIStatus authorizeFilter(CMPIIndicationMI*, const CMPIContext*, const CMPISelectExp* filter, const char* className,
                           const CMPIObjectPath* path, const char* owner) {
    return record(name<P>, "authorizeFilter", describe(filter, className, path) + " " + owner);
}

template <Provider P>
CMPIStatus mustPoll(CMPIIndicationMI*, const CMPIContext*, const CMPISelectExp* filter, const char* className,
                    const CMPIObjectPath* path) {
    return record(name<P>, "mustPoll", describe(filter, className, path));
}

template <Provider P>
CMPIStatus activateFilter(CMPIIndicationMI*, const CMPIContext* context, const CMPISelectExp* filter,
                          const char* className, const CMPIObjectPath* path, CMPIBoolean first) {
    savedContext = CBPrepareAttachThread(broker, context);
    if (misbehaviourOf(std::string(name<P>) + ".deliver") != 0) {
        deliverHere(context, "root/test", CMGetCharPtr(CMGetClassName(path, nullptr)), 1, "");
    }
    return record(name<P>, "activateFilter", describe(filter, className, path) + " first=" + std::to_string(first));
}

template <Provider P>
CMPIStatus deActivateFilter(CMPIIndicationMI*, const CMPIContext*, const CMPISelectExp* filter, const char* className,
                            const CMPIObjectPath* path, CMPIBoolean last) {
    return record(name<P>, "deActivateFilter", describe(filter, className, path) + " last=" + std::to_string(last));
}

template <Provider P>
CMPIStatus enableIndications(CMPIIndicationMI*, const CMPIContext*) {
    return record(name<P>, "enableIndications", "");
}

template <Provider P>
CMPIStatus disableIndications(CMPIIndicationMI*, const CMPIContext*) {
    return record(name<P>, "disableIndications", "");
}

CMPIStatus collection(CMPIIndicationMI*, const CMPIContext*, const CMPIInstance*) {
    return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
}

CMPIStatus activeCollection(CMPIIndicationMI*, const CMPIContext*, const CMPIInstance*, CMPIBoolean) {
    return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
}

template <Provider P>
CMPIIndicationMI* interfaceOf(const CMPIBroker* mb) {
    static const CMPIIndicationMIFT table = {
        CMPI_VERSION,         CMPI_VERSION,          "indicationAlerts", cleanup,
        authorizeFilter<P>,   mustPoll<P>,           activateFilter<P>,  deActivateFilter<P>,
        enableIndications<P>, disableIndications<P>, collection,         activeCollection,
        activeCollection};
    static CMPIIndicationMI interface = {nullptr, &table};
    broker = mb;
    return &interface;
}

/** What a provider does with one event. */
void* deliverOne(void*) {
    while (isHeld) {
        broker->xft->threadSleep(1);
    }
    const unsigned number = nextNumber++;
    if (alerts_deliver("root/test", burstClass.c_str(), number, "") != CMPI_RC_OK) {
        ++failed;
    }
    ++ended;
    return nullptr;
}

} // namespace

CMPI_EXTERN_C CMPIIndicationMI* FirstAlerts_Create_IndicationMI(const CMPIBroker* mb, const CMPIContext*,
                                                                CMPIStatus*) {
    return interfaceOf<Provider::first>(mb);
}

CMPI_EXTERN_C CMPIIndicationMI* SecondAlerts_Create_IndicationMI(const CMPIBroker* mb, const CMPIContext*,
                                                                 CMPIStatus*) {
    return interfaceOf<Provider::second>(mb);
}

CMPI_EXTERN_C const char* alerts_takeCalls(void) {
    static std::string taken;
    const std::lock_guard lock(mutex);
    taken = std::move(calls);
    calls.clear();
    return taken.c_str();
}

CMPI_EXTERN_C void alerts_misbehave(const char* provider, const char* function, int mode) {
    const std::lock_guard lock(mutex);
    misbehaviour[std::string(provider) + "." + function] = mode;
}

CMPI_EXTERN_C int alerts_deliver(const char* nameSpace, const char* className, unsigned number, const char* extra) {
    CMPIContext* context = CBPrepareAttachThread(broker, savedContext.load());
    if (CBAttachThread(broker, context).rc != CMPI_RC_OK) {
        return -1;
    }
    const int code = deliverHere(context, nameSpace, className, number, extra);
    CBDetachThread(broker, context);
    return code;
}

CMPI_EXTERN_C void alerts_burst(const char* className, unsigned count) {
    burstClass = className;
    nextNumber = 0;
    ended = 0;
    failed = 0;
    for (unsigned i = 0; i < count; ++i) {
        while (broker->xft->newThread(deliverOne, nullptr, 1) == nullptr) {
            broker->xft->threadSleep(1);
        }
    }
}

CMPI_EXTERN_C void alerts_hold(int held) {
    isHeld = held != 0;
}

CMPI_EXTERN_C unsigned alerts_ended(void) {
    return ended;
}

CMPI_EXTERN_C unsigned alerts_failed(void) {
    return failed;
}

#include "host/cimom/Subscriptions.h"

#include "host/cimom/ClassChecks.h"
#include "host/cimom/IndicationCall.h"
#include "host/cimom/QueryText.h"
#include "host/cimom/References.h"

#include <algorithm>
#include <utility>

namespace marlo {

namespace {

/** The class of a filter or of an indication is one, or there is a reason why not. */
std::string indicationFault(const Class& definition) {
    return definition.isIndication ? "" : definition.name + " is not a class of indications";
}

/** One step of a delivery, which does not keep the others from being done; the last failure is the outcome. */
template <typename Step>
void attempt(const Step& step, OnceLog& log, broker::Outcome& outcome) {
    try {
        step();
    } catch (...) {
        outcome = {CMPI_RC_ERR_FAILED, "a subscriber threw: " + currentExceptionText()};
        log.say(outcome.message);
    }
}

} // namespace

/** Holds the right to tell providers. Refused to a sink that runs below such a call on the same thread. */
class Subscriptions::Setup {
  public:
    explicit Setup(Subscriptions& subscriptions) : _subscriptions(subscriptions) {
        if (_subscriptions._setupThread == std::this_thread::get_id()) {
            throw RequestError(CMPI_RC_ERR_FAILED, "the provider of a subscription is being told of another one");
        }
        _subscriptions._setupMutex.lock();
        _subscriptions._setupThread = std::this_thread::get_id();
    }

    ~Setup() {
        _subscriptions._setupThread = std::thread::id();
        _subscriptions._setupMutex.unlock();
    }

    Setup(const Setup&) = delete;
    Setup& operator=(const Setup&) = delete;

  private:
    Subscriptions& _subscriptions;
};

std::shared_ptr<const Subscriptions::List> Subscriptions::list() const {
    const std::lock_guard lock(_listMutex);
    return _list;
}

/** Throws RequestError when no more are taken. */
void Subscriptions::add(SubscriptionId id, const Entry& entry) {
    const std::lock_guard lock(_listMutex);
    if (_ended) {
        throw RequestError(CMPI_RC_ERR_FAILED, "the object manager ends");
    }
    auto changed = std::make_shared<List>(*_list);
    changed->emplace_back(id, entry);
    _list = std::move(changed);
}

/** The entry of a number, or null. */
Subscriptions::Entry Subscriptions::remove(SubscriptionId id) {
    const std::lock_guard lock(_listMutex);
    auto changed = std::make_shared<List>(*_list);
    const auto found =
        std::find_if(changed->begin(), changed->end(), [id](const auto& entry) { return entry.first == id; });
    if (found == changed->end()) {
        return nullptr;
    }
    Entry entry = found->second;
    changed->erase(found);
    _list = std::move(changed);
    return entry;
}

Subscriptions::Entry Subscriptions::makeEntry(const std::string& nameSpace, const std::string& text,
                                              const std::string& language,
                                              const ObjectManager::RoundSink& sink) const {
    filter::Filter filter = readQuery(_schema, nameSpace, text, language, "the filter");
    const Class& definition = *_schema.findClass(nameSpace, filter.className());
    if (const std::string fault = indicationFault(definition); !fault.empty()) {
        throw RequestError(CMPI_RC_ERR_INVALID_CLASS, fault);
    }
    return std::make_shared<Subscription>(_broker, std::move(filter), nameSpace, definition.name, sink);
}

/**
 * Who gives the indications of a filter: the providers of its class and of the classes that derive from it. A
 * provider of the nearest superclass that has one gives those of a class that has none of its own.
 */
std::vector<Subscription::Activation> Subscriptions::servicesOf(const Subscription& entry) const {
    std::vector<Subscription::Activation> services;
    const auto addServices = [&](const std::string& registered, const std::string& asked) {
        for (const auto& provider : _providers) {
            if (provider->serves(ProviderKind::indication, entry.nameSpace(), registered)) {
                services.push_back({provider.get(), asked});
            }
        }
    };
    const Class* ancestor = _schema.findClass(entry.nameSpace(), entry.fromClass());
    while (services.empty() && ancestor != nullptr) {
        addServices(ancestor->name, entry.fromClass());
        ancestor = _schema.findClass(entry.nameSpace(), ancestor->superClass);
    }
    for (const Class* derived : _schema.withSubclasses(entry.nameSpace(), entry.fromClass())) {
        if (derived->name != entry.fromClass()) {
            addServices(derived->name, derived->name);
        }
    }
    if (services.empty()) {
        throw RequestError(CMPI_RC_ERR_NOT_SUPPORTED,
                           "no provider gives the indications of " + entry.fromClass() + " in " + entry.nameSpace());
    }
    return services;
}

/** All steps for one provider and class, or none of them. */
Status Subscriptions::activate(Subscription& entry, const Subscription::Activation& activation) {
    Provider& provider = *activation.provider;
    IndicationCall call(_broker, provider, entry.filterHandle(), entry.nameSpace(), entry.fromClass(),
                        activation.className);
    int& ofClass = _activations[{&provider, entry.nameSpace(), activation.className}];
    int& ofProvider = _activationsOfProvider[&provider];
    Status status = call.authorize();
    if (status.ok()) {
        status = call.askWhetherToPoll();
    }
    if (status.ok()) {
        status = call.activate(ofClass == 0);
    }
    if (!status.ok()) {
        return status;
    }
    if (ofProvider == 0) {
        status = call.enable();
        if (!status.ok()) {
            static_cast<void>(call.deactivate(ofClass == 0)); // what made it fail is what the client is told
            return status;
        }
    }
    ++ofClass;
    ++ofProvider;
    entry.activations.push_back(activation);
    return {};
}

Status Subscriptions::deactivate(const Subscription& entry, const Subscription::Activation& activation) {
    Provider& provider = *activation.provider;
    IndicationCall call(_broker, provider, entry.filterHandle(), entry.nameSpace(), entry.fromClass(),
                        activation.className);
    int& ofClass = _activations[{&provider, entry.nameSpace(), activation.className}];
    int& ofProvider = _activationsOfProvider[&provider];
    Status status = call.deactivate(--ofClass == 0);
    if (--ofProvider == 0) {
        const Status disabled = call.disable();
        if (status.ok()) {
            status = disabled;
        }
    }
    return status;
}

/** Ends what was activated last first; goes on after a failure and answers the first one. */
Status Subscriptions::deactivateAll(Subscription& entry) {
    Status status;
    while (!entry.activations.empty()) {
        const Status ended = deactivate(entry, entry.activations.back());
        entry.activations.pop_back();
        if (status.ok()) {
            status = ended;
        }
    }
    return status;
}

Status Subscriptions::subscribe(const std::string& nameSpace, const std::string& text, const std::string& language,
                                const ObjectManager::RoundSink& sink, SubscriptionId& id) {
    id = 0;
    const Entry entry = makeEntry(nameSpace, text, language, sink);
    const auto services = servicesOf(*entry);
    Status status;
    {
        const Setup setup(*this);
        const SubscriptionId given = ++_lastId;
        add(given, entry); // before anything is activated, so that not even the first indication is missed
        for (const Subscription::Activation& service : services) {
            status = activate(*entry, service);
            if (!status.ok()) {
                static_cast<void>(deactivateAll(*entry));
                remove(given);
                break;
            }
        }
        id = status.ok() ? given : 0;
    }
    if (!status.ok()) {
        entry->close(); // without the right to tell: a sink that is waited for may want it
    }
    return status;
}

Status Subscriptions::unsubscribe(SubscriptionId id) {
    Status status;
    Entry entry;
    {
        const Setup setup(*this);
        entry = remove(id);
        if (entry == nullptr) {
            return {CMPI_RC_ERR_NOT_FOUND, "there is no such subscription", {}};
        }
        status = deactivateAll(*entry);
    }
    entry->close();
    return status;
}

void Subscriptions::end() {
    {
        const std::lock_guard lock(_listMutex);
        _ended = true;
    }
    while (!list()->empty()) {
        const Status status = unsubscribe(list()->front().first);
        if (!status.ok() && status.code != CMPI_RC_ERR_NOT_FOUND) {
            _log.say(status.message);
        }
    }
}

/** The indication as its class has it; nothing, and why, when it is none. */
std::optional<Instance> Subscriptions::check(const std::string& given, Instance&& indication,
                                             broker::Outcome& outcome) {
    const std::string nameSpace = spellNameSpace(_schema, given);
    const std::string& className = indication.path.className;
    const auto deliverer = std::find_if(_providers.begin(), _providers.end(), [&](const auto& provider) {
        return provider->serves(ProviderKind::indication, nameSpace, className);
    });
    const std::string name = deliverer == _providers.end() ? "of nobody" : (*deliverer)->registration().name;
    try {
        const Class& definition = requireClass(_schema, nameSpace, className);
        std::string fault = indicationFault(definition);
        if (fault.empty() && definition.isAbstract) {
            fault = definition.name + " is abstract";
        }
        if (!fault.empty()) {
            throw RequestError(CMPI_RC_ERR_INVALID_CLASS, fault);
        }
        InstanceChecks checks(_schema, nameSpace, definition, name, _log);
        auto checked = checks.checkInstance(std::move(indication), std::nullopt);
        if (!checked) {
            outcome = {CMPI_RC_ERR_INVALID_PARAMETER, "the indication's path has keys that its class has not"};
        }
        return checked;
    } catch (const RequestError& error) {
        _log.say("provider " + name + ": an indication is dropped: " + error.what());
        outcome = {error.code(), error.what()};
        return std::nullopt;
    }
}

broker::Outcome Subscriptions::deliver(const std::string& nameSpace, Instance&& indication) {
    {
        const std::lock_guard lock(_listMutex);
        if (_ended && _list->empty()) {
            return {CMPI_RC_ERR_FAILED, "the object manager has ended"};
        }
    }
    broker::Outcome outcome;
    const auto checked = check(nameSpace, std::move(indication), outcome);
    if (!checked) {
        return outcome;
    }
    const auto subscribed = list(); // held, as others may unsubscribe meanwhile
    DeliveryRound round;
    for (const auto& each : *subscribed) {
        const auto hand = [&] {
            if (each.second->wants(*checked, _knowledge)) {
                each.second->deliver(*checked, round);
            }
        };
        attempt(hand, _log, outcome);
    }
    for (const auto& each : round._works) {
        attempt(each.second, _log, outcome);
    }
    return outcome;
}

} // namespace marlo

/** @file What clients change: filters, destinations and subscriptions that come, change and go. */
#include "host/subscriptions/Changing.h"

#include "host/cimom/Principal.h"
#include "host/subscriptions/Completion.h"
#include "host/subscriptions/Presence.h"

#include <algorithm>
#include <stdexcept>
#include <utility>

namespace marlo::subscriptions {

namespace {

/** Undoes a step unless what follows it has succeeded. */
class Undo {
  public:
    explicit Undo(std::function<void()> step) : _step(std::move(step)) {}

    ~Undo() {
        try {
            if (_step) {
                _step();
            }
        } catch (...) { // what made the steps fail is what the client is told
        }
    }

    Undo(const Undo&) = delete;
    Undo& operator=(const Undo&) = delete;

    void forget() { _step = nullptr; }

  private:
    std::function<void()> _step;
};

bool contains(const std::vector<std::string>& names, const char* name) {
    return std::any_of(names.begin(), names.end(),
                       [name](const std::string& each) { return equalNames(each, name); });
}

/** Who refers to an object, the first ones by name. */
std::string listOf(const std::vector<ObjectPointer>& referring) {
    constexpr std::size_t shown = 3;
    std::string list;
    for (std::size_t i = 0; i < std::min(shown, referring.size()); ++i) {
        list += (list.empty() ? "" : ", ") + referring[i]->path();
    }
    return referring.size() <= shown ? list : list + " and " + std::to_string(referring.size() - shown) + " more";
}

delivery::Subscription deliveryOf(const Object& subscription, const Object& destination) {
    delivery::Subscription known;
    known.key = subscription.key();
    known.destination = destination.key();
    known.onFatalError = static_cast<delivery::OnFatalError>(
        numberOf(subscription.instance, "OnFatalErrorPolicy")
            .value_or(static_cast<std::uint64_t>(delivery::OnFatalError::ignore)));
    constexpr std::uint64_t longest = 3'000'000'000; // more seconds than any policy waits for
    known.failureTrigger = std::chrono::seconds(
        std::min(numberOf(subscription.instance, "FailureTriggerTimeInterval").value_or(0), longest));
    return known;
}

} // namespace

ObjectPointer Service::require(const ObjectPath& path) const {
    ObjectPointer found = _registry.find(path.toString());
    if (found == nullptr) {
        throw RequestError(CMPI_RC_ERR_NOT_FOUND, "there is no instance " + path.toString());
    }
    return found;
}

void Service::requireRoom(Kind kind, std::size_t most) const {
    if (_registry.count(kind) >= most) {
        throw RequestError(CMPI_RC_ERR_FAILED, "there are " + std::to_string(most) + " of these, which is the limit");
    }
}

ObjectPointer Service::filterOf(const Object& subscription) const {
    return _registry.find(targetOf(subscription, "Filter"));
}

void Service::setDestination(const Object& destination) {
    delivery::Destination known;
    known.key = destination.key();
    known.url = textOf(destination.instance, "Destination");
    if (_options.trust) {
        _options.trust(known);
    }
    try {
        try {
            _delivery->setDestination(known);
        } catch (const std::invalid_argument& error) {
            if (_isOpen || known.authorityFile.empty()) {
                throw;
            }
            // A queue that is not claimed at the start would be lost; with those whom the system trusts it waits.
            say(std::string(error.what()) + ": " + known.url);
            known.authorityFile.clear();
            _delivery->setDestination(known);
        }
    } catch (const std::invalid_argument& error) {
        throw RequestError(CMPI_RC_ERR_INVALID_PARAMETER, std::string("Destination: ") + error.what());
    }
}

void Service::setSubscription(const Object& subscription) {
    const ObjectPointer destination = _registry.find(targetOf(subscription, "Handler"));
    if (destination == nullptr) {
        throw RequestError(CMPI_RC_ERR_INVALID_PARAMETER,
                           "there is no destination " + targetOf(subscription, "Handler"));
    }
    _delivery->setSubscription(deliveryOf(subscription, *destination));
}

/** On disk, and seen by clients. */
void Service::keep(Object&& object) {
    _records.add(object);
    _registry.put(std::make_shared<const Object>(std::move(object)));
}

void Service::replace(Object&& changed) {
    _records.replace(changed);
    _registry.put(std::make_shared<const Object>(std::move(changed)));
}

Status Service::create(const Class& definition, const Instance& instance, ObjectPath& created) {
    const auto kind = kindOf(definition.name);
    if (!kind) {
        return BuiltIn::create(definition, instance, created);
    }
    const Changing changing(*this);
    changing.requireOpen();
    Object object{_lastId + 1, *kind, false, actingPrincipal(), instance};
    completeKeys(schema(), object);
    if (_registry.find(object.path()) != nullptr) {
        return {CMPI_RC_ERR_ALREADY_EXISTS, "there is one already: " + object.path(), {}};
    }
    ++_lastId;
    created = object.instance.path;
    switch (*kind) {
    case Kind::filter:
        return addFilter(std::move(object));
    case Kind::destination:
        return addDestination(std::move(object));
    case Kind::subscription:
        break;
    }
    return addSubscription(std::move(object));
}

Status Service::addFilter(Object&& object) {
    requireRoom(Kind::filter, mostFilters);
    completeFilter(schema(), object.instance);
    keep(std::move(object));
    return {};
}

Status Service::addDestination(Object&& object) {
    requireRoom(Kind::destination, mostDestinations);
    completeDestination(object.instance);
    setDestination(object);
    Undo undo([this, key = object.key()] { _delivery->removeDestination(key); });
    keep(std::move(object));
    undo.forget();
    return {};
}

Status Service::addSubscription(Object&& object) {
    requireRoom(Kind::subscription, mostSubscriptions);
    completeSubscription(object.instance, std::chrono::system_clock::now());
    const ObjectPointer filter = filterOf(object);
    if (filter == nullptr) {
        throw RequestError(CMPI_RC_ERR_INVALID_PARAMETER, "there is no filter " + targetOf(object, "Filter"));
    }
    if (numberOf(filter->instance, "IndividualSubscriptionSupported") == 0U) {
        throw RequestError(CMPI_RC_ERR_INVALID_PARAMETER,
                           "the filter is not for subscriptions to itself (IndividualSubscriptionSupported)");
    }
    setSubscription(object);
    Undo undo([this, id = object.id, key = object.key()] {
        static_cast<void>(_activations.stop(id));
        _delivery->removeSubscription(key);
    });
    if (isWanted(object)) {
        if (Status status = _activations.start(object, filter->instance); !status.ok()) {
            return status;
        }
    }
    keep(std::move(object));
    undo.forget();
    wakeExpiry();
    return {};
}

Status Service::modify(const Class& definition, const Instance& instance, const std::vector<std::string>& names) {
    const auto kind = kindOf(definition.name);
    if (!kind) {
        return BuiltIn::modify(definition, instance, names);
    }
    const Changing changing(*this);
    changing.requireOpen();
    const ObjectPointer former = require(instance.path);
    if (former->isFixed) {
        throw RequestError(CMPI_RC_ERR_NOT_SUPPORTED, former->path() + " is the server's own and stays as it is");
    }
    Object changed = *former;
    for (const std::string& name : names) {
        const NamedValue* value = findName(instance.properties, name);
        set(changed.instance, name, value == nullptr ? Value{} : value->value);
    }
    switch (*kind) {
    case Kind::filter:
        if (contains(names, "SourceNamespace") && !contains(names, "SourceNamespaces")) {
            set(changed.instance, "SourceNamespaces", Value::null(CMPI_stringA)); // one of the two is what counts
        } else if (contains(names, "SourceNamespaces")) {
            set(changed.instance, "SourceNamespace", Value::null(CMPI_string));
        }
        return changeFilter(*former, std::move(changed));
    case Kind::destination:
        return changeDestination(*former, std::move(changed));
    case Kind::subscription:
        break;
    }
    return changeSubscription(*former, std::move(changed));
}

/** Activates another filter for subscriptions, or leaves all with the former one. */
Status Service::restartAll(const std::vector<ObjectPointer>& subscriptions, const Instance& filter,
                           const Instance& former) {
    for (auto each = subscriptions.begin(); each != subscriptions.end(); ++each) {
        Status status = _activations.start(**each, filter);
        if (!status.ok()) {
            for (auto done = subscriptions.begin(); done != each; ++done) {
                static_cast<void>(_activations.start(**done, former));
            }
            return status;
        }
    }
    return {};
}

Status Service::changeFilter(const Object& former, Object&& changed) {
    completeFilter(schema(), changed.instance);
    auto active = _registry.referringTo(former.path());
    active.erase(std::remove_if(active.begin(), active.end(),
                                [this](const ObjectPointer& each) { return !_activations.isActive(each->id); }),
                 active.end());
    if (Status status = restartAll(active, changed.instance, former.instance); !status.ok()) {
        return status;
    }
    Undo undo([&] { static_cast<void>(restartAll(active, former.instance, former.instance)); });
    replace(std::move(changed));
    undo.forget();
    return {};
}

Status Service::changeDestination(const Object& former, Object&& changed) {
    completeDestination(changed.instance);
    setDestination(changed);
    Undo undo([&] { setDestination(former); });
    replace(std::move(changed));
    undo.forget();
    return {};
}

Status Service::changeSubscription(const Object& former, Object&& changed) {
    checkSubscription(changed.instance);
    const ObjectPointer filter = filterOf(changed);
    if (!numberOf(changed.instance, "SubscriptionState")) {
        set(changed.instance, "SubscriptionState", number16(stateEnabled));
    }
    if (isWanted(changed) != isWanted(former)) {
        set(changed.instance, "TimeOfLastStateChange", timeValue(std::chrono::system_clock::now()));
    }
    const bool wasActive = _activations.isActive(former.id);
    setSubscription(changed);
    Undo undo([&] {
        setSubscription(former);
        if (!wasActive) {
            static_cast<void>(_activations.stop(former.id));
        }
    });
    if (isWanted(changed) && !wasActive) {
        Status status = filter == nullptr ? Status{CMPI_RC_ERR_FAILED, "its filter is gone", {}}
                                          : _activations.start(changed, filter->instance);
        if (!status.ok()) {
            return status;
        }
    }
    const bool stops = !isWanted(changed);
    replace(std::move(changed));
    undo.forget();
    if (stops) {
        static_cast<void>(_activations.stop(former.id)); // what waits is still delivered
    }
    wakeExpiry();
    return {};
}

Status Service::remove(const Class& definition, const ObjectPath& path) {
    const auto kind = kindOf(definition.name);
    if (!kind) {
        return BuiltIn::remove(definition, path);
    }
    const Changing changing(*this);
    changing.requireOpen();
    const ObjectPointer object = require(path);
    if (object->isFixed) {
        throw RequestError(CMPI_RC_ERR_NOT_SUPPORTED, object->path() + " is the server's own and stays");
    }
    if (*kind == Kind::subscription) {
        removeSubscription(*object);
        return {};
    }
    if (const auto referring = _registry.referringTo(object->path()); !referring.empty()) {
        return {CMPI_RC_ERR_FAILED, "it is still subscribed with: " + listOf(referring), {}};
    }
    _records.remove({object->id});
    _registry.remove(object->id);
    if (*kind == Kind::destination) {
        _delivery->removeDestination(object->key());
    }
    return {};
}

/** From the disk first: what is not there cannot come back. */
void Service::removeSubscription(const Object& subscription) {
    _records.remove({subscription.id});
    _registry.remove(subscription.id);
    static_cast<void>(_activations.stop(subscription.id));
    _delivery->removeSubscription(subscription.key());
}

/** What waits is forgotten: it would wait for a listener that does not answer. */
void Service::disable(const Object& subscription) {
    static_cast<void>(_activations.stop(subscription.id));
    _delivery->removeSubscription(subscription.key());
    Object changed = subscription;
    set(changed.instance, "SubscriptionState", number16(stateDisabled));
    set(changed.instance, "TimeOfLastStateChange", timeValue(std::chrono::system_clock::now()));
    replace(std::move(changed));
}

} // namespace marlo::subscriptions

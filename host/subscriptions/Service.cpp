#include "host/subscriptions/Service.h"

#include "host/cimom/Interop.h"
#include "host/subscriptions/Changing.h"
#include "host/subscriptions/Completion.h"
#include "host/subscriptions/Presence.h"

#include <algorithm>
#include <array>
#include <cstdlib>
#include <utility>

namespace marlo::subscriptions {

namespace {

/** Filters that are there for everyone: the events of the adapters. */
struct FixedFilter {
    const char* name;
    const char* className;
};

constexpr const char* adapterNameSpace = "root/tavis";
constexpr std::array<FixedFilter, 4> fixedFilters{{
    {"marlo:adapter-online", "MARLO_NetworkAdapterOnlineEvent"},
    {"marlo:adapter-offline", "MARLO_NetworkAdapterOfflineEvent"},
    {"marlo:adapter-switch-over", "MARLO_NetworkAdapterSwitchOverEvent"},
    {"marlo:adapter-switch-back", "MARLO_NetworkAdapterSwitchBackEvent"},
}};

/** How long to leave alone what could not be removed, from a full disk for instance. */
constexpr std::chrono::minutes expiryRetry(1);
/** The clock may be set: it is looked at again after this. */
constexpr std::chrono::hours longestSleep(1);

} // namespace

Service::Service(ObjectManager& manager, Options options)
    : _manager(manager),
      _options(std::move(options)),
      _delivery(std::make_shared<delivery::Delivery>(
          _options.database, _options.delivery,
          [this](const std::string& subscription, delivery::OnFatalError policy) {
              applyPolicy(subscription, policy);
          },
          [this](const std::string& line) { say(line); })),
      _activations(manager, _delivery, _options.mayRead),
      _records(_options.database) {}

Service::~Service() {
    stop(std::chrono::milliseconds(0));
}

void Service::say(const std::string& line) const {
    if (_options.log) {
        _options.log(line);
    }
}

/** What does not outlive a restart goes from the disk, together with what is subscribed for it. */
void Service::load() {
    _lastId = _records.lastId();
    std::vector<Object> objects = _records.load(schema(), [this](const std::string& line) { say(line); });
    std::vector<std::string> goneDestinations;
    for (const Object& each : objects) {
        if (each.kind == Kind::destination && numberOf(each.instance, "PersistenceType") == persistenceTransient) {
            goneDestinations.push_back(each.path());
        }
    }
    const auto isGone = [&goneDestinations](const std::string& path) {
        return std::find(goneDestinations.begin(), goneDestinations.end(), path) != goneDestinations.end();
    };
    const Time now = std::chrono::system_clock::now();
    std::vector<Id> gone;
    for (Object& each : objects) {
        const auto end = each.kind == Kind::subscription ? endOf(each.instance) : std::nullopt;
        if (isGone(each.path()) || isGone(targetOf(each, "Handler")) || (end && *end <= now)) {
            gone.push_back(each.id);
        } else {
            _registry.put(std::make_shared<const Object>(std::move(each)));
        }
    }
    if (!gone.empty()) {
        _records.remove(gone);
    }
}

/** Made once, so that their paths stay what they are when the host gets another name. */
void Service::makeFixedFilters() {
    const auto filters = _registry.all(Kind::filter);
    for (const FixedFilter& fixed : fixedFilters) {
        const bool isThere = std::any_of(filters.begin(), filters.end(), [&fixed](const ObjectPointer& each) {
            return each->isFixed && textOf(each->instance, "Name") == fixed.name;
        });
        if (isThere || schema().findClass(adapterNameSpace, fixed.className) == nullptr) {
            continue;
        }
        Object object{++_lastId, Kind::filter, true, "", {{"", interop, filterClass, {}}, {}}};
        set(object.instance, "Name", Value::string(fixed.name));
        set(object.instance, "ElementName", Value::string(fixed.className));
        set(object.instance, "SourceNamespaces", textArray({adapterNameSpace}));
        set(object.instance, "Query", Value::string(std::string("SELECT * FROM ") + fixed.className));
        set(object.instance, "QueryLanguage", Value::string("WQL"));
        set(object.instance, "IndividualSubscriptionSupported", Value::boolean(true));
        completeKeys(schema(), object);
        completeFilter(schema(), object.instance);
        keep(std::move(object));
    }
}

/** What fails is logged: the others shall work. */
void Service::activateAtStart(const Object& subscription) {
    const ObjectPointer filter = filterOf(subscription);
    const Status status = filter == nullptr ? Status{CMPI_RC_ERR_FAILED, "its filter is gone", {}}
                                            : _activations.start(subscription, filter->instance);
    if (!status.ok()) {
        say("subscription disabled: " + status.message + ": " + subscription.path());
    }
}

/** One object that fails is logged, and the others have their turn. */
void Service::guard(const char* failure, const Object& object, const std::function<void()>& step) const {
    try {
        step();
    } catch (const std::exception& error) {
        say(std::string(failure) + ": " + error.what() + ": " + object.path());
    }
}

bool Service::mayRead(const Object& subscription) const {
    return !_options.mayRead || _options.mayRead(subscription.owner);
}

void Service::start() {
    const Changing changing(*this);
    load();
    makeFixedFilters();
    const char* failure = "cannot be delivered";
    for (const ObjectPointer& each : _registry.all(Kind::destination)) {
        guard(failure, *each, [&] { setDestination(*each); });
    }
    for (const ObjectPointer& each : _registry.all(Kind::subscription)) {
        guard(failure, *each, [&] {
            if (mayRead(*each)) {
                setSubscription(*each);
            } // else delivery forgets what waits for it
            if (isWanted(*each)) {
                activateAtStart(*each);
            }
        });
    }
    _delivery->start();
    _isOpen = true;
    _expiry = std::thread([this] { runExpiry(); });
}

void Service::stop(std::chrono::milliseconds patience) {
    {
        const std::lock_guard lock(_expiryMutex);
        if (std::exchange(_isEnding, true)) {
            return;
        }
    }
    _expiryWake.notify_all();
    if (_expiry.joinable()) {
        _expiry.join();
    }
    {
        const Changing changing(*this);
        _isOpen = false;
        _activations.stopAll();
    }
    _delivery->stop(patience); // without the right to change: its policy thread may want it
}

/** Owners first: a destination that changes is sent at once what waits for it. */
void Service::review() {
    const Changing changing(*this);
    changing.requireOpen();
    const char* failure = "goes on as before";
    for (const ObjectPointer& each : _registry.all(Kind::subscription)) {
        guard(failure, *each, [&] { reviewOwner(*each); });
    }
    for (const ObjectPointer& each : _registry.all(Kind::destination)) {
        guard(failure, *each, [&] { setDestination(*each); });
    }
}

/** What waits goes as well: it was queued for somebody who is not to be told of anything any more. */
void Service::reviewOwner(const Object& subscription) {
    const bool isActive = _activations.isActive(subscription.id);
    if (!mayRead(subscription)) {
        if (isActive) {
            static_cast<void>(_activations.stop(subscription.id));
            say("subscription disabled, and what waits for it is discarded: user '" + subscription.owner +
                "' may not read: " + subscription.path());
        }
        _delivery->removeSubscription(subscription.key());
    } else if (isWanted(subscription) && !isActive) {
        setSubscription(subscription);
        activateAtStart(subscription);
    }
}

void Service::applyPolicy(const std::string& subscription, delivery::OnFatalError policy) {
    try {
        const Changing changing(*this);
        const ObjectPointer object =
            _isOpen ? _registry.find(std::strtoll(subscription.c_str(), nullptr, 10)) : nullptr;
        if (object == nullptr) {
            return;
        }
        const bool removes = policy == delivery::OnFatalError::remove;
        say(std::string("subscription ") + (removes ? "removed" : "disabled") +
            ": nothing can be delivered: " + object->path());
        if (removes) {
            removeSubscription(*object);
        } else {
            disable(*object);
        }
    } catch (const std::exception& error) {
        say("the policy of subscription " + subscription + " cannot be applied: " + error.what());
    }
}

void Service::wakeExpiry() {
    { const std::lock_guard lock(_expiryMutex); }
    _expiryWake.notify_all();
}

void Service::runExpiry() {
    std::unique_lock lock(_expiryMutex);
    Time notBefore{};
    while (!_isEnding) {
        const Time now = std::chrono::system_clock::now();
        Time next = now + longestSleep;
        for (const ObjectPointer& each : _registry.all(Kind::subscription)) {
            next = std::min(next, endOf(each->instance).value_or(next));
        }
        next = std::max(next, notBefore);
        if (next > now) {
            _expiryWake.wait_until(lock, next);
            continue;
        }
        lock.unlock();
        try {
            removeExpired();
        } catch (const std::exception& error) {
            say(std::string("subscriptions that are over cannot be removed: ") + error.what());
            notBefore = now + expiryRetry;
        }
        lock.lock();
    }
}

void Service::removeExpired() {
    const Changing changing(*this);
    const Time now = std::chrono::system_clock::now();
    for (const ObjectPointer& each : _registry.all(Kind::subscription)) {
        const auto end = endOf(each->instance);
        if (end && *end <= now) {
            removeSubscription(*each);
            say("subscription removed: its time is over: " + each->path());
        }
    }
}

std::vector<delivery::Counters> Service::counters() const {
    std::vector<delivery::Counters> counted = _delivery->counters();
    for (delivery::Counters& each : counted) {
        if (const auto found = _registry.find(std::strtoll(each.destination.c_str(), nullptr, 10))) {
            each.destination = textOf(found->instance, "Name");
        }
    }
    return counted;
}

std::vector<std::string> Service::classes() const {
    std::vector<std::string> names = presenceClasses();
    names.insert(names.end(), {filterClass, destinationClass, handlerClass, subscriptionClass});
    return names;
}

/** With what is true at this moment only. */
Instance Service::present(const Object& object) const {
    Instance shown = object.instance;
    if (object.kind != Kind::subscription) {
        return shown;
    }
    if (!_activations.isActive(object.id)) {
        set(shown, "SubscriptionState", number16(stateDisabled));
    }
    if (const auto duration = numberOf(shown, "SubscriptionDuration")) {
        const auto end = endOf(shown);
        const auto left =
            end ? std::chrono::duration_cast<std::chrono::seconds>(*end - std::chrono::system_clock::now())
                : std::chrono::seconds(*duration);
        set(shown, "SubscriptionTimeRemaining",
            number64(static_cast<std::uint64_t>(std::max<std::int64_t>(left.count(), 0))));
    }
    return shown;
}

Status Service::enumerate(const Class& definition, const ObjectManager::InstanceSink& sink) {
    const auto kind = kindOf(definition.name);
    if (!kind) {
        for (Instance& each : presence(definition.name, _registry, _delivery->counters(), _start)) {
            sink(std::move(each));
        }
        return {};
    }
    for (const ObjectPointer& each : _registry.all(*kind)) {
        if (each->instance.path.className == definition.name) {
            sink(present(*each));
        }
    }
    return {};
}

Status Service::get(const Class& definition, const ObjectPath& path, const ObjectManager::InstanceSink& sink) {
    if (!kindOf(definition.name)) {
        return enumerate(definition, sink);
    }
    if (const ObjectPointer found = _registry.find(path.toString())) {
        sink(present(*found));
    }
    return {};
}

} // namespace marlo::subscriptions

#include "host/cimom/ObjectManager.h"

#include "host/broker/Threads.h"
#include "host/cimom/BuiltIn.h"
#include "host/cimom/Core.h"
#include "host/cimom/Interop.h"
#include "host/cimom/Operations.h"
#include "host/cimom/References.h"
#include "host/cimom/Subscriptions.h"
#include "host/cimom/UpCallRouter.h"

#include <mutex>
#include <utility>

namespace marlo {

namespace {

/** A thread that delivers an event takes milliseconds; one that hangs shall not hang the end of the process. */
constexpr std::chrono::seconds longestWaitForThreads(2);

constexpr const char* interopNameSpace = "root/interop";

/** Never destroyed: threads may outlive all static objects. */
template <typename Thing>
void keepForGood(std::unique_ptr<Thing> thing) {
    static std::mutex& mutex = *std::make_unique<std::mutex>().release();
    static auto& kept = *std::make_unique<std::vector<std::unique_ptr<Thing>>>().release();
    const std::lock_guard lock(mutex);
    kept.push_back(std::move(thing));
}

} // namespace

struct ObjectManager::State {
    explicit State(const ObjectManagerOptions& options)
        : core(options, upCalls),
          subscriptions(core.schema, core.knowledge, core.broker, core.providers, core.onceLog),
          operations(core) {
        upCalls.connect(operations, subscriptions);
        if (auto interop = makeInterop(core.schema, neighbours())) {
            core.add(std::move(interop));
        }
    }

    /** What the interop namespace's own classes need to know of the others there. */
    InteropNeighbours neighbours() {
        const auto isServed = [this](const std::string& className) {
            return core.findServant(ProviderKind::instance, interopNameSpace, className).has_value();
        };
        const auto namesOf = [this, isServed](const std::string& className) {
            std::vector<ObjectPath> names;
            if (isServed(className)) {
                static_cast<void>(operations.enumerateNames(
                    interopNameSpace, className, [&names](ObjectPath&& name) { names.push_back(std::move(name)); }));
            }
            return names;
        };
        return {isServed, namesOf};
    }

    /** Ends all that providers were asked for; up-calls are refused from now on. */
    void end() {
        subscriptions.end();
        broker::waitForThreads(longestWaitForThreads);
        upCalls.end();
        core.end();
    }

    UpCallRouter upCalls;
    Core core;
    Subscriptions subscriptions;
    Operations operations;
};

ObjectManager::ObjectManager(const ObjectManagerOptions& options) : _state(std::make_unique<State>(options)) {}

ObjectManager::~ObjectManager() {
    const bool keep = _state->core.mayBeUsed();
    _state->end();
    if (keep) {
        keepForGood(std::move(_state));
    }
}

Status ObjectManager::enumerateInstances(const std::string& nameSpace, const std::string& className,
                                         const PropertyList& properties, const InstanceSink& sink) {
    return runOperation([&] { return _state->operations.enumerate(nameSpace, className, properties, sink); });
}

Status ObjectManager::enumerateInstanceNames(const std::string& nameSpace, const std::string& className,
                                             const PathSink& sink) {
    return runOperation([&] { return _state->operations.enumerateNames(nameSpace, className, sink); });
}

Status ObjectManager::getInstance(const ObjectPath& path, const PropertyList& properties, const InstanceSink& sink) {
    return runOperation([&] { return _state->operations.get(path, properties, sink); });
}

Status ObjectManager::modifyInstance(const Instance& modified, const PropertyList& properties) {
    return runOperation([&] { return _state->operations.modify(modified, properties); });
}

Status ObjectManager::invokeMethod(const ObjectPath& path, const std::string& method,
                                   const std::vector<NamedValue>& arguments, MethodAnswer& answer) {
    return runOperation([&] { return _state->operations.invoke(path, method, arguments, answer); });
}

Status ObjectManager::createInstance(const Instance& instance, ObjectPath& created) {
    return runOperation([&] { return _state->operations.create(instance, created); });
}

Status ObjectManager::deleteInstance(const ObjectPath& path) {
    return runOperation([&] { return _state->operations.remove(path); });
}

Status ObjectManager::execQuery(const std::string& nameSpace, const std::string& query, const std::string& language,
                                const InstanceSink& sink) {
    return runOperation([&] { return _state->operations.query(nameSpace, query, language, sink); });
}

Status ObjectManager::associators(const ObjectPath& path, const AssociationFilter& filter,
                                  const PropertyList& properties, const InstanceSink& sink) {
    return runOperation([&] { return _state->operations.associators(path, filter, properties, sink); });
}

Status ObjectManager::associatorNames(const ObjectPath& path, const AssociationFilter& filter, const PathSink& sink) {
    return runOperation([&] { return _state->operations.associatorNames(path, filter, sink); });
}

Status ObjectManager::references(const ObjectPath& path, const AssociationFilter& filter,
                                 const PropertyList& properties, const InstanceSink& sink) {
    return runOperation([&] { return _state->operations.references(path, filter, properties, sink); });
}

Status ObjectManager::referenceNames(const ObjectPath& path, const AssociationFilter& filter, const PathSink& sink) {
    return runOperation([&] { return _state->operations.referenceNames(path, filter, sink); });
}

void ObjectManager::add(std::shared_ptr<BuiltIn> builtIn) {
    _state->core.add(std::move(builtIn));
}

Status ObjectManager::subscribe(const std::string& nameSpace, const std::string& filter, const std::string& language,
                                const IndicationSink& sink, SubscriptionId& id) {
    return subscribe(
        nameSpace, filter, language,
        [sink](Instance&& indication, DeliveryRound& /*round*/) { sink(std::move(indication)); }, id);
}

Status ObjectManager::subscribe(const std::string& nameSpace, const std::string& filter, const std::string& language,
                                const RoundSink& sink, SubscriptionId& id) {
    id = 0;
    return runOperation(
        [&] { return _state->subscriptions.subscribe(spell(nameSpace), filter, language, sink, id); });
}

Status ObjectManager::unsubscribe(SubscriptionId id) {
    return runOperation([&] { return _state->subscriptions.unsubscribe(id); });
}

const Schema& ObjectManager::schema() const {
    return _state->core.schema;
}

std::vector<ProviderHealth> ObjectManager::providerHealth() const {
    std::vector<ProviderHealth> all;
    for (const auto& provider : _state->core.providers) {
        all.push_back(provider->health());
    }
    return all;
}

std::string ObjectManager::spell(const std::string& nameSpace) const {
    return spellNameSpace(_state->core.schema, nameSpace);
}

} // namespace marlo

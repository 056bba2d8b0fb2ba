#include "host/cimom/ObjectManager.h"

#include "host/broker/Broker.h"
#include "host/broker/Threads.h"
#include "host/cimom/AgentLog.h"
#include "host/cimom/ChangeChecks.h"
#include "host/cimom/ClassChecks.h"
#include "host/cimom/InstanceChecks.h"
#include "host/cimom/LogGate.h"
#include "host/cimom/Provider.h"
#include "host/cimom/ProviderCall.h"
#include "host/cimom/SchemaKnowledge.h"
#include "host/cimom/Subscriptions.h"

#include <algorithm>
#include <atomic>
#include <iostream>
#include <mutex>
#include <utility>

#include <pwd.h>
#include <unistd.h>

namespace marlo {

namespace {

/** Operations that providers ask each other for in a circle end here, long before the stack does. */
constexpr int deepestUpCall = 16;

/** A thread that delivers an event takes milliseconds; one that hangs shall not hang the end of the process. */
constexpr std::chrono::seconds longestWaitForThreads(2);

thread_local int depth = 0;

/** Counts the operations that are under way on this thread, one within the other. */
class DepthGuard {
  public:
    DepthGuard() {
        if (depth == deepestUpCall) {
            throw RequestError(CMPI_RC_ERR_FAILED, "providers ask each other in a circle: " +
                                                       std::to_string(deepestUpCall) + " requests within requests");
        }
        ++depth;
    }

    ~DepthGuard() { --depth; }

    DepthGuard(const DepthGuard&) = delete;
    DepthGuard& operator=(const DepthGuard&) = delete;
};

/** The name of the user that the process works for. */
std::string principalName() {
    std::vector<char> buffer(std::size_t{16} * 1024);
    passwd entry{};
    passwd* found = nullptr;
    const uid_t user = geteuid();
    if (getpwuid_r(user, &entry, buffer.data(), buffer.size(), &found) == 0 && found != nullptr) {
        return found->pw_name;
    }
    return std::to_string(user);
}

void writeToStandardError(const std::string& line) {
    std::cerr << line + '\n'; // one write per line: threads log concurrently
}

/** Why an operation failed whose provider did not say it: what was logged meanwhile. */
std::string reasonOf(const std::vector<std::string>& reported) {
    std::string reason;
    for (const std::string& line : reported) {
        reason += (reason.empty() ? "" : "; ") + line;
    }
    return reason.empty() ? "the provider ended without an answer, and nothing was logged" : reason;
}

broker::LogSink brokerLog(std::function<void(const std::string&)> log, bool trace) {
    return [log = std::move(log), trace](const broker::LogLine& line) {
        if (trace || !line.trace) {
            log(line.component + ": " + line.text);
        }
    };
}

} // namespace

struct ObjectManager::State final : broker::UpCalls {
    explicit State(const ObjectManagerOptions& options)
        : schema(Schema::readDirectory(options.schemaDirectory)),
          knowledge(schema),
          principal(principalName()),
          gate(options.log ? options.log : writeToStandardError),
          log([this](const std::string& line) { gate.write(line); }),
          onceLog(log),
          broker(knowledge, this, brokerLog(log, options.trace)),
          subscriptions(schema, knowledge, broker, providers, principal, onceLog) {
        for (Registration& registration :
             readRegistrations(options.providerDirectory, options.libraryDirectory, schema)) {
            providers.push_back(std::make_unique<Provider>(std::move(registration), broker.handle()));
        }
    }

    /** Ends all that providers were asked for; up-calls are refused from now on. */
    void end();

    /** True when threads that nobody can wait for may still use this. */
    [[nodiscard]] bool mayBeUsed() const;

    /** A provider and the class that it is to be asked for. */
    struct Service {
        Provider* provider;
        const Class* definition;
    };

    std::vector<Service> servicesOf(const std::string& nameSpace, const Class& definition) const;

    /** The provider that serves a class itself; throws RequestError with `code` and `what` when none does. */
    Provider& providerOf(ProviderKind kind, const std::string& nameSpace, const Class& definition, CMPIrc code,
                         const std::string& what) const;

    /** Runs an operation: what is refused and what the agent logs goes into its status. */
    template <typename Operation>
    static Status run(const Operation& operation);

    /** The same for what a provider asks for. */
    template <typename Operation>
    broker::Outcome runUpCall(const Operation& operation) const;

    Status enumerate(const std::string& nameSpace, const std::string& className, const PropertyList& properties,
                     const InstanceSink& sink);
    Status enumerateNames(const std::string& nameSpace, const std::string& className, const PathSink& sink);
    Status get(const ObjectPath& path, const PropertyList& properties, const InstanceSink& sink);
    Status modify(const Instance& modified, const PropertyList& properties);
    Status invoke(const ObjectPath& path, const std::string& name, const std::vector<NamedValue>& arguments,
                  MethodAnswer& answer);
    void checkOut(const Method& method, const std::string& provider, std::vector<NamedValue>& out);

    broker::Outcome enumerateInstances(const ObjectPath& classPath, const PropertyNames& properties,
                                       const UpCalls::InstanceSink& sink) override;
    broker::Outcome enumerateInstanceNames(const ObjectPath& classPath, const UpCalls::PathSink& sink) override;
    broker::Outcome getInstance(const ObjectPath& path, const PropertyNames& properties,
                                const UpCalls::InstanceSink& sink) override;
    broker::Outcome deliverIndication(const std::string& nameSpace, Instance&& indication) override;

    Schema schema;
    SchemaKnowledge knowledge;
    std::string principal;
    LogGate gate;
    std::function<void(const std::string&)> log;
    OnceLog onceLog;
    broker::Broker broker;
    std::vector<std::unique_ptr<Provider>> providers;
    Subscriptions subscriptions;
    std::atomic<bool> ended{false};
};

void ObjectManager::State::end() {
    subscriptions.end();
    broker::waitForThreads(longestWaitForThreads);
    ended = true;
    const broker::CallScope scope;
    const CMPIContext* context = broker.newContext();
    for (const auto& provider : providers) {
        provider->cleanUp(*context);
    }
    gate.close();
}

bool ObjectManager::State::mayBeUsed() const {
    return std::any_of(providers.begin(), providers.end(),
                       [](const auto& provider) { return provider->hasIndicationMI(); });
}

std::vector<ObjectManager::State::Service> ObjectManager::State::servicesOf(const std::string& nameSpace,
                                                                            const Class& definition) const {
    std::vector<Service> services;
    for (const Class* candidate : schema.withSubclasses(nameSpace, definition.name)) {
        for (const auto& provider : providers) {
            if (provider->serves(ProviderKind::instance, nameSpace, candidate->name)) {
                services.push_back({provider.get(), candidate});
            }
        }
    }
    if (services.empty()) {
        throw RequestError(CMPI_RC_ERR_NOT_SUPPORTED,
                           "no provider serves the instances of " + definition.name + " in " + nameSpace);
    }
    return services;
}

Provider& ObjectManager::State::providerOf(ProviderKind kind, const std::string& nameSpace, const Class& definition,
                                           CMPIrc code, const std::string& what) const {
    const auto found = std::find_if(providers.begin(), providers.end(), [&](const auto& provider) {
        return provider->serves(kind, nameSpace, definition.name);
    });
    if (found == providers.end()) {
        throw RequestError(code, "no provider serves the " + what + " of " + definition.name + " in " + nameSpace);
    }
    return **found;
}

template <typename Operation>
Status ObjectManager::State::run(const Operation& operation) {
    AgentLogCollector collector;
    Status status;
    try {
        const DepthGuard guard;
        status = operation();
    } catch (const RequestError& error) {
        status = {error.code(), error.what(), {}};
    }
    status.reported = collector.take();
    if (!status.ok() && status.message.empty()) {
        status.message = reasonOf(status.reported);
    }
    return status;
}

template <typename Operation>
broker::Outcome ObjectManager::State::runUpCall(const Operation& operation) const {
    if (ended) {
        return {CMPI_RC_ERR_FAILED, "the object manager has ended"};
    }
    const Status status = run(operation);
    return {status.code, status.message};
}

Status ObjectManager::State::enumerate(const std::string& nameSpace, const std::string& className,
                                       const PropertyList& properties, const InstanceSink& sink) {
    const Class& definition = requireClass(schema, nameSpace, className);
    requireProperties(schema, nameSpace, definition, properties);
    for (const auto& [provider, served] : servicesOf(nameSpace, definition)) {
        InstanceChecks checks(schema, nameSpace, *served, provider->registration().name, onceLog);
        ProviderCall call(broker, *provider, principal);
        Status status = call.enumerateInstances(
            {"", nameSpace, served->name, {}}, namesToAsk(*served, properties), [&](Instance&& instance) {
                if (auto checked = checks.checkInstance(std::move(instance), properties)) {
                    sink(*std::move(checked));
                }
            });
        if (!status.ok()) {
            return status;
        }
    }
    return {};
}

Status ObjectManager::State::enumerateNames(const std::string& nameSpace, const std::string& className,
                                            const PathSink& sink) {
    const Class& definition = requireClass(schema, nameSpace, className);
    for (const auto& [provider, served] : servicesOf(nameSpace, definition)) {
        InstanceChecks checks(schema, nameSpace, *served, provider->registration().name, onceLog);
        ProviderCall call(broker, *provider, principal);
        Status status = call.enumerateInstanceNames({"", nameSpace, served->name, {}}, [&](ObjectPath&& path) {
            if (auto checked = checks.checkPath(path)) {
                sink(*std::move(checked));
            }
        });
        if (!status.ok()) {
            return status;
        }
    }
    return {};
}

Status ObjectManager::State::get(const ObjectPath& path, const PropertyList& properties, const InstanceSink& sink) {
    const Class& definition = requireClass(schema, path.nameSpace, path.className);
    requireProperties(schema, path.nameSpace, definition, properties);
    const ObjectPath checkedPath = requireKeys(definition, path.nameSpace, path);
    Provider& provider =
        providerOf(ProviderKind::instance, path.nameSpace, definition, CMPI_RC_ERR_NOT_SUPPORTED, "instances");
    InstanceChecks checks(schema, path.nameSpace, definition, provider.registration().name, onceLog);
    ProviderCall call(broker, provider, principal);
    bool found = false;
    Status status = call.getInstance(checkedPath, namesToAsk(definition, properties), [&](Instance&& instance) {
        auto checked = found ? std::nullopt : checks.checkInstance(std::move(instance), properties);
        if (checked) {
            found = true;
            sink(*std::move(checked));
        }
    });
    if (status.ok() && !found) {
        status = {CMPI_RC_ERR_NOT_FOUND, "there is no instance " + checkedPath.toString(), {}};
    }
    return status;
}

Status ObjectManager::State::modify(const Instance& modified, const PropertyList& properties) {
    const std::string& nameSpace = modified.path.nameSpace;
    const Class& definition = requireClass(schema, nameSpace, modified.path.className);
    const ObjectPath path = requireKeys(definition, nameSpace, modified.path);
    const Modification modification = requireModification(definition, {path, modified.properties}, properties);
    Provider& provider =
        providerOf(ProviderKind::instance, nameSpace, definition, CMPI_RC_ERR_NOT_SUPPORTED, "instances");
    return ProviderCall(broker, provider, principal).modifyInstance(modification.instance, modification.names);
}

/** Leaves those that the method has, spelled as it has them; what is wrong with the others is logged. */
void ObjectManager::State::checkOut(const Method& method, const std::string& provider, std::vector<NamedValue>& out) {
    std::vector<NamedValue> checked;
    for (NamedValue& value : out) {
        const auto parameter =
            std::find_if(method.parameters.begin(), method.parameters.end(), [&value](const Parameter& known) {
                return known.out && equalNames(known.name, value.name);
            });
        auto converted =
            parameter == method.parameters.end() ? std::nullopt : convertValue(value.value, parameter->type);
        if (converted) {
            checked.push_back({parameter->name, *std::move(converted)});
        } else {
            onceLog.say("provider " + provider + ": left out the parameter '" + value.name + "' of type " +
                        fullTypeName(value.value.type) + ", which " + method.name + " does not give back");
        }
    }
    out = std::move(checked);
}

Status ObjectManager::State::invoke(const ObjectPath& path, const std::string& name,
                                    const std::vector<NamedValue>& arguments, MethodAnswer& answer) {
    const Class& definition = requireClass(schema, path.nameSpace, path.className);
    const Method& method = requireMethod(definition, name);
    const ObjectPath checkedPath = requireMethodPath(definition, method, path);
    const std::vector<NamedValue> checked = requireArguments(method, arguments);
    Provider& provider =
        providerOf(ProviderKind::method, path.nameSpace, definition, CMPI_RC_ERR_METHOD_NOT_AVAILABLE, "methods");
    Status status = ProviderCall(broker, provider, principal).invokeMethod(checkedPath, method.name, checked, answer);
    if (!status.ok()) {
        return status;
    }
    const std::string& providerName = provider.registration().name;
    const auto returned = convertValue(answer.returned, method.returnType);
    if (!returned || returned->isNull()) {
        return {CMPI_RC_ERR_FAILED,
                "provider " + providerName + " returned " + toText(answer.returned) + " of type " +
                    fullTypeName(answer.returned.type) + " from " + method.name + ", which is " +
                    fullTypeName(method.returnType),
                {}};
    }
    answer.returned = *returned;
    checkOut(method, providerName, answer.out);
    return status;
}

broker::Outcome ObjectManager::State::enumerateInstances(const ObjectPath& classPath, const PropertyNames& properties,
                                                         const UpCalls::InstanceSink& sink) {
    return runUpCall([&] { return enumerate(classPath.nameSpace, classPath.className, properties, sink); });
}

broker::Outcome ObjectManager::State::enumerateInstanceNames(const ObjectPath& classPath,
                                                             const UpCalls::PathSink& sink) {
    return runUpCall([&] { return enumerateNames(classPath.nameSpace, classPath.className, sink); });
}

broker::Outcome ObjectManager::State::getInstance(const ObjectPath& path, const PropertyNames& properties,
                                                  const UpCalls::InstanceSink& sink) {
    return runUpCall([&] { return get(path, properties, sink); });
}

broker::Outcome ObjectManager::State::deliverIndication(const std::string& nameSpace, Instance&& indication) {
    return subscriptions.deliver(nameSpace, std::move(indication));
}

/** Never destroyed: threads may outlive all static objects. */
template <typename Thing>
void keepForGood(std::unique_ptr<Thing> thing) {
    static std::mutex& mutex = *std::make_unique<std::mutex>().release();
    static auto& kept = *std::make_unique<std::vector<std::unique_ptr<Thing>>>().release();
    const std::lock_guard lock(mutex);
    kept.push_back(std::move(thing));
}

ObjectManager::ObjectManager(const ObjectManagerOptions& options) : _state(std::make_unique<State>(options)) {}

ObjectManager::~ObjectManager() {
    const bool keep = _state->mayBeUsed();
    _state->end();
    if (keep) {
        keepForGood(std::move(_state));
    }
}

Status ObjectManager::enumerateInstances(const std::string& nameSpace, const std::string& className,
                                         const PropertyList& properties, const InstanceSink& sink) {
    return State::run([&] { return _state->enumerate(nameSpace, className, properties, sink); });
}

Status ObjectManager::enumerateInstanceNames(const std::string& nameSpace, const std::string& className,
                                             const PathSink& sink) {
    return State::run([&] { return _state->enumerateNames(nameSpace, className, sink); });
}

Status ObjectManager::getInstance(const ObjectPath& path, const PropertyList& properties, const InstanceSink& sink) {
    return State::run([&] { return _state->get(path, properties, sink); });
}

Status ObjectManager::modifyInstance(const Instance& modified, const PropertyList& properties) {
    return State::run([&] { return _state->modify(modified, properties); });
}

Status ObjectManager::invokeMethod(const ObjectPath& path, const std::string& method,
                                   const std::vector<NamedValue>& arguments, MethodAnswer& answer) {
    return State::run([&] { return _state->invoke(path, method, arguments, answer); });
}

Status ObjectManager::subscribe(const std::string& nameSpace, const std::string& filter, const std::string& language,
                                const IndicationSink& sink, SubscriptionId& id) {
    id = 0;
    return State::run([&] { return _state->subscriptions.subscribe(nameSpace, filter, language, sink, id); });
}

Status ObjectManager::unsubscribe(SubscriptionId id) {
    return State::run([&] { return _state->subscriptions.unsubscribe(id); });
}

const Schema& ObjectManager::schema() const {
    return _state->schema;
}

} // namespace marlo

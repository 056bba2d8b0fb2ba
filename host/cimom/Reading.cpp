/** @file Operations that read instances of one class. */
#include "host/broker/InstanceSubject.h"
#include "host/cimom/AgentLog.h"
#include "host/cimom/ClassChecks.h"
#include "host/cimom/Operations.h"
#include "host/cimom/QueryText.h"
#include "host/cimom/References.h"
#include "host/filter/Filter.h"

#include <algorithm>
#include <utility>

namespace marlo {

namespace {

/** Operations that providers ask each other for in a circle end here. */
constexpr int deepestUpCall = 16;

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

/** Why an operation failed whose provider did not say it: what was logged meanwhile. */
std::string reasonOf(const std::vector<std::string>& reported) {
    std::string reason;
    for (const std::string& line : reported) {
        reason += (reason.empty() ? "" : "; ") + line;
    }
    return reason.empty() ? "the provider ended without an answer, and nothing was logged" : reason;
}

} // namespace

Status runOperation(const std::function<Status()>& operation) {
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

void cutTo(const PropertyList& properties, Instance& instance) {
    auto& all = instance.properties;
    all.erase(std::remove_if(all.begin(), all.end(),
                             [&properties](const NamedValue& each) { return !isAsked(properties, each.name); }),
              all.end());
}

/** The path with its namespace as the schema spells it. */
ObjectPath Operations::spelled(const ObjectPath& path) const {
    ObjectPath spelledPath = path;
    spelledPath.nameSpace = spellNameSpace(_core.schema, path.nameSpace);
    return spelledPath;
}

Status Operations::enumerate(const std::string& givenNameSpace, const std::string& className,
                             const PropertyList& properties, const InstanceSink& sink) {
    const std::string nameSpace = spellNameSpace(_core.schema, givenNameSpace);
    const Class& definition = requireClass(_core.schema, nameSpace, className);
    requireProperties(_core.schema, nameSpace, definition, properties);
    for (const auto& [servant, served] : _core.servicesOf(nameSpace, definition)) {
        InstanceChecks checks(_core.schema, nameSpace, *served, servant.name(), _core.onceLog);
        Status status =
            servant.enumerateInstances(*served, nameSpace, namesToAsk(*served, properties), [&](Instance&& instance) {
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

Status Operations::enumerateNames(const std::string& givenNameSpace, const std::string& className,
                                  const PathSink& sink) {
    const std::string nameSpace = spellNameSpace(_core.schema, givenNameSpace);
    const Class& definition = requireClass(_core.schema, nameSpace, className);
    for (const auto& [servant, served] : _core.servicesOf(nameSpace, definition)) {
        InstanceChecks checks(_core.schema, nameSpace, *served, servant.name(), _core.onceLog);
        Status status = servant.enumerateInstanceNames(*served, nameSpace, [&](ObjectPath&& path) {
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

Status Operations::get(const ObjectPath& given, const PropertyList& properties, const InstanceSink& sink) {
    const ObjectPath path = spelled(given);
    const Class& definition = requireClass(_core.schema, path.nameSpace, path.className);
    requireProperties(_core.schema, path.nameSpace, definition, properties);
    return getChecked(definition, requireKeys(_core.schema, definition, path.nameSpace, path), properties, sink);
}

/** The instance of a checked path; names that the class lacks are overlooked. */
Status Operations::getChecked(const Class& definition, const ObjectPath& path, const PropertyList& properties,
                              const InstanceSink& sink) {
    const Servant servant =
        _core.servantOf(ProviderKind::instance, path.nameSpace, definition, CMPI_RC_ERR_NOT_SUPPORTED, "instances");
    InstanceChecks checks(_core.schema, path.nameSpace, definition, servant.name(), _core.onceLog);
    bool found = false;
    Status status =
        servant.getInstance(definition, path, namesToAsk(definition, properties), [&](Instance&& instance) {
            auto checked = found ? std::nullopt : checks.checkInstance(std::move(instance), properties);
            if (checked) {
                found = true;
                sink(*std::move(checked));
            }
        });
    if (status.ok() && !found) {
        status = {CMPI_RC_ERR_NOT_FOUND, "there is no instance " + path.toString(), {}};
    }
    return status;
}

Status Operations::query(const std::string& givenNameSpace, const std::string& query, const std::string& language,
                         const InstanceSink& sink) {
    const std::string nameSpace = spellNameSpace(_core.schema, givenNameSpace);
    const filter::Filter filter = readQuery(_core.schema, nameSpace, query, language, "the query");
    const PropertyList selected = filter.properties().empty() ? PropertyList{} : PropertyList{filter.properties()};
    return enumerate(nameSpace, filter.className(), std::nullopt, [&](Instance&& instance) {
        if (filter.evaluate(broker::InstanceSubject(instance, _core.knowledge)) == filter::Truth::yes) {
            cutTo(selected, instance);
            sink(std::move(instance));
        }
    });
}

} // namespace marlo

/**
 * @file
 * Operations that open enumerations and pull from them.
 */
#include "host/wbem/Instances.h"
#include "host/wbem/ResultFilter.h"

#include <functional>

namespace marlo::wbem {

namespace {

using cimxml::PathWrap;
using cimxml::Wrap;

/** The parameters that all operations that open an enumeration have. */
struct Opening {
    std::chrono::seconds timeout{0};
    std::size_t firstObjects = 0; ///< go out with the answer to the opening itself
};

Opening readOpening(const Call& call) {
    Opening opening;
    opening.timeout = call.limits.operationTimeout;
    if (const auto seconds = call.arguments.number("OperationTimeout")) {
        opening.timeout = std::chrono::seconds(*seconds);
        if (*seconds == 0 || opening.timeout > call.limits.longestOperationTimeout) {
            throw RequestError(invalidOperationTimeout,
                               "OperationTimeout is from 1 to " +
                                   std::to_string(call.limits.longestOperationTimeout.count()) + " seconds, not " +
                                   std::to_string(*seconds));
        }
    }
    if (call.arguments.boolean("ContinueOnError", false)) {
        throw RequestError(continuationOnErrorNotSupported, "an enumeration ends with its first error");
    }
    opening.firstObjects = call.arguments.number("MaxObjectCount").value_or(0);
    return opening;
}

/** Writes a batch, what is to be pulled later, and whether that is nothing. */
void writeBatch(Call& call, Pulled pulled, const Enumerations::Batch& batch, const std::string& context) {
    cimxml::Form form;
    form.classOrigin = batch.classOrigin;
    InstanceOutput output(call, pulled == Pulled::instances ? Wrap::instance : Wrap::instanceWithPath, form);
    for (const Instance& object : batch.objects) {
        if (pulled == Pulled::paths) {
            call.reply.returned().path(object.path, PathWrap::path);
        } else {
            output.write(object);
        }
    }
    call.reply.returned();
    cimxml::Writer& writer = call.reply.behind();
    writer.outParameter({"EnumerationContext", Value::string(batch.last ? "" : context)});
    writer.outParameter({"EndOfSequence", Value::boolean(batch.last)});
    call.reply.succeed();
}

/**
 * Ends an answer that belongs to an enumeration: with the answer out, its time begins to run. An answer that is lost
 * on the way loses what it carried, and nobody shall take the rest for the whole: the enumeration goes with it.
 */
void answerBatch(Call& call, Pulled pulled, const Enumerations::Batch& batch, const std::string& context) {
    try {
        writeBatch(call, pulled, batch, context);
    } catch (...) {
        call.enumerations.drop(context);
        throw;
    }
    call.enumerations.await(context);
}

/** One enumeration that is being opened. */
class Opener {
  public:
    Opener(Call& call, Pulled pulled)
        : _call(call),
          _pulled(pulled),
          _opening(readOpening(call)),
          _held(call.enumerations.begin({call.identity.name(), call.nameSpace, pulled},
                                        call.arguments.boolean("IncludeClassOrigin", false))) {}

    /** Fills it by an operation of the object manager and answers. */
    Status open(const std::function<Status(const ObjectManager::InstanceSink& sink)>& operation) {
        Status status = operation([this](Instance&& instance) { _held->add(std::move(instance)); });
        if (status.ok()) {
            answer();
        }
        return status;
    }

    /** The same of paths. */
    Status openPaths(const std::function<Status(const ObjectManager::PathSink& sink)>& operation) {
        Status status = operation([this](ObjectPath&& path) { _held->add({std::move(path), {}}); });
        if (status.ok()) {
            answer();
        }
        return status;
    }

  private:
    void answer() {
        const Enumerations::Batch batch = _held->take(_opening.firstObjects);
        const std::string context = batch.last ? "" : _call.enumerations.keep(std::move(_held), _opening.timeout);
        answerBatch(_call, _pulled, batch, context);
    }

    Call& _call;
    Pulled _pulled;
    Opening _opening;
    std::unique_ptr<Enumerations::Held> _held;
};

/** An operation that gives instances, all of their properties or those that are listed. */
using InstanceOperation =
    std::function<Status(const PropertyList& properties, const ObjectManager::InstanceSink& sink)>;

/** A filter may ask for properties that the client does not: all are read, and those of the list go out. */
Status openInstances(Call& call, const PropertyList& properties, const InstanceOperation& operation) {
    const ResultFilter filter(call.manager.schema(), call.nameSpace, call.arguments);
    Opener opener(call, Pulled::instancesWithPath);
    return opener.open([&](const ObjectManager::InstanceSink& sink) {
        if (!filter.isGiven()) {
            return operation(properties, sink);
        }
        return operation(std::nullopt, [&](Instance&& instance) {
            if (filter.matches(instance)) {
                cutToList(properties, instance);
                sink(std::move(instance));
            }
        });
    });
}

/** Paths have no properties but keys, so a filter has the instances read. */
Status openPaths(Call& call, const InstanceOperation& instances,
                 const std::function<Status(const ObjectManager::PathSink& sink)>& paths) {
    const ResultFilter filter(call.manager.schema(), call.nameSpace, call.arguments);
    Opener opener(call, Pulled::paths);
    return opener.openPaths([&](const ObjectManager::PathSink& sink) {
        if (!filter.isGiven()) {
            return paths(sink);
        }
        return instances(std::nullopt, [&](Instance&& instance) {
            if (filter.matches(instance)) {
                sink(std::move(instance.path));
            }
        });
    });
}

Status pull(Call& call, Pulled pulled) {
    const std::string context = call.arguments.text("EnumerationContext");
    const auto most = call.arguments.number("MaxObjectCount");
    if (!most) {
        throw RequestError(CMPI_RC_ERR_INVALID_PARAMETER, "a pull needs the parameter MaxObjectCount");
    }
    const Enumerations::Batch batch =
        call.enumerations.pull(context, {call.identity.name(), call.nameSpace, pulled}, *most);
    answerBatch(call, pulled, batch, context);
    return {};
}

} // namespace

Status openEnumerateInstances(Call& call) {
    const std::string className = call.arguments.className("ClassName");
    const Class& definition = requireClass(call.manager.schema(), call.nameSpace, className);
    const bool deep = call.arguments.boolean("DeepInheritance", true);
    return openInstances(call, readProperties(call, className),
                         [&](const PropertyList& properties, const ObjectManager::InstanceSink& sink) {
                             return call.manager.enumerateInstances(call.nameSpace, className, properties,
                                                                    [&](Instance&& instance) {
                                                                        if (!deep) {
                                                                            cutToClass(definition, instance);
                                                                        }
                                                                        sink(std::move(instance));
                                                                    });
                         });
}

Status openEnumerateInstancePaths(Call& call) {
    const std::string className = call.arguments.className("ClassName");
    return openPaths(
        call,
        [&](const PropertyList& properties, const ObjectManager::InstanceSink& sink) {
            return call.manager.enumerateInstances(call.nameSpace, className, properties, sink);
        },
        [&](const ObjectManager::PathSink& sink) {
            return call.manager.enumerateInstanceNames(call.nameSpace, className, sink);
        });
}

Status openAssociatorInstances(Call& call) {
    const ObjectPath path = call.arguments.instanceName("InstanceName");
    const AssociationFilter filter = readAssociatorFilter(call.arguments);
    return openInstances(call, call.arguments.propertyList(),
                         [&](const PropertyList& properties, const ObjectManager::InstanceSink& sink) {
                             return call.manager.associators(path, filter, properties, sink);
                         });
}

Status openAssociatorInstancePaths(Call& call) {
    const ObjectPath path = call.arguments.instanceName("InstanceName");
    const AssociationFilter filter = readAssociatorFilter(call.arguments);
    return openPaths(
        call,
        [&](const PropertyList& properties, const ObjectManager::InstanceSink& sink) {
            return call.manager.associators(path, filter, properties, sink);
        },
        [&](const ObjectManager::PathSink& sink) { return call.manager.associatorNames(path, filter, sink); });
}

Status openReferenceInstances(Call& call) {
    const ObjectPath path = call.arguments.instanceName("InstanceName");
    const AssociationFilter filter = readReferenceFilter(call.arguments);
    return openInstances(call, call.arguments.propertyList(),
                         [&](const PropertyList& properties, const ObjectManager::InstanceSink& sink) {
                             return call.manager.references(path, filter, properties, sink);
                         });
}

Status openReferenceInstancePaths(Call& call) {
    const ObjectPath path = call.arguments.instanceName("InstanceName");
    const AssociationFilter filter = readReferenceFilter(call.arguments);
    return openPaths(
        call,
        [&](const PropertyList& properties, const ObjectManager::InstanceSink& sink) {
            return call.manager.references(path, filter, properties, sink);
        },
        [&](const ObjectManager::PathSink& sink) { return call.manager.referenceNames(path, filter, sink); });
}

Status openQueryInstances(Call& call) {
    const std::string language = call.arguments.text("FilterQueryLanguage");
    const std::string query = call.arguments.text("FilterQuery");
    if (call.arguments.boolean("ReturnQueryResultClass", false)) {
        return {CMPI_RC_ERR_NOT_SUPPORTED, "no class is made for the results of a query", {}};
    }
    Opener opener(call, Pulled::instances);
    return opener.open([&](const ObjectManager::InstanceSink& sink) {
        return call.manager.execQuery(call.nameSpace, query, language, sink);
    });
}

Status pullInstancesWithPath(Call& call) {
    return pull(call, Pulled::instancesWithPath);
}

Status pullInstancePaths(Call& call) {
    return pull(call, Pulled::paths);
}

Status pullInstances(Call& call) {
    return pull(call, Pulled::instances);
}

Status closeEnumeration(Call& call) {
    call.enumerations.close(call.arguments.text("EnumerationContext"), {call.identity.name(), call.nameSpace, {}});
    return {};
}

} // namespace marlo::wbem

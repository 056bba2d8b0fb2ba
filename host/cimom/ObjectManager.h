/**
 * @file
 * The object manager: finds the provider of a class, calls it as CMPI has it, and hands on what it answers.
 */
#pragma once

#include "host/cimom/DeliveryRound.h"
#include "host/cimom/ProviderHealth.h"
#include "host/model/AssociationFilter.h"
#include "host/model/Instance.h"
#include "host/schema/Schema.h"

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace marlo {

/** How a CIM operation ended: a CIM status code and, unless it is CMPI_RC_OK, what was wrong. */
struct Status {
    CMPIrc code = CMPI_RC_OK;
    std::string message;
    /** Failures that the agent logged on this call's thread although the operation itself was answered. */
    std::vector<std::string> reported;

    [[nodiscard]] bool ok() const { return code == CMPI_RC_OK; }
};

/** "CIM_ERR_NOT_FOUND" and the like for a status code. */
std::string statusName(CMPIrc code);

/** Property names that the client asked for; none asked means all. */
using PropertyList = std::optional<std::vector<std::string>>;

/** What a method answered: its own value, and its OUT parameters. */
struct MethodAnswer {
    Value returned;
    std::vector<NamedValue> out;
};

/** Tells a subscription from every other one of its object manager; 0 is none. */
using SubscriptionId = std::uint64_t;

struct ObjectManagerOptions {
    std::vector<std::string> schemaDirectories;   ///< *.mof, read one directory after the other
    std::vector<std::string> providerDirectories; ///< *.toml, a registration file per provider library
    /** Where registered libraries with a relative name lie, unless they lie beside their registration file. */
    std::string libraryDirectory;

    /** Receives what providers log and what is wrong with their answers, from any thread; none: standard error. */
    std::function<void(const std::string& line)> log;
    bool trace = false; ///< the log receives what providers trace as well
};

/**
 * In whose name this thread asks for operations, as CMPIPrincipal tells providers; else the user that the process
 * works for. Within each other the innermost counts.
 */
class ActingFor {
  public:
    explicit ActingFor(std::string principal);
    ~ActingFor();
    ActingFor(const ActingFor&) = delete;
    ActingFor& operator=(const ActingFor&) = delete;

  private:
    std::string _former;
};

class BuiltIn;

/**
 * One object manager. Operations may be called from any thread, concurrently. What providers throw is answered
 * CMPI_RC_ERR_FAILED with its text. Providers are loaded at the first request for one of their classes.
 *
 * Its end ends all subscriptions and waits, for a short while, until no thread of a provider runs that the broker has
 * started. Threads that run on, and agents' own, find everything in place and are refused: what a provider of
 * indications may still use is kept for the rest of the process.
 */
class ObjectManager {
  public:
    /** Reads schema and registrations. Throws std::runtime_error with file, line and reason. */
    explicit ObjectManager(const ObjectManagerOptions& options);
    ~ObjectManager();
    ObjectManager(const ObjectManager&) = delete;
    ObjectManager& operator=(const ObjectManager&) = delete;

    using InstanceSink = std::function<void(Instance&&)>;
    using PathSink = std::function<void(ObjectPath&&)>;

    /**
     * Instances of a class and of its subclasses, each with a complete path (namespace and keys, no host) and with
     * those properties that were asked for and that its provider set.
     *
     * All operations: a sink may throw, which ends the operation with what it threw. Unknown namespaces, classes and
     * property names, wrong keys and classes that no provider serves are refused without asking a provider.
     * Namespaces are taken as spellNameSpace has it. References come with the namespace and without a host, whatever
     * a provider put there. Texts are what the provider gave, byte by byte: whoever writes them out replaces what is
     * no UTF-8, so that a key that was read finds its instance again.
     */
    Status enumerateInstances(const std::string& nameSpace, const std::string& className,
                              const PropertyList& properties, const InstanceSink& sink);
    Status enumerateInstanceNames(const std::string& nameSpace, const std::string& className, const PathSink& sink);
    /** The instance at a path with all its keys; CMPI_RC_ERR_NOT_FOUND when the provider knows none. */
    Status getInstance(const ObjectPath& path, const PropertyList& properties, const InstanceSink& sink);

    /**
     * Changes the instance at `modified.path`, which has all its keys. With a list those properties are changed, to
     * NULL where `modified` lacks them; without one, those of `modified` that the schema lets be written (qualifier
     * Write). The provider is given the names and an instance with every property of the class, NULL where it is not
     * to be changed. A provider that ends in success without saying that it is done has failed.
     *
     * Both: values are converted where their type is another but holds them, integers for instance. What a provider
     * fails at without a reason of its own is answered CMPI_RC_ERR_FAILED with what was logged meanwhile.
     */
    Status modifyInstance(const Instance& modified, const PropertyList& properties);

    /**
     * Calls a method of the instance at a path with all its keys, or of the class itself where the method has the
     * qualifier Static and the path no keys. `answer` is good when the status is CMPI_RC_OK: a provider that ends in
     * success without a value of the method's type has failed.
     */
    Status invokeMethod(const ObjectPath& path, const std::string& method, const std::vector<NamedValue>& arguments,
                        MethodAnswer& answer);

    /**
     * Makes an instance of a class, with the keys that the instance's properties or path have; keys that are missing
     * are the provider's to find. `created` is its path, complete, with namespace and without host. A property that
     * has a default and is not given gets it.
     */
    Status createInstance(const Instance& instance, ObjectPath& created);

    /** Removes the instance at a path with all its keys. */
    Status deleteInstance(const ObjectPath& path);

    /**
     * Those of what enumerateInstances gives for the class of a SELECT statement ("WQL", "CQL", "CIM:CQL",
     * "DMTF:CQL") that its condition holds for, each with the selected properties and a complete path. Providers' own
     * execQuery is not asked: each understands another part of some language, and none asks for subclasses.
     */
    Status execQuery(const std::string& nameSpace, const std::string& query, const std::string& language,
                     const InstanceSink& sink);

    /**
     * What is associated with the instance at a path: the instances at the other ends, their paths, the associations
     * themselves, their paths; each once. Found among the instances of all association classes that somebody serves;
     * nothing where there are none. The start needs all its keys, but need not exist. What is at another end but
     * cannot be had is left out. A class or a role that does not exist is refused (CMPI_RC_ERR_INVALID_PARAMETER);
     * property names that a class lacks are overlooked, as what is found may be of many classes.
     */
    Status associators(const ObjectPath& path, const AssociationFilter& filter, const PropertyList& properties,
                       const InstanceSink& sink);
    Status associatorNames(const ObjectPath& path, const AssociationFilter& filter, const PathSink& sink);
    Status references(const ObjectPath& path, const AssociationFilter& filter, const PropertyList& properties,
                      const InstanceSink& sink);
    Status referenceNames(const ObjectPath& path, const AssociationFilter& filter, const PathSink& sink);

    /**
     * Has the object manager serve classes by itself. Before the first request; throws std::runtime_error for a class
     * that the schema lacks or that somebody serves. The classes of Interop.h are served from the beginning.
     */
    void add(std::shared_ptr<BuiltIn> builtIn);

    /** Receives an indication on the thread that delivers it; several at once when several deliver. */
    using IndicationSink = std::function<void(Instance&& indication)>;
    /** The same, with work left for later (DeliveryRound.h), which may be done after an unsubscribing has returned.
     */
    using RoundSink = std::function<void(Instance&& indication, DeliveryRound& round)>;

    /**
     * Subscribes to the indications of a filter (host/filter/Filter.h) in "WQL" or "CQL" and gives the subscription's
     * number, or 0 with the reason: a filter that is refused, with line and column (CMPI_RC_ERR_INVALID_QUERY and the
     * like), a class that is none of indications, no provider, or a provider that refuses. What was told to providers
     * before one of them refused is taken back.
     *
     * Each indication reaches the sink once, in its deliverer's order, without keys and with the selected properties
     * that are of its class; the first one may do so before this returns. What a sink throws is the deliverer's
     * failure. It may unsubscribe, but not while its provider is being told of a subscription on its own thread.
     */
    Status subscribe(const std::string& nameSpace, const std::string& filter, const std::string& language,
                     const IndicationSink& sink, SubscriptionId& id);
    Status subscribe(const std::string& nameSpace, const std::string& filter, const std::string& language,
                     const RoundSink& sink, SubscriptionId& id);

    /**
     * Ends a subscription whatever its providers answer; the first failure is answered. The sink is not called any
     * more once this has returned, but for one that this was called from.
     */
    Status unsubscribe(SubscriptionId id);

    [[nodiscard]] const Schema& schema() const;

    /** Of every registered provider, in the order of their registrations. Waits for none. */
    [[nodiscard]] std::vector<ProviderHealth> providerHealth() const;

    /** A namespace as the schema spells it, for what is asked of the schema itself (spellNameSpace). */
    [[nodiscard]] std::string spell(const std::string& nameSpace) const;

  private:
    struct State;
    std::unique_ptr<State> _state;
};

} // namespace marlo

/**
 * @file
 * The operations of the object manager: requests checked, asked of whoever serves the class, answers checked.
 */
#pragma once

#include "host/cimom/Core.h"
#include "host/cimom/ObjectManager.h"

#include <functional>
#include <optional>
#include <string>
#include <vector>

namespace marlo {

/**
 * Runs an operation: what is refused (RequestError) and what the agent logs goes into its status. Operations that
 * providers ask each other for in a circle are ended, long before the stack is. Throws what sinks throw.
 */
Status runOperation(const std::function<Status()>& operation);

/** As the functions of ObjectManager, which say what each one does, but that refusals are thrown as RequestError. */
class Operations {
  public:
    using InstanceSink = ObjectManager::InstanceSink;
    using PathSink = ObjectManager::PathSink;

    /** The core outlives this. */
    explicit Operations(Core& core) : _core(core) {}

    Status enumerate(const std::string& givenNameSpace, const std::string& className, const PropertyList& properties,
                     const InstanceSink& sink);
    Status enumerateNames(const std::string& givenNameSpace, const std::string& className, const PathSink& sink);
    Status get(const ObjectPath& given, const PropertyList& properties, const InstanceSink& sink);
    Status query(const std::string& givenNameSpace, const std::string& query, const std::string& language,
                 const InstanceSink& sink);

    Status modify(const Instance& modified, const PropertyList& properties);
    Status create(const Instance& instance, ObjectPath& created);
    Status remove(const ObjectPath& given);
    Status invoke(const ObjectPath& given, const std::string& name, const std::vector<NamedValue>& arguments,
                  MethodAnswer& answer);

    Status associators(const ObjectPath& path, const AssociationFilter& filter, const PropertyList& properties,
                       const InstanceSink& sink);
    Status associatorNames(const ObjectPath& path, const AssociationFilter& filter, const PathSink& sink);
    Status references(const ObjectPath& path, const AssociationFilter& filter, const PropertyList& properties,
                      const InstanceSink& sink);
    Status referenceNames(const ObjectPath& path, const AssociationFilter& filter, const PathSink& sink);

  private:
    [[nodiscard]] ObjectPath spelled(const ObjectPath& path) const;
    Status getChecked(const Class& definition, const ObjectPath& path, const PropertyList& properties,
                      const InstanceSink& sink);
    [[nodiscard]] std::optional<Value> convertOut(const std::string& nameSpace, const Value& value,
                                                  CMPIType type) const;
    void checkOut(const std::string& nameSpace, const Method& method, const std::string& servant,
                  std::vector<NamedValue>& out);
    Status findAssociations(
        const ObjectPath& given, const AssociationFilter& filter,
        const std::function<void(const Class& definition, Instance&& association, const ObjectPath& start)>& sink);
    Status findOtherEnds(const ObjectPath& path, const AssociationFilter& filter, std::vector<ObjectPath>& ends);

    Core& _core;
};

/** Leaves those properties that a list has. */
void cutTo(const PropertyList& properties, Instance& instance);

} // namespace marlo

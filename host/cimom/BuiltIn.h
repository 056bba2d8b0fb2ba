/**
 * @file
 * What the object manager serves by itself: classes without a provider library, such as those of the interop
 * namespace.
 */
#pragma once

#include "host/cimom/ObjectManager.h"

#include <string>
#include <vector>

namespace marlo {

/**
 * Serves the instances of some classes. Called from any thread, several at once, with arguments that have been
 * checked against the schema: classes exist, keys are complete, typed and spelled as the schema has them, properties
 * too. Answers need not be cut to what was asked for; they are checked as a provider's are, and their paths completed
 * from their keys. A RequestError (ClassChecks.h) that is thrown is the answer; what else is thrown is a failure.
 */
class BuiltIn {
  public:
    virtual ~BuiltIn() = default;
    BuiltIn(const BuiltIn&) = delete;
    BuiltIn& operator=(const BuiltIn&) = delete;

    /** The namespace, and the classes whose own instances (not their subclasses') it serves. */
    [[nodiscard]] virtual std::string nameSpace() const = 0;
    [[nodiscard]] virtual std::vector<std::string> classes() const = 0;

    virtual Status enumerate(const Class& definition, const ObjectManager::InstanceSink& sink) = 0;

    /** Gives the instance at the path, and possibly others, which are left out. By itself gives all. */
    virtual Status get(const Class& definition, const ObjectPath& path, const ObjectManager::InstanceSink& sink);
    /** All below answer CMPI_RC_ERR_NOT_SUPPORTED by themselves. `created` needs no namespace. */
    virtual Status create(const Class& definition, const Instance& instance, ObjectPath& created);
    /** `instance` has the new values of the `names`, NULL among them. */
    virtual Status modify(const Class& definition, const Instance& instance, const std::vector<std::string>& names);
    virtual Status remove(const Class& definition, const ObjectPath& path);
    virtual Status invoke(const Class& definition, const ObjectPath& path, const Method& method,
                          const std::vector<NamedValue>& arguments, MethodAnswer& answer);

  protected:
    BuiltIn() = default;
};

} // namespace marlo

/**
 * @file
 * The intrinsic methods (DSP0200) in one table: name, the role that it takes, its parameters, and what it does.
 */
#pragma once

#include "host/cimom/ObjectManager.h"
#include "host/security/Identity.h"
#include "host/wbem/Arguments.h"
#include "host/wbem/Enumerations.h"
#include "host/wbem/Reply.h"

#include <span>
#include <string>
#include <string_view>

namespace marlo::wbem {

/** One intrinsic method that is being answered. */
struct Call {
    ObjectManager& manager;
    Enumerations& enumerations;
    const Limits& limits;
    const security::Identity& identity;
    const std::string& nameSpace;
    const Arguments& arguments;
    Reply& reply;
};

/**
 * Writes what it gives to the reply and returns how it ended, or throws RequestError; the reply is ended by the
 * caller.
 */
using Operate = Status (*)(Call& call);

class Operation {
  public:
    /** There is no operation without a role: this is the only way to make one. */
    constexpr Operation(std::string_view name, security::Role role, std::string_view parameters, Operate function)
        : _name(name), _role(role), _parameters(parameters), _run(function) {}

    [[nodiscard]] constexpr std::string_view name() const { return _name; }

    [[nodiscard]] constexpr security::Role role() const { return _role; }

    /** Names, separated by spaces. */
    [[nodiscard]] constexpr std::string_view parameters() const { return _parameters; }

    [[nodiscard]] Operate run() const { return _run; }

  private:
    std::string_view _name;
    security::Role _role;
    std::string_view _parameters;
    Operate _run;
};

std::span<const Operation> operations();

/** Names are compared without case. Null for a method that there is not. */
const Operation* findOperation(std::string_view name);

/**
 * The role that an operation on a class takes: changing filters, destinations and subscriptions of indications is for
 * those who may subscribe, wherever `role` says change.
 */
security::Role roleFor(security::Role role, const Schema& schema, std::string_view nameSpace,
                       std::string_view className);

/** Throws RequestError (CMPI_RC_ERR_ACCESS_DENIED) that says who may not do what. */
void requireRole(const security::Identity& identity, security::Role role, const std::string& method);

// The methods, by the file that has them. Each is documented by the standard under its name.

Status getClass(Call& call);
Status enumerateClasses(Call& call);
Status enumerateClassNames(Call& call);
Status getQualifier(Call& call);
Status enumerateQualifiers(Call& call);

Status getInstance(Call& call);
Status enumerateInstances(Call& call);
Status enumerateInstanceNames(Call& call);
Status getProperty(Call& call);
Status execQuery(Call& call);

Status createInstance(Call& call);
Status modifyInstance(Call& call);
Status deleteInstance(Call& call);
Status setProperty(Call& call);

Status associators(Call& call);
Status associatorNames(Call& call);
Status references(Call& call);
Status referenceNames(Call& call);

Status openEnumerateInstances(Call& call);
Status openEnumerateInstancePaths(Call& call);
Status openAssociatorInstances(Call& call);
Status openAssociatorInstancePaths(Call& call);
Status openReferenceInstances(Call& call);
Status openReferenceInstancePaths(Call& call);
Status openQueryInstances(Call& call);
Status pullInstancesWithPath(Call& call);
Status pullInstancePaths(Call& call);
Status pullInstances(Call& call);
Status closeEnumeration(Call& call);

} // namespace marlo::wbem

#include "host/wbem/Operation.h"

#include <algorithm>
#include <array>

namespace marlo::wbem {

namespace {

using security::Role;

/** Of the standard, but not of this object manager: the schema is what its files say, and results are not counted. */
Status notSupported(Call& /*call*/) {
    return {CMPI_RC_ERR_NOT_SUPPORTED, "this operation is not supported", {}};
}

constexpr std::array<Operation, 35> table{{
    {"GetClass", Role::read, "ClassName LocalOnly IncludeQualifiers IncludeClassOrigin PropertyList", &getClass},
    {"EnumerateClasses", Role::read, "ClassName DeepInheritance LocalOnly IncludeQualifiers IncludeClassOrigin",
     &enumerateClasses},
    {"EnumerateClassNames", Role::read, "ClassName DeepInheritance", &enumerateClassNames},
    {"GetQualifier", Role::read, "QualifierName", &getQualifier},
    {"EnumerateQualifiers", Role::read, "", &enumerateQualifiers},

    {"GetInstance", Role::read, "InstanceName LocalOnly IncludeQualifiers IncludeClassOrigin PropertyList",
     &getInstance},
    {"EnumerateInstances", Role::read,
     "ClassName LocalOnly DeepInheritance IncludeQualifiers IncludeClassOrigin PropertyList", &enumerateInstances},
    {"EnumerateInstanceNames", Role::read, "ClassName", &enumerateInstanceNames},
    {"GetProperty", Role::read, "InstanceName PropertyName", &getProperty},
    {"ExecQuery", Role::read, "QueryLanguage Query", &execQuery},

    {"CreateInstance", Role::change, "NewInstance", &createInstance},
    {"ModifyInstance", Role::change, "ModifiedInstance IncludeQualifiers PropertyList", &modifyInstance},
    {"DeleteInstance", Role::change, "InstanceName", &deleteInstance},
    {"SetProperty", Role::change, "InstanceName PropertyName NewValue", &setProperty},

    {"Associators", Role::read,
     "ObjectName AssocClass ResultClass Role ResultRole IncludeQualifiers IncludeClassOrigin PropertyList",
     &associators},
    {"AssociatorNames", Role::read, "ObjectName AssocClass ResultClass Role ResultRole", &associatorNames},
    {"References", Role::read, "ObjectName ResultClass Role IncludeQualifiers IncludeClassOrigin PropertyList",
     &references},
    {"ReferenceNames", Role::read, "ObjectName ResultClass Role", &referenceNames},

    {"OpenEnumerateInstances", Role::read,
     "ClassName DeepInheritance IncludeClassOrigin PropertyList FilterQueryLanguage FilterQuery OperationTimeout "
     "ContinueOnError MaxObjectCount",
     &openEnumerateInstances},
    {"OpenEnumerateInstancePaths", Role::read,
     "ClassName FilterQueryLanguage FilterQuery OperationTimeout ContinueOnError MaxObjectCount",
     &openEnumerateInstancePaths},
    {"OpenAssociatorInstances", Role::read,
     "InstanceName AssocClass ResultClass Role ResultRole IncludeClassOrigin PropertyList FilterQueryLanguage "
     "FilterQuery OperationTimeout ContinueOnError MaxObjectCount",
     &openAssociatorInstances},
    {"OpenAssociatorInstancePaths", Role::read,
     "InstanceName AssocClass ResultClass Role ResultRole FilterQueryLanguage FilterQuery OperationTimeout "
     "ContinueOnError MaxObjectCount",
     &openAssociatorInstancePaths},
    {"OpenReferenceInstances", Role::read,
     "InstanceName ResultClass Role IncludeClassOrigin PropertyList FilterQueryLanguage FilterQuery OperationTimeout "
     "ContinueOnError MaxObjectCount",
     &openReferenceInstances},
    {"OpenReferenceInstancePaths", Role::read,
     "InstanceName ResultClass Role FilterQueryLanguage FilterQuery OperationTimeout ContinueOnError MaxObjectCount",
     &openReferenceInstancePaths},
    {"OpenQueryInstances", Role::read,
     "FilterQueryLanguage FilterQuery ReturnQueryResultClass OperationTimeout ContinueOnError MaxObjectCount",
     &openQueryInstances},
    {"PullInstancesWithPath", Role::read, "EnumerationContext MaxObjectCount", &pullInstancesWithPath},
    {"PullInstancePaths", Role::read, "EnumerationContext MaxObjectCount", &pullInstancePaths},
    {"PullInstances", Role::read, "EnumerationContext MaxObjectCount", &pullInstances},
    {"CloseEnumeration", Role::read, "EnumerationContext", &closeEnumeration},
    {"EnumerationCount", Role::read, "EnumerationContext", &notSupported},

    {"CreateClass", Role::change, "NewClass", &notSupported},
    {"ModifyClass", Role::change, "ModifiedClass", &notSupported},
    {"DeleteClass", Role::change, "ClassName", &notSupported},
    {"SetQualifier", Role::change, "QualifierDeclaration", &notSupported},
    {"DeleteQualifier", Role::change, "QualifierName", &notSupported},
}};

constexpr bool hasRole(const Operation& operation) {
    return operation.role() == Role::read || operation.role() == Role::change || operation.role() == Role::subscribe;
}

static_assert(std::all_of(table.begin(), table.end(), hasRole), "an operation without a role would be anybody's");

const char* roleName(Role role) {
    switch (role) {
    case Role::read:
        return "read";
    case Role::change:
        return "change";
    case Role::subscribe:
        return "subscribe";
    }
    return "";
}

} // namespace

std::span<const Operation> operations() {
    return table;
}

const Operation* findOperation(std::string_view name) {
    const auto* const found = std::find_if(table.begin(), table.end(), [name](const Operation& operation) {
        return equalNames(operation.name(), name);
    });
    return found == table.end() ? nullptr : found;
}

Role roleFor(Role role, const Schema& schema, std::string_view nameSpace, std::string_view className) {
    static constexpr std::array<std::string_view, 5> bases{"CIM_IndicationFilter", "CIM_FilterCollection",
                                                           "CIM_ListenerDestination", "CIM_IndicationHandler",
                                                           "CIM_AbstractIndicationSubscription"};
    if (role != Role::change) {
        return role;
    }
    const bool subscribes = std::any_of(bases.begin(), bases.end(), [&](std::string_view base) {
        return equalNames(className, base) || schema.isA(nameSpace, className, base);
    });
    return subscribes ? Role::subscribe : role;
}

void requireRole(const security::Identity& identity, Role role, const std::string& method) {
    if (!identity.may(role)) {
        throw RequestError(CMPI_RC_ERR_ACCESS_DENIED, "user '" + identity.name() + "' may not call " + method +
                                                          ", which takes the role '" + roleName(role) + "'");
    }
}

} // namespace marlo::wbem

/**
 * @file
 * Operations that read classes and qualifier declarations.
 */
#include "host/schema/ClassView.h"
#include "host/wbem/Operation.h"

#include <algorithm>

namespace marlo::wbem {

namespace {

void requireNameSpace(const Call& call) {
    if (!call.manager.schema().hasNameSpace(call.nameSpace)) {
        throw RequestError(CMPI_RC_ERR_INVALID_NAMESPACE, "there is no namespace '" + call.nameSpace + "'");
    }
}

/** LocalOnly, IncludeQualifiers and IncludeClassOrigin as classes have them. */
ClassFilter readFilter(const Arguments& arguments) {
    ClassFilter filter;
    filter.localOnly = arguments.boolean("LocalOnly", true);
    filter.includeQualifiers = arguments.boolean("IncludeQualifiers", true);
    filter.includeClassOrigin = arguments.boolean("IncludeClassOrigin", false);
    return filter;
}

void writeClass(Call& call, const Class& definition, const ClassFilter& filter) {
    cimxml::Form form;
    form.qualifiers = filter.includeQualifiers;
    form.classOrigin = filter.includeClassOrigin;
    call.reply.returned().classDefinition(viewClass(definition, filter), form);
}

/** The classes below the one of the parameter ClassName, or below none. */
std::vector<const Class*> readSubclasses(const Call& call) {
    requireNameSpace(call);
    const std::string className = call.arguments.optionalClassName("ClassName");
    if (!className.empty()) {
        requireClass(call.manager.schema(), call.nameSpace, className);
    }
    return subclasses(call.manager.schema(), call.nameSpace, className,
                      call.arguments.boolean("DeepInheritance", false));
}

} // namespace

Status getClass(Call& call) {
    requireNameSpace(call);
    const std::string className = call.arguments.className("ClassName");
    ClassFilter filter = readFilter(call.arguments);
    filter.properties = call.arguments.propertyList();
    const Class* definition = call.manager.schema().findClass(call.nameSpace, className);
    if (definition == nullptr) { // the class itself was asked for: it is what was not found
        return {CMPI_RC_ERR_NOT_FOUND, "there is no class '" + className + "' in " + call.nameSpace, {}};
    }
    writeClass(call, *definition, filter);
    return {};
}

Status enumerateClasses(Call& call) {
    const ClassFilter filter = readFilter(call.arguments);
    for (const Class* definition : readSubclasses(call)) {
        writeClass(call, *definition, filter);
    }
    call.reply.returned();
    return {};
}

Status enumerateClassNames(Call& call) {
    for (const Class* definition : readSubclasses(call)) {
        call.reply.returned().className(definition->name);
    }
    call.reply.returned();
    return {};
}

Status getQualifier(Call& call) {
    requireNameSpace(call);
    const std::string name = call.arguments.text("QualifierName");
    const auto types = call.manager.schema().qualifierTypes(call.nameSpace);
    const auto found = std::find_if(types.begin(), types.end(),
                                    [&name](const QualifierType* type) { return equalNames(type->name, name); });
    if (found == types.end()) {
        return {CMPI_RC_ERR_NOT_FOUND, "there is no qualifier '" + name + "' in " + call.nameSpace, {}};
    }
    call.reply.returned().qualifierDeclaration(**found);
    return {};
}

Status enumerateQualifiers(Call& call) {
    requireNameSpace(call);
    for (const QualifierType* type : call.manager.schema().qualifierTypes(call.nameSpace)) {
        call.reply.returned().qualifierDeclaration(*type);
    }
    call.reply.returned();
    return {};
}

} // namespace marlo::wbem

/**
 * @file
 * The arguments of an intrinsic method, by name and as what they have to be.
 */
#pragma once

#include "host/cimom/ClassChecks.h"
#include "host/cimxml/Message.h"

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace marlo::wbem {

/**
 * Lives as long as the call. Names are compared without case. What is wrong throws RequestError
 * (CMPI_RC_ERR_INVALID_PARAMETER) that names the parameter. A NULL is as good as no argument.
 */
class Arguments {
  public:
    /**
     * `parameters` are the names that the method has, separated by spaces. Throws for others and for doubled ones.
     * `nameSpace` is that of the call as the schema spells it.
     */
    Arguments(const cimxml::IntrinsicCall& call, std::string_view parameters, const Schema& schema,
              std::string nameSpace);

    [[nodiscard]] bool has(std::string_view name) const { return find(name) != nullptr; }

    /** A name of a class; an argument of the type string is taken too. */
    [[nodiscard]] std::string className(std::string_view name) const;
    /** Empty where there is none. */
    [[nodiscard]] std::string optionalClassName(std::string_view name) const;

    [[nodiscard]] std::string text(std::string_view name) const;
    [[nodiscard]] std::string optionalText(std::string_view name) const;
    [[nodiscard]] bool boolean(std::string_view name, bool otherwise) const;
    [[nodiscard]] std::optional<std::uint32_t> number(std::string_view name) const;
    [[nodiscard]] PropertyList propertyList() const;

    /** The path in the namespace of the call, without host. */
    [[nodiscard]] ObjectPath instanceName(std::string_view name) const;
    /** The same, or a path without keys where the argument is the name of a class. */
    [[nodiscard]] ObjectPath objectName(std::string_view name) const;
    /** The instance, its path in the namespace of the call. */
    [[nodiscard]] Instance instance(std::string_view name) const;

    /** As it came; monostate where there is none. */
    [[nodiscard]] const cimxml::Argument& raw(std::string_view name) const;

  private:
    [[nodiscard]] const cimxml::Argument* find(std::string_view name) const;
    [[nodiscard]] const cimxml::Argument& require(std::string_view name) const;
    [[nodiscard]] ObjectPath local(std::string_view name, ObjectPath path) const;

    const cimxml::IntrinsicCall& _call;
    const Schema& _schema;
    std::string _nameSpace;
};

/** The parameters AssocClass, ResultClass, Role and ResultRole of associators. */
AssociationFilter readAssociatorFilter(const Arguments& arguments);

/** ResultClass and Role of references, whose ResultClass is the class of the association. */
AssociationFilter readReferenceFilter(const Arguments& arguments);

/** Gives a key without a name, as DSP0201 allows it where there is one alone, the name that the schema has for it. */
void nameLoneKey(const Schema& schema, ObjectPath& path);

/** The class that a call is about, as far as its arguments name one, else empty; of calls that may be wrong, too. */
std::string subjectOf(const cimxml::IntrinsicCall& call);

} // namespace marlo::wbem

/**
 * @file
 * CIM operation messages (DSP0200) as they stand in XML (DSP0201), read and checked, but not yet compared with any
 * schema.
 */
#pragma once

#include "host/model/Instance.h"
#include "host/schema/Schema.h"

#include <optional>
#include <stdexcept>
#include <string>
#include <string_view>
#include <variant>
#include <vector>

namespace marlo::cimxml {

/** What one document may hold; one more is refused. */
struct Limits {
    std::size_t depth = 64;          ///< elements within each other
    std::size_t elements = 200000;   ///< of a document
    std::size_t attributes = 16;     ///< of an element
    std::size_t properties = 1000;   ///< of an instance or class
    std::size_t keys = 100;          ///< of an instance name
    std::size_t textBytes = 1 << 20; ///< of one value
};

/** A document that is none, and the word that the standard has for it in the field CIMError. */
class MessageError : public std::runtime_error {
  public:
    enum class Kind {
        notWellFormed,               ///< request-not-well-formed
        notValid,                    ///< request-not-valid
        notLooselyValid,             ///< request-not-loosely-valid
        unsupportedCimVersion,       ///< unsupported-cim-version
        unsupportedDtdVersion,       ///< unsupported-dtd-version
        unsupportedProtocolVersion,  ///< unsupported-protocol-version
        unsupportedOperation,        ///< unsupported-operation
        multipleRequestsUnsupported, ///< multiple-requests-unsupported: answered 501
    };

    MessageError(Kind kind, const std::string& what) : std::runtime_error(what), _kind(kind) {}

    [[nodiscard]] Kind kind() const { return _kind; }

  private:
    Kind _kind;
};

/** A text whose type only the schema knows. */
struct Untyped {
    std::string text;
    bool operator==(const Untyped&) const = default;
};

/** A NULL element of an array is nothing. */
using UntypedArray = std::vector<std::optional<Untyped>>;

/** Of a class name there is only the name. */
struct ClassName {
    std::string name;
};

/**
 * What an IPARAMVALUE or PARAMVALUE holds. Instance names are object paths; their keys are typed as far as KEYVALUE
 * says: TYPE where there is one, else texts for VALUETYPE string, booleans, and integers or reals for numeric.
 * Namespace and host are set where the element carried them. A key without a name (a lone KEYVALUE or
 * VALUE.REFERENCE) has an empty one.
 */
using Argument = std::variant<std::monostate, Untyped, UntypedArray, Value, ClassName, ObjectPath, Instance, Class,
                              Qualifier, QualifierType>;

struct NamedArgument {
    std::string name;
    Argument value; ///< monostate: NULL
};

/** An IMETHODCALL. */
struct IntrinsicCall {
    std::string method;
    std::string nameSpace; ///< "root/cimv2"
    std::vector<NamedArgument> arguments;
};

/** A METHODCALL: of an instance, or of a class where the path has no keys. */
struct ExtrinsicCall {
    std::string method;
    ObjectPath path;
    std::vector<NamedArgument> arguments;
};

/** An EXPMETHODCALL. */
struct ExportCall {
    std::string method;
    std::vector<NamedArgument> arguments;
};

struct Message {
    std::string id; ///< to be echoed, and nothing else
    std::string protocolVersion;
    std::variant<IntrinsicCall, ExtrinsicCall, ExportCall> call;
};

/** Reads a request; throws MessageError. DOCTYPE with a name alone is overlooked, entities are refused. */
Message readMessage(std::string_view document, const Limits& limits = {});

/**
 * A text as a value of a type, as DSP0201 writes it: integers also in hexadecimal, TRUE and FALSE without case,
 * char16 as one character. Nothing when it is none, or does not fit.
 */
std::optional<Value> readValue(const std::string& text, CMPIType type);

/** The argument as a value of a type, arrays element by element, monostate as NULL; nothing when it cannot be that.
 */
std::optional<Value> readArgument(const Argument& argument, CMPIType type);

} // namespace marlo::cimxml

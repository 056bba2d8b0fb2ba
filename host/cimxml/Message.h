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

/** What one document may hold; one more is refused (request-not-valid). */
struct Limits {
    std::size_t depth = 64;          ///< elements within each other
    std::size_t embedded = 8;        ///< embedded objects, which are documents of their own, within each other
    std::size_t elements = 200000;   ///< of a document
    std::size_t attributes = 16;     ///< of an element
    std::size_t properties = 1000;   ///< of an instance or class
    std::size_t keys = 100;          ///< of an instance name
    std::size_t textBytes = 1 << 20; ///< of one value or attribute
};

/**
 * A document that is no request, and the word that the standard has for it in the field CIMError. The text says
 * where, by line and column of the document counted from 1, and why.
 */
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
 *
 * PARAMTYPE is overlooked: what a parameter's type is, the schema says. Embedded objects (EmbeddedObject) are a Value
 * of CMPI_instance or an array of it, VALUE.REFARRAY one of CMPI_refA. A key or a property that is no value of the
 * type that its own element claims stays a text, so that it is compared with the schema, and refused, as any other.
 */
using Argument =
    std::variant<std::monostate, Untyped, UntypedArray, Value, ClassName, ObjectPath, Instance, Class, QualifierType>;

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

/**
 * Reads a request in UTF-8, with or without a byte order mark; throws MessageError. Other encodings are refused, and
 * so are entities but for the five of XML itself, and declarations in a DOCTYPE; what a DOCTYPE names is never looked
 * for. Elements that DSP0201 does not have are refused. Attributes that it does not have are overlooked: clients
 * write those of later versions, and xml:lang, into messages that are else as they should be. Any thread.
 */
Message readMessage(std::string_view text, const Limits& limits = {});

/**
 * A text as a value of a type, as DSP0201 writes it: integers also in hexadecimal, TRUE and FALSE without case,
 * char16 as one character, date-times of 25 characters (DSP0004). Texts are taken as they stand; white space around
 * all others is overlooked. Nothing when it is none, or does not fit; nothing for references, arrays and embedded
 * objects.
 */
std::optional<Value> readValue(const std::string& text, CMPIType type);

/**
 * The argument as a value of a type, arrays element by element, monostate as NULL; nothing when it cannot be that. An
 * embedded object can be a text: the schema has no type for it but string.
 */
std::optional<Value> readArgument(const Argument& argument, CMPIType type);

} // namespace marlo::cimxml

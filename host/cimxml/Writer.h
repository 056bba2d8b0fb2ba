/**
 * @file
 * Answers and exports in XML (DSP0201), piece by piece.
 */
#pragma once

#include "host/model/Instance.h"
#include "host/schema/Schema.h"

#include <functional>
#include <memory>
#include <string>
#include <string_view>

namespace marlo::cimxml {

/** What goes out with classes and instances. */
struct Form {
    bool qualifiers = false;
    bool classOrigin = false;
    bool operator==(const Form&) const = default;
};

/** How an instance is wrapped. */
enum class Wrap {
    instance,         ///< INSTANCE
    namedInstance,    ///< VALUE.NAMEDINSTANCE
    instanceWithPath, ///< VALUE.INSTANCEWITHPATH
    objectWithPath,   ///< VALUE.OBJECTWITHPATH
    object,           ///< VALUE.OBJECT
};

enum class PathWrap {
    name,   ///< INSTANCENAME
    path,   ///< INSTANCEPATH: host and namespace
    local,  ///< LOCALINSTANCEPATH
    object, ///< OBJECTPATH
};

/**
 * Writes one document to a sink, in pieces of some kilobytes. Characters that XML cannot carry become U+FFFD, and so
 * do bytes that are no UTF-8. What the sink throws is thrown on. Elements come in the order of the calls; whoever
 * calls keeps to the standard's order.
 */
class Writer {
  public:
    using Sink = std::function<void(std::string_view piece)>;

    /** `host` stands in paths that carry one. */
    Writer(Sink sink, std::string host);
    ~Writer();
    Writer(const Writer&) = delete;
    Writer& operator=(const Writer&) = delete;

    /** From the XML declaration to the opened IMETHODRESPONSE. */
    void beginIntrinsic(const std::string& messageId, const std::string& method);
    void beginReturnValue(); ///< IRETURNVALUE
    void endReturnValue();
    void error(unsigned code, const std::string& description);
    /** PARAMVALUE with PARAMTYPE, as open and pull operations give back EnumerationContext and EndOfSequence. */
    void outParameter(const NamedValue& parameter);
    void endIntrinsic();

    /** From the XML declaration to the opened METHODRESPONSE. */
    void beginExtrinsic(const std::string& messageId, const std::string& method);
    void returnValue(const Value& value); ///< RETURNVALUE with PARAMTYPE; nothing for NULL
    void endExtrinsic();

    /**
     * `definition` gives qualifiers, class origins and the classes of references; null where there is none. It lives
     * and stays as it is until this writer is gone: what all instances of a class have in common is written once and
     * kept.
     */
    void instance(const Instance& instance, Wrap wrap, const Class* definition, const Form& form);
    void path(const ObjectPath& path, PathWrap wrap);
    void className(const std::string& name);                               ///< CLASSNAME
    void classPath(const std::string& nameSpace, const std::string& name); ///< CLASSPATH in OBJECTPATH
    void classDefinition(const Class& definition, const Form& form);
    /** CLASSPATH and CLASS in VALUE.OBJECTWITHPATH, as associations of classes give them. */
    void classWithPath(const std::string& nameSpace, const Class& definition, const Form& form);
    void qualifierDeclaration(const QualifierType& type);
    /** VALUE, VALUE.ARRAY, VALUE.REFERENCE; nothing for NULL. For GetProperty. */
    void value(const Value& value);

    /** A whole EXPMETHODCALL of ExportIndication. */
    void exportIndication(const std::string& messageId, const Instance& indication);

    /** Hands what is left to the sink. */
    void finish();

  private:
    struct State;
    std::unique_ptr<State> _state;
};

} // namespace marlo::cimxml

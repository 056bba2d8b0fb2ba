#include "host/cimxml/Writer.h"

#include "host/cimxml/ClassMarkup.h"
#include "host/cimxml/Escape.h"
#include "host/cimxml/ObjectMarkup.h"
#include "host/cimxml/ValueMarkup.h"

#include <deque>

namespace marlo::cimxml {

namespace {

constexpr std::size_t pieceBytes = 16384;
constexpr std::size_t roomBytes = 24576; ///< so that what goes beyond a piece seldom needs more room

constexpr std::string_view declaration = "<?xml version=\"1.0\" encoding=\"utf-8\" ?>\n";

} // namespace

struct Writer::State {
    Sink sink;
    std::string host;
    std::string out;
    std::deque<InstanceMarkup> prepared; ///< of the classes that came so far; seldom more than one

    void passOn() {
        if (out.size() >= pieceBytes) {
            flush();
        }
    }

    void flush() {
        if (!out.empty()) {
            sink(out);
            out.clear();
        }
    }

    void begin(const std::string& messageId, std::string_view request) {
        out += declaration;
        out += R"(<CIM CIMVERSION="2.0" DTDVERSION="2.0"><MESSAGE)";
        appendAttribute(out, "ID", messageId);
        out += " PROTOCOLVERSION=\"1.0\"><";
        out += request;
        out += '>';
    }

    void beginResponse(const std::string& messageId, std::string_view element, const std::string& method) {
        begin(messageId, "SIMPLERSP");
        out += '<';
        out += element;
        appendAttribute(out, "NAME", method);
        out += '>';
    }

    const InstanceMarkup& markupOf(const Class& definition, const Form& form) {
        for (const InstanceMarkup& one : prepared) {
            if (one.isOf(&definition, form)) {
                return one;
            }
        }
        return prepared.emplace_back(definition, form);
    }

    void instance(const Instance& instance, const Class* definition, const Form& form) {
        if (definition == nullptr) {
            appendInstance(out, instance);
        } else {
            markupOf(*definition, form).append(out, instance);
        }
    }

    /** NAME and, where they tell something, PARAMTYPE and EmbeddedObject. */
    void parameterAttributes(const Value& value) {
        if (value.type != CMPI_null) {
            appendAttribute(out, "PARAMTYPE", typeAttribute(value.type));
        }
        if ((value.type & ~CMPI_ARRAY) == CMPI_instance) {
            appendAttribute(out, "EmbeddedObject", "instance");
        }
    }
};

Writer::Writer(Sink sink, std::string host)
    : _state(std::make_unique<State>(State{std::move(sink), std::move(host), {}, {}})) {
    _state->out.reserve(roomBytes);
}

Writer::~Writer() = default;

void Writer::beginIntrinsic(const std::string& messageId, const std::string& method) {
    _state->beginResponse(messageId, "IMETHODRESPONSE", method);
}

void Writer::beginReturnValue() {
    _state->out += "<IRETURNVALUE>";
}

void Writer::endReturnValue() {
    _state->out += "</IRETURNVALUE>";
}

void Writer::error(unsigned code, const std::string& description) {
    _state->out += "<ERROR";
    appendAttribute(_state->out, "CODE", std::to_string(code));
    appendAttribute(_state->out, "DESCRIPTION", description);
    _state->out += "/>";
}

void Writer::outParameter(const NamedValue& parameter) {
    _state->out += "<PARAMVALUE";
    appendAttribute(_state->out, "NAME", parameter.name);
    _state->parameterAttributes(parameter.value);
    _state->out += '>';
    appendValue(_state->out, parameter.value);
    _state->out += "</PARAMVALUE>";
    _state->passOn();
}

void Writer::endIntrinsic() {
    _state->out += "</IMETHODRESPONSE></SIMPLERSP></MESSAGE></CIM>\n";
}

void Writer::beginExtrinsic(const std::string& messageId, const std::string& method) {
    _state->beginResponse(messageId, "METHODRESPONSE", method);
}

void Writer::returnValue(const Value& value) {
    if (value.isNull()) {
        return;
    }
    _state->out += "<RETURNVALUE";
    _state->parameterAttributes(value);
    _state->out += '>';
    appendValue(_state->out, value);
    _state->out += "</RETURNVALUE>";
}

void Writer::endExtrinsic() {
    _state->out += "</METHODRESPONSE></SIMPLERSP></MESSAGE></CIM>\n";
}

void Writer::instance(const Instance& instance, Wrap wrap, const Class* definition, const Form& form) {
    std::string& out = _state->out;
    switch (wrap) {
    case Wrap::instance:
        _state->instance(instance, definition, form);
        break;
    case Wrap::namedInstance:
        out += "<VALUE.NAMEDINSTANCE>";
        appendPath(out, instance.path, PathWrap::name, _state->host);
        _state->instance(instance, definition, form);
        out += "</VALUE.NAMEDINSTANCE>";
        break;
    case Wrap::instanceWithPath:
        out += "<VALUE.INSTANCEWITHPATH>";
        appendPath(out, instance.path, PathWrap::path, _state->host);
        _state->instance(instance, definition, form);
        out += "</VALUE.INSTANCEWITHPATH>";
        break;
    case Wrap::objectWithPath:
        out += "<VALUE.OBJECTWITHPATH>";
        appendPath(out, instance.path, PathWrap::path, _state->host);
        _state->instance(instance, definition, form);
        out += "</VALUE.OBJECTWITHPATH>";
        break;
    case Wrap::object:
        out += "<VALUE.OBJECT>";
        _state->instance(instance, definition, form);
        out += "</VALUE.OBJECT>";
        break;
    }
    _state->passOn();
}

void Writer::path(const ObjectPath& path, PathWrap wrap) {
    appendPath(_state->out, path, wrap, _state->host);
    _state->passOn();
}

void Writer::className(const std::string& name) {
    appendClassName(_state->out, name);
    _state->passOn();
}

void Writer::classPath(const std::string& nameSpace, const std::string& name) {
    _state->out += "<OBJECTPATH>";
    appendClassPath(_state->out, _state->host, nameSpace, name);
    _state->out += "</OBJECTPATH>";
    _state->passOn();
}

void Writer::classDefinition(const Class& definition, const Form& form) {
    appendClass(_state->out, definition, form);
    _state->passOn();
}

void Writer::classWithPath(const std::string& nameSpace, const Class& definition, const Form& form) {
    _state->out += "<VALUE.OBJECTWITHPATH>";
    appendClassPath(_state->out, _state->host, nameSpace, definition.name);
    appendClass(_state->out, definition, form);
    _state->out += "</VALUE.OBJECTWITHPATH>";
    _state->passOn();
}

void Writer::qualifierDeclaration(const QualifierType& type) {
    appendQualifierType(_state->out, type);
    _state->passOn();
}

void Writer::value(const Value& value) {
    appendValue(_state->out, value);
    _state->passOn();
}

void Writer::exportIndication(const std::string& messageId, const Instance& indication) {
    _state->begin(messageId, "SIMPLEEXPREQ");
    _state->out += R"(<EXPMETHODCALL NAME="ExportIndication"><EXPPARAMVALUE NAME="NewIndication">)";
    appendInstance(_state->out, indication);
    _state->out += "</EXPPARAMVALUE></EXPMETHODCALL></SIMPLEEXPREQ></MESSAGE></CIM>\n";
}

void Writer::finish() {
    _state->flush();
}

} // namespace marlo::cimxml

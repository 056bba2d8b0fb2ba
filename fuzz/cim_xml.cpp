#include "fuzz/Require.h"
#include "host/cimxml/Message.h"
#include "host/cimxml/Writer.h"

/** Any text as a message: what is read from it is written, read again, and written as before. */
namespace {

using namespace marlo;
using cimxml::NamedArgument;
using fuzz::require;

/** Documents of this size and more take long and show nothing that smaller ones do not. */
constexpr std::size_t longest = 65536;

constexpr CMPIType types[] = {CMPI_boolean, CMPI_char16, CMPI_uint8,    CMPI_sint64, CMPI_real32,
                              CMPI_real64,  CMPI_string, CMPI_dateTime, CMPI_ref,    CMPI_instance};

const std::vector<NamedArgument>& argumentsOf(const cimxml::Message& message) {
    return std::visit([](const auto& call) -> const std::vector<NamedArgument>& { return call.arguments; },
                      message.call);
}

class Write {
  public:
    explicit Write(cimxml::Writer& writer) : _writer(writer) {}

    void operator()(const Value& value) const {
        if (!value.isNull()) {
            _writer.value(value);
        }
    }

    void operator()(const ObjectPath& path) const {
        _writer.value({CMPI_ref, std::make_shared<const ObjectPath>(path)});
    }

    void operator()(const Instance& instance) const {
        _writer.instance(instance, cimxml::Wrap::namedInstance, nullptr, {});
    }

    void operator()(const Class& definition) const { _writer.classDefinition(definition, {true, true}); }

    void operator()(const QualifierType& type) const { _writer.qualifierDeclaration(type); }

    void operator()(const cimxml::ClassName& name) const { _writer.className(name.name); }

    void operator()(const cimxml::Untyped& text) const { _writer.value(Value::string(text.text)); }

    void operator()(const cimxml::UntypedArray& /*texts*/) const {}

    void operator()(std::monostate) const {}

  private:
    cimxml::Writer& _writer;
};

std::string written(const cimxml::Argument& argument) {
    std::string text;
    cimxml::Writer writer([&text](std::string_view piece) { text += piece; }, "host");
    std::visit(Write(writer), argument);
    writer.finish();
    return text;
}

cimxml::Message readAgain(const std::string& element, bool isEmbedded) {
    const std::string attribute = isEmbedded ? " EmbeddedObject=\"instance\"" : "";
    return cimxml::readMessage(
        "<CIM CIMVERSION=\"2.0\" DTDVERSION=\"2.0\"><MESSAGE ID=\"1\" PROTOCOLVERSION=\"1.0\"><SIMPLEREQ>"
        "<IMETHODCALL NAME=\"A\"><LOCALNAMESPACEPATH><NAMESPACE NAME=\"a\"/></LOCALNAMESPACEPATH>"
        "<IPARAMVALUE NAME=\"B\"" +
        attribute + ">" + element + "</IPARAMVALUE></IMETHODCALL></SIMPLEREQ></MESSAGE></CIM>");
}

void requireRoundTrip(const cimxml::Argument& argument) {
    for (const CMPIType type : types) {
        (void)cimxml::readArgument(argument, type);
        (void)cimxml::readArgument(argument, static_cast<CMPIType>(type | CMPI_ARRAY));
    }
    const std::string once = written(argument);
    if (once.empty()) {
        return;
    }
    const auto* value = std::get_if<Value>(&argument);
    const bool isEmbedded = value != nullptr && (value->type & ~CMPI_ARRAY) == CMPI_instance;
    require(written(argumentsOf(readAgain(once, isEmbedded)).at(0).value) == once, "what was written is read back");
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    if (size >= longest) {
        return 0;
    }
    try {
        const cimxml::Message message = cimxml::readMessage(fuzz::textOf(data, size));
        for (const NamedArgument& argument : argumentsOf(message)) {
            requireRoundTrip(argument.value);
        }
        if (const auto* call = std::get_if<cimxml::ExtrinsicCall>(&message.call)) {
            requireRoundTrip(call->path);
        }
    } catch (const cimxml::MessageError& error) {
        require(*error.what() != '\0', "a refusal has its reason");
    }
    return 0;
}

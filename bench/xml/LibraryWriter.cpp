#include "bench/xml/LibraryWriter.h"

#include <memory>
#include <variant>

#include <libxml/xmlwriter.h>

namespace marlo::bench {

namespace {

struct Free {
    void operator()(xmlBuffer* buffer) const { xmlBufferFree(buffer); }

    void operator()(xmlTextWriter* writer) const { xmlFreeTextWriter(writer); }
};

const xmlChar* xmlChars(const char* text) {
    return reinterpret_cast<const xmlChar*>(text); // NOLINT: libxml2's bytes of UTF-8
}

/** Short names for what is written; data is at hand, so that nothing is converted but numbers. */
class Output {
  public:
    Output() : _buffer(xmlBufferCreate()), _writer(xmlNewTextWriterMemory(_buffer.get(), 0)) {}

    void begin(const char* name) { xmlTextWriterStartElement(_writer.get(), xmlChars(name)); }

    void attribute(const char* name, const std::string& value) {
        xmlTextWriterWriteAttribute(_writer.get(), xmlChars(name), xmlChars(value.c_str()));
    }

    void text(const std::string& value) { xmlTextWriterWriteString(_writer.get(), xmlChars(value.c_str())); }

    void raw(const char* value) { xmlTextWriterWriteRaw(_writer.get(), xmlChars(value)); }

    void end() { xmlTextWriterFullEndElement(_writer.get()); }

    std::string take() {
        xmlTextWriterFlush(_writer.get());
        const auto* bytes = reinterpret_cast<const char*>(xmlBufferContent(_buffer.get())); // NOLINT: as above
        return {bytes, static_cast<std::size_t>(xmlBufferLength(_buffer.get()))};
    }

  private:
    std::unique_ptr<xmlBuffer, Free> _buffer;
    std::unique_ptr<xmlTextWriter, Free> _writer;
};

std::string textOf(const Value& value) {
    if (const auto* text = std::get_if<std::string>(&value.data)) {
        return *text;
    }
    if (const auto* number = std::get_if<std::uint64_t>(&value.data)) {
        return std::to_string(*number);
    }
    if (const auto* truth = std::get_if<bool>(&value.data)) {
        return *truth ? "TRUE" : "FALSE";
    }
    return std::get<DateTime>(value.data).text;
}

void writeValue(Output& out, const Value& value) {
    out.begin("VALUE");
    out.text(textOf(value));
    out.end();
}

void writeProperty(Output& out, const NamedValue& property) {
    out.begin(property.value.isArray() ? "PROPERTY.ARRAY" : "PROPERTY");
    out.attribute("NAME", property.name);
    out.attribute("TYPE", typeName(property.value.type));
    if (const auto* elements = std::get_if<Value::Array>(&property.value.data)) {
        out.begin("VALUE.ARRAY");
        for (const Value& element : *elements) {
            writeValue(out, element);
        }
        out.end();
    } else {
        writeValue(out, property.value);
    }
    out.end();
}

void writePath(Output& out, const ObjectPath& path) {
    out.begin("INSTANCENAME");
    out.attribute("CLASSNAME", path.className);
    for (const NamedValue& key : path.keys) {
        out.begin("KEYBINDING");
        out.attribute("NAME", key.name);
        out.begin("KEYVALUE");
        out.attribute("VALUETYPE", "string");
        out.attribute("TYPE", "string");
        out.text(textOf(key.value));
        out.end();
        out.end();
    }
    out.end();
}

} // namespace

std::string writeByLibrary(const std::vector<Instance>& instances) {
    Output out;
    out.raw(
        "<?xml version=\"1.0\" encoding=\"utf-8\" ?>\n<CIM CIMVERSION=\"2.0\" DTDVERSION=\"2.0\"><MESSAGE ID=\"1\" "
        "PROTOCOLVERSION=\"1.0\"><SIMPLERSP><IMETHODRESPONSE NAME=\"EnumerateInstances\"><IRETURNVALUE>");
    for (const Instance& instance : instances) {
        out.begin("VALUE.NAMEDINSTANCE");
        writePath(out, instance.path);
        out.begin("INSTANCE");
        out.attribute("CLASSNAME", instance.path.className);
        for (const NamedValue& property : instance.properties) {
            writeProperty(out, property);
        }
        out.end();
        out.end();
    }
    out.raw("</IRETURNVALUE></IMETHODRESPONSE></SIMPLERSP></MESSAGE></CIM>\n");
    return out.take();
}

} // namespace marlo::bench

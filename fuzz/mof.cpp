#include "fuzz/Require.h"
#include "host/schema/Schema.h"

#include <algorithm>
#include <stdexcept>

/** Any text as MOF: it is refused with its place, or it is a schema in which everything that is named is found. */
namespace {

using namespace marlo;
using fuzz::require;

/** Other files are none of the fuzzer's. */
bool includesFiles(std::string_view text) {
    constexpr std::string_view word = "include";
    return std::search(text.begin(), text.end(), word.begin(), word.end(), [](char left, char right) {
               return (static_cast<unsigned char>(left) | 0x20U) == static_cast<unsigned char>(right);
           }) != text.end();
}

void requireWhole(const Schema& schema, const std::string& nameSpace, const Class& definition) {
    require(schema.findClass(nameSpace, definition.name) == &definition, "a class is found by its name");
    require(schema.isA(nameSpace, definition.name, definition.name), "a class is itself");
    if (!definition.superClass.empty()) {
        const Class* superClass = schema.findClass(nameSpace, definition.superClass);
        require(superClass != nullptr, "a superclass is of the schema");
        require(superClass->properties.size() <= definition.properties.size(), "properties are inherited");
        require(superClass->methods.size() <= definition.methods.size(), "methods are inherited");
        require(!schema.isA(nameSpace, definition.superClass, definition.name), "no class derives from itself");
    }
    for (const Property& property : definition.properties) {
        require(definition.findProperty(property.name) == &property, "no name is of two properties");
        require(property.defaultValue.type == property.type, "a default has the property's type");
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    const std::string_view text = fuzz::textOf(data, size);
    if (includesFiles(text)) {
        return 0;
    }
    try {
        const Schema schema = Schema::readText(text, "fuzz.mof");
        for (const std::string& nameSpace : schema.nameSpaces()) {
            for (const Class* definition : schema.classes(nameSpace)) {
                requireWhole(schema, nameSpace, *definition);
            }
        }
    } catch (const std::runtime_error& error) {
        require(std::string_view(error.what()).starts_with("fuzz.mof"), "a refusal names the file");
    }
    return 0;
}

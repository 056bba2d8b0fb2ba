#include "instrumentation/Localisation.h"

#include "tests/support/scripted_agent/Recorder.h"
#include "tests/support/scripted_agent/ScriptedAgent.h"

using scripted_agent::add;
using scripted_agent::announced;
using scripted_agent::quoted;
using scripted_agent::script;

namespace {

/** Enough for the texts of tests: what is not ASCII is shown as a question mark. */
std::string narrow(const std::wstring& text) {
    std::string narrowed;
    for (const wchar_t letter : text) {
        narrowed += letter > L'\0' && letter < 0x80 ? static_cast<char>(letter) : '?';
    }
    return narrowed;
}

std::string shown(const std::wstring& text) {
    return quoted(narrow(text).c_str());
}

} // namespace

namespace Orv {

class ResourceLibrary {
  public:
    unsigned int component;
    unsigned int languageId;
};

unsigned int Locale::getLanguageId() {
    (void)announced([] { return std::string("Locale::getLanguageId()"); });
    add("Locale::getLanguageId() = " + std::to_string(script().languageId));
    return script().languageId;
}

const ResourceLibrary* Locale::getResourceLibrary(unsigned int component, unsigned int languageId) {
    add(announced([&] {
        return "Locale::getResourceLibrary(" + std::to_string(component) + ", " + std::to_string(languageId) + ")";
    }));
    static const ResourceLibrary library{1, 7};
    return component == library.component && languageId == library.languageId ? &library : nullptr;
}

std::wstring ResourceString(const ResourceLibrary* library, const std::wstring& resourceId) {
    const std::string call = announced([&] {
        return "ResourceString(" + std::string(library != nullptr ? "" : "null, ") + shown(resourceId) + ")";
    });
    const auto found = script().messages.find(resourceId);
    std::wstring text = library != nullptr && found != script().messages.end() ? found->second : L"";
    add(call + " = " + shown(text));
    return text;
}

std::string make_string(const std::wstring& text) {
    add(announced([&] { return "make_string(" + shown(text) + ")"; }));
    return narrow(text);
}

std::wstring Product::getUid() {
    (void)announced([] { return std::string("Product::getUid()"); });
    add("Product::getUid() = " + shown(script().uid));
    return script().uid;
}

} // namespace Orv

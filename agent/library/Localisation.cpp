#include "instrumentation/Localisation.h"

#include "agent/library/MessageTexts.h"
#include "agent/library/SystemIdentifier.h"

#include <memory>

namespace Orv {

namespace {

constexpr char32_t replacement = 0xFFFD;

bool isScalar(char32_t character) {
    return character <= 0x10FFFF && (character < 0xD800 || character > 0xDFFF);
}

/** RFC 3629. */
void appendUtf8(char32_t character, std::string& text) {
    const auto put = [&](char32_t byte) { text += static_cast<char>(static_cast<unsigned char>(byte)); };
    if (character < 0x80) {
        put(character);
    } else if (character < 0x800) {
        put(0xC0U | character >> 6U);
        put(0x80U | (character & 0x3FU));
    } else if (character < 0x10000) {
        put(0xE0U | character >> 12U);
        put(0x80U | (character >> 6U & 0x3FU));
        put(0x80U | (character & 0x3FU));
    } else {
        put(0xF0U | character >> 18U);
        put(0x80U | (character >> 12U & 0x3FU));
        put(0x80U | (character >> 6U & 0x3FU));
        put(0x80U | (character & 0x3FU));
    }
}

} // namespace

unsigned int Locale::getLanguageId() {
    return static_cast<unsigned int>(Agent::environmentLanguage());
}

const ResourceLibrary* Locale::getResourceLibrary(unsigned int component, unsigned int languageId) {
    return Agent::resourceLibrary(component, languageId);
}

std::wstring ResourceString(const ResourceLibrary* library, const std::wstring& resourceId) {
    if (library == nullptr) {
        return {};
    }
    const auto found = library->texts().find(resourceId);
    return found == library->texts().end() ? std::wstring() : std::wstring(found->second);
}

std::string make_string(const std::wstring& text) {
    std::string result;
    result.reserve(text.size());
    for (const wchar_t wide : text) {
        const auto character = static_cast<char32_t>(wide);
        appendUtf8(isScalar(character) ? character : replacement, result);
    }
    return result;
}

std::wstring Product::getUid() {
    // Read once, since it never changes; never destroyed, since an alert may be on its way when static objects are.
    static const auto* const identifier = [] {
        const std::string text = Agent::readSystemIdentifier("");
        return std::make_unique<std::wstring>(text.begin(), text.end()).release();
    }();
    return *identifier;
}

} // namespace Orv

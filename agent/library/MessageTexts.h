/**
 * @file
 * The texts of the agent's messages, by language.
 */
#pragma once

#include <map>
#include <string>
#include <string_view>

namespace Orv {

/** The texts of one component in one language. */
class ResourceLibrary {
  public:
    using Texts = std::map<std::wstring_view, std::wstring_view>;

    explicit ResourceLibrary(Texts texts) : _texts(std::move(texts)) {}

    /** By resource id. */
    [[nodiscard]] const Texts& texts() const { return _texts; }

  private:
    Texts _texts;
};

namespace Agent {

enum class Language : unsigned int { english = 1, german = 2 };

constexpr unsigned int adapterComponent = 1;

/** The language of a locale's name, such as "de_DE.UTF-8"; English for what there are no texts in. */
Language languageOf(std::string_view localeName);

/** The language that LC_ALL, LC_MESSAGES or LANG asks for: the first that is set and not empty counts. */
Language environmentLanguage();

/** Null when there are no such texts; else alive as long as the process. */
const ResourceLibrary* resourceLibrary(unsigned int component, unsigned int language);

} // namespace Agent

} // namespace Orv

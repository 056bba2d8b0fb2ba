/**
 * @file
 * What the agent knows of the administrator's language and of the product: message texts, and the system's
 * identifier.
 *
 * All operations may be called from any thread at any time.
 */
#pragma once

#include "instrumentation/Export.h"

#include <string>

namespace Orv {

/** The message texts of one component in one language. Opaque; it belongs to the agent and lives as long as that. */
class ResourceLibrary;

/** The language in which the agent's messages are read. */
class ORV_API Locale {
  public:
    /**
     * The agent's number for the language that the environment of this process asks for (LC_ALL, LC_MESSAGES, LANG,
     * the first that is set). A language that the agent has no texts in gives the number of English.
     */
    [[nodiscard]] static unsigned int getLanguageId();

    /**
     * The texts of a component (1: network adapters) in a language that getLanguageId gave; null when the agent has
     * none.
     */
    [[nodiscard]] static const ResourceLibrary* getResourceLibrary(unsigned int component, unsigned int languageId);
};

/**
 * The text behind a resource id, such as L"MSGID_NAI_NIC_ONLINE"; empty when the library is null or lacks it. No text
 * holds a percent sign: texts are used as formats without arguments.
 */
[[nodiscard]] ORV_API std::wstring ResourceString(const ResourceLibrary* library, const std::wstring& resourceId);

/** A wide text (UTF-32) in UTF-8; what is no Unicode scalar value becomes U+FFFD. */
[[nodiscard]] ORV_API std::string make_string(const std::wstring& text);

/** The product that the agent runs in. */
class ORV_API Product {
  public:
    /**
     * The identifier of this system, the same after every start: the UUID of its firmware (SMBIOS) where this process
     * may read it, else the machine id of the operating system; empty when there is neither.
     */
    [[nodiscard]] static std::wstring getUid();
};

} // namespace Orv

#include "agent/library/MessageTexts.h"

#include <cstdlib>
#include <memory>

namespace Orv::Agent {

namespace {

ResourceLibrary::Texts englishTexts() {
    return {{L"MSGID_NAI_NIC_OFFLINE", L"The network adapter is offline."},
            {L"MSGID_NAI_NIC_ONLINE", L"The network adapter is online."},
            {L"MSGID_NAI_NIC_SWITCHOVER", L"The network adapter has switched over to a backup member."},
            {L"MSGID_NAI_NIC_SWITCHBACK", L"The network adapter has switched back to its primary member."},
            {L"MSGID_NAI_NIC_FAILED", L"The network adapter has failed."}};
}

ResourceLibrary::Texts germanTexts() {
    return {{L"MSGID_NAI_NIC_OFFLINE", L"Der Netzwerkadapter ist offline."},
            {L"MSGID_NAI_NIC_ONLINE", L"Der Netzwerkadapter ist online."},
            {L"MSGID_NAI_NIC_SWITCHOVER", L"Der Netzwerkadapter hat auf ein Ersatzmitglied umgeschaltet."},
            {L"MSGID_NAI_NIC_SWITCHBACK",
             L"Der Netzwerkadapter hat auf sein prim\u00e4res Mitglied zur\u00fcckgeschaltet."},
            {L"MSGID_NAI_NIC_FAILED", L"Der Netzwerkadapter ist ausgefallen."}};
}

} // namespace

Language languageOf(std::string_view localeName) {
    return localeName.substr(0, localeName.find_first_of("_.@")) == "de" ? Language::german : Language::english;
}

Language environmentLanguage() {
    for (const char* name : {"LC_ALL", "LC_MESSAGES", "LANG"}) {
        const char* value = std::getenv(name);
        if (value != nullptr && *value != '\0') {
            return languageOf(value);
        }
    }
    return Language::english;
}

const ResourceLibrary* resourceLibrary(unsigned int component, unsigned int language) {
    // Never destroyed: an alert may still be on its way when static objects are.
    static const auto* const english = std::make_unique<ResourceLibrary>(englishTexts()).release();
    static const auto* const german = std::make_unique<ResourceLibrary>(germanTexts()).release();
    if (component != adapterComponent) {
        return nullptr;
    }
    switch (static_cast<Language>(language)) {
    case Language::english:
        return english;
    case Language::german:
        return german;
    }
    return nullptr;
}

} // namespace Orv::Agent

#include "agent/persistence/Ifupdown.h"

#include "agent/persistence/DhcpClient.h"
#include "agent/persistence/InterfacesFiles.h"
#include "agent/persistence/Joined.h"

#include <algorithm>
#include <array>
#include <filesystem>
#include <stdexcept>

#include <fnmatch.h>

namespace Orv::Agent::Persistence {

namespace {

using Place = InterfacesFiles::Place;

constexpr std::array<std::string_view, 4> editableMethods{"static", "dhcp", "bootp", "manual"};
constexpr std::array<std::string_view, 5> addressOptions{"address", "netmask", "broadcast", "network", "gateway"};

/** iface NAME FAMILY METHOD ... */
bool isStanzaOf(const Place& place, const std::string& interface) {
    return place.keyword() == "iface" && place.words().size() >= 4 && place.words()[1].text == interface;
}

bool isIpv4StanzaOf(const Place& place, const std::string& interface) {
    return isStanzaOf(place, interface) && place.words()[2].text == "inet";
}

bool isSelection(const Place& place) {
    return place.keyword() == "auto" || place.keyword().starts_with("allow-");
}

/** Whether a word of an `auto` or `allow-` line selects the interface: by its name, or by a pattern "/eth*". */
bool selects(std::string word, const std::string& interface) {
    word = word.substr(0, word.find('='));
    if (!word.starts_with('/')) {
        return word == interface;
    }
    const std::string pattern = word.substr(1, word.find('/', 1) - 1);
    return fnmatch(pattern.c_str(), interface.c_str(), 0) == 0;
}

template <typename Predicate>
bool anySelection(const InterfacesFiles& files, const std::string& interface, Predicate predicate) {
    return std::any_of(files.stanzas().begin(), files.stanzas().end(), [&](const Place& place) {
        return isSelection(place) &&
               std::any_of(place.words().begin() + 1, place.words().end(), [&](const InterfacesFile::Word& word) {
                   return selects(word.text, interface) && predicate(word.text);
               });
    });
}

void refuseIndirection(const InterfacesFiles& files, const std::string& interface) {
    for (const Place& place : files.stanzas()) {
        const auto& words = place.words();
        const bool maps = place.keyword() == "mapping" &&
                          std::any_of(words.begin() + 1, words.end(), [&](const InterfacesFile::Word& word) {
                              return fnmatch(word.text.c_str(), interface.c_str(), 0) == 0;
                          });
        if (maps) {
            throw std::runtime_error(place.file->path + ": a script chooses its configuration (\"mapping\")");
        }
    }
    if (anySelection(files, interface, [](const std::string& word) { return word.find('=') != std::string::npos; })) {
        throw std::runtime_error("its configuration in /etc/network/interfaces has a logical name");
    }
}

/** The stanza to edit; null when there is none. */
const Place* stanzaOf(const InterfacesFiles& files, const std::string& interface) {
    const Place* found = nullptr;
    for (const Place& place : files.stanzas()) {
        const bool isFirst = found == nullptr || found->words()[3].text == "manual";
        if (isIpv4StanzaOf(place, interface) && isFirst && (found == nullptr || place.words()[3].text != "manual")) {
            found = &place;
        }
    }
    if (found == nullptr) {
        return nullptr;
    }
    const std::string& method = found->words()[3].text;
    if (std::find(editableMethods.begin(), editableMethods.end(), method) == editableMethods.end()) {
        throw std::runtime_error(found->file->path + ": its method is \"" + method + "\", which cannot be edited");
    }
    if (found->words().size() > 4) {
        throw std::runtime_error(found->file->path + ": its stanza inherits from another");
    }
    return found;
}

/** A mask as the file writes masks: in dotted form, or as a number. */
std::string maskLike(const std::string& before, std::uint8_t prefixLength) {
    const bool isNumber = before.find_first_not_of("0123456789") == std::string::npos;
    return isNumber ? std::to_string(prefixLength) : maskOf(prefixLength).text();
}

void editAddress(StanzaEditor& editor, const Ipv4Prefixed& address) {
    const std::string before = editor.value("address").value_or("");
    const auto mask = editor.value("netmask");
    const bool maskSays = mask && before.find('/') == std::string::npos;
    editor.set("address", maskSays ? address.address.text() : address.text());
    if (mask && prefixLengthOf(Ipv4Address::parse(*mask).value_or(Ipv4Address{1})) != address.prefixLength) {
        editor.set("netmask", maskLike(*mask, address.prefixLength));
    }
    // "+" and "-" are computed anew by ifup; a written out address would be that of the former network.
    if (Ipv4Address::parse(editor.value("broadcast").value_or(""))) {
        editor.set("broadcast", address.broadcast().text());
    }
    if (editor.value("network")) {
        editor.set("network", Ipv4Address{address.address.number & maskOf(address.prefixLength).number}.text());
    }
}

void editIpv4(StanzaEditor& editor, const Ipv4Settings& wanted, const std::string& method) {
    const bool isLeased = wanted.mode == AddressMode::leased;
    if (isLeased || !wanted.address) {
        editor.setHeaderWord(3, !isLeased ? "manual" : method == "bootp" ? "bootp" : "dhcp");
        for (const std::string_view option : addressOptions) {
            editor.remove(option);
        }
        return;
    }
    editor.setHeaderWord(3, "static");
    editAddress(editor, *wanted.address);
    if (wanted.gateway) {
        editor.set("gateway", wanted.gateway->text(), {"address", "netmask", "broadcast", "network"});
    } else {
        editor.remove("gateway");
    }
}

/** One dns-* option: edited where it stands, added where resolvconf is there to read it. */
void editName(StanzaEditor& editor, std::string_view option, const std::string& value, bool isAdded) {
    if (value.empty()) {
        editor.remove(option);
    } else if (editor.value(option)) {
        editor.set(option, value);
    } else if (isAdded) {
        editor.append(option, value);
    }
}

void editNames(StanzaEditor& editor, const NameSettings& wanted, bool isAdded) {
    if (wanted.servers) {
        // The older form has a line for each server.
        const bool isOlder = editor.value("dns-nameserver").has_value();
        editor.remove("dns-nameserver");
        editName(editor, "dns-nameservers", joined(*wanted.servers), isAdded || isOlder);
    }
    if (wanted.suffixes) {
        editName(editor, "dns-search", joined(*wanted.suffixes), isAdded);
    }
    if (wanted.domain) {
        editName(editor, "dns-domain", *wanted.domain, isAdded);
    }
}

/** The content of the file with the stanza edited. */
std::string edited(const InterfacesFile& file, const InterfacesFile::Stanza& stanza, const AdapterSettings& wanted,
                   bool namesAreRead) {
    TextEdit edit;
    StanzaEditor editor(file, stanza, edit);
    if (wanted.ipv4) {
        editIpv4(editor, *wanted.ipv4, file.header(stanza).words[3].text);
    }
    editNames(editor, wanted.names, namesAreRead);
    return edit.applied(file.text());
}

/** Whether a script that ifup runs hands dns-* options on. */
bool readsNames(const Environment& environment) {
    const bool hasResolved = std::filesystem::exists(environment.root + "/etc/network/if-up.d/resolved") &&
                             std::filesystem::exists(environment.root + "/run/systemd/resolve");
    return hasResolved || std::filesystem::exists(environment.commands.resolvconf.front());
}

/** Interfaces that are there from the beginning are brought up when they are found, where the files do it so. */
std::string selectionFor(const InterfacesFiles& files, const InterfaceFacts& interface) {
    const auto selecting = std::find_if(files.stanzas().begin(), files.stanzas().end(), [](const Place& place) {
        return isSelection(place) && !(place.words().size() == 2 && place.words()[1].text == "lo");
    });
    const bool isHotplug = selecting != files.stanzas().end() && selecting->keyword() == "allow-hotplug";
    return isHotplug && interface.kind.empty() ? "allow-hotplug " : "auto ";
}

/** A bare stanza at the end of the file, to be edited like any other. */
std::string withStanza(const InterfacesFiles& files, const InterfacesFile& file, const InterfaceFacts& interface) {
    const std::string newline = file.newline();
    std::string text = file.text();
    text += text.empty() ? "" : text.ends_with('\n') ? newline : newline + newline;
    if (!anySelection(files, interface.name, [](const std::string&) { return true; })) {
        text += selectionFor(files, interface) + interface.name + newline;
    }
    return text + "iface " + interface.name + " inet manual" + newline;
}

} // namespace

FileEdits Ifupdown::plan(const InterfaceFacts& interface, const AdapterSettings& wanted) const {
    const InterfacesFiles files(_environment.root);
    refuseIndirection(files, interface.name);
    const bool namesAreRead = readsNames(_environment);
    const Place* place = stanzaOf(files, interface.name);
    if (place != nullptr) {
        const InterfacesFile& file = place->file->content;
        std::string after = edited(file, *place->stanza, wanted, namesAreRead);
        // What cannot be taken apart as it was put together is better not written.
        const InterfacesFile result(after);
        const std::size_t number = static_cast<std::size_t>(place->stanza - file.stanzas().data());
        if (number >= result.stanzas().size() ||
            edited(result, result.stanzas()[number], wanted, namesAreRead) != after) {
            throw std::runtime_error(place->file->path + ": cannot be edited in the form that it has");
        }
        return after == file.text() ? FileEdits{} : FileEdits{{place->file->path, file.text(), std::move(after)}};
    }
    const bool saysSomething = wanted.ipv4 && (wanted.ipv4->mode == AddressMode::leased || wanted.ipv4->address);
    if (!saysSomething) {
        return {};
    }
    const auto* main = files.mainFile();
    const InterfacesFile bare(withStanza(files, main != nullptr ? main->content : InterfacesFile(""), interface));
    return {{InterfacesFiles::mainPath(_environment.root),
             main != nullptr ? std::optional(main->content.text()) : std::nullopt,
             edited(bare, bare.stanzas().back(), wanted, namesAreRead)}};
}

bool Ifupdown::knows(const InterfaceFacts& interface, const Environment& environment) {
    const InterfacesFiles files(environment.root);
    return std::any_of(files.stanzas().begin(), files.stanzas().end(), [&](const Place& place) {
        return place.keyword() == "iface" && place.words().size() >= 2 && place.words()[1].text == interface.name;
    });
}

bool Ifupdown::stopDhcp(const InterfaceFacts& interface) {
    return DhcpClient(_environment).stop(interface.name);
}

void Ifupdown::activate(const InterfaceFacts& /*interface*/, const AdapterSettings& /*wanted*/) {}

void Ifupdown::startDhcp(const InterfaceFacts& interface) {
    DhcpClient client(_environment);
    if (client.isRunning(interface.name)) {
        return;
    }
    if (client.isUp(interface.name)) {
        client.start(interface.name);
        return;
    }
    client.ifup(interface.name);
}

} // namespace Orv::Agent::Persistence

#include "agent/persistence/Ifupdown.h"

#include "agent/persistence/DhcpClient.h"
#include "agent/persistence/InterfacesFiles.h"
#include "agent/persistence/StanzaChange.h"

#include <algorithm>
#include <array>
#include <filesystem>
#include <stdexcept>

#include <fnmatch.h>

namespace Orv::Agent::Persistence {

namespace {

using Place = InterfacesFiles::Place;

constexpr std::array<std::string_view, 4> editableMethods{"static", "dhcp", "bootp", "manual"};

/** iface NAME FAMILY METHOD ... */
bool isIpv4StanzaOf(const Place& place, const std::string& interface) {
    if (place.keyword() != "iface") {
        return false;
    }
    const auto words = place.words();
    return words.size() >= 4 && words[1].text == interface && words[2].text == "inet";
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
        if (!isSelection(place)) {
            return false;
        }
        const auto words = place.words();
        return std::any_of(words.begin() + 1, words.end(), [&](const InterfacesFile::Word& word) {
            return selects(word.text, interface) && predicate(word.text);
        });
    });
}

void refuseIndirection(const InterfacesFiles& files, const std::string& interface) {
    for (const Place& place : files.stanzas()) {
        if (place.keyword() != "mapping") {
            continue;
        }
        const auto words = place.words();
        const bool maps = std::any_of(words.begin() + 1, words.end(), [&](const InterfacesFile::Word& word) {
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
    std::string method = "manual";
    for (const Place& place : files.stanzas()) {
        if (method != "manual" || !isIpv4StanzaOf(place, interface)) {
            continue;
        }
        std::string candidate = place.words()[3].text;
        if (found == nullptr || candidate != "manual") {
            found = &place;
            method = std::move(candidate);
        }
    }
    if (std::find(editableMethods.begin(), editableMethods.end(), method) == editableMethods.end()) {
        throw std::runtime_error(found->file->path + ": its method is \"" + method + "\", which cannot be edited");
    }
    if (found != nullptr && found->words().size() > 4) {
        throw std::runtime_error(found->file->path + ": its stanza inherits from another");
    }
    return found;
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
        return isSelection(place) && place.file->content.valueOf(place.file->content.header(*place.stanza)) != "lo";
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

FileEdits edit(const std::string& path, const std::optional<std::string>& before, std::optional<std::string> after) {
    if (!after) {
        throw std::runtime_error(path + ": cannot be edited in the form that it has");
    }
    return after == before ? FileEdits{} : FileEdits{{path, before, std::move(after)}};
}

} // namespace

FileEdits Ifupdown::plan(const InterfaceFacts& interface, const AdapterSettings& wanted) const {
    const InterfacesFiles files(_environment.root);
    refuseIndirection(files, interface.name);
    const bool namesAreRead = readsNames(_environment);
    if (const Place* place = stanzaOf(files, interface.name); place != nullptr) {
        const InterfacesFile& file = place->file->content;
        return edit(place->file->path, file.text(), changedStanza(file, *place->stanza, wanted, namesAreRead));
    }
    const bool saysSomething = wanted.ipv4 && (wanted.ipv4->mode == AddressMode::leased || wanted.ipv4->address);
    if (!saysSomething) {
        return {};
    }
    const auto* main = files.mainFile();
    const InterfacesFile bare(withStanza(files, main != nullptr ? main->content : InterfacesFile(""), interface));
    return edit(InterfacesFiles::mainPath(_environment.root),
                main != nullptr ? std::optional(main->content.text()) : std::nullopt,
                changedStanza(bare, bare.stanzas().back(), wanted, namesAreRead));
}

bool Ifupdown::knows(const InterfaceFacts& interface, const Environment& environment) {
    const InterfacesFiles files(environment.root);
    return std::any_of(files.stanzas().begin(), files.stanzas().end(), [&](const Place& place) {
        if (place.keyword() != "iface") {
            return false;
        }
        const auto words = place.words();
        return words.size() >= 2 && words[1].text == interface.name;
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

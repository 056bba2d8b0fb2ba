#include "agent/persistence/StanzaChange.h"

#include "agent/persistence/Joined.h"

#include <array>

namespace Orv::Agent::Persistence {

namespace {

constexpr std::array<std::string_view, 5> addressOptions{"address", "netmask", "broadcast", "network", "gateway"};

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
        editIpv4(editor, *wanted.ipv4, file.wordsOf(file.header(stanza)).at(3).text);
    }
    editNames(editor, wanted.names, namesAreRead);
    return edit.applied(file.text());
}

} // namespace

std::optional<std::string> changedStanza(const InterfacesFile& file, const InterfacesFile::Stanza& stanza,
                                         const AdapterSettings& wanted, bool namesAreRead) {
    std::string after = edited(file, stanza, wanted, namesAreRead);
    const InterfacesFile result(after);
    const auto number = static_cast<std::size_t>(&stanza - file.stanzas().data());
    const bool isReadBack = result.stanzas().size() == file.stanzas().size() &&
                            edited(result, result.stanzas()[number], wanted, namesAreRead) == after;
    return isReadBack ? std::optional(std::move(after)) : std::nullopt;
}

} // namespace Orv::Agent::Persistence

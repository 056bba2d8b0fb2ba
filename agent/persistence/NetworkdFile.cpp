#include "agent/persistence/NetworkdFile.h"

#include "agent/linux/Words.h"
#include "agent/persistence/Joined.h"

#include <algorithm>
#include <array>
#include <charconv>

namespace Orv::Agent::Persistence {

namespace {

/** A line of its own, which no value can hold. */
constexpr std::string_view restMark = "\n# From other files:\n";

/** An assignment or, without a key, anything else that stands between section headers; with its lines as they are. */
struct Entry {
    std::string key;
    std::string value;
    std::string lines;
};

/** The first one has no header when something stands in front of all of them. */
struct Section {
    std::string header; ///< its line as it is
    std::string name;   ///< "[Network]"
    std::vector<Entry> entries;

    [[nodiscard]] std::optional<std::string> value(std::string_view key) const {
        const auto found =
            std::find_if(entries.rbegin(), entries.rend(), [&](const Entry& entry) { return entry.key == key; });
        return found == entries.rend() ? std::nullopt : std::optional(found->value);
    }
};

/** Takes the next line off the text, with its end. */
std::string_view takeLine(std::string_view& text) {
    const std::size_t end = text.find('\n');
    const std::string_view line = text.substr(0, end == std::string_view::npos ? text.size() : end + 1);
    text.remove_prefix(line.size());
    return line;
}

bool isComment(std::string_view line) {
    return line.empty() || line.starts_with('#') || line.starts_with(';');
}

/** Without its end and the blanks round it. */
std::string_view bare(std::string_view line) {
    return Linux::trimmed(line.substr(0, line.find('\n')));
}

/** A line that ends in a backslash goes on in the next one that is no comment. */
Entry readEntry(std::string_view line, std::string_view& text) {
    Entry entry{{}, {}, std::string(line)};
    std::string whole(bare(line));
    while (whole.ends_with('\\') && !text.empty()) {
        const std::string_view next = takeLine(text);
        entry.lines += next;
        if (!isComment(bare(next))) {
            whole.back() = ' ';
            whole += bare(next);
        }
    }
    // Nothing is left to go on with; written back, it would take the next line for its own.
    whole.resize(whole.find_last_not_of(" \t\\") + 1);
    if (const std::size_t equals = whole.find('='); equals != std::string::npos) {
        entry.key = Linux::trimmed(std::string_view(whole).substr(0, equals));
        entry.value = Linux::trimmed(std::string_view(whole).substr(equals + 1));
    }
    return entry;
}

std::vector<Section> sectionsOf(std::string_view text) {
    std::vector<Section> sections(1);
    while (!text.empty()) {
        const std::string_view line = takeLine(text);
        const std::string_view content = bare(line);
        if (content.starts_with('[')) {
            sections.push_back({std::string(line), std::string(content), {}});
        } else if (isComment(content)) {
            sections.back().entries.push_back({{}, {}, std::string(line)});
        } else {
            sections.back().entries.push_back(readEntry(line, text));
        }
    }
    return sections;
}

std::optional<Ipv4Prefixed> prefixed(const std::string& text) {
    const std::size_t slash = text.find('/');
    const auto address = Ipv4Address::parse(std::string_view(text).substr(0, slash));
    if (!address) {
        return std::nullopt;
    }
    unsigned length = classPrefixLength(*address);
    if (slash != std::string::npos) {
        const char* end = text.data() + text.size();
        const auto [rest, error] = std::from_chars(text.data() + slash + 1, end, length);
        if (error != std::errc() || rest != end || length > 32) {
            return std::nullopt;
        }
    }
    return Ipv4Prefixed{*address, static_cast<std::uint8_t>(length)};
}

bool isOneOf(const std::string& text, std::initializer_list<std::string_view> words) {
    std::string lower;
    std::transform(text.begin(), text.end(), std::back_inserter(lower), [](char letter) {
        return letter >= 'A' && letter <= 'Z' ? static_cast<char>(letter + 32) : letter;
    });
    return std::find(words.begin(), words.end(), lower) != words.end();
}

/** Of the many spellings of DHCP= one for each meaning. */
std::string plainDhcp(const std::string& value) {
    if (isOneOf(value, {"yes", "true", "on", "1", "y", "t", "both"})) {
        return "yes";
    }
    if (isOneOf(value, {"ipv4", "v4"})) {
        return "ipv4";
    }
    return isOneOf(value, {"ipv6", "v6"}) ? "ipv6" : "no";
}

void addWords(std::optional<std::vector<std::string>>& list, const std::string& value) {
    if (value.empty() || !list) {
        list.emplace();
    }
    for (const std::string_view word : Linux::wordsOf(value)) {
        // No address and no name has a backslash; at the end of a line it would take the next one in.
        if (word.find('\\') == std::string_view::npos) {
            list->emplace_back(word);
        }
    }
}

/** The address of an [Address] section, where it is of IPv4. */
std::optional<Ipv4Prefixed> addressOf(const Section& section) {
    const auto value = section.name == "[Address]" ? section.value("Address") : std::nullopt;
    return value ? prefixed(*value) : std::nullopt;
}

/** The gateway of a [Route] section, where it is that of the default route of IPv4. */
std::optional<Ipv4Address> gatewayOf(const Section& section) {
    const auto value = section.name == "[Route]" ? section.value("Gateway") : std::nullopt;
    const std::string destination = section.value("Destination").value_or("");
    const bool isDefault = destination.empty() || destination == "0.0.0.0/0";
    return value && isDefault ? Ipv4Address::parse(*value) : std::nullopt;
}

/** Reads one assignment of [Network]. True when it is one of those that `settings` are made of. */
bool take(NetworkdSettings& settings, const Entry& entry) {
    if (entry.key == "DHCP") {
        settings.dhcp = plainDhcp(entry.value);
    } else if (entry.key == "Address" && !settings.address) {
        settings.address = prefixed(entry.value);
        return settings.address.has_value();
    } else if (entry.key == "Gateway" && !settings.gateway) {
        settings.gateway = Ipv4Address::parse(entry.value);
        return settings.gateway.has_value();
    } else if (entry.key == "DNS") {
        addWords(settings.servers, entry.value);
    } else if (entry.key == "Domains") {
        addWords(settings.domains, entry.value);
    } else {
        return false;
    }
    return entry.key != "Address" && entry.key != "Gateway";
}

/** Reads a section. True when it is one that says nothing else. */
bool take(NetworkdSettings& settings, Section& section) {
    if (section.name == "[Network]") {
        std::erase_if(section.entries, [&](const Entry& entry) { return take(settings, entry); });
        return false;
    }
    if (const auto address = addressOf(section); address && !settings.address) {
        settings.address = address;
        return true;
    }
    if (const auto gateway = gatewayOf(section); gateway && !settings.gateway) {
        settings.gateway = gateway;
        return true;
    }
    return false;
}

std::string networkSection(const NetworkdSettings& settings, bool resetsLists) {
    std::string text = "[Network]\n";
    const auto add = [&](const std::string& key, const std::string& value) { text += key + "=" + value + "\n"; };
    if (settings.dhcp) {
        add("DHCP", *settings.dhcp);
    }
    if (settings.address) {
        add("Address", settings.address->text());
    }
    if (settings.gateway) {
        add("Gateway", settings.gateway->text());
    }
    for (const auto& [key, list] : {std::pair{"DNS", &settings.servers}, std::pair{"Domains", &settings.domains}}) {
        if (*list && (resetsLists || (*list)->empty())) {
            add(key, "");
        }
        if (*list && !(*list)->empty()) {
            add(key, joined(**list));
        }
    }
    return text;
}

} // namespace

NetworkdSettings readNetworkdSettings(std::string_view texts) {
    NetworkdSettings settings;
    for (Section& section : sectionsOf(texts)) {
        take(settings, section);
    }
    return settings;
}

NetworkdSettings changed(NetworkdSettings own, const NetworkdSettings& inForce, const AdapterSettings& wanted) {
    if (wanted.ipv4) {
        const std::string before = inForce.dhcp.value_or("no");
        const bool hasIpv6 = before == "yes" || before == "ipv6";
        const bool isLeased = wanted.ipv4->mode == AddressMode::leased;
        own.dhcp = isLeased ? (hasIpv6 ? "yes" : "ipv4") : (hasIpv6 ? "ipv6" : "no");
        own.address = isLeased ? std::nullopt : wanted.ipv4->address;
        own.gateway = isLeased ? std::nullopt : wanted.ipv4->gateway;
    }
    if (wanted.names.servers) {
        own.servers = wanted.names.servers;
    }
    std::vector<std::string> domains =
        (own.domains ? own.domains : inForce.domains).value_or(std::vector<std::string>());
    if (wanted.names.suffixes) {
        std::erase_if(domains, [](const std::string& domain) { return !domain.starts_with('~'); });
        domains.insert(domains.begin(), wanted.names.suffixes->begin(), wanted.names.suffixes->end());
        own.domains = domains;
    }
    if (wanted.names.domain) {
        std::erase(domains, *wanted.names.domain);
        domains.insert(domains.begin(), *wanted.names.domain);
        own.domains = domains;
    }
    return own;
}

std::string dropInText(const NetworkdSettings& settings) {
    return "# Written by marlo; every change of the adapter writes it anew.\n" + networkSection(settings, true);
}

std::string unitText(const std::string& interface, const NetworkdSettings& settings, std::string_view rest) {
    return "# Written by marlo, which writes the first two sections anew with every change of the adapter.\n"
           "[Match]\nName=" +
           interface + "\n\n" + networkSection(settings, false) + (rest.empty() ? "" : std::string(restMark)) +
           std::string(rest);
}

std::string restOf(std::string_view texts) {
    NetworkdSettings taken;
    std::string rest;
    for (Section& section : sectionsOf(texts)) {
        if (section.name == "[Match]" || take(taken, section)) {
            continue;
        }
        rest += section.header;
        for (const Entry& entry : section.entries) {
            rest += entry.lines;
        }
        if (!rest.empty() && !rest.ends_with('\n')) {
            rest += '\n';
        }
    }
    return rest;
}

std::string restOfOwn(std::string_view unit) {
    const std::size_t mark = unit.find(restMark);
    return mark == std::string_view::npos ? "" : std::string(unit.substr(mark + restMark.size()));
}

NetworkdSettings readOwnSettings(std::string_view text) {
    return readNetworkdSettings(text.substr(0, text.find(restMark)));
}

} // namespace Orv::Agent::Persistence

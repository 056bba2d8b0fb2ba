#include "agent/file/DescriptionReader.h"

#include "agent/file/DerivedHardware.h"

#include <algorithm>
#include <unordered_set>
#include <utility>

namespace Orv::Agent {

namespace {

using namespace NodeLexicon;

struct PropertyKey {
    const char* key;
    Properties property;
};

constexpr PropertyKey numberKeys[] = {
    {"status", PROP_STATUS}, {"dhcp", PROP_DHCP_ENABLED}, {"ip_support", PROP_IP_SUPPORT}};

constexpr PropertyKey textKeys[] = {
    {"ipv4_address", PROP_IPV4_ADDRESS}, {"ipv4_subnet_mask", PROP_IPV4_SUBNET_MASK},
    {"ipv6_address", PROP_IPV6_ADDRESS}, {"default_gateway", PROP_DEFAULT_GATEWAY},
    {"dns_hostname", PROP_DNS_HOSTNAME}, {"dns_domain", PROP_DNS_DOMAIN},
    {"mac_address", PROP_MAC_ADDRESS},
};

constexpr PropertyKey listKeys[] = {{"dns_servers", PROP_DNS_SERVERS}, {"dns_suffixes", PROP_DNS_SUFFIXES}};

constexpr const char* ordinaryChassis = "Chassis";

DescribedNode readNode(TomlReader& reader, NodeType type) {
    return {type,
            reader.text("identity"),
            reader.text("description"),
            reader.text("chassis").value_or(ordinaryChassis),
            reader.text("device"),
            {}};
}

void readProperties(TomlReader& reader, PropertyMap& properties) {
    for (const auto& [key, property] : numberKeys) {
        if (const auto number = readNumber<unsigned int>(reader, key)) {
            properties.emplace(property, *number);
        }
    }
    for (const auto& [key, property] : textKeys) {
        if (auto text = reader.text(key)) {
            properties.emplace(property, std::move(*text));
        }
    }
    for (const auto& [key, property] : listKeys) {
        if (auto list = reader.texts(key)) {
            properties.emplace(property, std::move(*list));
        }
    }
}

NetworkPort readPortFacts(TomlReader& reader) {
    NetworkPort port;
    port.card = reader.text("card");
    port.status = reader.text("status");
    port.elementName = reader.text("element_name");
    port.caption = reader.text("caption");
    port.speed = readNumber<std::uint64_t>(reader, "speed");
    port.maxSpeed = readNumber<std::uint64_t>(reader, "max_speed");
    port.requestedSpeed = readNumber<std::uint64_t>(reader, "requested_speed");
    port.portType = readNumber<std::uint16_t>(reader, "port_type");
    port.portNumber = readNumber<std::uint16_t>(reader, "port_number");
    port.permanentAddress = reader.text("permanent_address");
    port.fullDuplex = reader.boolean("full_duplex");
    port.autoSense = reader.boolean("auto_sense");
    port.linkTechnology = readNumber<std::uint16_t>(reader, "link_technology");
    return port;
}

/** Of a part: tables before the first header of an array of tables, such arrays after it. */
bool isAlike(const toml::table& part, bool isFirst) {
    return std::all_of(part.begin(), part.end(), [&](const auto& entry) {
        return isFirst ? entry.second.is_table() : entry.second.is_array_of_tables();
    });
}

} // namespace

void DescriptionReader::readHost(TomlReader& document) {
    toml::table* table = document.table("host");
    if (table == nullptr) {
        return;
    }
    TomlReader reader(*table, _file, "host.", _firstLine);
    if (auto description = reader.text("description")) {
        _builder.describeHost(std::move(*description));
    }
    reader.refuseOtherKeys();
}

void DescriptionReader::readAdapter(toml::table& table) {
    TomlReader reader(table, _file, "adapter.", _firstLine);
    DescribedNode node = readNode(reader, NODE_NETWORK_ADAPTER);
    readProperties(reader, node.properties);
    reader.refuseOtherKeys();
    _builder.add(std::move(node));
}

void DescriptionReader::readPort(toml::table& table) {
    TomlReader reader(table, _file, "port.", _firstLine);
    DescribedNode node = readNode(reader, NODE_NETWORK_PORT);
    if (auto address = reader.text("mac_address")) {
        node.properties.emplace(PROP_MAC_ADDRESS, std::move(*address));
    }
    NetworkPort port = readPortFacts(reader);
    reader.refuseOtherKeys();
    if (port.card) {
        _cardReferences.push_back({*port.card, reader.lineOf("card")});
    }
    if (node.identity) {
        port.name = *node.identity;
        port.description = node.description;
        port.managementController = node.chassis == managementChassis;
        _hardware.ports.push_back(std::move(port));
    }
    _saysHardware = true;
    _builder.add(std::move(node));
}

void DescriptionReader::readCard(toml::table& table) {
    TomlReader reader(table, _file, "card.", _firstLine);
    const auto name = reader.text("name");
    if (!name) {
        reader.refuseKey("name", "a card needs a name");
    }
    NetworkCard card;
    card.name = *name;
    card.status = reader.text("status");
    card.elementName = reader.text("element_name");
    card.description = reader.text("description");
    card.serialNumber = reader.text("serial_number");
    card.packageType = readNumber<std::uint16_t>(reader, "package_type");
    card.managementController = reader.boolean("management_controller").value_or(false);
    reader.refuseOtherKeys();
    _saysHardware = true;
    _hardware.cards.push_back(std::move(card));
}

void DescriptionReader::readDocument(toml::table& document) {
    TomlReader reader(document, _file, "", _firstLine);
    readHost(reader);
    for (toml::table* adapter : reader.tables("adapter")) {
        readAdapter(*adapter);
    }
    for (toml::table* port : reader.tables("port")) {
        readPort(*port);
    }
    for (toml::table* card : reader.tables("card")) {
        readCard(*card);
    }
    reader.refuseOtherKeys();
}

/** A card may stand behind the ports that name it. */
void DescriptionReader::checkCards() const {
    std::unordered_set<std::string_view> names;
    for (const NetworkCard& card : _hardware.cards) {
        names.insert(card.name);
    }
    for (const auto& [card, line] : _cardReferences) {
        if (!names.contains(card)) {
            refuse(_file, line, "port.card", "no card is named \"" + card + '"');
        }
    }
}

DescribedHost DescriptionReader::result() {
    checkCards();
    if (!_saysHardware) {
        _builder.addPortsOfAdapters();
    }
    return {_builder.build(), std::move(_hardware), _saysHardware};
}

/** False when the document is not fit to be read so: only the whole of it shows then whether and where it is wrong.
 */
bool DescriptionReader::readInParts(const std::vector<DocumentPart>& parts) {
    for (const DocumentPart& part : parts) {
        toml::table document;
        try {
            document = toml::parse(part.text);
        } catch (const toml::parse_error&) {
            return false;
        }
        if (!isAlike(document, &part == &parts.front())) {
            return false;
        }
        _firstLine = part.firstLine;
        readDocument(document);
    }
    return true;
}

DescribedHost DescriptionReader::read(std::string_view text, const std::string& file) {
    DescriptionReader inParts(file);
    if (inParts.readInParts(cutDocument(text))) {
        return inParts.result();
    }
    DescriptionReader whole(file);
    toml::table document = parseToml(text, file);
    whole.readDocument(document);
    return whole.result();
}

} // namespace Orv::Agent

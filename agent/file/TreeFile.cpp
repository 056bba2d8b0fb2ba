#include "agent/file/TreeFile.h"

#include "agent/config/TextFile.h"
#include "agent/config/TomlReader.h"
#include "agent/file/DerivedHardware.h"
#include "agent/file/TreeBuilder.h"

#include <algorithm>
#include <limits>
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

/** One description on its way from TOML to a tree. */
class DescriptionReader {
  public:
    DescriptionReader(std::string_view text, const std::string& file)
        : _file(file), _document(parseToml(text, file)), _reader(_document, _file, _noPrefix) {}

    TreeDescription read();

  private:
    std::string readHost();
    void readAdapter(toml::table& table);
    void readPort(toml::table& table);
    void readCard(toml::table& table);

    static DescribedNode readNode(TomlReader& reader, NodeType type);
    static void readPortFacts(TomlReader& reader, NetworkPort& port);

    const std::string& _file;
    const std::string _noPrefix;
    const std::string _adapterPrefix = "adapter.";
    const std::string _portPrefix = "port.";
    const std::string _cardPrefix = "card.";
    toml::table _document;
    TomlReader _reader;
    std::optional<TreeBuilder> _builder;
    DerivedHardware _derived;
    HardwareInventory _hardware;
    bool _derive = false;
};

std::string DescriptionReader::readHost() {
    toml::table* table = _reader.table("host");
    if (table == nullptr) {
        return "Host";
    }
    const std::string prefix = "host.";
    TomlReader reader(*table, _file, prefix);
    std::string description = reader.text("description").value_or("Host");
    reader.refuseOtherKeys();
    return description;
}

DescribedNode DescriptionReader::readNode(TomlReader& reader, NodeType type) {
    return {type,
            reader.text("identity"),
            reader.text("description"),
            reader.text("chassis").value_or(ordinaryChassis),
            reader.text("device"),
            {}};
}

void DescriptionReader::readAdapter(toml::table& table) {
    TomlReader reader(table, _file, _adapterPrefix);
    DescribedNode node = readNode(reader, NODE_NETWORK_ADAPTER);
    for (const auto& [key, property] : numberKeys) {
        if (const auto number = readNumber<unsigned int>(reader, key)) {
            node.properties.emplace(property, *number);
        }
    }
    for (const auto& [key, property] : textKeys) {
        if (auto text = reader.text(key)) {
            node.properties.emplace(property, std::move(*text));
        }
    }
    for (const auto& [key, property] : listKeys) {
        if (auto list = reader.texts(key)) {
            node.properties.emplace(property, std::move(*list));
        }
    }
    reader.refuseOtherKeys();
    const DescribedNode port = DerivedHardware::portNode(node);
    const DerivedHardware::Adapter adapter = DerivedHardware::adapterOf(node);
    const std::string device = _builder->add(std::move(node));
    if (_derive) {
        _derived.add(adapter, device);
        _builder->addBelow(device, port);
    }
}

void DescriptionReader::readPortFacts(TomlReader& reader, NetworkPort& port) {
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
}

void DescriptionReader::readPort(toml::table& table) {
    TomlReader reader(table, _file, _portPrefix);
    DescribedNode node = readNode(reader, NODE_NETWORK_PORT);
    if (auto address = reader.text("mac_address")) {
        node.properties.emplace(PROP_MAC_ADDRESS, std::move(*address));
    }
    NetworkPort port;
    readPortFacts(reader, port);
    port.description = node.description;
    port.managementController = node.chassis == DerivedHardware::managementChassis;
    reader.refuseOtherKeys();
    const bool cardExists = std::any_of(_hardware.cards.begin(), _hardware.cards.end(),
                                        [&](const NetworkCard& card) { return card.name == port.card; });
    if (port.card && !cardExists) {
        reader.refuseKey("card", "no card is named \"" + *port.card + '"');
    }
    if (node.identity) {
        port.name = *node.identity;
        _hardware.ports.push_back(std::move(port));
    }
    _builder->add(std::move(node));
}

void DescriptionReader::readCard(toml::table& table) {
    TomlReader reader(table, _file, _cardPrefix);
    NetworkCard card;
    const auto name = reader.text("name");
    if (!name) {
        reader.refuseKey("name", "a card needs a name");
    }
    card.name = *name;
    card.status = reader.text("status");
    card.elementName = reader.text("element_name");
    card.description = reader.text("description");
    card.serialNumber = reader.text("serial_number");
    card.packageType = readNumber<std::uint16_t>(reader, "package_type");
    card.managementController = reader.boolean("management_controller").value_or(false);
    reader.refuseOtherKeys();
    _hardware.cards.push_back(std::move(card));
}

TreeDescription DescriptionReader::read() {
    _builder.emplace(readHost());
    const auto adapters = _reader.tables("adapter");
    const auto ports = _reader.tables("port");
    const auto cards = _reader.tables("card");
    _reader.refuseOtherKeys();
    _derive = ports.empty() && cards.empty();
    for (toml::table* card : cards) {
        readCard(*card);
    }
    for (toml::table* adapter : adapters) {
        readAdapter(*adapter);
        adapter->clear(); // a large description is not to be in memory twice
    }
    for (toml::table* port : ports) {
        readPort(*port);
    }
    if (_derive) {
        _hardware = std::move(_derived).inventory();
    }
    return {_builder->build(), std::move(_hardware)};
}

} // namespace

TreeDescription parseTreeDescription(std::string_view text, const std::string& file) {
    return DescriptionReader(text, file).read();
}

TreeDescription readTreeFile(const std::string& path) {
    return parseTreeDescription(readTextFile(path).text, path);
}

} // namespace Orv::Agent

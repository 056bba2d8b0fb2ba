#include "agent/file/DerivedHardware.h"

#include <algorithm>
#include <string>
#include <string_view>
#include <unordered_map>
#include <unordered_set>
#include <utility>

namespace Orv::Agent {

namespace {

using namespace NodeLexicon;

constexpr std::uint16_t moduleOrCard = 9; ///< CIM_PhysicalPackage.PackageType

template <typename Value>
std::optional<Value> propertyOf(const Node& node, Properties property) {
    const auto found = node.properties.find(property);
    const Value* value = found == node.properties.end() ? nullptr : std::get_if<Value>(&found->second);
    return value == nullptr ? std::nullopt : std::optional<Value>(*value);
}

/** A node's description where it says more than the identity, which stands in for it. */
std::optional<std::string> ownDescription(const Node& node, const std::string& identity) {
    return node.description == identity ? std::nullopt : std::optional(node.description);
}

/** CIM_ManagedSystemElement.Status of an adapter's status code. */
std::string statusText(unsigned int code) {
    if (code == 1) {
        return "OK";
    }
    return code == 5 ? "Stopped" : "Lost Comm";
}

bool isHexadecimal(char character) {
    return (character >= '0' && character <= '9') || (character >= 'A' && character <= 'F');
}

/** CIM_NetworkPort.PermanentAddress of six octets with colons; none for anything else. */
std::optional<std::string> permanentAddress(const std::string& macAddress) {
    std::string digits;
    for (const char character : macAddress) {
        if (character != ':') {
            digits += character >= 'a' && character <= 'f' ? static_cast<char>(character - 'a' + 'A') : character;
        }
    }
    const bool fits = digits.size() == 12 && std::all_of(digits.begin(), digits.end(), isHexadecimal);
    return fits ? std::optional(std::move(digits)) : std::nullopt;
}

/** Gathers ports, and the cards that they are on. */
class HardwareDeriver {
  public:
    explicit HardwareDeriver(const Tree& tree) : _tree(tree) {}

    void addPortOf(const Node& adapter);

    HardwareInventory inventory;

  private:
    struct Card {
        std::size_t index;
        std::uint16_t ports;
    };

    Card& cardOf(const Node& device, const NetworkPort& firstPort);

    const Tree& _tree;
    std::unordered_map<std::string_view, Card> _cards; ///< by device path
    std::unordered_set<std::string> _names;
};

HardwareDeriver::Card& HardwareDeriver::cardOf(const Node& device, const NetworkPort& firstPort) {
    const auto [found, isNew] = _cards.emplace(device.path, Card{inventory.cards.size(), 0});
    if (isNew) {
        NetworkCard card;
        card.name = firstPort.name;
        card.status = firstPort.status;
        card.elementName = ownDescription(device, firstPort.name);
        card.packageType = moduleOrCard;
        card.managementController = firstPort.managementController;
        inventory.cards.push_back(std::move(card));
    }
    return found->second;
}

void HardwareDeriver::addPortOf(const Node& adapter) {
    const auto identity = propertyOf<std::string>(adapter, PROP_NODE_STRING);
    if (!identity || !_names.insert(*identity).second) {
        return;
    }
    const Tree::NodePointer device = _tree.find(adapter.parentPath);
    const Tree::NodePointer chassis = _tree.find(device->parentPath);
    NetworkPort port;
    port.name = *identity;
    port.description = ownDescription(adapter, *identity);
    port.managementController = chassis->description == managementChassis;
    if (const auto address = propertyOf<std::string>(adapter, PROP_MAC_ADDRESS)) {
        port.permanentAddress = permanentAddress(*address);
    }
    if (const auto status = propertyOf<unsigned int>(adapter, PROP_STATUS)) {
        port.status = statusText(*status);
    }
    Card& card = cardOf(*device, port);
    port.card = inventory.cards[card.index].name;
    port.portNumber = card.ports++;
    inventory.ports.push_back(std::move(port));
}

} // namespace

HardwareInventory deriveHardware(const Tree& tree) {
    HardwareDeriver deriver(tree);
    for (const auto& adapter : tree.nodesOfType(NODE_NETWORK_ADAPTER)) {
        deriver.addPortOf(*adapter);
    }
    return std::move(deriver.inventory);
}

} // namespace Orv::Agent

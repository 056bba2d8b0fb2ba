#include "agent/file/DerivedHardware.h"

#include <algorithm>
#include <utility>

namespace Orv::Agent {

namespace {

using namespace NodeLexicon;

constexpr std::uint16_t moduleOrCard = 9; ///< CIM_PhysicalPackage.PackageType

template <typename Value>
std::optional<Value> propertyOf(const DescribedNode& node, Properties property) {
    const auto found = node.properties.find(property);
    const Value* value = found == node.properties.end() ? nullptr : std::get_if<Value>(&found->second);
    return value == nullptr ? std::nullopt : std::optional<Value>(*value);
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

} // namespace

DerivedHardware::Adapter DerivedHardware::adapterOf(const DescribedNode& node) {
    return {node.identity,
            node.description,
            node.device,
            propertyOf<std::string>(node, PROP_MAC_ADDRESS),
            propertyOf<unsigned int>(node, PROP_STATUS),
            node.chassis == managementChassis};
}

DescribedNode DerivedHardware::portNode(const DescribedNode& adapter) {
    DescribedNode port{NODE_NETWORK_PORT, adapter.identity, adapter.description, {}, std::nullopt, {}};
    if (auto address = propertyOf<std::string>(adapter, PROP_MAC_ADDRESS)) {
        port.properties.emplace(PROP_MAC_ADDRESS, std::move(*address));
    }
    return port;
}

DerivedHardware::Card& DerivedHardware::cardOf(const Adapter& adapter, const std::string& devicePath) {
    const auto [found, isNew] = _cards.emplace(devicePath, Card{_inventory.cards.size(), 0});
    if (isNew) {
        NetworkCard card;
        card.name = *adapter.identity;
        card.elementName = adapter.device;
        card.packageType = moduleOrCard;
        card.managementController = adapter.managementController;
        if (adapter.status) {
            card.status = statusText(*adapter.status);
        }
        _inventory.cards.push_back(std::move(card));
    }
    return found->second;
}

void DerivedHardware::add(const Adapter& adapter, const std::string& devicePath) {
    if (!adapter.identity || !_names.emplace(*adapter.identity, true).second) {
        return;
    }
    Card& card = cardOf(adapter, devicePath);
    NetworkPort port;
    port.name = *adapter.identity;
    port.card = _inventory.cards[card.index].name;
    port.description = adapter.description;
    port.portNumber = card.ports++;
    port.managementController = adapter.managementController;
    if (adapter.macAddress) {
        port.permanentAddress = permanentAddress(*adapter.macAddress);
    }
    if (adapter.status) {
        port.status = statusText(*adapter.status);
    }
    _inventory.ports.push_back(std::move(port));
}

HardwareInventory DerivedHardware::inventory() && {
    return std::move(_inventory);
}

} // namespace Orv::Agent

/**
 * @file
 * The network hardware of a description that describes adapters alone.
 */
#pragma once

#include "agent/file/TreeBuilder.h"
#include "agent/hardware/Inventory.h"

#include <optional>
#include <string>
#include <unordered_map>

namespace Orv::Agent {

/**
 * Gives every adapter that has an identity a port, and every device a card. Only what the adapters say is said of
 * them; of adapters of one identity the first counts, since ports are known by name.
 */
class DerivedHardware {
  public:
    /** The description of the chassis that is the management controller. */
    static constexpr const char* managementChassis = "BMC";

    /** What an adapter's port and card are made of. */
    struct Adapter {
        std::optional<std::string> identity;
        std::optional<std::string> description;
        std::optional<std::string> device;
        std::optional<std::string> macAddress;
        std::optional<unsigned int> status;
        bool managementController = false;
    };

    static Adapter adapterOf(const DescribedNode& node);

    /** The adapter's port as a node below the same device: the identity and the MAC address. */
    static DescribedNode portNode(const DescribedNode& adapter);

    /** Adapters below one device path are ports of one card. */
    void add(const Adapter& adapter, const std::string& devicePath);

    HardwareInventory inventory() &&;

  private:
    struct Card {
        std::size_t index;
        std::uint16_t ports;
    };

    Card& cardOf(const Adapter& adapter, const std::string& devicePath);

    HardwareInventory _inventory;
    std::unordered_map<std::string, Card> _cards; ///< by device path
    std::unordered_map<std::string, bool> _names;
};

} // namespace Orv::Agent

#include "agent/hardware/InventoryBuilder.h"

#include "agent/hardware/Ethtool.h"
#include "agent/hardware/Sysfs.h"
#include "agent/text/Text.h"

#include <algorithm>
#include <array>
#include <map>

#include <linux/if.h>
#include <linux/if_arp.h>
#include <linux/netlink.h>

namespace Orv::Agent::Hardware {

namespace {

constexpr std::uint64_t bitsPerMegabit = 1'000'000;
constexpr std::uint16_t moduleOrCard = 9; ///< CIM_PhysicalPackage.PackageType

/** CIM_NetworkPort.LinkTechnology */
enum LinkTechnology : std::uint16_t { Ethernet = 2, InfiniBand = 3, Fddi = 5, TokenRing = 7, WirelessLan = 11 };

std::optional<std::uint16_t> linkTechnology(const InterfaceFacts& facts) {
    switch (facts.link.hardwareType) {
    case ARPHRD_ETHER:
        return facts.wireless ? WirelessLan : Ethernet; // a wireless interface carries Ethernet addresses as well
    case ARPHRD_IEEE80211:
    case ARPHRD_IEEE80211_PRISM:
    case ARPHRD_IEEE80211_RADIOTAP:
        return WirelessLan;
    case ARPHRD_INFINIBAND:
        return InfiniBand;
    case ARPHRD_FDDI:
        return Fddi;
    case ARPHRD_IEEE802_TR:
        return TokenRing;
    default:
        return std::nullopt;
    }
}

/** CIM_ManagedSystemElement.Status, the worse the earlier. */
constexpr std::array statuses{"Stopped", "Lost Comm", "OK"};

std::size_t statusRank(const Link& link) {
    if ((link.flags & IFF_UP) == 0) {
        return 0;
    }
    return (link.flags & IFF_RUNNING) == 0 ? 1 : 2;
}

std::optional<std::uint64_t> bitsPerSecond(std::optional<std::uint32_t> megabits) {
    return megabits ? std::optional(*megabits * bitsPerMegabit) : std::nullopt;
}

/** Twelve digits as CIM has them; none for addresses that are not Ethernet's. */
std::optional<std::string> addressDigits(const std::vector<std::uint8_t>& address) {
    constexpr std::size_t ethernetOctets = 6;
    if (address.size() != ethernetOctets) {
        return std::nullopt;
    }
    constexpr std::string_view digits = "0123456789ABCDEF";
    std::string text;
    for (const auto octet : address) {
        text += digits[octet >> 4U];
        text += digits[octet & 0xfU];
    }
    return text;
}

/** Vendor and model, as far as they are known. */
std::optional<std::string> label(const ParentDevice& device) {
    if (device.vendor && device.model) {
        return *device.vendor + ' ' + *device.model;
    }
    return device.vendor ? device.vendor : device.model;
}

std::string describe(const ParentDevice& device) {
    const auto known = label(device);
    std::string text = known ? *known + ", " : "";
    text += device.subsystem + ' ' + std::filesystem::path(device.syspath).filename().string();
    return device.driver ? text + ", driver " + *device.driver : text;
}

NetworkCard makeCard(const std::string& name, const ParentDevice& device) {
    NetworkCard card;
    card.name = name;
    card.elementName = label(device);
    card.description = describe(device);
    card.serialNumber = device.serial;
    if (device.subsystem == "pci" || device.subsystem == "usb") {
        card.packageType = moduleOrCard; // a paravirtual device is no package of any type
    }
    card.managementController = device.managementController;
    return card;
}

NetworkPort makePort(const InterfaceFacts& facts) {
    const auto& settings = facts.settings;
    NetworkPort port;
    port.name = cleanText(facts.link.name);
    port.status = statuses[statusRank(facts.link)];
    port.elementName = port.name;
    if (facts.device) {
        port.caption = label(*facts.device);
        port.managementController = facts.device->managementController;
    } else if (!facts.link.kind.empty()) {
        port.caption = cleanText(facts.link.kind);
    }
    port.description = facts.link.alias.empty() ? port.caption : cleanText(facts.link.alias);
    port.speed = bitsPerSecond(settings.speed);
    port.maxSpeed = bitsPerSecond(fastestMode(settings.supported));
    port.requestedSpeed = settings.autonegotiation == false ? port.speed : std::nullopt;
    port.portType = cimPortType(settings);
    port.portNumber = facts.portNumber;
    port.permanentAddress = addressDigits(facts.link.permanentAddress);
    port.fullDuplex = settings.fullDuplex;
    port.autoSense = canNegotiate(settings);
    port.linkTechnology = linkTechnology(facts);
    return port;
}

/** Whether /sys/class/net shows this interface: it may be mounted for another namespace, with other interfaces. */
bool isShown(const Link& link, const std::filesystem::path& directory) {
    return readAttribute(directory / "ifindex") == std::to_string(link.index);
}

InterfaceFacts readFacts(Link link, SettingsByIndex& settings, const DeviceReader& reader,
                         const EthtoolIoctl& ioctl) {
    InterfaceFacts facts;
    facts.link = std::move(link);
    if (const auto found = settings.find(facts.link.index); found != settings.end()) {
        facts.settings = std::move(found->second);
    }
    facts.device = deviceOf(facts.link, reader);
    if (facts.device) {
        facts.link.permanentAddress = permanentAddressOf(facts.link, ioctl).value_or(std::vector<std::uint8_t>());
        const auto directory = reader.interfaceDirectory(facts.link.name);
        if (isShown(facts.link, directory)) {
            facts.portNumber = readNumber(directory / "dev_port");
            std::error_code error;
            facts.wireless = std::filesystem::exists(directory / "phy80211", error);
        }
    }
    return facts;
}

} // namespace

HardwareInventory buildInventory(const std::vector<InterfaceFacts>& interfaces) {
    HardwareInventory inventory;
    std::map<std::string, std::size_t> cards; // syspath to place
    std::map<std::size_t, std::size_t> ranks; // place to the best status of the card's ports
    for (const auto& facts : interfaces) {
        if ((facts.link.flags & IFF_LOOPBACK) != 0) {
            continue;
        }
        NetworkPort port = makePort(facts);
        if (facts.device) {
            const auto [entry, isNew] = cards.try_emplace(facts.device->syspath, inventory.cards.size());
            if (isNew) {
                inventory.cards.push_back(makeCard(port.name, *facts.device));
            }
            auto& rank = ranks[entry->second];
            rank = std::max(rank, statusRank(facts.link));
            inventory.cards[entry->second].status = statuses[rank];
            port.card = inventory.cards[entry->second].name;
        }
        inventory.ports.push_back(std::move(port));
    }
    return inventory;
}

std::optional<ParentDevice> deviceOf(const Link& link, const DeviceReader& reader) {
    if (link.device) {
        return reader.describe(*link.device);
    }
    if (!link.kind.empty() || !isShown(link, reader.interfaceDirectory(link.name))) {
        return std::nullopt;
    }
    return reader.describeOfInterface(link.name);
}

std::optional<std::vector<std::uint8_t>> permanentAddressOf(const Link& link, const EthtoolIoctl& ioctl) {
    auto address = link.permanentAddress.empty() ? ioctl.permanentAddress(link.name) : link.permanentAddress;
    return address.empty() ? std::nullopt : std::optional(std::move(address));
}

std::vector<InterfaceFacts> readInterfaces() {
    NetlinkSocket socket(NETLINK_ROUTE);
    auto links = readLinks(socket);
    auto settings = readLinkSettings(links);
    const DeviceReader reader;
    const EthtoolIoctl ioctl;
    std::vector<InterfaceFacts> interfaces;
    interfaces.reserve(links.size());
    for (auto& link : links) {
        interfaces.push_back(readFacts(std::move(link), settings, reader, ioctl));
    }
    return interfaces;
}

} // namespace Orv::Agent::Hardware

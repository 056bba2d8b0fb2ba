#include "platform/Objects.h"

#include "agent/config/Configuration.h"
#include "agent/file/FileCache.h"
#include "agent/file/TreeFile.h"
#include "agent/hardware/Hardware.h"
#include "agent/text/Text.h"

#include <array>
#include <cerrno>
#include <mutex>
#include <system_error>

#include <unistd.h>

namespace Orv::Platform {

namespace {

/** The names by which clients tell what belongs to the management controller and not to the host. */
constexpr const char* managementCardName = "NIC1";
constexpr const char* managementSystemClass = "TAVIS_SPComputerSystem";
constexpr const char* hostSystemClass = "TAVIS_ComputerSystem";

constexpr std::size_t longestHostName = 1024;

std::string hostName() {
    std::array<char, longestHostName + 1> name{};
    if (gethostname(name.data(), longestHostName) != 0) {
        throw std::system_error(errno, std::generic_category(), "gethostname");
    }
    return Agent::cleanText(name.data());
}

using Text = std::optional<std::string>;

/** The Tag stays the interface name for the management controller's cards too: there may be several. */
Object cardObject(const Agent::NetworkCard& card) {
    return {2,
            {{"CreationClassName", Text(networkCard.name)},
             {"Tag", Text(card.name)},
             {"Name", Text(card.managementController ? managementCardName : card.name)},
             {"Status", card.status},
             {"ElementName", card.elementName},
             {"Description", card.description},
             {"SerialNumber", card.serialNumber},
             {"PackageType", card.packageType}}};
}

Object portObject(const Agent::NetworkPort& port, const std::string& systemName) {
    return {4,
            {{"SystemCreationClassName", Text(port.managementController ? managementSystemClass : hostSystemClass)},
             {"SystemName", Text(systemName)},
             {"CreationClassName", Text(networkPort.name)},
             {"DeviceID", Text(port.name)},
             {"Name", Text(port.name)},
             {"Status", port.status},
             {"ElementName", port.elementName},
             {"Caption", port.caption},
             {"Description", port.description},
             {"Speed", port.speed},
             {"MaxSpeed", port.maxSpeed},
             {"RequestedSpeed", port.requestedSpeed},
             {"PortType", port.portType},
             {"PortNumber", port.portNumber},
             {"PermanentAddress", port.permanentAddress},
             {"FullDuplex", port.fullDuplex},
             {"AutoSense", port.autoSense},
             {"LinkTechnology", port.linkTechnology}}};
}

void forEachCard(const Agent::HardwareInventory& inventory, const ObjectSink& sink) {
    for (const auto& card : inventory.cards) {
        if (!sink(cardObject(card))) {
            return;
        }
    }
}

void forEachPort(const Agent::HardwareInventory& inventory, const ObjectSink& sink) {
    const std::string systemName = hostName();
    for (const auto& port : inventory.ports) {
        if (!sink(portObject(port, systemName))) {
            return;
        }
    }
}

using Inventory = std::shared_ptr<const Agent::HardwareInventory>;

Inventory parseInventory(const std::string& text, const std::string& path) {
    return std::make_shared<const Agent::HardwareInventory>(Agent::parseTreeDescription(text, path).hardware);
}

/** One description serves all requests until it changes; the configuration may name another one meanwhile. */
Inventory describedInventory(const std::string& path) {
    static std::mutex mutex;
    static std::optional<Agent::FileCache<Agent::HardwareInventory>> cache;
    const std::lock_guard lock(mutex);
    if (!cache || cache->path() != path) {
        cache.emplace(path, parseInventory);
    }
    return cache->current();
}

} // namespace

const ObjectClass networkCard{"TAVIS_NetworkCard", forEachCard};
const ObjectClass networkPort{"TAVIS_NetworkPort", forEachPort};

std::shared_ptr<const Agent::HardwareInventory> currentInventory() {
    const auto configuration = Agent::loadConfiguration();
    if (configuration.backEnd == Agent::Configuration::BackEndKind::File) {
        return describedInventory(configuration.treeFile);
    }
    return std::make_shared<const Agent::HardwareInventory>(Agent::Linux::readHardwareInventory());
}

} // namespace Orv::Platform

#include "agent/hardware/Devices.h"

#include "agent/hardware/Sysfs.h"
#include "agent/text/Text.h"

#include <algorithm>

#include <libudev.h>

namespace Orv::Agent::Hardware {

namespace {

using Path = std::filesystem::path;

struct DeviceCloser {
    void operator()(udev_device* device) const { udev_device_unref(device); }
};

/**
 * The card of an interface's parent device: itself, but for a function of a USB device that device, which may carry
 * several functions.
 */
Path cardOf(const Path& parent) {
    std::error_code error;
    const bool usbFunction = std::filesystem::exists(parent / "bInterfaceNumber", error);
    return usbFunction ? parent.parent_path() : parent;
}

/**
 * The device that has the hardware's names: the first of the device and those that it is plugged into that is of PCI
 * or USB (a virtio device has no names of its own, the PCI function below it has), else the device.
 */
Path namedDevice(const Path& device) {
    for (Path path = device; path.has_relative_path(); path = path.parent_path()) {
        const auto subsystem = readLinkName(path / "subsystem");
        if (subsystem == "pci" || subsystem == "usb") {
            return path;
        }
    }
    return device;
}

/** Addresses of the interfaces of a device as sysfs shows them. */
std::vector<std::string> macAddresses(const Path& parent) {
    std::vector<std::string> result;
    std::error_code error;
    for (const auto& entry : std::filesystem::directory_iterator(parent / "net", error)) {
        if (auto address = readAttribute(entry.path() / "address")) {
            result.push_back(std::move(*address));
        }
    }
    return result;
}

std::optional<DeviceIdentity> identityOf(const Path& parent, const Path& device) {
    const auto subsystem = readLinkName(device / "subsystem");
    DeviceIdentity identity;
    std::optional<std::uint16_t> vendor;
    std::optional<std::uint16_t> product;
    if (subsystem == "usb") {
        identity.bus = DeviceBus::Usb;
        vendor = readHexadecimal(device / "idVendor");
        product = readHexadecimal(device / "idProduct");
        identity.serial = readAttribute(device / "serial").value_or("");
    } else if (subsystem == "pci") {
        identity.bus = DeviceBus::Pci;
        vendor = readNumber(device / "vendor");
        product = readNumber(device / "device");
        identity.subsystemVendor = readNumber(device / "subsystem_vendor");
        identity.subsystemProduct = readNumber(device / "subsystem_device");
        identity.pciAddress = device.filename().string();
    }
    if (!vendor || !product) {
        return std::nullopt;
    }
    identity.vendor = *vendor;
    identity.product = *product;
    identity.macAddresses = macAddresses(parent);
    return identity;
}

} // namespace

void DeviceReader::UdevCloser::operator()(udev* context) const {
    udev_unref(context);
}

DeviceReader::DeviceReader(std::string sysRoot)
    : _root(std::move(sysRoot)),
      _udev(_root.empty() ? udev_new() : nullptr),
      _hostInterfaces(readHostInterfaces(_root)) {}

std::optional<ParentDevice> DeviceReader::describe(const DeviceName& device) const {
    return describePath(Path(_root + "/sys/bus") / device.bus / "devices" / device.name);
}

std::optional<ParentDevice> DeviceReader::describeOfInterface(const std::string& interface) const {
    return describePath(interfaceDirectory(interface) / "device");
}

Path DeviceReader::interfaceDirectory(const std::string& interface) const {
    return Path(_root + "/sys/class/net") / interface;
}

std::optional<ParentDevice> DeviceReader::describePath(const Path& link) const {
    std::error_code error;
    const Path parent = std::filesystem::canonical(link, error);
    if (error) {
        return std::nullopt;
    }
    const Path card = cardOf(parent);
    const Path named = namedDevice(card);
    const auto subsystem = readLinkName(card / "subsystem");
    if (!subsystem) {
        return std::nullopt; // unplugged meanwhile
    }
    ParentDevice device;
    device.syspath = cleanText(card.string().substr(_root.size()));
    device.subsystem = cleanText(*subsystem);
    device.vendor = firstText(named, "ID_VENDOR_FROM_DATABASE", {"manufacturer", "vendor", "idVendor"});
    device.model = firstText(named, "ID_MODEL_FROM_DATABASE", {"product", "device", "idProduct"});
    device.serial = firstText(named, "ID_SERIAL_SHORT", {"serial"});
    if (const auto driver = readLinkName(parent / "driver")) {
        device.driver = cleanText(*driver);
    }
    device.managementController = isManagementController(parent, named);
    return device;
}

std::optional<std::string> DeviceReader::property(const Path& device, const char* name) const {
    if (!_udev) {
        return std::nullopt;
    }
    const std::unique_ptr<udev_device, DeviceCloser> entry(udev_device_new_from_syspath(_udev.get(), device.c_str()));
    const char* value = entry ? udev_device_get_property_value(entry.get(), name) : nullptr;
    return value == nullptr || *value == '\0' ? std::nullopt : std::optional<std::string>(value);
}

/** The first that is known: the property, then each attribute in turn. */
std::optional<std::string> DeviceReader::firstText(const Path& device, const char* property,
                                                   std::initializer_list<const char*> attributes) const {
    if (const auto text = this->property(device, property)) {
        return cleanText(*text);
    }
    for (const char* attribute : attributes) {
        if (const auto text = readAttribute(device / attribute)) {
            return cleanText(*text);
        }
    }
    return std::nullopt;
}

bool DeviceReader::isManagementController(const Path& parent, const Path& device) const {
    if (_hostInterfaces.empty()) {
        return false;
    }
    const auto identity = identityOf(parent, device);
    return identity && std::any_of(_hostInterfaces.begin(), _hostInterfaces.end(),
                                   [&](const HostInterface& interface) { return matches(interface, *identity); });
}

} // namespace Orv::Agent::Hardware

#include "agent/hardware/HostInterface.h"

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iterator>

namespace Orv::Agent::Hardware {

namespace {

constexpr std::uint8_t hostInterfaceType = 42;
constexpr std::uint8_t networkInterface = 0x40;

/** Device types of DSP0270. Version 2 descriptors start with their own length. */
enum DescriptorType : std::uint8_t { UsbVersion1 = 2, PciVersion1 = 3, UsbVersion2 = 4, PciVersion2 = 5 };

std::string hexadecimal(unsigned value, std::size_t width) {
    std::string text(width, '0');
    for (auto digit = text.rbegin(); digit != text.rend(); ++digit, value >>= 4U) {
        *digit = "0123456789abcdef"[value & 0xfU];
    }
    return text;
}

/** Little-endian fields at fixed places; the caller has checked the size. */
struct Fields {
    Bytes bytes;

    [[nodiscard]] std::uint8_t octet(std::size_t at) const { return std::to_integer<std::uint8_t>(bytes[at]); }

    [[nodiscard]] std::uint16_t word(std::size_t at) const {
        return static_cast<std::uint16_t>(octet(at) | octet(at + 1) << 8U);
    }

    /** Firmware that does not care for a subsystem identifier leaves all bits clear or set. */
    [[nodiscard]] std::optional<std::uint16_t> identifier(std::size_t at) const {
        const auto value = word(at);
        return value == 0 || value == 0xffff ? std::nullopt : std::optional(value);
    }

    /** Empty for an address of zeros, which is none. */
    [[nodiscard]] std::string macAddress(std::size_t at) const {
        std::string text = hexadecimal(octet(at), 2);
        bool none = octet(at) == 0;
        for (std::size_t i = 1; i < 6; ++i) {
            text += ':' + hexadecimal(octet(at + i), 2);
            none = none && octet(at + i) == 0;
        }
        return none ? "" : text;
    }

    /** Segment, bus, and device and function in one octet. */
    [[nodiscard]] std::string pciAddress(std::size_t at) const {
        const unsigned place = octet(at + 3);
        return hexadecimal(word(at), 4) + ':' + hexadecimal(octet(at + 2), 2) + ':' + hexadecimal(place >> 3U, 2) +
               '.' + hexadecimal(place & 7U, 1);
    }
};

/** The text of a USB string descriptor: its length, its type, UTF-16. What is not ASCII will match nothing. */
std::string usbString(const Fields& fields, std::size_t at) {
    if (fields.bytes.size() < at + 2) {
        return {};
    }
    const std::size_t end = std::min<std::size_t>(at + fields.octet(at), fields.bytes.size());
    std::string text;
    for (std::size_t place = at + 2; place + 1 < end; place += 2) {
        const auto unit = fields.word(place);
        text += unit < 0x80 ? static_cast<char>(unit) : '?';
    }
    return text;
}

HostInterface parseUsb(const Fields& fields, std::size_t start) {
    HostInterface interface;
    interface.bus = DeviceBus::Usb;
    interface.vendor = fields.word(start);
    interface.product = fields.word(start + 2);
    return interface;
}

HostInterface parsePci(const Fields& fields, std::size_t start) {
    HostInterface interface;
    interface.bus = DeviceBus::Pci;
    interface.vendor = fields.word(start);
    interface.product = fields.word(start + 2);
    interface.subsystemVendor = fields.identifier(start + 4);
    interface.subsystemProduct = fields.identifier(start + 6);
    return interface;
}

/** A device type and the descriptor behind it; none for other types and for descriptors that are cut short. */
std::optional<HostInterface> parseDescriptor(Bytes bytes) {
    const Fields fields{bytes.empty() ? bytes : bytes.subspan(1)};
    const std::uint8_t type = bytes.empty() ? std::uint8_t{0} : std::to_integer<std::uint8_t>(bytes[0]);
    const std::size_t size = fields.bytes.size();
    std::optional<HostInterface> interface;
    if (type == UsbVersion1 && size >= 4) {
        interface = parseUsb(fields, 0);
        interface->serial = usbString(fields, 4);
    } else if (type == PciVersion1 && size >= 8) {
        interface = parsePci(fields, 0);
    } else if (type == UsbVersion2 && size >= 12) {
        interface = parseUsb(fields, 1);
        interface->macAddress = fields.macAddress(6);
    } else if (type == PciVersion2 && size >= 19) {
        interface = parsePci(fields, 1);
        interface->macAddress = fields.macAddress(9);
        interface->pciAddress = fields.pciAddress(15);
    }
    return interface;
}

/** The formatted area of a type 42 structure: header (4), interface type, length of what follows, that. */
std::optional<HostInterface> parseStructure(Bytes formatted) {
    const Fields fields{formatted};
    if (fields.octet(0) != hostInterfaceType || formatted.size() < 6 || fields.octet(4) != networkInterface) {
        return std::nullopt;
    }
    const std::size_t length = std::min<std::size_t>(fields.octet(5), formatted.size() - 6);
    return parseDescriptor(formatted.subspan(6, length));
}

/** Bytes behind the strings of a structure, which end with two zeros. */
Bytes behindStrings(Bytes strings) {
    constexpr std::array end{std::byte{0}, std::byte{0}};
    const auto found = std::search(strings.begin(), strings.end(), end.begin(), end.end());
    return found == strings.end() ? Bytes() : Bytes(found + 2, strings.end());
}

std::string readFile(const std::filesystem::path& file) {
    std::ifstream stream(file, std::ios::binary);
    return {std::istreambuf_iterator<char>(stream), std::istreambuf_iterator<char>()};
}

template <class Value>
bool agree(const Value& left, const Value& right) {
    return left == Value() || right == Value() || left == right;
}

} // namespace

std::vector<HostInterface> parseHostInterfaces(Bytes structures) {
    constexpr std::size_t headerSize = 4;
    std::vector<HostInterface> interfaces;
    while (structures.size() >= headerSize) {
        const auto length = std::to_integer<std::size_t>(structures[1]);
        if (length < headerSize || length > structures.size()) {
            break;
        }
        if (const auto interface = parseStructure(structures.first(length))) {
            interfaces.push_back(*interface);
        }
        structures = behindStrings(structures.subspan(length));
    }
    return interfaces;
}

std::vector<HostInterface> readHostInterfaces(const std::string& sysRoot) {
    const std::filesystem::path firmware = sysRoot + "/sys/firmware/dmi";
    std::string structures = readFile(firmware / "tables" / "DMI");
    if (structures.empty()) {
        std::error_code error;
        for (const auto& entry : std::filesystem::directory_iterator(firmware / "entries", error)) {
            if (entry.path().filename().string().starts_with("42-")) {
                structures += readFile(entry.path() / "raw");
            }
        }
    }
    return parseHostInterfaces(std::as_bytes(std::span(structures)));
}

bool matches(const HostInterface& interface, const DeviceIdentity& device) {
    const auto& seen = device.macAddresses;
    return interface.bus == device.bus && interface.vendor == device.vendor && interface.product == device.product &&
           agree(interface.subsystemVendor, device.subsystemVendor) &&
           agree(interface.subsystemProduct, device.subsystemProduct) && agree(interface.serial, device.serial) &&
           agree(interface.pciAddress, device.pciAddress) &&
           (interface.macAddress.empty() || seen.empty() ||
            std::find(seen.begin(), seen.end(), interface.macAddress) != seen.end());
}

} // namespace Orv::Agent::Hardware

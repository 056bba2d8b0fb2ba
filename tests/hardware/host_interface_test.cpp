#include "agent/hardware/HostInterface.h"

#include <gtest/gtest.h>

namespace Orv::Agent::Hardware {
namespace {

using Octets = std::vector<std::uint8_t>;

/** A type 42 structure of a network host interface with this device type and descriptor, and no strings. */
Octets structure(std::uint8_t deviceType, const Octets& descriptor, std::uint8_t interfaceType = 0x40) {
    Octets octets{42, 0, 0x10, 0x00, interfaceType, static_cast<std::uint8_t>(descriptor.size() + 1), deviceType};
    octets.insert(octets.end(), descriptor.begin(), descriptor.end());
    octets.push_back(0); // no protocol records
    octets[1] = static_cast<std::uint8_t>(octets.size());
    octets.insert(octets.end(), {0, 0});
    return octets;
}

std::vector<HostInterface> parse(const Octets& octets) {
    return parseHostInterfaces(std::as_bytes(std::span(octets)));
}

Octets operator+(Octets left, const Octets& right) {
    left.insert(left.end(), right.begin(), right.end());
    return left;
}

const Octets usbVersion1{0x6b, 0x04, 0xb0, 0xff, 8, 3, 'A', 0, '1', 0, 'z', 0};
const Octets pciVersion1{0x86, 0x80, 0x33, 0x15, 0x28, 0x10, 0x01, 0x00};
const Octets usbVersion2{16, 0x6b, 0x04, 0xb0, 0xff, 2, 0x02, 0x11, 0x22, 0x33, 0x44, 0xaa, 0, 0, 0xff, 0xff};
const Octets pciVersion2{23, 0x86, 0x80, 0x33, 0x15, 0x28, 0x10, 0x01, 0x00, 0x02, 0,   0,
                         0,  0,    1,    0x00, 0x00, 0x65, 0x09, 0,    0,    0xff, 0xff};

HostInterface usb() {
    HostInterface interface;
    interface.bus = DeviceBus::Usb;
    interface.vendor = 0x046b;
    interface.product = 0xffb0;
    return interface;
}

HostInterface pci() {
    HostInterface interface;
    interface.bus = DeviceBus::Pci;
    interface.vendor = 0x8086;
    interface.product = 0x1533;
    interface.subsystemVendor = 0x1028;
    interface.subsystemProduct = 0x0001;
    return interface;
}

TEST(HostInterfaces, OfUsbTellIdentifiersAndSerialNumber) {
    auto expected = usb();
    expected.serial = "A1z";
    EXPECT_EQ(parse(structure(2, usbVersion1)), std::vector{expected});
}

TEST(HostInterfaces, OfPciTellIdentifiers) {
    EXPECT_EQ(parse(structure(3, pciVersion1)), std::vector{pci()});
}

TEST(HostInterfaces, OfUsbVersion2TellTheMacAddress) {
    auto expected = usb();
    expected.macAddress = "02:11:22:33:44:aa";
    EXPECT_EQ(parse(structure(4, usbVersion2)), std::vector{expected});
}

TEST(HostInterfaces, OfPciVersion2TellMacAddressAndPlace) {
    auto expected = pci();
    expected.macAddress = "02:00:00:00:00:01";
    expected.pciAddress = "0000:65:01.1";
    EXPECT_EQ(parse(structure(5, pciVersion2)), std::vector{expected});
}

TEST(HostInterfaces, LeaveOpenWhatTheFirmwareLeavesBlank) {
    Octets blank = pciVersion2;
    std::fill(blank.begin() + 5, blank.begin() + 9, 0xff);
    std::fill(blank.begin() + 9, blank.begin() + 15, 0);
    const auto interfaces = parse(structure(5, blank));
    ASSERT_EQ(interfaces.size(), 1U);
    EXPECT_FALSE(interfaces[0].subsystemVendor);
    EXPECT_FALSE(interfaces[0].subsystemProduct);
    EXPECT_EQ(interfaces[0].macAddress, "");
}

TEST(HostInterfaces, AreFoundBetweenOtherStructuresAndTheirStrings) {
    const Octets bios{0, 6, 0, 0, 1, 2, 'm', 'a', 'k', 'e', 'r', 0, '1', '.', '0', 0, 0};
    const Octets end{127, 4, 0xff, 0xfe, 0, 0};
    EXPECT_EQ(parse(bios + structure(3, pciVersion1) + bios + structure(4, usbVersion2) + end).size(), 2U);
}

TEST(HostInterfaces, AreNetworkInterfacesOnly) {
    EXPECT_TRUE(parse(structure(2, usbVersion1, 0x02)).empty()); // a keyboard controller style interface
    EXPECT_TRUE(parse(structure(0x80, usbVersion1)).empty());    // a descriptor of the maker's own
}

TEST(HostInterfaces, CutShortAreLeftOut) {
    const std::vector<std::pair<std::uint8_t, Octets>> descriptors{
        {2, {usbVersion1.begin(), usbVersion1.begin() + 4}},
        {3, pciVersion1},
        {4, {usbVersion2.begin(), usbVersion2.begin() + 12}},
        {5, {pciVersion2.begin(), pciVersion2.begin() + 19}}};
    for (const auto& [type, whole] : descriptors) {
        EXPECT_EQ(parse(structure(type, whole)).size(), 1U) << int{type};
        for (std::size_t size = 0; size < whole.size(); ++size) {
            const Octets cut(whole.begin(), whole.begin() + static_cast<std::ptrdiff_t>(size));
            EXPECT_TRUE(parse(structure(type, cut)).empty()) << int{type} << ' ' << size;
        }
    }
}

TEST(HostInterfaces, OfATableThatIsCutAnywhereAreReadWithoutHarm) {
    const Octets table = structure(2, usbVersion1) + structure(5, pciVersion2);
    for (std::size_t size = 0; size < table.size(); ++size) {
        const Octets cut(table.begin(), table.begin() + static_cast<std::ptrdiff_t>(size)); // its own end for ASan
        EXPECT_LE(parse(cut).size(), 2U);
        EXPECT_EQ(parse(cut).empty(), size < 20) << size; // the formatted area of the first ends there
    }
}

TEST(HostInterfaces, EndAtAStructureShorterThanItsHeader) {
    EXPECT_TRUE(parse(Octets{42, 3, 0, 0, 0, 0} + structure(3, pciVersion1)).empty());
}

TEST(HostInterfaces, ClaimMoreDataThanTheStructureHoldsWithoutHarm) {
    Octets octets = structure(3, pciVersion1);
    octets[5] = 0xff;
    EXPECT_EQ(parse(octets).size(), 1U);
    octets = structure(2, usbVersion1);
    octets[5 + 6] = 0xff; // the serial number's own length
    EXPECT_EQ(parse(octets).size(), 1U);
}

DeviceIdentity identity(const HostInterface& interface) {
    return {interface.bus,
            interface.vendor,
            interface.product,
            interface.subsystemVendor,
            interface.subsystemProduct,
            interface.serial,
            interface.pciAddress,
            {}};
}

TEST(HostInterfaceMatch, NeedsTheSameBusAndIdentifiers) {
    EXPECT_TRUE(matches(pci(), identity(pci())));
    EXPECT_FALSE(matches(pci(), identity(usb())));
    auto other = identity(pci());
    other.product = 0x1534;
    EXPECT_FALSE(matches(pci(), other));
    other = identity(pci());
    other.subsystemProduct = 2;
    EXPECT_FALSE(matches(pci(), other));
}

TEST(HostInterfaceMatch, ComparesWhatBothSidesTell) {
    auto interface = usb();
    interface.serial = "A1";
    auto device = identity(usb());
    EXPECT_TRUE(matches(interface, device)); // the device shows no serial number
    device.serial = "A2";
    EXPECT_FALSE(matches(interface, device));
    device.serial = "A1";
    EXPECT_TRUE(matches(interface, device));
}

TEST(HostInterfaceMatch, TellsTwoEqualCardsApartByPlaceAndMacAddress) {
    auto interface = pci();
    interface.pciAddress = "0000:65:01.1";
    auto device = identity(interface);
    device.pciAddress = "0000:65:01.0";
    EXPECT_FALSE(matches(interface, device));

    interface = usb();
    interface.macAddress = "02:00:00:00:00:01";
    device = identity(usb());
    device.macAddresses = {"02:00:00:00:00:02"};
    EXPECT_FALSE(matches(interface, device));
    device.macAddresses.push_back("02:00:00:00:00:01");
    EXPECT_TRUE(matches(interface, device));
}

} // namespace
} // namespace Orv::Agent::Hardware

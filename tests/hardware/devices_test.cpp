#include "agent/hardware/Hardware.h"
#include "agent/hardware/Sysfs.h"

#include <cstdlib>
#include <filesystem>
#include <fstream>

#include <gtest/gtest.h>

namespace Orv::Agent::Linux {
namespace {

using Path = std::filesystem::path;

/** A /sys of the test's own. */
class FakeSysfs : public testing::Test {
  protected:
    FakeSysfs() {
        std::string pattern = (std::filesystem::temp_directory_path() / "sysfs-XXXXXX").string();
        _root = mkdtemp(pattern.data());
    }

    ~FakeSysfs() override { std::filesystem::remove_all(_root); }

    FakeSysfs(const FakeSysfs&) = delete;
    FakeSysfs& operator=(const FakeSysfs&) = delete;

    [[nodiscard]] std::string root() const { return _root.string(); }

    void write(const std::string& file, const std::string& content) const {
        std::filesystem::create_directories((_root / file).parent_path());
        std::ofstream(_root / file, std::ios::binary) << content;
    }

    void link(const std::string& from, const std::string& to) const {
        std::filesystem::create_directories((_root / from).parent_path());
        std::filesystem::create_symlink(_root / to, _root / from);
    }

    /** A device on a bus with its driver. */
    void device(const std::string& path, const std::string& bus, const std::string& driver) const {
        std::filesystem::create_directories(_root / path);
        std::filesystem::create_directories(_root / "sys/bus" / bus / "drivers" / driver);
        link(path + "/subsystem", "sys/bus/" + bus);
        link(path + "/driver", "sys/bus/" + bus + "/drivers/" + driver);
        link("sys/bus/" + bus + "/devices/" + Path(path).filename().string(), path);
    }

    void pciCard(const std::string& path) const {
        device(path, "pci", "igb");
        write(path + "/vendor", "0x8086\n");
        write(path + "/device", "0x1533\n");
        write(path + "/subsystem_vendor", "0x1028\n");
        write(path + "/subsystem_device", "0x0001\n");
    }

    /** A USB device and the function of it that carries interfaces. */
    void usbCard(const std::string& path, const std::string& serial) const {
        device(path, "usb", "usb");
        write(path + "/idVendor", "046b\n");
        write(path + "/idProduct", "ffb0\n");
        write(path + "/manufacturer", "Maker\n");
        write(path + "/product", "Virtual Ethernet\n");
        write(path + "/serial", serial);
        device(path + "/1-1:1.0", "usb", "cdc_ether");
        write(path + "/1-1:1.0/bInterfaceNumber", "00\n");
    }

    void interface(const std::string& name, const std::string& parent) const {
        write(parent + "/net/" + name + "/address", "02:00:00:00:00:01\n");
        link(parent + "/net/" + name + "/device", parent);
        link("sys/class/net/" + name, parent + "/net/" + name);
    }

  private:
    Path _root;
};

const std::string pciPath = "sys/devices/pci0000:00/0000:03:00.0";
const std::string usbPath = "sys/devices/pci0000:00/0000:00:14.0/usb1/1-1";

/** Type 42: a PCI version 1 network host interface of 8086:1533 with subsystem 1028:0001. */
const std::string pciFirmware("\x2a\x10\x10\x00\x40\x09\x03\x86\x80\x33\x15\x28\x10\x01\x00\x00\x00\x00", 18);

TEST_F(FakeSysfs, DescribesAPciCard) {
    pciCard(pciPath);
    interface("enp3s0", pciPath);
    const auto device = findParentDevice("enp3s0", root());
    ASSERT_TRUE(device);
    EXPECT_EQ(device->syspath, "/" + pciPath);
    EXPECT_EQ(device->subsystem, "pci");
    EXPECT_EQ(device->driver, "igb");
    EXPECT_EQ(device->vendor, "0x8086");
    EXPECT_EQ(device->model, "0x1533");
    EXPECT_FALSE(device->serial);
    EXPECT_FALSE(device->managementController);
    EXPECT_EQ(describeDevice({"pci", "0000:03:00.0"}, root()), device);
}

TEST_F(FakeSysfs, DescribesAUsbDeviceByItselfAndNotByTheFunction) {
    usbCard(usbPath, "SN-1\n");
    interface("usb0", usbPath + "/1-1:1.0");
    const auto device = findParentDevice("usb0", root());
    ASSERT_TRUE(device);
    EXPECT_EQ(device->syspath, "/" + usbPath);
    EXPECT_EQ(device->driver, "cdc_ether");
    EXPECT_EQ(device->vendor, "Maker");
    EXPECT_EQ(device->model, "Virtual Ethernet");
    EXPECT_EQ(device->serial, "SN-1");
}

TEST_F(FakeSysfs, NamesAVirtioDeviceByThePciFunctionBelowIt) {
    pciCard(pciPath);
    device(pciPath + "/virtio0", "virtio", "virtio_net");
    write(pciPath + "/virtio0/vendor", "0x1af4\n");
    interface("eth0", pciPath + "/virtio0");
    const auto device = findParentDevice("eth0", root());
    ASSERT_TRUE(device);
    EXPECT_EQ(device->syspath, "/" + pciPath + "/virtio0");
    EXPECT_EQ(device->subsystem, "virtio");
    EXPECT_EQ(device->vendor, "0x8086");
}

TEST_F(FakeSysfs, NamesAVirtioDeviceWithoutPciByItself) {
    const std::string path = "sys/devices/platform/a000.virtio_mmio/virtio0";
    device(path, "virtio", "virtio_net");
    write(path + "/vendor", "0x554d4551\n");
    EXPECT_EQ(describeDevice({"virtio", "virtio0"}, root())->vendor, "0x554d4551");
}

TEST_F(FakeSysfs, CleansBadBytesOfHardware) {
    usbCard(usbPath, "A\xff\x01Z\n");
    const auto device = describeDevice({"usb", "1-1:1.0"}, root());
    ASSERT_TRUE(device);
    EXPECT_EQ(device->serial, "A\xef\xbf\xbd Z");
}

TEST_F(FakeSysfs, HasNoDeviceForAVirtualInterface) {
    write("sys/devices/virtual/net/br0/address", "02:00:00:00:00:01\n");
    link("sys/class/net/br0", "sys/devices/virtual/net/br0");
    EXPECT_FALSE(findParentDevice("br0", root()));
}

TEST_F(FakeSysfs, HasNoDeviceForAnInterfaceThatVanished) {
    EXPECT_FALSE(findParentDevice("eth7", root()));
    EXPECT_FALSE(describeDevice({"pci", "0000:ff:00.0"}, root()));
}

TEST_F(FakeSysfs, HasNoDeviceForOneThatIsBeingUnplugged) {
    std::filesystem::create_directories(root() + "/" + pciPath);
    link("sys/bus/pci/devices/0000:03:00.0", pciPath);
    EXPECT_FALSE(describeDevice({"pci", "0000:03:00.0"}, root()));
}

TEST_F(FakeSysfs, TellsTheManagementControllersInterfaceByTheFirmwaresTable) {
    pciCard(pciPath);
    write("sys/firmware/dmi/tables/DMI", pciFirmware);
    EXPECT_TRUE(describeDevice({"pci", "0000:03:00.0"}, root())->managementController);
}

TEST_F(FakeSysfs, TellsTheManagementControllersInterfaceByTheFirmwaresEntries) {
    pciCard(pciPath);
    write("sys/firmware/dmi/entries/1-0/raw", pciFirmware);
    EXPECT_FALSE(describeDevice({"pci", "0000:03:00.0"}, root())->managementController); // no entry of type 42
    write("sys/firmware/dmi/entries/42-0/raw", pciFirmware);
    EXPECT_TRUE(describeDevice({"pci", "0000:03:00.0"}, root())->managementController);
}

TEST_F(FakeSysfs, TellsAnotherCardFromTheManagementControllers) {
    pciCard(pciPath);
    write(pciPath + "/subsystem_device", "0x0002\n");
    write("sys/firmware/dmi/tables/DMI", pciFirmware);
    EXPECT_FALSE(describeDevice({"pci", "0000:03:00.0"}, root())->managementController);
}

TEST_F(FakeSysfs, TellsAUsbManagementInterfaceByItsMacAddress) {
    usbCard(usbPath, "\n");
    interface("usb0", usbPath + "/1-1:1.0");
    std::string firmware("\x2a\x14\x10\x00\x40\x0d\x04\x0c\x6b\x04\xb0\xff\x00\x02\x00\x00\x00\x00\x01\x00\x00\x00",
                         22);
    write("sys/firmware/dmi/tables/DMI", firmware);
    EXPECT_TRUE(findParentDevice("usb0", root())->managementController);
    firmware[18] = 2; // last octet of the address
    write("sys/firmware/dmi/tables/DMI", firmware);
    EXPECT_FALSE(findParentDevice("usb0", root())->managementController);
}

TEST_F(FakeSysfs, AttributesAreReadWithoutTheirBlanks) {
    write("a", "  two words \nsecond line\n");
    write("b", "\n");
    write("c", "0x1f\n");
    write("d", "12\n");
    write("e", "0x12345\n");
    write("f", "1f\n");
    using Hardware::readAttribute;
    using Hardware::readHexadecimal;
    using Hardware::readNumber;
    EXPECT_EQ(readAttribute(root() + "/a"), "two words");
    EXPECT_FALSE(readAttribute(root() + "/b"));
    EXPECT_FALSE(readAttribute(root() + "/missing"));
    EXPECT_EQ(readNumber(root() + "/c"), 31);
    EXPECT_EQ(readNumber(root() + "/d"), 12);
    EXPECT_FALSE(readNumber(root() + "/e"));
    EXPECT_FALSE(readNumber(root() + "/f"));
    EXPECT_EQ(readHexadecimal(root() + "/f"), 31);
}

} // namespace
} // namespace Orv::Agent::Linux

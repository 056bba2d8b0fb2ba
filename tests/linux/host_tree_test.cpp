#include "agent/linux/HostTree.h"
#include "tests/linux/Facts.h"
#include "tests/linux/TemporaryHost.h"
#include "tests/linux/TreeReading.h"

#include <stdexcept>

#include <gtest/gtest.h>

namespace Orv::Agent::Linux {
namespace {

using namespace NodeLexicon;
using namespace Orv::Test;

/** A tree over links that a test makes up and hardware that it describes. */
class HostTreeTest : public testing::Test {
  protected:
    void SetUp() override { configuration.refresh(); }

    std::shared_ptr<const Tree> read(const std::vector<Link>& links) {
        for (const Link& known : links) {
            state.apply(Change<Link>{known, false});
        }
        return tree.update(state, configuration, state.takeChanges());
    }

    static Link onBus(int index, const std::string& name, const std::string& device) {
        Link made = link(index, name);
        made.address = {2, 0, 0, 0, 0, static_cast<std::uint8_t>(index)};
        made.parentBus = "pci";
        made.parentName = device;
        return made;
    }

    std::map<std::string, ParentDevice> devices; ///< by name on their bus, or by interface for old kernels
    std::map<std::string, std::vector<std::uint8_t>> permanentAddresses;
    int questions = 0;

    TemporaryHost host;
    KernelState state;
    HostConfiguration configuration{host.root()};
    HostTree tree{{[this](const DeviceName& device) { return describe(device.name); },
                   [this](const std::string& interface) { return describe(interface); },
                   [this](const std::string& interface) -> std::optional<std::vector<std::uint8_t>> {
                       ++questions;
                       const auto found = permanentAddresses.find(interface);
                       return found == permanentAddresses.end() ? std::nullopt : std::optional(found->second);
                   }}};

  private:
    std::optional<ParentDevice> describe(const std::string& name) {
        ++questions;
        if (name == "broken") {
            throw std::runtime_error("no such luck");
        }
        const auto found = devices.find(name);
        return found == devices.end() ? std::nullopt : std::optional(found->second);
    }
};

std::string parentDescription(const Tree& tree, const Node& node) {
    const auto parent = tree.find(node.parentPath);
    return parent ? parent->description : "nothing";
}

std::string grandparentDescription(const Tree& tree, const Node& node) {
    const auto parent = tree.find(node.parentPath);
    return parent ? parentDescription(tree, *parent) : "nothing";
}

TEST_F(HostTreeTest, putsThePortsOfACardBelowOneDevice) {
    devices["0000:03:00.0"] = {"/sys/devices/pci/0", "pci", "Vendor", "Model", {}, "driver", false};
    const auto made = read({onBus(2, "eth0", "0000:03:00.0"), onBus(3, "eth1", "0000:03:00.0")});
    const auto first = adapterOf(*made, "eth0");
    const auto second = adapterOf(*made, "eth1");
    EXPECT_EQ(first->parentPath, second->parentPath);
    EXPECT_EQ(parentDescription(*made, *first), "Vendor Model");
    EXPECT_EQ(made->nodesOfType(NODE_NETWORK_PORT).size(), 2U);
    EXPECT_EQ(adapterOf(*made, "eth0", NODE_NETWORK_PORT)->parentPath, first->parentPath);
}

TEST_F(HostTreeTest, describesADeviceByWhatIsKnownOfIt) {
    const std::vector<std::pair<ParentDevice, std::string>> cases{
        {{"/sys/a", "pci", "Vendor", std::nullopt, {}, "driver", false}, "Vendor"},
        {{"/sys/b", "pci", std::nullopt, "Model", {}, "driver", false}, "Model"},
        {{"/sys/c", "pci", std::nullopt, std::nullopt, {}, "driver", false}, "driver"},
        {{"/sys/d", "usb", std::nullopt, std::nullopt, {}, std::nullopt, false}, "usb"},
    };
    int index = 2;
    for (const auto& [device, expected] : cases) {
        devices[device.syspath] = device;
        const std::string name = "eth" + std::to_string(index);
        const auto made = read({onBus(index++, name, device.syspath)});
        EXPECT_EQ(parentDescription(*made, *adapterOf(*made, name)), expected);
    }
}

TEST_F(HostTreeTest, putsTheControllersInterfaceBelowBmc) {
    devices["usb1"] = {"/sys/devices/usb1", "usb", "Vendor", "Model", {}, "cdc_ether", true};
    devices["pci1"] = {"/sys/devices/pci1", "pci", "Vendor", "Model", {}, "e1000e", false};
    const auto made = read({onBus(2, "usb0", "usb1"), onBus(3, "eth0", "pci1")});
    EXPECT_EQ(grandparentDescription(*made, *adapterOf(*made, "usb0")), "BMC");
    EXPECT_NE(grandparentDescription(*made, *adapterOf(*made, "eth0")), "BMC");
    EXPECT_EQ(parentDescription(*made, *made->find(made->find(adapterOf(*made, "usb0")->parentPath)->parentPath)),
              configuration.hostName());
}

TEST_F(HostTreeTest, givesAPortItsPermanentAddress) {
    devices["pci1"] = {"/sys/devices/pci1", "pci", {}, {}, {}, {}, false};
    Link told = onBus(2, "eth0", "pci1");
    told.permanentAddress = {2, 0, 0, 0, 0, 0xEE};
    permanentAddresses["eth1"] = {2, 0, 0, 0, 0, 0xDD};
    const auto made = read({told, onBus(3, "eth1", "pci1"), onBus(4, "eth2", "pci1")});
    const auto address = [&](const char* name) {
        return valueOf<std::string>(*adapterOf(*made, name, NODE_NETWORK_PORT), PROP_MAC_ADDRESS);
    };
    EXPECT_EQ(address("eth0"), "02:00:00:00:00:ee");
    EXPECT_EQ(address("eth1"), "02:00:00:00:00:dd");
    EXPECT_EQ(address("eth2"), "02:00:00:00:00:04");
    EXPECT_EQ(textOf(*made, "eth0", PROP_MAC_ADDRESS), "02:00:00:00:00:02") << "the adapter has the one in use";
}

TEST_F(HostTreeTest, asksNothingAboutAVirtualInterface) {
    Link virtualOne = link(2, "veth0");
    virtualOne.kind = "veth";
    const auto made = read({virtualOne});
    EXPECT_EQ(questions, 0);
    EXPECT_EQ(parentDescription(*made, *adapterOf(*made, "veth0")), "veth");
    EXPECT_TRUE(made->nodesOfType(NODE_NETWORK_PORT).empty());
}

TEST_F(HostTreeTest, asksAboutHardwareOnceForEachNameThatItHas) {
    devices["pci1"] = {"/sys/devices/pci1", "pci", {}, {}, {}, {}, false};
    Link known = onBus(2, "eth0", "pci1");
    known.permanentAddress = {2, 0, 0, 0, 0, 0xEE};
    read({known});
    EXPECT_EQ(questions, 1);
    known.flags = 0;
    read({known});
    EXPECT_EQ(questions, 1);
    known.name = "lan0";
    read({known});
    EXPECT_EQ(questions, 2);
}

TEST_F(HostTreeTest, findsTheDeviceOnAKernelThatDoesNotNameIt) {
    devices["eth0"] = {"/sys/devices/pci1", "pci", "Vendor", "Model", {}, {}, false};
    const auto made = read({link(2, "eth0"), link(3, "odd0")});
    EXPECT_EQ(parentDescription(*made, *adapterOf(*made, "eth0")), "Vendor Model");
    EXPECT_EQ(parentDescription(*made, *adapterOf(*made, "odd0")), "virtual");
    EXPECT_EQ(made->nodesOfType(NODE_NETWORK_PORT).size(), 1U);
}

TEST_F(HostTreeTest, keepsAnInterfaceWhoseHardwareCannotBeAsked) {
    const auto made = read({onBus(2, "eth0", "broken"), onBus(3, "eth1", "unknown")});
    EXPECT_EQ(parentDescription(*made, *adapterOf(*made, "eth0")), "pci broken");
    EXPECT_EQ(parentDescription(*made, *adapterOf(*made, "eth1")), "pci unknown");
    EXPECT_EQ(made->nodesOfType(NODE_NETWORK_PORT).size(), 2U);
}

TEST_F(HostTreeTest, sharesNodesThatAReadingFindsUnchanged) {
    devices["pci1"] = {"/sys/devices/pci1", "pci", "Vendor", "Model", {}, {}, false};
    const auto before = read({onBus(2, "eth0", "pci1")});
    const auto after = tree.update(state, configuration, {2});
    EXPECT_NE(after, before);
    EXPECT_EQ(after->nodes(), before->nodes()) << "the pointers, not only what they point at";
}

TEST_F(HostTreeTest, showsWhatHasChangedAmongNodesThatStay) {
    devices["pci1"] = {"/sys/devices/pci1", "pci", "Vendor", "Model", {}, {}, false};
    Link card = onBus(2, "eth0", "pci1");
    const auto before = read({card, link(3, "odd0"), link(4, "odd1")});
    card.flags = 0;
    card.address.back() = 0xCC;
    // What is built between two trees belongs to the next as well.
    state.apply(Change<Link>{card, false});
    tree.rebuild(state, configuration, state.takeChanges());
    const auto after = read({link(4, "odd1", 0)});
    EXPECT_EQ(textOf(*after, "eth0", PROP_MAC_ADDRESS), "02:00:00:00:00:cc");
    EXPECT_EQ(valueOf<std::string>(*adapterOf(*after, "eth0", NODE_NETWORK_PORT), PROP_MAC_ADDRESS),
              "02:00:00:00:00:cc");
    EXPECT_NE(adapterOf(*after, "odd1"), adapterOf(*before, "odd1"));
    EXPECT_EQ(adapterOf(*after, "odd0"), adapterOf(*before, "odd0"));
    EXPECT_EQ(textOf(*before, "eth0", PROP_MAC_ADDRESS), "02:00:00:00:00:02") << "trees do not change";
}

TEST_F(HostTreeTest, showsAnInterfaceThatHasMovedToAnotherDeviceThere) {
    devices["pci1"] = {"/sys/devices/pci1", "pci", "Vendor", "One", {}, {}, false};
    devices["pci2"] = {"/sys/devices/pci2", "pci", "Vendor", "Two", {}, {}, false};
    read({onBus(2, "eth0", "pci1"), link(3, "odd0")});
    const auto made = read({onBus(2, "eth0", "pci2")});
    EXPECT_EQ(parentDescription(*made, *adapterOf(*made, "eth0")), "Vendor Two");
    EXPECT_EQ(made->nodesOfType(NODE_NETWORK_ADAPTER).size(), 2U);
}

TEST_F(HostTreeTest, dropsADeviceWithItsLastInterface) {
    devices["pci1"] = {"/sys/devices/pci1", "pci", "Vendor", "Model", {}, {}, false};
    const auto before = read({onBus(2, "eth0", "pci1"), link(3, "odd0")});
    const std::string device = adapterOf(*before, "eth0")->parentPath;
    state.apply(Change<Link>{onBus(2, "eth0", "pci1"), true});
    const auto after = read({});
    EXPECT_EQ(after->find(device), nullptr);
    EXPECT_NE(before->find(device), nullptr);
    EXPECT_EQ(adapterNames(*after), std::set<std::string>{"odd0"});
}

TEST_F(HostTreeTest, cleansWhatTheKernelSays) {
    Link odd = link(2, "e\x01\xff");
    odd.kind = "k\x02";
    const auto made = read({odd});
    EXPECT_EQ(adapterNames(*made), std::set<std::string>{"e \xEF\xBF\xBD"});
    EXPECT_EQ(parentDescription(*made, *made->nodesOfType(NODE_NETWORK_ADAPTER).front()), "k ");
}

} // namespace
} // namespace Orv::Agent::Linux

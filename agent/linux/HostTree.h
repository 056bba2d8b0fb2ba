/**
 * @file
 * The tree of this host, put together from what the kernel, the hardware and the host's files say.
 *
 *     host                                    described by the host's name
 *       chassis, or BMC                       "BMC" carries what belongs to the management controller
 *         device                              vendor and model; of virtual interfaces the kind, shared by all of it
 *           adapter (NODE_NETWORK_ADAPTER)    each interface but the loopback
 *           port (NODE_NETWORK_PORT)          each interface that a device carries
 */
#pragma once

#include "agent/hardware/Hardware.h"
#include "agent/linux/HostConfiguration.h"
#include "agent/linux/KernelState.h"
#include "agent/tree/Tree.h"

#include <functional>
#include <map>
#include <memory>
#include <optional>
#include <set>
#include <string>
#include <vector>

namespace Orv::Agent::Linux {

/** Where facts about hardware come from; they may throw std::exception, which counts as nothing known. */
struct HardwareSource {
    std::function<std::optional<ParentDevice>(const DeviceName&)> describe;
    std::function<std::optional<ParentDevice>(const std::string& interface)> find;
    std::function<std::optional<std::vector<std::uint8_t>>(const std::string& interface)> permanentAddress;
};

/** Builds one tree after the other; nodes that did not change are shared between them. One thread at a time. */
class HostTree {
  public:
    explicit HostTree(HardwareSource hardware) : _hardware(std::move(hardware)) {}

    using NodePointer = Tree::NodePointer;

    /** Builds anew the nodes of the interfaces in `changed`, takes the others over, and puts the tree together. */
    std::shared_ptr<const Tree> update(const KernelState& state, const HostConfiguration& configuration,
                                       const std::set<int>& changed);

    /** The first of these alone: what it costs does not depend on how many other interfaces there are. */
    void rebuild(const KernelState& state, const HostConfiguration& configuration, const std::set<int>& changed);

    /** The adapter node of an interface as it was last built; null when there is none. */
    [[nodiscard]] NodePointer adapter(int index) const;

    /** The interface whose adapter node, as it was last built, has this path. */
    [[nodiscard]] std::optional<int> adapterAt(const std::string& path) const;

    /** What the host's files recognise an interface by; `link` is one that the last tree was built from. */
    [[nodiscard]] InterfaceFacts facts(const Link& link) const;

    /** What is above that node, from its device up; empty when there is no such node. */
    [[nodiscard]] std::vector<NodePointer> ancestors(int index, const HostConfiguration& configuration) const;

  private:
    /** The device node above an interface. */
    struct Device {
        std::string path;
        std::string description;
        bool isReal = false; ///< there is hardware, so the interface is a port
        bool managementController = false;
    };

    struct Interface {
        Link link; ///< as it was when the device was looked up
        Device device;
        std::vector<std::uint8_t> permanentAddress;
        NodePointer adapter;
        NodePointer port; ///< null when there is no hardware
    };

    void updateInterface(const Link& link, const KernelState& state, const HostConfiguration& configuration);
    void identify(const Link& link, Interface& interface);
    Device deviceOf(const Link& link) const;
    std::optional<ParentDevice> parentOf(const Link& link) const;
    [[nodiscard]] NodePointer structureNode(const std::string& path, const std::string& parent,
                                            const std::string& description) const;
    [[nodiscard]] std::vector<NodePointer> above(const Device& device, const std::string& hostName) const;
    std::shared_ptr<const Tree> assemble(const std::string& hostName);
    [[nodiscard]] std::shared_ptr<const Tree> exchange() const;
    std::vector<NodePointer> structure(const std::string& hostName);

    HardwareSource _hardware;
    std::map<int, Interface> _interfaces;
    std::map<std::string, NodePointer> _structure; ///< host, chassis and device nodes by path
    std::shared_ptr<const Tree> _tree;             ///< the last one; null in the beginning
    std::string _hostName;                         ///< as it is in that
    std::set<int> _rebuilt;                        ///< interfaces whose nodes may have become others since
    bool _isReshaped = true;                       ///< since then interfaces have come, gone or become others
};

} // namespace Orv::Agent::Linux

#include "agent/linux/HostTree.h"

#include "agent/linux/AdapterNode.h"
#include "agent/linux/Selection.h"
#include "agent/text/Text.h"

#include <charconv>
#include <exception>
#include <utility>

namespace Orv::Agent::Linux {

namespace {

constexpr const char* hostPath = "/host";
constexpr const char* chassisPath = "/host/chassis";
constexpr const char* chassisDescription = "Chassis";
constexpr const char* controllerPath = "/host/bmc";
constexpr const char* controllerDescription = "BMC";

/** The known node when it equals the fresh one, so that trees share it; else the fresh one. */
Tree::NodePointer keep(const Tree::NodePointer& known, Node fresh) {
    return known && *known == fresh ? known : std::make_shared<const Node>(std::move(fresh));
}

std::string describe(const ParentDevice& device) {
    std::string text = device.vendor.value_or("");
    if (device.model) {
        text += (text.empty() ? "" : " ") + *device.model;
    }
    return text.empty() ? device.driver.value_or(device.subsystem) : text;
}

/** What `question` answers; nothing when it throws: hardware that cannot be asked must not hide the interface. */
template <typename Question>
auto ask(const Question& question) -> decltype(question()) {
    try {
        return question();
    } catch (const std::exception&) {
        return std::nullopt;
    }
}

} // namespace

std::shared_ptr<const Tree> HostTree::update(const KernelState& state, const HostConfiguration& configuration,
                                             const std::set<int>& changed) {
    rebuild(state, configuration, changed);
    const std::string& hostName = configuration.hostName();
    _tree = _isReshaped || hostName != _hostName ? assemble(hostName) : exchange();
    _hostName = hostName;
    _isReshaped = false;
    _rebuilt.clear();
    return _tree;
}

void HostTree::rebuild(const KernelState& state, const HostConfiguration& configuration,
                       const std::set<int>& changed) {
    for (const int index : changed) {
        const auto link = state.links().find(index);
        if (link == state.links().end() || isLoopback(link->second)) {
            _isReshaped = _interfaces.erase(index) != 0 || _isReshaped;
        } else {
            _rebuilt.insert(index);
            updateInterface(link->second, state, configuration);
        }
    }
}

Tree::NodePointer HostTree::adapter(int index) const {
    const auto found = _interfaces.find(index);
    return found == _interfaces.end() ? nullptr : found->second.adapter;
}

std::optional<int> HostTree::adapterAt(const std::string& path) const {
    // The path ends in the index.
    const char* const end = path.data() + path.size();
    int index = 0;
    if (std::from_chars(path.data() + path.rfind('/') + 1, end, index).ptr != end) {
        return std::nullopt;
    }
    const NodePointer node = adapter(index);
    return node && node->path == path ? std::optional(index) : std::nullopt;
}

InterfaceFacts HostTree::facts(const Link& link) const {
    const auto found = _interfaces.find(link.index);
    return factsOf(link, found == _interfaces.end() ? link.permanentAddress : found->second.permanentAddress);
}

std::vector<Tree::NodePointer> HostTree::ancestors(int index, const HostConfiguration& configuration) const {
    const auto found = _interfaces.find(index);
    return found == _interfaces.end() ? std::vector<NodePointer>()
                                      : above(found->second.device, configuration.hostName());
}

void HostTree::updateInterface(const Link& link, const KernelState& state, const HostConfiguration& configuration) {
    Interface& interface = _interfaces[link.index];
    identify(link, interface);
    const std::string name = cleanText(link.name);
    const std::string suffix = '/' + std::to_string(link.index);
    interface.adapter =
        keep(interface.adapter,
             {interface.device.path + "/adapter" + suffix, interface.device.path, NodeLexicon::NODE_NETWORK_ADAPTER,
              name, adapterProperties(link, interface.permanentAddress, state, configuration)});
    if (!interface.device.isReal) {
        interface.port = nullptr;
        return;
    }
    PropertyMap properties{{NodeLexicon::PROP_NODE_STRING, name}};
    const auto& address = interface.permanentAddress.empty() ? link.address : interface.permanentAddress;
    if (auto text = hardwareAddressText(address)) {
        properties.emplace(NodeLexicon::PROP_MAC_ADDRESS, std::move(*text));
    }
    interface.port = keep(interface.port, {interface.device.path + "/port" + suffix, interface.device.path,
                                           NodeLexicon::NODE_NETWORK_PORT, name, std::move(properties)});
}

/** Looks up the hardware, which is dear, only for an interface that is new or has become another. */
void HostTree::identify(const Link& link, Interface& interface) {
    const Link& known = interface.link;
    // A new name counts, because udev renames an interface when its own data about the device are complete.
    const bool same = known.index == link.index && known.name == link.name && known.kind == link.kind &&
                      known.parentName == link.parentName && known.parentBus == link.parentBus &&
                      known.permanentAddress == link.permanentAddress;
    if (same) {
        return;
    }
    _isReshaped = true;
    interface.device = deviceOf(link);
    interface.permanentAddress = link.permanentAddress;
    if (interface.device.isReal && link.permanentAddress.empty()) {
        interface.permanentAddress =
            ask([&] { return _hardware.permanentAddress(link.name); }).value_or(std::vector<std::uint8_t>());
    }
    interface.link = link;
}

std::optional<ParentDevice> HostTree::parentOf(const Link& link) const {
    if (!link.parentName.empty()) {
        return ask([&] { return _hardware.describe({link.parentBus, link.parentName}); });
    }
    // A link without kind and without parent is a rare thing on a kernel that names parents, and every piece of
    // hardware on one that does not (before 5.14).
    return link.kind.empty() ? ask([&] { return _hardware.find(link.name); }) : std::nullopt;
}

HostTree::Device HostTree::deviceOf(const Link& link) const {
    if (const auto parent = parentOf(link)) {
        const char* above = parent->managementController ? controllerPath : chassisPath;
        return {above + parent->syspath, describe(*parent), true, parent->managementController};
    }
    if (!link.parentName.empty()) {
        const std::string name = cleanText(link.parentBus + ' ' + link.parentName);
        return {std::string(chassisPath) + "/device/" + name, name, true, false};
    }
    const std::string kind = link.kind.empty() ? "virtual" : cleanText(link.kind);
    return {std::string(chassisPath) + "/virtual/" + kind, kind, false, false};
}

/** A host, chassis or device node: that of the last tree where it is the same. */
Tree::NodePointer HostTree::structureNode(const std::string& path, const std::string& parent,
                                          const std::string& description) const {
    const auto known = _structure.find(path);
    return keep(known == _structure.end() ? nullptr : known->second, {path, parent, std::nullopt, description, {}});
}

/** The device, what it is in, and the host. */
std::vector<Tree::NodePointer> HostTree::above(const Device& device, const std::string& hostName) const {
    const bool controller = device.managementController;
    const char* path = controller ? controllerPath : chassisPath;
    return {structureNode(device.path, path, device.description),
            structureNode(path, hostPath, controller ? controllerDescription : chassisDescription),
            structureNode(hostPath, "", hostName)};
}

/** Host, chassis and the devices that carry something; those of the last tree are shared or forgotten. */
std::vector<Tree::NodePointer> HostTree::structure(const std::string& hostName) {
    std::map<std::string, NodePointer> fresh;
    std::vector<NodePointer> nodes;
    const auto add = [&](const std::string& path, const std::string& parent, const std::string& description) {
        const auto [place, isNew] = fresh.try_emplace(path);
        if (isNew) {
            place->second = structureNode(path, parent, description);
            nodes.push_back(place->second);
        }
    };
    add(hostPath, "", hostName);
    add(chassisPath, hostPath, chassisDescription);
    const Device* last = nullptr;
    for (const auto& [index, interface] : _interfaces) {
        const Device& device = interface.device;
        // Virtual interfaces of one kind share a device, by the thousand.
        if (last != nullptr && last->path == device.path) {
            continue;
        }
        last = &device;
        if (device.managementController) {
            add(controllerPath, hostPath, controllerDescription);
        }
        add(device.path, device.managementController ? controllerPath : chassisPath, device.description);
    }
    _structure = std::move(fresh);
    return nodes;
}

std::shared_ptr<const Tree> HostTree::assemble(const std::string& hostName) {
    std::vector<NodePointer> nodes = structure(hostName);
    nodes.reserve(nodes.size() + 2 * _interfaces.size());
    for (const auto& [index, interface] : _interfaces) {
        nodes.push_back(interface.adapter);
        if (interface.port) {
            nodes.push_back(interface.port);
        }
    }
    return std::make_shared<const Tree>(std::move(nodes));
}

/** The last tree with the nodes that have been built since: most changes leave everything in its place. */
std::shared_ptr<const Tree> HostTree::exchange() const {
    std::vector<NodePointer> nodes;
    for (const int index : _rebuilt) {
        const Interface& interface = _interfaces.at(index);
        nodes.push_back(interface.adapter);
        if (interface.port) {
            nodes.push_back(interface.port);
        }
    }
    return std::make_shared<const Tree>(*_tree, nodes);
}

} // namespace Orv::Agent::Linux

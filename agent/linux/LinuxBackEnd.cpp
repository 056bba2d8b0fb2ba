#include "agent/linux/LinuxBackEnd.h"

#include "agent/linux/HostConfiguration.h"
#include "agent/linux/HostTree.h"
#include "agent/linux/KernelReader.h"

#include <mutex>
#include <set>
#include <stdexcept>
#include <utility>

namespace Orv::Agent::Linux {

namespace {

HardwareSource realHardware(const std::string& root) {
    return {[root](const DeviceName& device) { return describeDevice(device, root); },
            [root](const std::string& interface) { return findParentDevice(interface, root); }, readPermanentAddress};
}

class LinuxBackEnd : public BackEnd {
  public:
    explicit LinuxBackEnd(const HostPaths& paths) : _configuration(paths.root), _tree(realHardware(paths.root)) {}

    std::shared_ptr<const Tree> snapshot() override {
        const std::lock_guard lock(_mutex);
        const KernelState& state = _kernel.update();
        _pending.merge(_kernel.takeChanges());
        if (_configuration.refresh()) {
            for (const auto& known : state.links()) {
                _pending.insert(known.first);
            }
        }
        if (!_current || !_pending.empty()) {
            _current = _tree.update(state, _configuration, _pending);
            _pending.clear();
        }
        return _current;
    }

    void setProperty(const std::string& path, NodeLexicon::Properties property,
                     const PropertyValue& /*value*/) override {
        const Tree::NodePointer node = snapshot()->find(path);
        throw std::runtime_error((node ? node->description : path) + ": property " + std::to_string(property) +
                                 " cannot be set: this host's adapters are only read");
    }

  private:
    std::mutex _mutex; ///< guards everything below
    KernelReader _kernel;
    HostConfiguration _configuration;
    HostTree _tree;
    std::set<int> _pending; ///< interfaces whose nodes are out of date, kept when building them fails
    std::shared_ptr<const Tree> _current;
};

} // namespace

std::unique_ptr<BackEnd> makeLinuxBackEnd(HostPaths paths) {
    return std::make_unique<LinuxBackEnd>(paths);
}

} // namespace Orv::Agent::Linux

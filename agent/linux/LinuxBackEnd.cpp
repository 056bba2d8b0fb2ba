#include "agent/linux/LinuxBackEnd.h"

#include "agent/linux/HostConfiguration.h"
#include "agent/linux/HostTree.h"
#include "agent/linux/KernelReader.h"
#include "agent/linux/LinkEvents.h"

#include <mutex>
#include <optional>
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
        return current();
    }

    std::unique_ptr<EventWatch> watch(EventSink& sink) override;

    void setProperty(const std::string& path, NodeLexicon::Properties property,
                     const PropertyValue& /*value*/) override {
        const Tree::NodePointer node = snapshot()->find(path);
        throw std::runtime_error((node ? node->description : path) + ": property " + std::to_string(property) +
                                 " cannot be set: this host's adapters are only read");
    }

  private:
    class Watch;

    std::shared_ptr<const Tree> current() {
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

    std::mutex _mutex; ///< guards everything below
    KernelReader _kernel;
    HostConfiguration _configuration;
    HostTree _tree;
    std::set<int> _pending; ///< interfaces whose nodes are out of date, kept when building them fails
    std::shared_ptr<const Tree> _current;
};

/**
 * Reports the states that each of the kernel's messages leaves, whichever thread it is that reads them: who takes a
 * snapshot reports what was new to it.
 */
class LinuxBackEnd::Watch : public EventWatch {
  public:
    Watch(LinuxBackEnd& backEnd, EventSink& sink) : _backEnd(backEnd) {
        const std::lock_guard lock(_backEnd._mutex);
        _backEnd.current();
        _events.emplace(_backEnd._tree, sink, _backEnd._kernel.state());
        _backEnd._kernel.onStep([this](const KernelState& state) { take(state); });
    }

    ~Watch() override {
        const std::lock_guard lock(_backEnd._mutex);
        _backEnd._kernel.onStep({});
    }

    [[nodiscard]] int descriptor() const override { return _backEnd._kernel.descriptor(); }

    void collect() override {
        const std::lock_guard lock(_backEnd._mutex);
        _backEnd._kernel.follow();
    }

  private:
    void take(const KernelState& state) {
        const std::set<int> changed = _backEnd._kernel.takeChanges();
        _backEnd._pending.insert(changed.begin(), changed.end());
        _events->take(state, _backEnd._configuration, changed);
    }

    LinuxBackEnd& _backEnd;
    std::optional<LinkEvents> _events;
};

std::unique_ptr<EventWatch> LinuxBackEnd::watch(EventSink& sink) {
    return std::make_unique<Watch>(*this, sink);
}

} // namespace

std::unique_ptr<BackEnd> makeLinuxBackEnd(HostPaths paths) {
    return std::make_unique<LinuxBackEnd>(paths);
}

} // namespace Orv::Agent::Linux

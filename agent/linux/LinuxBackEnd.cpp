#include "agent/linux/LinuxBackEnd.h"

#include "agent/linux/HostConfiguration.h"
#include "agent/linux/HostTree.h"
#include "agent/linux/KernelReader.h"
#include "agent/linux/LinkEvents.h"
#include "agent/persistence/Manager.h"
#include "agent/persistence/NameService.h"
#include "agent/write/HostWriter.h"
#include "agent/write/KernelWriter.h"

#include <mutex>
#include <optional>
#include <set>
#include <utility>

namespace Orv::Agent::Linux {

namespace {

HardwareSource realHardware(const std::string& root) {
    return {[root](const DeviceName& device) { return describeDevice(device, root); },
            [root](const std::string& interface) { return findParentDevice(interface, root); }, readPermanentAddress};
}

class LinuxBackEnd : public BackEnd {
  public:
    LinuxBackEnd(const HostPaths& paths, Persistence::Environment host)
        : _configuration(paths.root),
          _tree(realHardware(paths.root)),
          _host(std::move(host)),
          _writer(writerParts()) {
        _host.root = paths.root;
    }

    std::shared_ptr<const Tree> snapshot() override {
        const std::lock_guard lock(_mutex);
        return current();
    }

    std::unique_ptr<EventWatch> watch(EventSink& sink) override;

    void setProperty(const std::string& path, NodeLexicon::Properties property, const PropertyValue& value) override {
        _writer.write(path, property, value);
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

    WriterParts writerParts() {
        return {[this](const std::string& path) {
                    const std::lock_guard lock(_mutex);
                    return _tree.adapterAt(path);
                },
                [this](const std::string& path) { return look(path); },
                [this](int index) {
                    const std::lock_guard lock(_mutex);
                    return _kernel.state().links().count(index) != 0;
                },
                [this](const InterfaceFacts& interface) { return Persistence::managerOf(interface, _host); },
                [this](const InterfaceFacts& interface) { return Persistence::nameServiceOf(interface, _host); },
                std::make_unique<KernelWriter>()};
    }

    std::optional<AdapterFacts> look(const std::string& path) {
        const std::lock_guard lock(_mutex);
        const Tree::NodePointer node = current()->find(path);
        const std::optional<int> index = _tree.adapterAt(path);
        if (!node || !index) {
            return std::nullopt;
        }
        const InterfaceFacts facts = _tree.facts(_kernel.state().links().at(*index));
        return AdapterFacts{facts, node->properties, _configuration.modeOf(facts)};
    }

    std::mutex _mutex; ///< guards what follows, up to the writing parts
    KernelReader _kernel;
    HostConfiguration _configuration;
    HostTree _tree;
    std::set<int> _pending; ///< interfaces whose nodes are out of date, kept when building them fails
    std::shared_ptr<const Tree> _current;
    Persistence::Environment _host; ///< not changed any more
    HostWriter _writer;
};

/**
 * Reports the states that each of the kernel's messages leaves, whichever thread it is that reads them: who takes a
 * snapshot reports what was new to it.
 */
class LinuxBackEnd::Watch : public EventWatch {
  public:
    Watch(LinuxBackEnd& backEnd, EventSink& sink) : _backEnd(backEnd), _sink(sink) {
        const std::lock_guard lock(_backEnd._mutex);
        _backEnd.current();
        _fullReads = _backEnd._kernel.fullReads();
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
        if (std::exchange(_fullReads, _backEnd._kernel.fullReads()) != _backEnd._kernel.fullReads()) {
            _sink.report("the kernel's notifications came too fast: events that left no difference may be missing");
        }
    }

  private:
    void take(const KernelState& state) {
        const std::set<int> changed = _backEnd._kernel.takeChanges();
        _backEnd._pending.insert(changed.begin(), changed.end());
        _events->take(state, _backEnd._configuration, changed);
    }

    LinuxBackEnd& _backEnd;
    EventSink& _sink;
    unsigned _fullReads = 0;
    std::optional<LinkEvents> _events;
};

std::unique_ptr<EventWatch> LinuxBackEnd::watch(EventSink& sink) {
    return std::make_unique<Watch>(*this, sink);
}

} // namespace

std::unique_ptr<BackEnd> makeLinuxBackEnd(HostPaths paths, Persistence::Environment host) {
    return std::make_unique<LinuxBackEnd>(paths, std::move(host));
}

} // namespace Orv::Agent::Linux

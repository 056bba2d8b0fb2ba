#include "agent/write/AdapterChange.h"

#include <iterator>
#include <stdexcept>

namespace Orv::Agent::Linux {

AdapterChange::AdapterChange(const WriterParts& parts, std::mutex& filesMutex, const AdapterFacts& adapter,
                             const AdapterSettings& inForce, const AdapterSettings& wanted)
    : _parts(parts),
      _filesMutex(filesMutex),
      _interface(adapter.interface),
      _isConfiguredFixed(adapter.configured == AddressMode::fixed),
      _inForce(inForce),
      _wanted(wanted),
      _manager(parts.manager(adapter.interface)),
      _nameService(wanted.names.none() ? nullptr : parts.nameService(adapter.interface)) {}

void AdapterChange::make() {
    try {
        makeSteps();
        _files.commit();
    } catch (const std::exception& failure) {
        if (const std::string failures = _undo.run(); !failures.empty()) {
            throw std::runtime_error(failure.what() + failures);
        }
        throw;
    }
}

void AdapterChange::makeSteps() {
    if (goesTo(AddressMode::fixed) && mayHaveClient()) {
        stopClient();
    }
    editFiles();
    if (concernsKernel()) {
        changeKernel();
    }
    _manager->activate(_interface, _wanted);
    if (_nameService) {
        tellNameService();
    }
    if (goesTo(AddressMode::leased)) {
        startClient();
    }
}

/** Whether to look for a DHCP client, which takes a look at every process of the host. */
bool AdapterChange::mayHaveClient() const {
    const Ipv4Settings& inForce = *_inForce.ipv4;
    const bool isFixed = _isConfiguredFixed && inForce.mode == AddressMode::fixed && inForce.address;
    // With only the mode in it, a change leaves everything else as it is.
    const bool isModeAlone = _wanted.ipv4 == inForce;
    return inForce.mode == AddressMode::leased || (isModeAlone && !isFixed);
}

bool AdapterChange::concernsKernel() const {
    // A lease stays where DHCP is switched on once more.
    const bool isLeasedAlready = goesTo(AddressMode::leased) && _inForce.ipv4->mode == AddressMode::leased;
    return _wanted.ipv4 && _wanted.ipv4 != _inForce.ipv4 && !isLeasedAlready;
}

Persistence::FileEdits AdapterChange::plan(const AdapterSettings& settings) const {
    Persistence::FileEdits edits = _manager->plan(_interface, settings);
    if (_nameService) {
        Persistence::FileEdits more = _nameService->plan(settings.names);
        edits.insert(edits.end(), std::make_move_iterator(more.begin()), std::make_move_iterator(more.end()));
    }
    return edits;
}

void AdapterChange::stopClient() {
    {
        // A refusal must come before anything is stopped.
        const std::lock_guard lock(_filesMutex);
        (void)plan(_wanted);
    }
    if (_manager->stopDhcp(_interface)) {
        _undo.add([this] { _manager->startDhcp(_interface); });
    }
}

void AdapterChange::editFiles() {
    // Runs behind the putting back of the files, which is what the manager is to take up then.
    _undo.add([this] { _manager->activate(_interface, _inForce); });
    const std::lock_guard lock(_filesMutex);
    _files.apply(plan(_wanted));
    _undo.add([this] { putFilesBack(); });
}

void AdapterChange::putFilesBack() {
    const std::lock_guard lock(_filesMutex);
    try {
        _files.revert();
    } catch (const std::runtime_error&) {
        // Another interface's part of the file has changed while this one waited for its lease.
        _files.commit();
        _files.apply(plan(_inForce));
        _files.commit();
    }
}

void AdapterChange::changeKernel() {
    const InterfaceTables before = _parts.live->read(_interface.index);
    _undo.add([this, before] { _parts.live->restore(before); });
    const bool endsLease = goesTo(AddressMode::fixed) && _inForce.ipv4->mode == AddressMode::leased;
    _expected =
        _parts.live->write(before, *_wanted.ipv4, endsLease ? LiveIpv4::Leases::leave : LiveIpv4::Leases::stay);
}

void AdapterChange::tellNameService() {
    _undo.add([this] { _nameService->apply(_interface, _inForce.names); });
    _nameService->apply(_interface, _wanted.names.over(_inForce.names));
}

void AdapterChange::startClient() {
    _undo.add([this] { (void)_manager->stopDhcp(_interface); });
    _manager->startDhcp(_interface);
    if (_expected) {
        // Clients clear an interface on their way, and add what they bring behind what is left.
        _parts.live->welcomeLease(*_expected);
    }
}

} // namespace Orv::Agent::Linux

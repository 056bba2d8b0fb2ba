#include "agent/write/HostWriter.h"

#include "agent/write/AdapterChange.h"

#include <exception>
#include <utility>

namespace Orv::Agent::Linux {

HostWriter::HostWriter(WriterParts parts) : _parts(std::move(parts)) {}

std::shared_ptr<HostWriter::Slot> HostWriter::slotOf(int index) {
    const std::lock_guard lock(_slotsMutex);
    std::shared_ptr<Slot>& slot = _slots[index];
    if (!slot) {
        slot = std::make_shared<Slot>();
        std::erase_if(_slots, [&](const auto& known) { return known.first != index && !_parts.exists(known.first); });
    }
    return slot;
}

void HostWriter::write(const std::string& path, NodeLexicon::Properties property, const PropertyValue& value) {
    const std::optional<int> index = _parts.find(path);
    const std::shared_ptr<Slot> slot = index ? slotOf(*index) : std::make_shared<Slot>();
    const std::lock_guard lock(slot->mutex);
    // Only now, because writes that this one waited for have changed it.
    const std::optional<AdapterFacts> found = _parts.look(path);
    if (!found) {
        throw ChangeError(path, property, value, "there is no such adapter");
    }
    const AdapterFacts& adapter = *found;
    const std::string& name = adapter.interface.name;
    const AdapterSettings inForce = settingsOf(adapter.properties);
    const Resolution resolution = resolve(name, property, value, inForce, slot->pending);
    if (resolution.wanted.ipv4 || !resolution.wanted.names.none()) {
        try {
            AdapterChange(_parts, _filesMutex, adapter, inForce, resolution.wanted).make();
        } catch (const std::exception& failure) {
            throw ChangeError(name, property, value, failure.what());
        }
    }
    slot->pending = resolution.pending;
}

} // namespace Orv::Agent::Linux

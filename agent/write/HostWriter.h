/**
 * @file
 * Writing a property of an adapter of this host: in the kernel, in the host's files and in its running services.
 */
#pragma once

#include "agent/change/Resolve.h"
#include "agent/persistence/Manager.h"
#include "agent/persistence/NameService.h"
#include "agent/write/LiveIpv4.h"

#include <functional>
#include <map>
#include <memory>
#include <mutex>
#include <optional>
#include <string>

namespace Orv::Agent::Linux {

/** An adapter as it is now. */
struct AdapterFacts {
    InterfaceFacts interface;
    PropertyMap properties;
    std::optional<AddressMode> configured; ///< what the host's files say about it
};

/** What writing stands on. Every function may be called from any thread. */
struct WriterParts {
    /** The index of the interface whose adapter had this path when the tree was last looked at. */
    std::function<std::optional<int>(const std::string& path)> find;

    /** The adapter at a path of the tree as it is at this moment; none when there is no adapter there. */
    std::function<std::optional<AdapterFacts>(const std::string& path)> look;

    /** Whether there is an interface of this index. */
    std::function<bool(int index)> exists;

    std::function<std::unique_ptr<Persistence::Manager>(const InterfaceFacts&)> manager;
    std::function<std::unique_ptr<Persistence::NameService>(const InterfaceFacts&)> nameService;
    std::unique_ptr<LiveIpv4> live;
};

/**
 * Makes each write one transaction: either the kernel, the files, the resolver and the DHCP client all have it when
 * it returns, or it throws and they are as they were. Any number of threads may write at a time. Writes to one
 * interface follow one another; those to several meet only while files are edited, since interfaces share files, and
 * never wait for one another's DHCP.
 */
class HostWriter {
  public:
    explicit HostWriter(WriterParts parts);

    /**
     * Writes one property of the adapter at `path`. Throws ChangeError with the interface, the property, the value
     * and the cause; when something could not be undone, with that, too.
     */
    void write(const std::string& path, NodeLexicon::Properties property, const PropertyValue& value);

  private:
    /** What is kept of an interface from one write to the next. */
    struct Slot {
        std::mutex mutex; ///< held for the length of a write
        PendingPair pending;
    };

    std::shared_ptr<Slot> slotOf(int index);

    WriterParts _parts;
    std::mutex _filesMutex; ///< held while files are planned and edited
    std::mutex _slotsMutex;
    std::map<int, std::shared_ptr<Slot>> _slots; ///< by interface index, of those that have been written to
};

} // namespace Orv::Agent::Linux

/**
 * @file
 * What `ip monitor` sees of a namespace, for comparison.
 */
#pragma once

#include "tests/support/Namespace.h"

#include <filesystem>
#include <map>
#include <ostream>
#include <string>
#include <vector>

namespace Orv::Test {

/** An interface whose status has become another. */
struct Transition {
    std::string name;
    unsigned status; ///< as PROP_STATUS

    bool operator==(const Transition&) const = default;

    friend std::ostream& operator<<(std::ostream& out, const Transition& transition) {
        return out << transition.name << ' ' << transition.status;
    }
};

/** `ip monitor link` in a namespace, from the end of the constructor on. */
class IpMonitor {
  public:
    explicit IpMonitor(const Namespace& space);
    ~IpMonitor();
    IpMonitor(const IpMonitor&) = delete;
    IpMonitor& operator=(const IpMonitor&) = delete;

    /**
     * The transitions since the beginning, by its lines alone. An interface that comes counts when it is up and
     * running, and one that goes while it is as stopped. What was done in the namespace before the call is in them.
     */
    std::vector<Transition> transitions();

  private:
    [[nodiscard]] std::string output() const;
    void awaitMarker();

    const Namespace& _space;
    std::filesystem::path _file;
    std::string _process;
    std::map<int, unsigned> _statuses; ///< of the interfaces that there were in the beginning
    std::size_t _begin = 0;
    int _markers = 0;
};

} // namespace Orv::Test

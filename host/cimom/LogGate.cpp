#include "host/cimom/LogGate.h"

#include <mutex>

namespace marlo {

void LogGate::write(const std::string& line) {
    const std::shared_lock lock(_mutex);
    if (_log) {
        _log(line);
    }
}

void LogGate::close() {
    const std::unique_lock lock(_mutex);
    _log = nullptr;
}

} // namespace marlo

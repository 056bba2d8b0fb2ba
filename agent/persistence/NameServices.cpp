#include "agent/persistence/NameService.h"
#include "agent/persistence/ResolvConf.h"
#include "agent/persistence/ResolvconfCommand.h"
#include "agent/persistence/Resolved.h"

#include <filesystem>

namespace Orv::Agent::Persistence {

std::unique_ptr<NameService> nameServiceOf(const InterfaceFacts& /*interface*/, const Environment& environment) {
    if (Resolved::serves(environment)) {
        return std::make_unique<Resolved>(environment);
    }
    if (std::filesystem::exists(environment.commands.resolvconf.front())) {
        return std::make_unique<ResolvconfCommand>(environment);
    }
    return std::make_unique<ResolvConf>(environment);
}

} // namespace Orv::Agent::Persistence

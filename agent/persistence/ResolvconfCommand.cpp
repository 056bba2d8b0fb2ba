#include "agent/persistence/ResolvconfCommand.h"

#include "agent/persistence/Command.h"
#include "agent/persistence/ResolvConf.h"

namespace Orv::Agent::Persistence {

FileEdits ResolvconfCommand::plan(const NameSettings& /*wanted*/) const {
    return {};
}

void ResolvconfCommand::apply(const InterfaceFacts& interface, const NameSettings& whole) {
    const std::string record = interface.name + ".inet";
    const std::string text = editResolvConf("", whole);
    std::vector<std::string> command = _environment.commands.resolvconf;
    command.insert(command.end(), {text.empty() ? "-d" : "-a", record});
    runOrThrow(command, _environment.commands.patience, text);
}

} // namespace Orv::Agent::Persistence

#include "agent/persistence/Unmanaged.h"

#include "agent/persistence/DhcpClient.h"

namespace Orv::Agent::Persistence {

FileEdits Unmanaged::plan(const InterfaceFacts& interface, const AdapterSettings& wanted) const {
    if (wanted.ipv4 && _environment.report) {
        _environment.report(interface.name +
                            ": no manager of this host configures it; the change will not survive a boot");
    }
    return {};
}

bool Unmanaged::stopDhcp(const InterfaceFacts& interface) {
    return DhcpClient(_environment).stop(interface.name);
}

void Unmanaged::activate(const InterfaceFacts& /*interface*/, const AdapterSettings& /*wanted*/) {}

void Unmanaged::startDhcp(const InterfaceFacts& interface) {
    DhcpClient client(_environment);
    if (!client.isRunning(interface.name)) {
        client.start(interface.name);
    }
}

} // namespace Orv::Agent::Persistence

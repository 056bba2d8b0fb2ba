#include "agent/linux/TeamSocket.h"

#include "agent/hardware/GenericFamily.h"
#include "agent/linux/TeamMessages.h"

#include <cerrno>
#include <system_error>

#include <libmnl/libmnl.h>
#include <linux/if_team.h>
#include <linux/netlink.h>

namespace Orv::Agent::Linux {

namespace {

Hardware::Bytes payloadOf(const nlmsghdr& message) {
    return {static_cast<const std::byte*>(mnl_nlmsg_get_payload(&message)), mnl_nlmsg_get_payload_len(&message)};
}

} // namespace

TeamSocket::Sockets::Sockets(int receiveBytes)
    : requests(NETLINK_GENERIC), notifications(receiveBytes, NETLINK_GENERIC) {}

TeamSocket::TeamSocket(int receiveBytes) {
    try {
        _sockets.emplace(receiveBytes);
    } catch (const std::system_error& error) {
        // The words of a kernel without it, and of a rule that keeps this process from it.
        const int code = error.code().value();
        if (code != EPROTONOSUPPORT && code != EACCES && code != EPERM) {
            throw;
        }
    }
}

/** Each time anew, for a driver that was removed and loaded again has other numbers. False when it announces nothing.
 */
bool TeamSocket::subscribe() {
    Hardware::GenericFamily family;
    auto request = Hardware::familyRequest(TEAM_GENL_NAME);
    _sockets->requests.ask(
        request, [&](Hardware::Bytes payload) { family = Hardware::parseFamily(payload).value_or(family); });
    const auto group = family.groups.find(TEAM_GENL_CHANGE_EVENT_MC_GRP_NAME);
    if (group == family.groups.end()) {
        return false;
    }
    _sockets->notifications.subscribe(group->second);
    _family = family.type;
    return true;
}

void TeamSocket::read(int team, const Handler& handler) {
    if (!_sockets) {
        return;
    }
    try {
        if (!subscribe()) {
            return;
        }
        auto request = teamOptionsRequest(_family, team);
        _sockets->requests.ask(request, [&](Hardware::Bytes payload) { handler(parseTeamMessage(payload)); });
    } catch (const std::system_error& error) {
        switch (error.code().value()) {
        case EINVAL: // the driver's word for an interface that is no team, or no more
        case ENODEV:
        case ENOENT: // the driver has been removed, and its teams with it
            break;
        case EPERM:
            // Changes alone, without what they change, would tell less than nothing.
            _sockets.reset();
            break;
        default:
            throw;
        }
    }
}

NotificationSocket::Drain TeamSocket::drain(const Handler& handler) {
    if (_family == 0 || !_sockets) {
        return NotificationSocket::Drain::complete;
    }
    return _sockets->notifications.drain([&](const nlmsghdr& message) {
        if (message.nlmsg_type == _family) {
            handler(parseTeamMessage(payloadOf(message)));
        }
    });
}

} // namespace Orv::Agent::Linux

#include "host/security/Privileges.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <iterator>
#include <stdexcept>
#include <system_error>
#include <vector>

#include <cap-ng.h>
#include <sys/prctl.h>
#include <unistd.h>

namespace marlo::security {

namespace {

constexpr std::array<unsigned, 10> needed{CAP_NET_ADMIN,  CAP_NET_RAW,    CAP_NET_BIND_SERVICE, CAP_CHOWN,
                                          CAP_FOWNER,     CAP_KILL,       CAP_SETUID,           CAP_SETGID,
                                          CAP_SYS_CHROOT, CAP_AUDIT_WRITE};

/** Those of the needed ones that the process has. */
std::vector<unsigned> available() {
    std::vector<unsigned> found;
    std::copy_if(needed.begin(), needed.end(), std::back_inserter(found),
                 [](unsigned capability) { return capng_have_capability(CAPNG_PERMITTED, capability) != 0; });
    return found;
}

void keepOnly(const std::vector<unsigned>& capabilities) {
    capng_clear(CAPNG_SELECT_ALL);
    for (const unsigned capability : capabilities) {
        constexpr unsigned sets = CAPNG_EFFECTIVE | CAPNG_PERMITTED | CAPNG_BOUNDING_SET;
        if (capng_update(CAPNG_ADD, static_cast<capng_type_t>(sets), capability) != 0) {
            throw std::runtime_error("capabilities cannot be chosen");
        }
    }
    if (const int result = capng_apply(CAPNG_SELECT_ALL); result != 0) {
        throw std::runtime_error("capabilities cannot be given up (libcap-ng: " + std::to_string(result) + ")");
    }
}

std::string namesOf(const std::vector<unsigned>& capabilities) {
    std::string names;
    for (const unsigned capability : capabilities) {
        names += (names.empty() ? "" : ", ") + std::string(capng_capability_to_name(capability));
    }
    return names.empty() ? "none" : names;
}

void forbidNewPrivileges() {
    if (::prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) != 0) {
        throw std::system_error(errno, std::generic_category(), "PR_SET_NO_NEW_PRIVS");
    }
}

} // namespace

std::string dropPrivileges() {
    if (::geteuid() != 0) {
        return "not started by root: there are no capabilities to give up";
    }
    if (capng_get_caps_process() != 0) {
        throw std::runtime_error("the capabilities of this process cannot be read");
    }
    const std::vector<unsigned> kept = available();
    keepOnly(kept);
    forbidNewPrivileges();
    return "kept capabilities: " + namesOf(kept);
}

} // namespace marlo::security

#include "host/cimom/Principal.h"

#include "host/cimom/ObjectManager.h"

#include <memory>
#include <utility>
#include <vector>

#include <pwd.h>
#include <unistd.h>

namespace marlo {

namespace {

thread_local std::string acting;

std::string userOfProcess() {
    std::vector<char> buffer(std::size_t{16} * 1024);
    passwd entry{};
    passwd* found = nullptr;
    const uid_t user = geteuid();
    if (getpwuid_r(user, &entry, buffer.data(), buffer.size(), &found) == 0 && found != nullptr) {
        return found->pw_name;
    }
    return std::to_string(user);
}

} // namespace

ActingFor::ActingFor(std::string principal) : _former(std::exchange(acting, std::move(principal))) {}

ActingFor::~ActingFor() {
    acting = std::move(_former);
}

std::string actingPrincipal() {
    // Never destroyed: providers' threads may outlive all static objects.
    static const std::string& user = *std::make_unique<std::string>(userOfProcess()).release();
    return acting.empty() ? user : acting;
}

} // namespace marlo

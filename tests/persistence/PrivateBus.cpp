#include "tests/persistence/PrivateBus.h"

#include "agent/config/Descriptor.h"

#include <array>
#include <chrono>
#include <csignal>
#include <filesystem>
#include <stdexcept>

#include <arpa/inet.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <sys/wait.h>
#include <systemd/sd-bus.h>
#include <unistd.h>

namespace Orv::Test {

namespace {

constexpr const char* daemonPath = "/usr/bin/dbus-daemon";

void require(int result, const char* what) {
    if (result < 0) {
        throw std::runtime_error(std::string(what) + ": error " + std::to_string(-result));
    }
}

/** The socket is there a moment before the daemon listens to it. */
bool listens(const std::string& path) {
    const Agent::Descriptor socket(::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0));
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    path.copy(address.sun_path, sizeof address.sun_path - 1);
    return ::connect(socket.number(), reinterpret_cast<const sockaddr*>(&address), sizeof address) == 0;
}

int answer(sd_bus_message* message, void* services, const std::string& call) {
    const std::string error = static_cast<MockServices*>(services)->record(call);
    if (error.empty()) {
        return sd_bus_reply_method_return(message, "");
    }
    return sd_bus_reply_method_errorf(message, "org.freedesktop.resolve1.LinkBusy", "%s", error.c_str());
}

int onReload(sd_bus_message* message, void* services, sd_bus_error* /*error*/) {
    return answer(message, services, "Reload");
}

int onServers(sd_bus_message* message, void* services, sd_bus_error* /*error*/) {
    int index = 0;
    require(sd_bus_message_read(message, "i", &index), "index");
    std::string call = "SetLinkDNS " + std::to_string(index);
    require(sd_bus_message_enter_container(message, 'a', "(iay)"), "servers");
    while (sd_bus_message_enter_container(message, 'r', "iay") > 0) {
        int family = 0;
        const void* bytes = nullptr;
        std::size_t size = 0;
        require(sd_bus_message_read(message, "i", &family), "family");
        require(sd_bus_message_read_array(message, 'y', &bytes, &size), "bytes");
        std::array<char, INET6_ADDRSTRLEN> text{};
        const bool fits = size == (family == AF_INET ? 4U : 16U);
        call += fits ? std::string(" ") + inet_ntop(family, bytes, text.data(), text.size()) : " wrong";
        require(sd_bus_message_exit_container(message), "server");
    }
    return answer(message, services, call);
}

int onDomains(sd_bus_message* message, void* services, sd_bus_error* /*error*/) {
    int index = 0;
    require(sd_bus_message_read(message, "i", &index), "index");
    std::string call = "SetLinkDomains " + std::to_string(index);
    require(sd_bus_message_enter_container(message, 'a', "(sb)"), "domains");
    const char* domain = nullptr;
    int onlyRoutes = 0;
    while (sd_bus_message_read(message, "(sb)", &domain, &onlyRoutes) > 0) {
        call += std::string(" ") + (onlyRoutes != 0 ? "~" : "") + domain;
    }
    return answer(message, services, call);
}

const sd_bus_vtable networkMethods[] = {
    SD_BUS_VTABLE_START(0), SD_BUS_METHOD("Reload", "", "", onReload, SD_BUS_VTABLE_UNPRIVILEGED), SD_BUS_VTABLE_END};

const sd_bus_vtable resolveMethods[] = {
    SD_BUS_VTABLE_START(0), SD_BUS_METHOD("SetLinkDNS", "ia(iay)", "", onServers, SD_BUS_VTABLE_UNPRIVILEGED),
    SD_BUS_METHOD("SetLinkDomains", "ia(sb)", "", onDomains, SD_BUS_VTABLE_UNPRIVILEGED), SD_BUS_VTABLE_END};

} // namespace

std::string whyNoBus() {
    return std::filesystem::exists(daemonPath) ? "" : "dbus-daemon is not installed";
}

PrivateBus::PrivateBus() {
    // Services may run as users of their own.
    std::filesystem::permissions(_files.root(), std::filesystem::perms(0755));
    _files.write("/bus.conf", "<busconfig><listen>" + address() +
                                  "</listen><auth>EXTERNAL</auth><policy context=\"default\">"
                                  "<allow send_destination=\"*\"/><allow receive_sender=\"*\"/><allow own=\"*\"/>"
                                  "<allow user=\"*\"/></policy></busconfig>");
    const std::string configuration = "--config-file=" + _files.at("/bus.conf").string();
    _daemon = ::fork();
    if (_daemon == 0) {
        ::execl(daemonPath, daemonPath, configuration.c_str(), "--nofork", "--nopidfile", nullptr);
        ::_exit(127);
    }
    for (int i = 0; i < 500 && !listens(_files.at("/bus").string()); ++i) {
        std::this_thread::sleep_for(std::chrono::milliseconds(10));
    }
}

PrivateBus::~PrivateBus() {
    ::kill(_daemon, SIGKILL);
    ::waitpid(_daemon, nullptr, 0);
}

std::string PrivateBus::address() const {
    return "unix:path=" + _files.at("/bus").string();
}

MockServices::MockServices(const PrivateBus& bus) {
    require(sd_bus_new(&_bus), "bus");
    require(sd_bus_set_address(_bus, bus.address().c_str()), "address");
    require(sd_bus_set_bus_client(_bus, 1), "client");
    require(sd_bus_start(_bus), "start");
    require(sd_bus_add_object_vtable(_bus, nullptr, "/org/freedesktop/network1", "org.freedesktop.network1.Manager",
                                     networkMethods, this),
            "network1");
    require(sd_bus_add_object_vtable(_bus, nullptr, "/org/freedesktop/resolve1", "org.freedesktop.resolve1.Manager",
                                     resolveMethods, this),
            "resolve1");
    require(sd_bus_request_name(_bus, "org.freedesktop.network1", 0), "name");
    require(sd_bus_request_name(_bus, "org.freedesktop.resolve1", 0), "name");
    _thread = std::thread([this] {
        while (!_ends) {
            if (sd_bus_process(_bus, nullptr) == 0) {
                sd_bus_wait(_bus, 20'000);
            }
        }
    });
}

MockServices::~MockServices() {
    _ends = true;
    _thread.join();
    sd_bus_flush_close_unref(_bus);
}

std::vector<std::string> MockServices::calls() {
    const std::lock_guard lock(_mutex);
    return _calls;
}

void MockServices::failWith(const std::string& text) {
    const std::lock_guard lock(_mutex);
    _error = text;
}

std::string MockServices::record(const std::string& call) {
    const std::lock_guard lock(_mutex);
    _calls.push_back(call);
    return _error;
}

} // namespace Orv::Test

#include "agent/linux/LinuxBackEnd.h"
#include "tests/agent/backend_contract.h"
#include "tests/support/Namespace.h"

#include <array>
#include <chrono>
#include <fstream>
#include <system_error>

#include <linux/rtnetlink.h>
#include <poll.h>
#include <sys/socket.h>
#include <unistd.h>

namespace Orv::Test {
namespace {

/**
 * What the kernel of a namespace says of new IPv6 addresses. It does so from a work queue, some time after the
 * command that adds the address has returned, even for addresses that need no duplicate detection.
 */
class Ipv6Announcements {
  public:
    explicit Ipv6Announcements(const Namespace& space) {
        space.run([this] {
            _socket = ::socket(AF_NETLINK, SOCK_RAW | SOCK_NONBLOCK | SOCK_CLOEXEC, NETLINK_ROUTE);
            sockaddr_nl address{};
            address.nl_family = AF_NETLINK;
            address.nl_groups = RTMGRP_IPV6_IFADDR;
            if (::bind(_socket, reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0) {
                throw std::system_error(errno, std::generic_category(), "bind");
            }
        });
    }

    ~Ipv6Announcements() { ::close(_socket); }

    Ipv6Announcements(const Ipv6Announcements&) = delete;
    Ipv6Announcements& operator=(const Ipv6Announcements&) = delete;

    void forget() const {
        while (receivedType() != 0) {
        }
    }

    void awaitNewAddress() const {
        const auto patience = std::chrono::steady_clock::now() + std::chrono::minutes(1);
        while (std::chrono::steady_clock::now() < patience) {
            pollfd ready{_socket, POLLIN, 0};
            ::poll(&ready, 1, 100);
            if (receivedType() == RTM_NEWADDR) {
                return;
            }
        }
        throw std::runtime_error("the kernel does not announce the address");
    }

  private:
    /** Message type of the next announcement, 0 when none waits. */
    [[nodiscard]] int receivedType() const {
        alignas(nlmsghdr) std::array<char, 4096> buffer{};
        const ssize_t length = ::recv(_socket, buffer.data(), buffer.size(), 0);
        return length < static_cast<ssize_t>(sizeof(nlmsghdr))
                   ? 0
                   : reinterpret_cast<nlmsghdr*>(buffer.data())->nlmsg_type;
    }

    int _socket = -1;
};

/** A host that is a network namespace; its interfaces are cabled to another one. */
class LinuxHost {
  public:
    static void require(std::string& whyNot) { whyNot = whyNoNamespaces(); }

    LinuxHost() {
        std::filesystem::create_directories(etc());
        _namespace.run([this] { _backEnd = Agent::Linux::makeLinuxBackEnd({_files.directory().string()}); });
    }

    Agent::BackEnd& backEnd() { return *_backEnd; }

    void add(const AdapterSetup& adapter) {
        _namespace.ip("link add " + adapter.name + " address " + adapter.mac + " type veth peer name " +
                      adapter.name + " netns " + _farEnd.descriptorPath());
        _namespace.ip("link set " + adapter.name + " addrgenmode none");
        change(adapter);
    }

    void remove(const std::string& name) { _namespace.ip("link delete " + name); }

    void change(const AdapterSetup& adapter) {
        using State = AdapterSetup::State;
        _namespace.ip("addr flush dev " + adapter.name);
        _farEnd.ip("link set " + adapter.name + (adapter.state == State::unplugged ? " down" : " up"));
        _namespace.ip("link set " + adapter.name + (adapter.state == State::stopped ? " down" : " up"));
        const std::string device = " dev " + adapter.name;
        if (adapter.ipv4) {
            const std::string lifetime = adapter.leased ? " valid_lft 3600 preferred_lft 3600" : "";
            _namespace.ip("addr add " + *adapter.ipv4 + "/24" + device + lifetime);
        }
        if (adapter.ipv6) {
            _announcements.forget();
            _namespace.ip("addr add " + *adapter.ipv6 + "/64" + device + " nodad");
            _announcements.awaitNewAddress();
        }
        if (adapter.gateway) {
            _namespace.ip("route add default via " + *adapter.gateway + device);
        }
        awaitState(adapter);
    }

    void resolve(const ResolverSetup& resolver) {
        std::ofstream file(etc() / "next");
        for (const std::string& server : resolver.servers) {
            file << "nameserver " << server << '\n';
        }
        if (!resolver.suffixes.empty()) {
            file << "search";
            for (const std::string& suffix : resolver.suffixes) {
                file << ' ' << suffix;
            }
            file << '\n';
        }
        file.close();
        std::filesystem::rename(etc() / "next", etc() / "resolv.conf");
    }

  private:
    /** The kernel tells both ends of a cable of each other's state by and by, after the command has returned. */
    void awaitState(const AdapterSetup& adapter) const {
        const bool runs = adapter.state == AdapterSetup::State::running;
        _namespace.shell("for i in $(seq 6000); do test \"$(cat /sys/class/net/" + adapter.name + "/operstate)\" " +
                         (runs ? "=" : "!=") + " up && exit 0; sleep 0.01; done; echo its state stays; exit 1");
        // The state can be read before it is announced; both happen under the lock that this waits for.
        _namespace.ip("link set " + adapter.name + " txqueuelen 1000");
    }

    [[nodiscard]] std::filesystem::path etc() const { return _files.directory() / "etc"; }

    TemporaryFile _files; ///< its directory stands in for the root of the file system
    Namespace _farEnd;
    Namespace _namespace;
    Ipv6Announcements _announcements{_namespace}; ///< older than the back end: the kernel tells the younger first
    std::unique_ptr<Agent::BackEnd> _backEnd;
};

INSTANTIATE_TYPED_TEST_SUITE_P(Linux, BackEndContract, LinuxHost);

} // namespace
} // namespace Orv::Test

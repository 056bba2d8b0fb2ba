/**
 * @file
 * A host of its own whose adapters can be written to: a kernel, files and programs that touch nothing outside.
 */
#pragma once

#include "agent/linux/LinuxBackEnd.h"
#include "tests/linux/KernelTables.h"
#include "tests/linux/TreeReading.h"
#include "tests/support/Namespace.h"

#include <fstream>
#include <iterator>
#include <memory>
#include <string>
#include <vector>

#include <gtest/gtest.h>

namespace Orv::Test {

/**
 * A namespace with "left", which is up, and its other end "right" in a second namespace. What the host keeps in /etc,
 * /run and the leases of the DHCP client are copies or empty; `ifupdown` configures its interfaces.
 */
class WriteFixture : public testing::Test {
  protected:
    using Text = std::string;
    using List = std::vector<std::string>;

    void SetUp() override {
        REQUIRE_NAMESPACES();
        space = std::make_unique<Namespace>();
        network = std::make_unique<Namespace>();
        space->shell("mount -t tmpfs tmpfs /mnt && cp -a /etc/. /mnt/ && mount --move /mnt /etc && "
                     "mount -t tmpfs tmpfs /run && mkdir -p /run/network /run/lock && "
                     "mount -t tmpfs tmpfs /var/lib/dhcp && "
                     "rm -rf /etc/network/if-*.d/* /etc/network/interfaces.d/* /etc/systemd/network "
                     "/etc/dhcp/dhclient-*-hooks.d/* /etc/resolv.conf && "
                     "echo 'timeout 3; retry 60; request subnet-mask, broadcast-address, routers, domain-name, "
                     "domain-name-servers;' > /etc/dhcp/dhclient.conf");
        write("/etc/resolv.conf", "# by hand\nnameserver 192.0.2.53\n");
        space->ip("link add left type veth peer name right netns " + network->descriptorPath());
        space->ip("link set lo up");
        space->ip("link set left up");
        network->ip("link set right up");
        configure("auto left\niface left inet static\n    address 192.0.2.10/24\n    gateway 192.0.2.1\n");
    }

    void TearDown() override {
        if (space) {
            forClients("kill -9 ${at#/proc/}");
        }
        if (serves) {
            stopServer();
        }
    }

    /** Writes a file of the host. */
    void write(const std::string& path, const std::string& text) const {
        space->run([&] { std::ofstream(path) << text; });
    }

    [[nodiscard]] std::string read(const std::string& path) const {
        std::string text;
        space->run([&] {
            std::ifstream stream(path);
            text.assign(std::istreambuf_iterator<char>(stream), {});
        });
        return text;
    }

    /** Boots the host with these lines in its interfaces file, and starts the back end. */
    void configure(const std::string& lines) {
        write("/etc/network/interfaces", "# the network\nauto lo\niface lo inet loopback\n\n" + lines);
        boot();
        space->run([&] { backEnd = Agent::Linux::makeLinuxBackEnd(); });
    }

    /** What a boot makes of the files: nothing is left of what was there. */
    void boot() const {
        forClients("kill -9 ${at#/proc/}");
        space->shell("ip link set left down; ip -4 addr flush dev left; rm -f /run/network/ifstate* /run/dhclient*; "
                     "ifup -a 2>&1");
    }

    [[nodiscard]] std::string interfaces() const { return read("/etc/network/interfaces"); }

    [[nodiscard]] std::shared_ptr<const Agent::Tree> tree() const {
        std::shared_ptr<const Agent::Tree> present;
        space->run([&] { present = backEnd->snapshot(); });
        return present;
    }

    [[nodiscard]] std::string pathOf(const std::string& name) const {
        const auto node = adapterOf(*tree(), name);
        return node ? node->path : name;
    }

    /** Writes a property in the way of an agent that runs on that host. */
    void set(NodeLexicon::Properties property, const Agent::PropertyValue& value,
             const std::string& name = "left") const {
        const std::string path = pathOf(name);
        space->run([&] { backEnd->setProperty(path, property, value); });
    }

    /** The text of the exception; empty when there was none. */
    [[nodiscard]] std::string failureOf(NodeLexicon::Properties property, const Agent::PropertyValue& value,
                                        const std::string& name = "left") const {
        try {
            set(property, value, name);
        } catch (const std::exception& failure) {
            return failure.what();
        }
        return {};
    }

    [[nodiscard]] Lines addresses() const { return addressLines(*space, "left"); }

    [[nodiscard]] Lines routes() const { return routeLines(*space, "left"); }

    /** A DHCP server that gives out 198.51.100.50 to .60, itself as the gateway, a server and a domain. */
    void startServer() {
        serves = true;
        network->shell("mount -t tmpfs tmpfs /run; mount -t tmpfs tmpfs /mnt; "
                       "ip addr add 198.51.100.1/24 dev right; "
                       "dnsmasq --conf-file=/dev/null --port=0 --interface=right --bind-interfaces --no-ping "
                       "--dhcp-authoritative --user=root --pid-file=/run/dnsmasq.pid --dhcp-leasefile=/mnt/leases "
                       "--dhcp-range=198.51.100.50,198.51.100.60,255.255.255.0,1h --dhcp-option=3,198.51.100.1 "
                       "--dhcp-option=6,198.51.100.53 --dhcp-option=15,lease.example > /dev/null 2>&1");
    }

    void stopServer() {
        serves = false;
        network->shell("kill $(cat /run/dnsmasq.pid)");
    }

    /** The processes in the namespace that are DHCP clients, one per line. */
    [[nodiscard]] std::string clients() const { return forClients("tr '\\0' ' ' < $at/cmdline; echo"); }

    /** Runs a command for each DHCP client in the namespace, with its directory of /proc in `at`. */
    std::string forClients(const std::string& command) const {
        return space->shell("for comm in $(grep -lx dhclient /proc/[0-9]*/comm 2> /dev/null); do at=${comm%/comm}; "
                            "[ \"$(readlink $at/ns/net)\" != \"$(readlink /proc/self/ns/net)\" ] || { " +
                            command + "; }; done");
    }

    std::unique_ptr<Namespace> space;
    std::unique_ptr<Namespace> network;
    std::unique_ptr<Agent::BackEnd> backEnd;
    bool serves = false;
};

} // namespace Orv::Test

#include "agent/persistence/DhcpClient.h"
#include "host/security/Gatekeeper.h"
#include "host/security/Privileges.h"
#include "tests/security/Child.h"
#include "tests/security/Shell.h"
#include "tests/security/TemporaryDirectory.h"
#include "tests/support/Namespace.h"

#include <algorithm>
#include <array>
#include <cctype>
#include <cerrno>
#include <chrono>
#include <csignal>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <iterator>
#include <sstream>
#include <stdexcept>
#include <string>
#include <string_view>
#include <thread>

#include <cap-ng.h>
#include <crypt.h>
#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <linux/capability.h>
#include <net/if.h>
#include <netinet/in.h>
#include <sched.h>
#include <sys/ioctl.h>
#include <sys/mount.h>
#include <sys/prctl.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/sysmacros.h>
#include <sys/wait.h>
#include <unistd.h>

namespace {

using marlo::security::dropPrivileges;
using marlo::test::inChild;
using marlo::test::shell;
using marlo::test::TemporaryDirectory;
using testing::HasSubstr;

using Mask = unsigned long long;

constexpr Mask bit(unsigned capability) {
    return Mask{1} << capability;
}

constexpr Mask kept = bit(CAP_NET_ADMIN) | bit(CAP_NET_RAW) | bit(CAP_NET_BIND_SERVICE) | bit(CAP_CHOWN) |
                      bit(CAP_FOWNER) | bit(CAP_KILL) | bit(CAP_SETUID) | bit(CAP_SETGID) | bit(CAP_SYS_CHROOT) |
                      bit(CAP_AUDIT_WRITE);

std::string hex(Mask mask) {
    std::array<char, 20> text{};
    std::snprintf(text.data(), text.size(), "%016llx", mask);
    return text.data();
}

/** A line of a status file of /proc (proc(5)), without its name. */
std::string statusLine(std::istream&& status, const std::string& name) {
    for (std::string line; std::getline(status, line);) {
        if (line.starts_with(name + ":\t")) {
            return line.substr(name.size() + 2);
        }
    }
    return "none";
}

std::string ownStatus(const std::string& name) {
    return statusLine(std::ifstream("/proc/thread-self/status"), name);
}

std::string outcome(int result) {
    return result >= 0 ? "done" : std::strerror(errno);
}

class Privileges : public testing::Test {
  protected:
    void SetUp() override { REQUIRE_NAMESPACES(); }
};

/** What tells all of a process's power, once it has given up what it can. */
std::string powers() {
    std::string text = ownStatus("CapEff");
    for (const char* line : {"CapPrm", "CapBnd", "CapInh", "CapAmb", "NoNewPrivs"}) {
        text += " " + ownStatus(line);
    }
    return text;
}

TEST_F(Privileges, AreThoseThatAreNeededAndNoOthers) {
    EXPECT_EQ(inChild([] {
                  dropPrivileges();
                  return powers();
              }),
              hex(kept) + " " + hex(kept) + " " + hex(kept) + " " + hex(0) + " " + hex(0) + " 1");
}

TEST_F(Privileges, AreSaid) {
    EXPECT_EQ(inChild(dropPrivileges),
              "kept capabilities: net_admin, net_raw, net_bind_service, chown, fowner, kill, setuid, setgid, "
              "sys_chroot, audit_write");
}

TEST_F(Privileges, AreThoseThatTheServiceUnitGrants) {
    std::string granted;
    std::ifstream unit(MARLO_UNIT);
    for (std::string line; std::getline(unit, line);) {
        if (constexpr std::string_view key = "CapabilityBoundingSet="; line.starts_with(key)) {
            std::istringstream names(line.substr(key.size()));
            for (std::string name; names >> name;) {
                std::transform(name.begin(), name.end(), name.begin(),
                               [](unsigned char letter) { return static_cast<char>(std::tolower(letter)); });
                granted += (granted.empty() ? "" : ", ") + name.substr(std::string_view("cap_").size());
            }
        }
    }
    EXPECT_EQ(inChild(dropPrivileges), "kept capabilities: " + granted);
}

TEST_F(Privileges, OfProgramsAreTheSame) {
    const std::string status = inChild([] {
        dropPrivileges();
        return shell("cat /proc/self/status");
    });
    EXPECT_EQ(statusLine(std::istringstream(status), "CapEff"), hex(kept));
    EXPECT_EQ(statusLine(std::istringstream(status), "CapBnd"), hex(kept));
    EXPECT_EQ(statusLine(std::istringstream(status), "NoNewPrivs"), "1");
}

TEST_F(Privileges, OfProgramsAreTheSameWhereTheBoundIsNotOursToSet) {
    const std::string status = inChild([] {
        capng_get_caps_process();
        capng_update(CAPNG_DROP, static_cast<capng_type_t>(CAPNG_EFFECTIVE | CAPNG_PERMITTED), CAP_SETPCAP);
        capng_apply(CAPNG_SELECT_CAPS);
        dropPrivileges();
        return ownStatus("CapBnd") == hex(kept) ? "nothing to test" : shell("cat /proc/self/status");
    });
    EXPECT_EQ(statusLine(std::istringstream(status), "CapEff"), hex(kept));
    EXPECT_EQ(statusLine(std::istringstream(status), "CapPrm"), hex(kept));
}

TEST_F(Privileges, AreThoseOfThreadsThatStartLater) {
    EXPECT_EQ(inChild([] {
                  dropPrivileges();
                  std::string status;
                  std::thread([&] { status = ownStatus("CapEff") + " " + ownStatus("NoNewPrivs"); }).join();
                  return status;
              }),
              hex(kept) + " 1");
}

TEST_F(Privileges, ToRuleTheMachineAreGone) {
    EXPECT_EQ(inChild([] {
                  dropPrivileges();
                  std::string outcomes = outcome(unshare(CLONE_NEWUTS));
                  outcomes += ", " + outcome(mount("tmpfs", "/tmp", "tmpfs", 0, nullptr));
                  outcomes += ", " + outcome(prctl(PR_CAPBSET_DROP, CAP_NET_RAW));
                  outcomes += ", " + outcome(mknod("/tmp/marlo-null", S_IFCHR | 0600, makedev(1, 3)));
                  return outcomes;
              }),
              "Operation not permitted, Operation not permitted, Operation not permitted, Operation not permitted");
}

TEST_F(Privileges, CanBeGivenUpTwice) {
    EXPECT_EQ(inChild([] {
                  dropPrivileges();
                  dropPrivileges();
                  return powers();
              }),
              hex(kept) + " " + hex(kept) + " " + hex(kept) + " " + hex(0) + " " + hex(0) + " 1");
}

TEST_F(Privileges, OfWhoHadFewerAreNotMore) {
    const Mask fewer = kept & ~bit(CAP_NET_RAW);
    EXPECT_EQ(inChild([&] {
                  prctl(PR_CAPBSET_DROP, CAP_NET_RAW);
                  capng_get_caps_process();
                  capng_update(CAPNG_DROP, static_cast<capng_type_t>(CAPNG_EFFECTIVE | CAPNG_PERMITTED), CAP_NET_RAW);
                  capng_apply(CAPNG_SELECT_CAPS);
                  dropPrivileges();
                  return powers();
              }),
              hex(fewer) + " " + hex(fewer) + " " + hex(fewer) + " " + hex(0) + " " + hex(0) + " 1");
}

TEST_F(Privileges, AreNoneWithoutRoot) {
    EXPECT_EQ(inChild([] {
                  setgid(65534);
                  setuid(65534);
                  return dropPrivileges();
              }),
              "not started by root: there are no capabilities to give up");
}

TEST_F(Privileges, SufficeToConfigureTheNetwork) {
    const Orv::Test::Namespace network;
    EXPECT_THAT(inChild([&] {
                    network.enter();
                    dropPrivileges();
                    const int socketNumber = socket(AF_INET, SOCK_DGRAM, 0);
                    ifreq request{};
                    std::strcpy(request.ifr_name, "lo");
                    request.ifr_flags = IFF_UP | IFF_LOOPBACK;
                    const std::string own = outcome(ioctl(socketNumber, SIOCSIFFLAGS, &request));
                    return own + ", " + shell("ip address add 192.0.2.9/24 dev lo && ip -o -4 address show dev lo");
                }),
                testing::AllOf(testing::StartsWith("done, "), HasSubstr("192.0.2.9/24"), HasSubstr("127.0.0.1/8")));
}

TEST_F(Privileges, SufficeForDhcpClients) {
    const Orv::Test::Namespace network;
    EXPECT_EQ(inChild([&] {
                  network.enter();
                  dropPrivileges();
                  std::string outcomes = outcome(socket(AF_PACKET, SOCK_RAW, 0));
                  sockaddr_in bootpc{};
                  bootpc.sin_family = AF_INET;
                  bootpc.sin_port = htons(68);
                  outcomes += ", " + outcome(bind(socket(AF_INET, SOCK_DGRAM, 0),
                                                  reinterpret_cast<const sockaddr*>(&bootpc), sizeof bootpc));
                  outcomes += ", " + outcome(chroot("/"));
                  outcomes += ", " + outcome(setgid(12345));
                  outcomes += ", " + outcome(setuid(12345));
                  return outcomes;
              }),
              "done, done, done, done, done");
}

TEST_F(Privileges, SufficeToKeepTheOwnerOfAFileThatIsReplaced) {
    const TemporaryDirectory directory;
    EXPECT_EQ(inChild([&] {
                  dropPrivileges();
                  const int file = open(directory.file("file").c_str(), O_CREAT | O_RDWR, 0600);
                  std::string outcomes = outcome(file);
                  outcomes += ", " + outcome(fchown(file, 12345, 12345));
                  outcomes += ", " + outcome(fchmod(file, 0400));
                  outcomes += ", " + outcome(open(directory.file("file").c_str(), O_RDONLY));
                  return outcomes;
              }),
              "done, done, done, Permission denied");
}

TEST_F(Privileges, SufficeToAskPamAboutAccounts) {
    Orv::Test::Namespace system;
    system.replaceFile("/etc/passwd", "root:x:0:0::/root:/bin/sh\nalice:x:7001:7001::/:/bin/sh\n");
    crypt_data data{};
    const std::string hash = crypt_r("good", "$6$rounds=1000$marlo$", &data);
    system.replaceFile("/etc/shadow", "alice:" + hash + ":19000:0:99999:7:::\n");
    system.shell("chown root:shadow /etc/shadow; chmod 0640 /etc/shadow"); // as Debian has it
    const TemporaryDirectory services;
    std::ofstream(services.file("test")) << "auth required pam_unix.so\naccount required pam_unix.so\n";
    EXPECT_EQ(inChild([&] {
                  system.enter();
                  dropPrivileges();
                  const auto check = marlo::security::makePamCheck("test", services.path());
                  std::string outcomes = check->isGood("alice", "good") ? "good" : "bad";
                  outcomes += check->isGood("alice", "other") ? " good" : " bad";
                  return outcomes;
              }),
              "good bad");
}

/** A DHCP client of eth0, as far as anybody can see, of a user: root's has every capability that root has. */
class Client {
  public:
    Client(const Orv::Test::Namespace& network, const TemporaryDirectory& directory, uid_t user)
        : _script(directory.file("dhclient")) {
        mkfifo((_script + ".never").c_str(), 0666);
        std::ofstream(_script) << "read line <" << _script << ".never\n";
        chmod(directory.path().c_str(), 0755);
        _process = fork();
        if (_process == 0) {
            network.enter();
            if (setresuid(user, user, user) == 0) {
                execl("/bin/sh", "sh", _script.c_str(), "eth0", nullptr);
            }
            _exit(1);
        }
        awaitStart();
    }

    ~Client() {
        kill(_process, SIGKILL);
        waitpid(_process, nullptr, 0);
    }

    Client(const Client&) = delete;
    Client& operator=(const Client&) = delete;

  private:
    void awaitStart() const {
        const std::string path = "/proc/" + std::to_string(_process) + "/cmdline";
        const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(30);
        for (std::string arguments; !arguments.ends_with(std::string("eth0") + '\0');) {
            if (std::chrono::steady_clock::now() > end) {
                throw std::runtime_error("no client has started");
            }
            std::ifstream file(path, std::ios::binary);
            arguments.assign(std::istreambuf_iterator<char>(file), {});
        }
    }

    const std::string _script;
    pid_t _process = -1;
};

std::string lookForClient(const Orv::Test::Namespace& network) {
    return inChild([&] {
        network.enter();
        dropPrivileges();
        const Orv::Agent::Persistence::Environment environment;
        Orv::Agent::Persistence::DhcpClient client(environment);
        std::string outcomes = client.isRunning("eth0") ? "found, " : "not found, ";
        outcomes += client.stop("eth0") ? "ended, " : "not ended, ";
        outcomes += client.isRunning("eth0") ? "still there" : "gone";
        return outcomes;
    });
}

TEST_F(Privileges, SufficeToEndADhcpClientThatHasMore) {
    const Orv::Test::Namespace network;
    const TemporaryDirectory directory;
    const Client client(network, directory, 0);
    EXPECT_EQ(lookForClient(network), "found, ended, gone");
}

TEST_F(Privileges, SufficeToEndADhcpClientOfAnotherUser) {
    const Orv::Test::Namespace network;
    const TemporaryDirectory directory;
    const Client client(network, directory, 12345);
    EXPECT_EQ(lookForClient(network), "found, ended, gone");
}

TEST_F(Privileges, DoNotReachTheDhcpClientsOfOtherNamespaces) {
    const Orv::Test::Namespace network;
    const Orv::Test::Namespace other;
    const TemporaryDirectory directory;
    const Client client(other, directory, 0);
    EXPECT_EQ(lookForClient(network), "not found, not ended, gone");
}

} // namespace

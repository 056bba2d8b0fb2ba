/**
 * @file
 * What tests need that have a machine to themselves: they change its network as they like, through the shell and by
 * the cables, and see through the agent library and through marlo what comes of it.
 */
#pragma once

#include "instrumentation/Instrumentation.h"
#include "tests/vm/Cable.h"

#include <chrono>
#include <condition_variable>
#include <cstdlib>
#include <fstream>
#include <mutex>
#include <stdexcept>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

namespace Orv::Test {

inline void shell(const std::string& command) {
    if (std::system(command.c_str()) != 0) {
        throw std::runtime_error(command);
    }
}

inline void ip(const std::string& arguments) {
    shell("ip " + arguments);
}

/** The first line of a file, such as the kernel has below /sys; empty when there is no such file. */
inline std::string firstLine(const std::string& path) {
    std::ifstream file(path);
    std::string line;
    std::getline(file, line);
    return line;
}

/** Waits until it is so, at most twenty seconds: this machine is slow. Whether it is. */
template <typename Condition>
bool isSoon(Condition condition) {
    const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(20);
    while (!condition() && std::chrono::steady_clock::now() < end) {
        std::this_thread::sleep_for(std::chrono::milliseconds(20));
    }
    return condition();
}

/** A property of an adapter or a port; the value of an empty one when either is not there. */
template <typename Value>
Value propertyOf(const std::string& name, NodeLexicon::Properties property,
                 NodeLexicon::NodeType type = NodeLexicon::NODE_NETWORK_ADAPTER) {
    Value value{};
    Instrumentation cursor;
    for (cursor.selectNode(type); cursor; ++cursor) {
        std::string identity;
        if (cursor.getProperty(NodeLexicon::PROP_NODE_STRING, identity) && identity == name) {
            cursor.getProperty(property, value);
            return value;
        }
    }
    return value;
}

inline unsigned int statusOf(const std::string& name) {
    return propertyOf<unsigned int>(name, NodeLexicon::PROP_STATUS);
}

inline void expectStatus(const std::string& name, unsigned int status) {
    EXPECT_TRUE(isSoon([&] { return statusOf(name) == status; })) << name << " has status " << statusOf(name);
}

/** Collects "NAME STATUS" of every event of an adapter's status, as long as it lives. */
class StatusWatch {
  public:
    StatusWatch() { Instrumentation().startMonitoring(NodeLexicon::NODE_NETWORK_ADAPTER, &take, this); }

    ~StatusWatch() { Instrumentation().stopMonitoring(NodeLexicon::NODE_NETWORK_ADAPTER, &take, this); }

    StatusWatch(const StatusWatch&) = delete;
    StatusWatch& operator=(const StatusWatch&) = delete;

    /** What has come since the last call, as soon as there are so many and a second has brought no more. */
    std::vector<std::string> take(std::size_t count) {
        std::unique_lock lock(_mutex);
        _changed.wait_for(lock, std::chrono::seconds(20), [&] { return _seen.size() >= count; });
        while (_changed.wait_for(lock, std::chrono::seconds(1)) == std::cv_status::no_timeout) {
        }
        return std::exchange(_seen, {});
    }

  private:
    static void take(unsigned int code, DateTime /*time*/, std::string path, const void* context) {
        if (code != 0) {
            return;
        }
        Instrumentation cursor;
        cursor.selectNode(path);
        std::string name = "no node";
        unsigned int status = 0;
        if (cursor) {
            cursor.getProperty(NodeLexicon::PROP_NODE_STRING, name);
            cursor.getProperty(NodeLexicon::PROP_STATUS, status);
        }
        static_cast<const StatusWatch*>(context)->add(name + ' ' + std::to_string(status));
    }

    void add(std::string seen) const {
        const std::lock_guard lock(_mutex);
        _seen.push_back(std::move(seen));
        _changed.notify_all();
    }

    // The context comes back as const.
    mutable std::mutex _mutex;
    mutable std::condition_variable _changed;
    mutable std::vector<std::string> _seen;
};

/** bond0, active-backup, of eth0, its primary member, and eth1; up, with both cables in. */
class BondTest : public testing::Test {
  protected:
    static constexpr const char* device = "bond0";

    void SetUp() override {
        ip("link add bond0 type bond mode active-backup miimon 100 primary_reselect always");
        ip("link set eth0 master bond0");
        ip("link set eth1 master bond0");
        ip("link set bond0 type bond primary eth0");
        ip("link set bond0 up");
        expectCarrier("eth0");
        expectStatus("bond0", 1);
    }

    void TearDown() override {
        plugCable("eth0");
        plugCable("eth1");
        ip("link del bond0");
        ip("link set eth0 down");
        ip("link set eth1 down");
    }

    /** Which member the kernel says carries the bond; it has moved within a tenth of a second. */
    static void expectCarrier(const std::string& member) {
        const auto carrier = [] { return firstLine("/sys/class/net/bond0/bonding/active_slave"); };
        EXPECT_TRUE(isSoon([&] { return carrier() == member; })) << "carried by " << carrier();
    }
};

/** team0, which teamd runs as activebackup, of eth0 and eth1; with both cables in when a test begins. */
class TeamTest : public testing::Test {
  protected:
    static constexpr const char* device = "team0";

    void TearDown() override {
        plugCable("eth0");
        plugCable("eth1");
        stopTeam();
    }

    /** With these priorities of its ports, as teamd has them: the greater number is preferred. */
    static void startTeam(int priorityOfEth0, int priorityOfEth1) {
        const auto port = [](int priority) { return "{\"prio\": " + std::to_string(priority) + "}"; };
        shell("mkdir -p /var/run/teamd");
        shell("teamd -d -t team0 -c '{\"runner\": {\"name\": \"activebackup\"}, \"link_watch\": {\"name\": "
              "\"ethtool\"}, \"ports\": {\"eth0\": " +
              port(priorityOfEth0) + ", \"eth1\": " + port(priorityOfEth1) + "}}' 2>/dev/null");
        ip("link set team0 up");
    }

    static void stopTeam() {
        if (!firstLine("/sys/class/net/team0/ifindex").empty()) {
            shell("teamd -k -t team0 2>/dev/null");
        }
        ip("link set eth0 down");
        ip("link set eth1 down");
    }

    /** Which port the driver says carries the team. */
    static void expectCarrier(const std::string& port) {
        const std::string index = firstLine("/sys/class/net/" + port + "/ifindex");
        const auto carrier = [] {
            shell("teamnl team0 getoption activeport >/tmp/activeport");
            return firstLine("/tmp/activeport");
        };
        EXPECT_TRUE(isSoon([&] { return carrier() == index; })) << "carried by " << carrier();
    }
};

/** eth0 is preferred. */
class PreferringTeamTest : public TeamTest {
  protected:
    void SetUp() override {
        startTeam(100, 10);
        expectCarrier("eth0");
        expectStatus("team0", 1);
        expectStatus("eth1", 1);
    }
};

} // namespace Orv::Test

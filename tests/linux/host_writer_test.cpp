#include "agent/write/HostWriter.h"
#include "tests/linux/ScriptedHost.h"

#include <algorithm>
#include <condition_variable>
#include <thread>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace Orv::Agent::Linux {
namespace {

using namespace NodeLexicon;
using namespace Orv::Test;
using testing::AllOf;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

constexpr unsigned dhcp = 1;
constexpr unsigned fixed = 3;

class HostWriterTest : public testing::Test {
  protected:
    HostWriterTest() {
        host.add(2, "eth0", fixed, "192.0.2.10", "255.255.255.0", "192.0.2.1");
        host.add(3, "eth1", dhcp, "198.51.100.10", "255.255.255.0", "198.51.100.1");
        host.clients.insert("eth1");
    }

    /** The text of the exception. */
    std::string failureOf(const std::string& path, Properties property, const PropertyValue& value) {
        try {
            writer.write(path, property, value);
        } catch (const ChangeError& error) {
            return error.what();
        }
        return {};
    }

    ScriptedHost host;
    HostWriter writer{host.parts()};
};

TEST_F(HostWriterTest, changesAnAddressInTheFilesFirstAndThenInTheKernel) {
    writer.write("eth0", PROP_IPV4_ADDRESS, std::string("192.0.2.20"));
    EXPECT_THAT(host.takeSteps(),
                ElementsAre("plan eth0", "read", "write static 192.0.2.20/24 via 192.0.2.1", "activate eth0"));
    EXPECT_EQ(host.fileText(), "# made by hand\neth0 static 192.0.2.20/24 via 192.0.2.1\n");
}

TEST_F(HostWriterTest, endsTheClientBeforeItMakesALeaseLast) {
    writer.write("eth1", PROP_DHCP_ENABLED, fixed);
    EXPECT_THAT(host.takeSteps(), ElementsAre("plan eth1", "stop eth1", "plan eth1", "read",
                                              "write static 198.51.100.10/24 via 198.51.100.1", "activate eth1"));
    EXPECT_THAT(host.clients, IsEmpty());
}

TEST_F(HostWriterTest, looksForNoClientWhereFilesAndKernelSayStatic) {
    writer.write("eth0", PROP_DHCP_ENABLED, fixed);
    EXPECT_THAT(host.takeSteps(), testing::Contains("stop eth0"));
    host.adapters["eth0"].configured = AddressMode::fixed;
    writer.write("eth0", PROP_DHCP_ENABLED, fixed);
    EXPECT_THAT(host.takeSteps(), testing::Not(testing::Contains("stop eth0")));
    host.add(4, "eth2", fixed, "", "", "");
    host.adapters["eth2"].configured = AddressMode::fixed;
    writer.write("eth2", PROP_DHCP_ENABLED, fixed);
    EXPECT_THAT(host.takeSteps(), testing::Contains("stop eth2"));
}

TEST_F(HostWriterTest, startsTheClientWhenEverythingElseIsDone) {
    writer.write("eth0", PROP_DHCP_ENABLED, dhcp);
    EXPECT_THAT(host.takeSteps(),
                ElementsAre("plan eth0", "read", "write dhcp", "activate eth0", "start eth0", "welcome"));
    EXPECT_EQ(host.fileText(), "# made by hand\neth0 dhcp\n");
}

TEST_F(HostWriterTest, leavesALeaseThatIsAskedForAgain) {
    writer.write("eth1", PROP_DHCP_ENABLED, dhcp);
    EXPECT_THAT(host.takeSteps(), ElementsAre("plan eth1", "activate eth1", "start eth1"));
}

TEST_F(HostWriterTest, touchesNoAddressForTheResolver) {
    writer.write("eth0", PROP_DNS_SERVERS, std::vector<std::string>{"192.0.2.99"});
    EXPECT_THAT(host.takeSteps(), ElementsAre("plan eth0", "plan names", "activate eth0", "names eth0 192.0.2.99"));
}

TEST_F(HostWriterTest, keepsAMaskUntilItsAddressComes) {
    host.add(4, "eth2", fixed, "", "", "");
    writer.write("eth2", PROP_DHCP_ENABLED, fixed);
    (void)host.takeSteps();
    writer.write("eth2", PROP_IPV4_ADDRESS, std::string("255.255.240.0"));
    EXPECT_THAT(host.takeSteps(), IsEmpty());
    writer.write("eth2", PROP_IPV4_SUBNET_MASK, std::string("192.0.2.77"));
    EXPECT_THAT(host.takeSteps(), ElementsAre("plan eth2", "read", "write static 192.0.2.77/20", "activate eth2"));
}

TEST_F(HostWriterTest, forgetsAMaskWithItsInterface) {
    host.add(4, "eth2", fixed, "", "", "");
    writer.write("eth2", PROP_IPV4_SUBNET_MASK, std::string("255.255.240.0"));
    host.adapters.erase("eth2");
    writer.write("eth0", PROP_IPV4_ADDRESS, std::string("192.0.2.20"));
    host.add(4, "eth2", fixed, "", "", "");
    (void)host.takeSteps();
    writer.write("eth2", PROP_IPV4_ADDRESS, std::string("192.0.2.77"));
    EXPECT_THAT(host.takeSteps(), testing::Contains("write static 192.0.2.77/24"));
}

TEST_F(HostWriterTest, refusesBeforeAnythingIsTouched) {
    EXPECT_THAT(failureOf("eth0", PROP_IPV4_ADDRESS, std::string("224.0.0.1")),
                AllOf(HasSubstr("eth0"), HasSubstr("IPv4Address"), HasSubstr("224.0.0.1"), HasSubstr("multicast")));
    EXPECT_THAT(failureOf("eth7", PROP_IPV4_ADDRESS, std::string("192.0.2.20")),
                HasSubstr("there is no such adapter"));
    EXPECT_THAT(host.takeSteps(), IsEmpty());
}

TEST_F(HostWriterTest, endsNoClientWhenTheFilesCannotBeEdited) {
    host.failing = {"plan eth1"};
    EXPECT_THAT(failureOf("eth1", PROP_DHCP_ENABLED, fixed), HasSubstr("plan eth1 failed"));
    EXPECT_THAT(host.takeSteps(), ElementsAre("plan eth1"));
    EXPECT_THAT(host.clients, ElementsAre("eth1"));
}

/** A write, a step of it that fails, and what must be done then to take back what was done until then. */
struct Failure {
    const char* interface;
    Properties property;
    PropertyValue value;
    const char* step;
    std::vector<std::string> undone;
};

class HostWriterFailureTest : public HostWriterTest, public testing::WithParamInterface<Failure> {};

TEST_P(HostWriterFailureTest, putsEverythingBackAndSaysWhy) {
    const Failure& failure = GetParam();
    const std::string fileBefore = host.fileText();
    const std::set<std::string> clientsBefore = host.clients;
    host.failing = {failure.step};
    const std::string text = failureOf(failure.interface, failure.property, failure.value);
    EXPECT_THAT(text, AllOf(HasSubstr(failure.interface), HasSubstr(propertyName(failure.property)),
                            HasSubstr(shownValue(failure.value))));
    if (failure.step != std::string("file")) {
        EXPECT_THAT(text, HasSubstr(std::string(failure.step) + " failed"));
    } else {
        EXPECT_THAT(text, HasSubstr("changed by somebody else"));
    }
    EXPECT_THAT(text, testing::Not(HasSubstr("could not be put back")));
    EXPECT_EQ(host.fileText(), fileBefore);
    EXPECT_EQ(host.clients, clientsBefore);
    const std::vector<std::string> steps = host.takeSteps();
    const auto failed = std::find(steps.begin(), steps.end(), failure.step);
    const auto undone =
        failed == steps.end() ? steps.end() - static_cast<std::ptrdiff_t>(failure.undone.size()) : failed + 1;
    EXPECT_EQ(std::vector<std::string>(undone, steps.end()), failure.undone);
}

using Steps = std::vector<std::string>;

INSTANTIATE_TEST_SUITE_P(
    EachStep, HostWriterFailureTest,
    testing::Values(
        Failure{"eth0", PROP_IPV4_ADDRESS, std::string("192.0.2.20"), "plan eth0", Steps{"activate eth0"}},
        Failure{"eth0", PROP_IPV4_ADDRESS, std::string("192.0.2.20"), "file", Steps{"activate eth0"}},
        Failure{"eth0", PROP_IPV4_ADDRESS, std::string("192.0.2.20"), "read", Steps{"activate eth0"}},
        Failure{"eth0", PROP_IPV4_ADDRESS, std::string("192.0.2.20"), "write static 192.0.2.20/24 via 192.0.2.1",
                Steps{"restore", "activate eth0"}},
        Failure{"eth1", PROP_DHCP_ENABLED, fixed, "stop eth1", Steps{}},
        Failure{"eth1", PROP_DHCP_ENABLED, fixed, "file", Steps{"activate eth1", "start eth1"}},
        Failure{"eth1", PROP_DHCP_ENABLED, fixed, "write static 198.51.100.10/24 via 198.51.100.1",
                Steps{"restore", "activate eth1", "start eth1"}},
        Failure{"eth0", PROP_DHCP_ENABLED, dhcp, "start eth0", Steps{"stop eth0", "restore", "activate eth0"}},
        Failure{"eth0", PROP_DHCP_ENABLED, dhcp, "welcome", Steps{"stop eth0", "restore", "activate eth0"}},
        Failure{"eth0", PROP_DNS_SERVERS, std::vector<std::string>{"192.0.2.99"}, "plan names",
                Steps{"activate eth0"}},
        Failure{"eth0", PROP_DNS_SERVERS, std::vector<std::string>{"192.0.2.99"}, "names eth0 192.0.2.99",
                Steps{"names eth0 192.0.2.53", "activate eth0"}}));

TEST_F(HostWriterTest, saysWhatCouldNotBePutBackAndPutsBackTheRest) {
    host.failing = {"write static 192.0.2.20/24 via 192.0.2.1", "restore"};
    EXPECT_THAT(failureOf("eth0", PROP_IPV4_ADDRESS, std::string("192.0.2.20")),
                HasSubstr("via 192.0.2.1 failed; and what was there before could not be put back: restore failed"));
    EXPECT_EQ(host.fileText(), "# made by hand\n");
}

TEST_F(HostWriterTest, stillHasTheWaitingMaskWhenTheAddressCouldNotBeWritten) {
    host.add(4, "eth2", fixed, "", "", "");
    writer.write("eth2", PROP_IPV4_SUBNET_MASK, std::string("255.255.240.0"));
    host.failing = {"write static 192.0.2.77/20"};
    EXPECT_THAT(failureOf("eth2", PROP_IPV4_ADDRESS, std::string("192.0.2.77")), HasSubstr("failed"));
    EXPECT_THAT(failureOf("eth2", PROP_IPV4_ADDRESS, std::string("192.0.2.78")), IsEmpty());
    EXPECT_THAT(host.takeSteps(), testing::Contains("write static 192.0.2.78/20"));
}

TEST_F(HostWriterTest, putsItsOwnPartBackInAFileThatAnotherInterfaceHasChanged) {
    host.failing = {"start eth0"};
    host.during = [&](const std::string& step) {
        if (step == "start eth0") {
            host.during = {};
            writer.write("eth1", PROP_DHCP_ENABLED, fixed);
        }
    };
    EXPECT_THAT(failureOf("eth0", PROP_DHCP_ENABLED, dhcp), HasSubstr("start eth0 failed"));
    EXPECT_EQ(host.fileText(), "# made by hand\neth1 static 198.51.100.10/24 via 198.51.100.1\n"
                               "eth0 static 192.0.2.10/24 via 192.0.2.1\n");
}

/** Lets one thread wait in a step until another says so. */
class Gate {
  public:
    void wait() {
        std::unique_lock lock(_mutex);
        _isThere = true;
        _changed.notify_all();
        _changed.wait(lock, [this] { return _isOpen; });
    }

    void awaitArrival() {
        std::unique_lock lock(_mutex);
        _changed.wait(lock, [this] { return _isThere; });
    }

    void open() {
        const std::lock_guard lock(_mutex);
        _isOpen = true;
        _changed.notify_all();
    }

  private:
    std::mutex _mutex;
    std::condition_variable _changed;
    bool _isThere = false;
    bool _isOpen = false;
};

TEST_F(HostWriterTest, writesToOneInterfaceWhileAnotherWaitsForItsLease) {
    Gate gate;
    host.during = [&](const std::string& step) {
        if (step == "start eth0") {
            gate.wait();
        }
    };
    std::thread waiting([&] { writer.write("eth0", PROP_DHCP_ENABLED, dhcp); });
    gate.awaitArrival();
    writer.write("eth1", PROP_DHCP_ENABLED, fixed);
    EXPECT_THAT(host.fileText(), HasSubstr("eth1 static"));
    EXPECT_EQ(host.clients.count("eth0"), 0U);
    gate.open();
    waiting.join();
    EXPECT_EQ(host.clients.count("eth0"), 1U);
}

TEST_F(HostWriterTest, letsWritesToOneInterfaceFollowOneAnother) {
    std::atomic<int> inside = 0;
    std::atomic<int> most = 0;
    host.during = [&](const std::string& step) {
        if (step == "activate eth0") {
            most = std::max<int>(most, ++inside);
            std::this_thread::sleep_for(std::chrono::milliseconds(2));
            --inside;
        }
    };
    std::vector<std::thread> writers;
    for (int number = 20; number < 28; ++number) {
        writers.emplace_back(
            [&, number] { writer.write("eth0", PROP_IPV4_ADDRESS, "192.0.2." + std::to_string(number)); });
    }
    for (std::thread& thread : writers) {
        thread.join();
    }
    EXPECT_EQ(most, 1);
}

} // namespace
} // namespace Orv::Agent::Linux

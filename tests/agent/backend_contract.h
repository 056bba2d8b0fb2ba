/**
 * @file
 * What every back end does alike, as tests over any host that can be changed by a test.
 *
 * A host under test is a class with
 *   static void require(std::string& whyNot)    the reason why there can be no such host here, if any
 *   BackEnd& backEnd()                          over this host
 *   void add(const AdapterSetup&)               a new interface behind those that are there
 *   void remove(const std::string& name)
 *   void change(const AdapterSetup&)            of an interface that is there: state, addresses and gateway
 *   void resolve(const ResolverSetup&)          for the whole host, from now on
 */
#pragma once

#include "agent/tree/BackEnd.h"
#include "agent/tree/Cursor.h"
#include "tests/agent/TemporaryFile.h"

#include <atomic>
#include <cstdlib>
#include <memory>
#include <optional>
#include <set>
#include <string>
#include <thread>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace Orv::Test {

struct AdapterSetup {
    enum class State { running, stopped, unplugged };

    std::string name;
    State state = State::running;
    std::string mac = "02:00:5e:00:00:01";
    std::optional<std::string> ipv4; ///< with a prefix length of 24
    bool leased = false;             ///< the IPv4 address comes from DHCP
    std::optional<std::string> ipv6; ///< with a prefix length of 64
    std::optional<std::string> gateway;
};

struct ResolverSetup {
    std::vector<std::string> servers;
    std::vector<std::string> suffixes; ///< the first is the domain, too
};

template <typename Host>
class BackEndContract : public testing::Test {
  protected:
    void SetUp() override {
        std::string whyNot;
        Host::require(whyNot);
        if (whyNot.empty()) {
            host = std::make_unique<Host>();
        } else if (std::getenv("CI") != nullptr) {
            FAIL() << whyNot;
        } else {
            GTEST_SKIP() << whyNot;
        }
    }

    Agent::BackEnd& backEnd() { return host->backEnd(); }

    /** A cursor on the adapter of this name. */
    std::unique_ptr<Agent::Cursor> at(const std::string& name) {
        auto cursor = std::make_unique<Agent::Cursor>(backEnd());
        cursor->select(NodeLexicon::NODE_NETWORK_ADAPTER);
        while (cursor->node() != nullptr && text(*cursor, NodeLexicon::PROP_NODE_STRING) != name) {
            cursor->advance();
        }
        if (cursor->node() == nullptr) {
            throw std::runtime_error("no adapter " + name);
        }
        return cursor;
    }

    std::vector<std::string> names() {
        std::vector<std::string> found;
        Agent::Cursor cursor(backEnd());
        for (cursor.select(NodeLexicon::NODE_NETWORK_ADAPTER); cursor.node() != nullptr; cursor.advance()) {
            found.push_back(text(cursor, NodeLexicon::PROP_NODE_STRING));
        }
        return found;
    }

    static std::string text(const Agent::Cursor& cursor, NodeLexicon::Properties property) {
        std::string value = "absent";
        cursor.get(property, value);
        return value;
    }

    static unsigned int number(const Agent::Cursor& cursor, NodeLexicon::Properties property) {
        unsigned int value = 4000000000;
        cursor.get(property, value);
        return value;
    }

    static std::vector<std::string> list(const Agent::Cursor& cursor, NodeLexicon::Properties property) {
        std::vector<std::string> value{"absent"};
        cursor.get(property, value);
        return value;
    }

    static AdapterSetup plain(const std::string& name) {
        AdapterSetup setup;
        setup.name = name;
        return setup;
    }

    static AdapterSetup addressed(const std::string& name) {
        AdapterSetup setup = plain(name);
        setup.ipv4 = "192.0.2.10";
        setup.ipv6 = "2001:db8::10";
        setup.gateway = "192.0.2.254";
        return setup;
    }

    std::unique_ptr<Host> host;
};

TYPED_TEST_SUITE_P(BackEndContract);

TYPED_TEST_P(BackEndContract, hasNoAdaptersOnAHostWithoutInterfaces) {
    EXPECT_THAT(this->names(), testing::IsEmpty());
}

TYPED_TEST_P(BackEndContract, hasOneAdapterPerInterfaceInTheOrderInWhichTheyCame) {
    for (const char* name : {"eth2", "eth10", "eth1"}) {
        this->host->add(this->plain(name));
    }
    EXPECT_THAT(this->names(), testing::ElementsAre("eth2", "eth10", "eth1"));
}

TYPED_TEST_P(BackEndContract, readsAddressesGatewayAndHardwareAddress) {
    AdapterSetup setup = this->addressed("eth0");
    setup.mac = "02:00:5e:ab:cd:ef";
    this->host->add(setup);
    const auto cursor = this->at("eth0");
    EXPECT_EQ(this->text(*cursor, NodeLexicon::PROP_IPV4_ADDRESS), "192.0.2.10");
    EXPECT_EQ(this->text(*cursor, NodeLexicon::PROP_IPV4_SUBNET_MASK), "255.255.255.0");
    EXPECT_EQ(this->text(*cursor, NodeLexicon::PROP_IPV6_ADDRESS), "2001:db8::10");
    EXPECT_EQ(this->text(*cursor, NodeLexicon::PROP_DEFAULT_GATEWAY), "192.0.2.254");
    EXPECT_EQ(this->text(*cursor, NodeLexicon::PROP_MAC_ADDRESS), "02:00:5e:ab:cd:ef");
}

TYPED_TEST_P(BackEndContract, lacksThePropertiesThatTheInterfaceLacks) {
    this->host->add(this->addressed("eth0"));
    this->host->add(this->plain("eth1"));
    const auto cursor = this->at("eth1");
    for (const auto property : {NodeLexicon::PROP_IPV4_ADDRESS, NodeLexicon::PROP_IPV4_SUBNET_MASK,
                                NodeLexicon::PROP_IPV6_ADDRESS, NodeLexicon::PROP_DEFAULT_GATEWAY}) {
        EXPECT_EQ(this->text(*cursor, property), "absent") << property;
    }
    EXPECT_EQ(this->number(*cursor, NodeLexicon::PROP_IP_SUPPORT), 4000000000U);
}

TYPED_TEST_P(BackEndContract, givesNoPropertyAsAnotherType) {
    this->host->add(this->addressed("eth0"));
    const auto cursor = this->at("eth0");
    EXPECT_EQ(this->text(*cursor, NodeLexicon::PROP_STATUS), "absent");
    EXPECT_EQ(this->number(*cursor, NodeLexicon::PROP_IPV4_ADDRESS), 4000000000U);
    EXPECT_THAT(this->list(*cursor, NodeLexicon::PROP_IPV4_ADDRESS), testing::ElementsAre("absent"));
}

TYPED_TEST_P(BackEndContract, tellsRunningStoppedAndUnplugged) {
    AdapterSetup stopped = this->plain("eth1");
    stopped.state = AdapterSetup::State::stopped;
    AdapterSetup unplugged = this->plain("eth2");
    unplugged.state = AdapterSetup::State::unplugged;
    this->host->add(this->plain("eth0"));
    this->host->add(stopped);
    this->host->add(unplugged);
    EXPECT_EQ(this->number(*this->at("eth0"), NodeLexicon::PROP_STATUS), 1U);
    EXPECT_EQ(this->number(*this->at("eth1"), NodeLexicon::PROP_STATUS), 5U);
    EXPECT_EQ(this->number(*this->at("eth2"), NodeLexicon::PROP_STATUS), 12U);
}

TYPED_TEST_P(BackEndContract, tellsAStaticAddressFromALeasedOne) {
    AdapterSetup leased = this->plain("eth1");
    leased.ipv4 = "198.51.100.7";
    leased.leased = true;
    this->host->add(this->addressed("eth0"));
    this->host->add(leased);
    EXPECT_EQ(this->number(*this->at("eth0"), NodeLexicon::PROP_DHCP_ENABLED), 3U);
    EXPECT_EQ(this->number(*this->at("eth1"), NodeLexicon::PROP_DHCP_ENABLED), 1U);
}

TYPED_TEST_P(BackEndContract, readsNameServersAndSuffixesInTheirOrder) {
    this->host->resolve({{"192.0.2.53", "2001:db8::53"}, {"lab.example.org", "example.org"}});
    this->host->add(this->addressed("eth0"));
    const auto cursor = this->at("eth0");
    EXPECT_THAT(this->list(*cursor, NodeLexicon::PROP_DNS_SERVERS),
                testing::ElementsAre("192.0.2.53", "2001:db8::53"));
    EXPECT_THAT(this->list(*cursor, NodeLexicon::PROP_DNS_SUFFIXES),
                testing::ElementsAre("lab.example.org", "example.org"));
    EXPECT_EQ(this->text(*cursor, NodeLexicon::PROP_DNS_DOMAIN), "lab.example.org");
}

TYPED_TEST_P(BackEndContract, lacksNameServersWhereThereAreNone) {
    this->host->add(this->addressed("eth0"));
    const auto cursor = this->at("eth0");
    EXPECT_THAT(this->list(*cursor, NodeLexicon::PROP_DNS_SERVERS), testing::ElementsAre("absent"));
    EXPECT_THAT(this->list(*cursor, NodeLexicon::PROP_DNS_SUFFIXES), testing::ElementsAre("absent"));
}

TYPED_TEST_P(BackEndContract, climbsFromAdapterToDeviceToChassisToHost) {
    this->host->add(this->plain("eth0"));
    const auto adapter = this->at("eth0");
    Agent::Cursor climber(this->backEnd());
    climber.select(adapter->parentPath());
    ASSERT_NE(climber.node(), nullptr);
    EXPECT_NE(climber.node()->description, "");
    climber.select(climber.parentPath());
    ASSERT_NE(climber.node(), nullptr);
    EXPECT_EQ(climber.node()->description, "Chassis");
    climber.select(climber.parentPath());
    ASSERT_NE(climber.node(), nullptr);
    EXPECT_EQ(climber.parentPath(), "");
}

TYPED_TEST_P(BackEndContract, climbsFromAnAdapterThatHasVanishedMeanwhile) {
    this->host->add(this->plain("eth0"));
    const auto adapter = this->at("eth0");
    this->host->remove("eth0");
    Agent::Cursor climber(this->backEnd());
    climber.select(adapter->parentPath());
    climber.select(climber.parentPath());
    ASSERT_NE(climber.node(), nullptr);
    EXPECT_EQ(climber.node()->description, "Chassis");
    EXPECT_THAT(this->names(), testing::IsEmpty());
}

TYPED_TEST_P(BackEndContract, keepsASnapshotAsItWas) {
    this->host->add(this->addressed("eth0"));
    this->host->add(this->plain("eth1"));
    const auto cursor = this->at("eth0");
    const auto held = this->backEnd().snapshot();
    this->host->remove("eth0");
    this->host->remove("eth1");
    EXPECT_EQ(this->text(*cursor, NodeLexicon::PROP_IPV4_ADDRESS), "192.0.2.10");
    cursor->advance();
    EXPECT_EQ(this->text(*cursor, NodeLexicon::PROP_NODE_STRING), "eth1");
    EXPECT_EQ(held->nodesOfType(NodeLexicon::NODE_NETWORK_ADAPTER).size(), 2U);
}

TYPED_TEST_P(BackEndContract, seesEveryChangeThatWasMadeBeforeItIsAsked) {
    this->host->add(this->plain("eth0"));
    EXPECT_THAT(this->names(), testing::ElementsAre("eth0"));
    this->host->add(this->plain("eth1"));
    EXPECT_THAT(this->names(), testing::ElementsAre("eth0", "eth1"));
    this->host->remove("eth0");
    EXPECT_THAT(this->names(), testing::ElementsAre("eth1"));
    this->host->change(this->addressed("eth1"));
    EXPECT_EQ(this->text(*this->at("eth1"), NodeLexicon::PROP_IPV4_ADDRESS), "192.0.2.10");
    AdapterSetup stopped = this->plain("eth1");
    stopped.state = AdapterSetup::State::stopped;
    this->host->change(stopped);
    EXPECT_EQ(this->text(*this->at("eth1"), NodeLexicon::PROP_IPV4_ADDRESS), "absent");
    EXPECT_EQ(this->number(*this->at("eth1"), NodeLexicon::PROP_STATUS), 5U);
}

TYPED_TEST_P(BackEndContract, seesNewNameServers) {
    this->host->add(this->plain("eth0"));
    this->host->resolve({{"192.0.2.53"}, {}});
    EXPECT_THAT(this->list(*this->at("eth0"), NodeLexicon::PROP_DNS_SERVERS), testing::ElementsAre("192.0.2.53"));
    this->host->resolve({{"192.0.2.54"}, {}});
    EXPECT_THAT(this->list(*this->at("eth0"), NodeLexicon::PROP_DNS_SERVERS), testing::ElementsAre("192.0.2.54"));
}

TYPED_TEST_P(BackEndContract, givesTheSameTreeWhileNothingChanges) {
    this->host->add(this->addressed("eth0"));
    const auto first = this->backEnd().snapshot();
    EXPECT_EQ(this->backEnd().snapshot(), first);
    this->host->add(this->plain("eth1"));
    EXPECT_NE(this->backEnd().snapshot(), first);
}

TYPED_TEST_P(BackEndContract, hasAPathOfItsOwnForEveryNodeAndAParentForAllButOne) {
    this->host->add(this->addressed("eth0"));
    this->host->add(this->plain("eth1"));
    const auto tree = this->backEnd().snapshot();
    std::set<std::string> paths;
    int roots = 0;
    for (const auto& node : tree->nodes()) {
        EXPECT_TRUE(paths.insert(node->path).second) << node->path;
        EXPECT_EQ(tree->find(node->path), node);
        roots += node->parentPath.empty() ? 1 : 0;
        EXPECT_TRUE(node->parentPath.empty() || tree->find(node->parentPath) != nullptr) << node->parentPath;
    }
    EXPECT_EQ(roots, 1);
    EXPECT_GE(paths.size(), 5U);
}

TYPED_TEST_P(BackEndContract, findsNothingAtAPathThatIsNot) {
    this->host->add(this->plain("eth0"));
    Agent::Cursor cursor(this->backEnd());
    cursor.select("/no/such/path");
    EXPECT_EQ(cursor.node(), nullptr);
}

TYPED_TEST_P(BackEndContract, refusesAWriteNamingNodeAndProperty) {
    this->host->add(this->addressed("eth0"));
    const auto cursor = this->at("eth0");
    const std::string message = messageOf([&] { cursor->set(NodeLexicon::PROP_DNS_HOSTNAME, std::string("other")); });
    EXPECT_THAT(message, testing::MatchesRegex("eth0: (DNSHostName|property 97) cannot be set.*"));
}

TYPED_TEST_P(BackEndContract, servesManyThreadsWhileTheHostChanges) {
    this->host->add(this->addressed("eth0"));
    std::atomic<bool> isDone{false};
    std::atomic<int> wrong{0};
    std::vector<std::thread> readers;
    for (int i = 0; i < 3; ++i) {
        readers.emplace_back([&] {
            while (!isDone) {
                Agent::Cursor cursor(this->backEnd());
                cursor.select(NodeLexicon::NODE_NETWORK_ADAPTER);
                wrong += this->text(cursor, NodeLexicon::PROP_IPV4_ADDRESS) == "192.0.2.10" ? 0 : 1;
                Agent::Cursor climber(this->backEnd());
                climber.select(cursor.parentPath());
                climber.select(climber.parentPath());
                wrong += climber.node() != nullptr && climber.node()->description == "Chassis" ? 0 : 1;
            }
        });
    }
    for (int i = 0; i < 10; ++i) {
        this->host->add(this->plain("eth1"));
        this->host->remove("eth1");
    }
    isDone = true;
    for (auto& reader : readers) {
        reader.join();
    }
    EXPECT_EQ(wrong, 0);
    EXPECT_THAT(this->names(), testing::ElementsAre("eth0"));
}

REGISTER_TYPED_TEST_SUITE_P(
    BackEndContract, hasNoAdaptersOnAHostWithoutInterfaces, hasOneAdapterPerInterfaceInTheOrderInWhichTheyCame,
    readsAddressesGatewayAndHardwareAddress, lacksThePropertiesThatTheInterfaceLacks, givesNoPropertyAsAnotherType,
    tellsRunningStoppedAndUnplugged, tellsAStaticAddressFromALeasedOne, readsNameServersAndSuffixesInTheirOrder,
    lacksNameServersWhereThereAreNone, climbsFromAdapterToDeviceToChassisToHost,
    climbsFromAnAdapterThatHasVanishedMeanwhile, keepsASnapshotAsItWas, seesEveryChangeThatWasMadeBeforeItIsAsked,
    seesNewNameServers, givesTheSameTreeWhileNothingChanges, hasAPathOfItsOwnForEveryNodeAndAParentForAllButOne,
    findsNothingAtAPathThatIsNot, refusesAWriteNamingNodeAndProperty, servesManyThreadsWhileTheHostChanges);

} // namespace Orv::Test

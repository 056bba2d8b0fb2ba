#include "agent/tree/Cursor.h"
#include "tests/agent/FakeBackEnd.h"
#include "tests/agent/TemporaryFile.h"

#include <thread>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace Orv::NodeLexicon;
using Orv::Agent::Cursor;
using Orv::Agent::PropertyMap;
using Orv::Agent::Tree;
using Orv::Test::FakeBackEnd;
using Orv::Test::makeNode;
using Orv::Test::messageOf;
using testing::ElementsAre;

PropertyMap named(const std::string& identity) {
    return {{PROP_NODE_STRING, identity}};
}

std::shared_ptr<const Tree> treeOf(const std::vector<std::string>& adapters, const std::string& chassis = "Chassis") {
    std::vector<Tree::NodePointer> nodes{makeNode("host", "", {}, "Host"), makeNode("c", "host", {}, chassis),
                                         makeNode("d", "c", {}, "Card")};
    for (const std::string& adapter : adapters) {
        nodes.push_back(makeNode("a:" + adapter, "d", NODE_NETWORK_ADAPTER, "of " + adapter, named(adapter)));
    }
    return std::make_shared<const Tree>(std::move(nodes));
}

struct CursorTest : testing::Test {
    CursorTest() { backEnd.tree = treeOf({"eth0", "eth1"}); }

    std::string identity(const Cursor& cursor) {
        std::string text = "absent";
        cursor.get(PROP_NODE_STRING, text);
        return text;
    }

    std::vector<std::string> scan() {
        std::vector<std::string> seen;
        Cursor cursor(backEnd);
        for (cursor.select(NODE_NETWORK_ADAPTER); cursor.node() != nullptr; cursor.advance()) {
            seen.push_back(identity(cursor));
        }
        return seen;
    }

    FakeBackEnd backEnd;
};

TEST_F(CursorTest, StandsOnNothingBeforeASelection) {
    const Cursor cursor(backEnd);
    EXPECT_EQ(cursor.node(), nullptr);
    EXPECT_EQ(cursor.parentPath(), "");
    EXPECT_EQ(backEnd.snapshots, 0);
}

TEST_F(CursorTest, MeetsEveryNodeOfTheTypeOnce) {
    EXPECT_THAT(scan(), ElementsAre("eth0", "eth1"));
}

TEST_F(CursorTest, IsFalseAtOnceWhenNothingIsOfTheType) {
    Cursor cursor(backEnd);
    cursor.select(NODE_NETWORK_PORT);
    EXPECT_EQ(cursor.node(), nullptr);
}

TEST_F(CursorTest, StaysPastTheEnd) {
    Cursor cursor(backEnd);
    cursor.select(NODE_NETWORK_ADAPTER);
    for (int i = 0; i < 5; ++i) {
        cursor.advance();
    }
    EXPECT_EQ(cursor.node(), nullptr);
    EXPECT_EQ(identity(cursor), "absent");
}

TEST_F(CursorTest, ReadsEachTypeOfValue) {
    backEnd.tree =
        std::make_shared<const Tree>(std::vector{makeNode("a", "", NODE_NETWORK_ADAPTER, "",
                                                          {{PROP_STATUS, 65537U},
                                                           {PROP_MAC_ADDRESS, std::string("02:00")},
                                                           {PROP_DNS_SERVERS, std::vector<std::string>{"b", "a"}}})});
    Cursor cursor(backEnd);
    cursor.select(NODE_NETWORK_ADAPTER);
    unsigned int status = 0;
    std::string address;
    std::vector<std::string> servers;
    EXPECT_TRUE(cursor.get(PROP_STATUS, status));
    EXPECT_TRUE(cursor.get(PROP_MAC_ADDRESS, address));
    EXPECT_TRUE(cursor.get(PROP_DNS_SERVERS, servers));
    EXPECT_EQ(status, 65537U);
    EXPECT_EQ(address, "02:00");
    EXPECT_THAT(servers, ElementsAre("b", "a"));
}

TEST_F(CursorTest, LeavesTheValueAloneWhenThePropertyIsAbsent) {
    Cursor cursor(backEnd);
    cursor.select(NODE_NETWORK_ADAPTER);
    std::string text = "kept";
    unsigned int number = 7;
    std::vector<std::string> list{"kept"};
    EXPECT_FALSE(cursor.get(PROP_IPV4_ADDRESS, text));
    EXPECT_FALSE(cursor.get(PROP_STATUS, number));
    EXPECT_FALSE(cursor.get(PROP_DNS_SERVERS, list));
    EXPECT_EQ(text, "kept");
    EXPECT_EQ(number, 7U);
    EXPECT_THAT(list, ElementsAre("kept"));
}

TEST_F(CursorTest, LeavesTheValueAloneWhenThePropertyIsOfAnotherType) {
    Cursor cursor(backEnd);
    cursor.select(NODE_NETWORK_ADAPTER);
    unsigned int number = 7;
    EXPECT_FALSE(cursor.get(PROP_NODE_STRING, number));
    EXPECT_EQ(number, 7U);
}

TEST_F(CursorTest, TakesASnapshotPerSelectionByType) {
    Cursor cursor(backEnd);
    cursor.select(NODE_NETWORK_ADAPTER);
    backEnd.tree = treeOf({"eth7"});
    EXPECT_EQ(identity(cursor), "eth0");
    cursor.select(NODE_NETWORK_ADAPTER);
    EXPECT_EQ(identity(cursor), "eth7");
    EXPECT_EQ(backEnd.snapshots, 2);
}

TEST_F(CursorTest, ScansTheSnapshotToItsEndWhenTheTreeChanges) {
    Cursor cursor(backEnd);
    cursor.select(NODE_NETWORK_ADAPTER);
    backEnd.tree = treeOf({});
    cursor.advance();
    EXPECT_EQ(identity(cursor), "eth1");
}

TEST_F(CursorTest, ClimbsWithoutAnotherSnapshot) {
    Cursor adapter(backEnd);
    adapter.select(NODE_NETWORK_ADAPTER);
    Cursor climber(backEnd);
    climber.select(adapter.parentPath());
    EXPECT_EQ(climber.node()->description, "Card");
    climber.select(climber.parentPath());
    EXPECT_EQ(climber.node()->description, "Chassis");
    EXPECT_EQ(backEnd.snapshots, 1);
}

TEST_F(CursorTest, ClimbsInTheSnapshotThatTheAdapterCameFrom) {
    Cursor adapter(backEnd);
    adapter.select(NODE_NETWORK_ADAPTER);
    backEnd.tree = treeOf({"eth9"}, "BMC"); // the host changes between the reading and the climb
    Cursor climber(backEnd);
    climber.select(adapter.parentPath());
    climber.select(climber.parentPath());
    EXPECT_EQ(climber.node()->description, "Chassis");
}

TEST_F(CursorTest, ClimbsThoughTheWholeTreeHasVanished) {
    Cursor adapter(backEnd);
    adapter.select(NODE_NETWORK_ADAPTER);
    backEnd.failure = "gone";
    backEnd.tree.reset();
    Cursor climber(backEnd);
    climber.select(adapter.parentPath());
    climber.select(climber.parentPath());
    EXPECT_EQ(climber.node()->description, "Chassis");
}

TEST_F(CursorTest, LooksUpThePathOfAnEndedCursorInANewSnapshot) {
    std::string path;
    {
        Cursor adapter(backEnd);
        adapter.select(NODE_NETWORK_ADAPTER);
        path = adapter.parentPath();
    }
    backEnd.tree = std::make_shared<const Tree>(std::vector{makeNode("d", "", {}, "New card")});
    Cursor climber(backEnd);
    climber.select(path);
    EXPECT_EQ(climber.node()->description, "New card");
}

TEST_F(CursorTest, LooksUpThePathOfAnotherThreadInANewSnapshot) {
    Cursor adapter(backEnd);
    adapter.select(NODE_NETWORK_ADAPTER);
    const std::string path = adapter.parentPath();
    backEnd.tree = std::make_shared<const Tree>(std::vector{makeNode("d", "", {}, "New card")});
    std::string description;
    std::thread([&] {
        Cursor climber(backEnd);
        climber.select(path);
        description = climber.node()->description;
    }).join();
    EXPECT_EQ(description, "New card");
}

TEST_F(CursorTest, DoesNotClimbIntoTheTreeOfAnotherBackEnd) {
    Cursor adapter(backEnd);
    adapter.select(NODE_NETWORK_ADAPTER);
    FakeBackEnd other;
    Cursor climber(other);
    climber.select(adapter.parentPath());
    EXPECT_EQ(climber.node(), nullptr);
    EXPECT_EQ(other.snapshots, 1);
}

TEST_F(CursorTest, FindsANodeThatCameAfterTheSnapshotOfTheLastPath) {
    Cursor adapter(backEnd);
    adapter.select(NODE_NETWORK_ADAPTER);
    EXPECT_EQ(adapter.parentPath(), "d");
    backEnd.tree = treeOf({"eth9"});
    Cursor other(backEnd);
    other.select("a:eth9");
    ASSERT_NE(other.node(), nullptr);
    EXPECT_EQ(other.node()->description, "of eth9");
}

TEST_F(CursorTest, SelectsNothingAtAPathThatIsNot) {
    Cursor cursor(backEnd);
    cursor.select("nowhere");
    EXPECT_EQ(cursor.node(), nullptr);
}

TEST_F(CursorTest, HasAnEmptyPathAboveTheRootThatSelectsNothing) {
    Cursor cursor(backEnd);
    cursor.select("host");
    ASSERT_NE(cursor.node(), nullptr);
    EXPECT_EQ(cursor.parentPath(), "");
    cursor.select(cursor.parentPath());
    EXPECT_EQ(cursor.node(), nullptr);
}

TEST_F(CursorTest, SelectsOneNodeByPath) {
    Cursor cursor(backEnd);
    cursor.select("a:eth0");
    EXPECT_EQ(identity(cursor), "eth0");
    cursor.advance();
    EXPECT_EQ(cursor.node(), nullptr);
}

TEST_F(CursorTest, HasNoSelectionWhenTheSnapshotFails) {
    Cursor cursor(backEnd);
    cursor.select(NODE_NETWORK_ADAPTER);
    backEnd.failure = "no agent";
    EXPECT_EQ(messageOf([&] { cursor.select(NODE_NETWORK_ADAPTER); }), "no agent");
    EXPECT_EQ(cursor.node(), nullptr);
}

TEST_F(CursorTest, HandsAWriteToTheBackEndWithThePathOfTheNode) {
    Cursor cursor(backEnd);
    cursor.select(NODE_NETWORK_ADAPTER);
    cursor.advance();
    cursor.set(PROP_DHCP_ENABLED, 3U);
    EXPECT_THAT(backEnd.writes, ElementsAre(FakeBackEnd::Write{"a:eth1", PROP_DHCP_ENABLED, 3U}));
}

TEST_F(CursorTest, RefusesAWriteWithoutANode) {
    Cursor cursor(backEnd);
    EXPECT_THAT(messageOf([&] { cursor.set(PROP_DHCP_ENABLED, 3U); }), testing::HasSubstr("stands on no node"));
    EXPECT_TRUE(backEnd.writes.empty());
}

} // namespace

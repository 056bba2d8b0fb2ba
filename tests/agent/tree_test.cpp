#include "agent/tree/Tree.h"
#include "tests/agent/FakeBackEnd.h"

#include <algorithm>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace Orv::NodeLexicon;
using Orv::Agent::PropertyMap;
using Orv::Agent::PropertyValue;
using Orv::Agent::Tree;
using Orv::Test::makeNode;
using testing::ElementsAre;
using testing::IsEmpty;

std::vector<std::string> pathsOf(const std::vector<Tree::NodePointer>& nodes) {
    std::vector<std::string> paths;
    for (const auto& node : nodes) {
        paths.push_back(node->path);
    }
    return paths;
}

Tree sample() {
    return Tree({makeNode("host", "", {}), makeNode("b", "host", NODE_NETWORK_ADAPTER),
                 makeNode("p", "host", NODE_NETWORK_PORT), makeNode("a", "host", NODE_NETWORK_ADAPTER)});
}

TEST(PropertyMap, IsOrderedByPropertyHoweverItWasFilled) {
    PropertyMap map;
    map.emplace(PROP_STATUS, 1U);
    map.emplace(PROP_DHCP_ENABLED, 3U);
    map.emplace(PROP_IPV4_ADDRESS, std::string("a"));
    std::vector<Properties> order;
    for (const auto& [property, value] : map) {
        order.push_back(property);
    }
    EXPECT_THAT(order, ElementsAre(PROP_DHCP_ENABLED, PROP_IPV4_ADDRESS, PROP_STATUS));
    EXPECT_EQ(map, (PropertyMap{{PROP_IPV4_ADDRESS, std::string("a")}, {PROP_STATUS, 1U}, {PROP_DHCP_ENABLED, 3U}}));
}

TEST(PropertyMap, FindsWhatItHoldsAndNothingElse) {
    const PropertyMap map{{PROP_STATUS, 1U}, {PROP_DHCP_ENABLED, 3U}};
    ASSERT_NE(map.find(PROP_STATUS), map.end());
    EXPECT_EQ(map.find(PROP_STATUS)->second, PropertyValue(1U));
    EXPECT_EQ(map.find(PROP_IPV4_ADDRESS), map.end());
    EXPECT_EQ(PropertyMap().find(PROP_STATUS), PropertyMap().end());
}

TEST(PropertyMap, KeepsTheFirstValueOfAProperty) {
    PropertyMap map{{PROP_STATUS, 1U}};
    map.emplace(PROP_STATUS, 5U);
    EXPECT_EQ(map, (PropertyMap{{PROP_STATUS, 1U}}));
    EXPECT_EQ(map.size(), 1U);
}

TEST(Tree, ListsNodesOfATypeInTheOrderGiven) {
    const Tree tree = sample();
    EXPECT_THAT(pathsOf(tree.nodesOfType(NODE_NETWORK_ADAPTER)), ElementsAre("b", "a"));
    EXPECT_THAT(pathsOf(tree.nodesOfType(NODE_NETWORK_PORT)), ElementsAre("p"));
    EXPECT_THAT(pathsOf(tree.nodes()), ElementsAre("host", "b", "p", "a"));
}

TEST(Tree, HasNoNodesOfATypeThatDoesNotOccur) {
    EXPECT_THAT(Tree().nodesOfType(NODE_NETWORK_PORT), IsEmpty());
    EXPECT_THAT(sample().nodesOfType(static_cast<NodeType>(13)), IsEmpty());
}

TEST(Tree, FindsANodeByItsPathWhole) {
    const Tree tree = sample();
    ASSERT_NE(tree.find("a"), nullptr);
    EXPECT_EQ(tree.find("a")->path, "a");
    EXPECT_EQ(tree.find("hos"), nullptr);
    EXPECT_EQ(tree.find(""), nullptr);
    EXPECT_EQ(Tree().find("a"), nullptr);
}

// So many paths that some of them agree in all 32 bits of their hashes.
TEST(Tree, FindsEachOfManyNodesAndNoOther) {
    constexpr int count = 300000;
    std::vector<Tree::NodePointer> nodes;
    for (int i = 0; i < count; ++i) {
        nodes.push_back(makeNode(std::to_string(i), "", {}));
    }
    const Tree tree(nodes);
    ASSERT_EQ(tree.nodes().size(), nodes.size());
    EXPECT_TRUE(
        std::all_of(nodes.begin(), nodes.end(), [&](const auto& node) { return tree.find(node->path) == node; }));
    int strangers = 0;
    for (int i = count; i < 2 * count; ++i) {
        strangers += tree.find(std::to_string(i)) == nullptr ? 0 : 1;
    }
    EXPECT_EQ(strangers, 0);
}

TEST(Tree, DropsTheLaterOfTwoNodesOfOnePath) {
    const Tree tree({makeNode("a", "", NODE_NETWORK_ADAPTER, "first"),
                     makeNode("a", "", NODE_NETWORK_ADAPTER, "second"), makeNode("b", "", NODE_NETWORK_ADAPTER)});
    EXPECT_THAT(pathsOf(tree.nodesOfType(NODE_NETWORK_ADAPTER)), ElementsAre("a", "b"));
    EXPECT_EQ(tree.nodes().size(), 2U);
    EXPECT_EQ(tree.find("a")->description, "first");
}

TEST(Tree, SharesItsNodesWithWhoeverGaveThem) {
    const auto node = makeNode("a", "", NODE_NETWORK_ADAPTER);
    const Tree before({node});
    const Tree after({node, makeNode("b", "", NODE_NETWORK_ADAPTER)});
    EXPECT_EQ(before.find("a"), after.find("a"));
}

TEST(Tree, ExchangesNodesAndSharesTheOthers) {
    const Tree former = sample();
    const auto fresh = makeNode("a", "host", NODE_NETWORK_ADAPTER, "fresh");
    const auto host = makeNode("host", "", {}, "renamed");
    const Tree tree(former, {fresh, host, makeNode("stranger", "host", NODE_NETWORK_PORT)});
    EXPECT_EQ(tree.nodesOfType(NODE_NETWORK_ADAPTER).at(1), fresh);
    EXPECT_EQ(tree.nodes().at(3), fresh);
    EXPECT_EQ(tree.find("a"), fresh);
    EXPECT_EQ(tree.find("host"), host);
    EXPECT_EQ(tree.find("b"), former.find("b"));
    EXPECT_THAT(pathsOf(tree.nodes()), ElementsAre("host", "b", "p", "a"));
    EXPECT_THAT(pathsOf(tree.nodesOfType(NODE_NETWORK_PORT)), ElementsAre("p"));
    EXPECT_NE(former.find("a"), fresh) << "the former stays as it was";
    EXPECT_EQ(Tree(Tree(), {fresh}).find("a"), nullptr);
}

TEST(Tree, FindsEveryNodeAfterBeingMoved) {
    Tree tree = sample();
    const Tree moved = std::move(tree);
    EXPECT_NE(moved.find("p"), nullptr);
    EXPECT_THAT(pathsOf(moved.nodesOfType(NODE_NETWORK_ADAPTER)), ElementsAre("b", "a"));
}

} // namespace

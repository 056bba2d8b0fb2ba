// Descriptions of many adapters, which are read part by part.
#include "agent/file/DocumentParts.h"
#include "agent/file/TreeFile.h"
#include "tests/agent/TemporaryFile.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace Orv::NodeLexicon;
using Orv::Agent::cutDocument;
using Orv::Agent::parseTreeDescription;
using Orv::Test::messageOf;

constexpr int many = 1000;

std::string adapters(int count) {
    std::string text;
    for (int i = 0; i < count; ++i) {
        text += "[[adapter]]\nidentity = \"eth" + std::to_string(i) + "\"\n";
    }
    return text;
}

Orv::Agent::TreeDescription parse(const std::string& text) {
    return parseTreeDescription(text, "lab.toml");
}

std::size_t adaptersOf(const std::string& text) {
    return parse(text).tree->nodesOfType(NODE_NETWORK_ADAPTER).size();
}

std::string failureOf(const std::string& text) {
    return messageOf([&] { parse(text); });
}

TEST(DocumentParts, AreTheDocumentWhenPutTogether) {
    const std::string text = "# lab\n[host]\n" + adapters(many) + "[[card]]\nname = \"x\"";
    const auto parts = cutDocument(text);
    ASSERT_GT(parts.size(), 4U);
    std::string together;
    for (const auto& part : parts) {
        EXPECT_EQ(part.firstLine, 1U + static_cast<std::size_t>(std::count(together.begin(), together.end(), '\n')));
        EXPECT_TRUE(&part == &parts.front() || part.text.starts_with("[["));
        together += part.text;
    }
    EXPECT_EQ(together, text);
}

TEST(DocumentParts, LeaveASmallDocumentWithoutHeadersWhole) {
    EXPECT_EQ(cutDocument("[host]\n").size(), 1U);
    EXPECT_EQ(cutDocument("").size(), 1U);
    EXPECT_EQ(cutDocument(" [[adapter]]\n[[adapter.x]]\n").size(), 1U);
}

TEST(LargeTreeFile, HoldsEveryAdapterInOrder) {
    const auto tree = parse("[host]\ndescription = \"lab\"\n" + adapters(many)).tree;
    const auto& nodes = tree->nodesOfType(NODE_NETWORK_ADAPTER);
    ASSERT_EQ(nodes.size(), static_cast<std::size_t>(many));
    for (int i = 0; i < many; ++i) {
        ASSERT_EQ(nodes[static_cast<std::size_t>(i)]->description, "eth" + std::to_string(i));
    }
    EXPECT_EQ(tree->nodes().front()->description, "lab");
    EXPECT_EQ(tree->nodesOfType(NODE_NETWORK_PORT).size(), nodes.size());
}

TEST(LargeTreeFile, IsRefusedWithTheLineOfTheWholeFile) {
    const std::string wrong = adapters(many) + "status = \"up\"\n" + adapters(many);
    EXPECT_EQ(failureOf(wrong),
              "lab.toml:2001: adapter.status: expected an integer from 0 to 4294967295, found a string");
    EXPECT_EQ(failureOf(adapters(many) + "colour = 1\n"), "lab.toml:2001: adapter.colour: unknown key");
    EXPECT_THAT(failureOf(adapters(many) + "status = = 1\n"), testing::StartsWith("lab.toml:2001: "));
    EXPECT_THAT(failureOf(adapters(many) + "identity = \"twice\"\n"), testing::StartsWith("lab.toml:2001: "));
}

TEST(LargeTreeFile, MayHoldTextsThatLookLikeHeaders) {
    std::string text;
    for (int i = 0; i < many; ++i) {
        text += "[[adapter]]\nidentity = \"eth\"\ndescription = \"\"\"\n[[adapter]]\n[[port]]\"\"\"\n";
    }
    EXPECT_EQ(adaptersOf(text), static_cast<std::size_t>(many));
    EXPECT_EQ(parse(text).tree->nodesOfType(NODE_NETWORK_ADAPTER).back()->description, "[[adapter]] [[port]]");
}

TEST(LargeTreeFile, MayDescribeTheHostAtItsEnd) {
    const auto tree = parse(adapters(many) + "[host]\ndescription = \"lab\"\n").tree;
    EXPECT_EQ(tree->nodes().front()->description, "lab");
    EXPECT_EQ(tree->nodesOfType(NODE_NETWORK_ADAPTER).size(), static_cast<std::size_t>(many));
}

TEST(LargeTreeFile, MayNotDescribeTheHostTwice) {
    const std::string text = "[host]\ndescription = \"lab\"\n" + adapters(many) + "[host]\ndescription = \"lab\"\n";
    EXPECT_THAT(failureOf(text), testing::StartsWith("lab.toml:2003: "));
}

TEST(LargeTreeFile, MayNotHaveItsAdaptersAsAListAndAsTables) {
    const std::string text = "adapter = [{identity = \"a\"}]\n" + adapters(many);
    EXPECT_THAT(failureOf(text), testing::StartsWith("lab.toml:2: "));
}

TEST(LargeTreeFile, MayDescribeACardFarBehindItsPort) {
    const std::string port = "[[port]]\nidentity = \"p\"\ncard = \"c\"\n";
    const auto hardware = parse(port + adapters(many) + "[[card]]\nname = \"c\"\n").hardware;
    EXPECT_EQ(hardware.ports.size(), 1U);
    EXPECT_EQ(hardware.cards.size(), 1U);
    EXPECT_EQ(failureOf(adapters(many) + port), "lab.toml:2003: port.card: no card is named \"c\"");
}

TEST(LargeTreeFile, DerivesNoPortsWhenTheLastPartHasOne) {
    const auto description = parse(adapters(many) + "[[port]]\nidentity = \"p\"\n");
    EXPECT_EQ(description.tree->nodesOfType(NODE_NETWORK_PORT).size(), 1U);
    EXPECT_EQ(description.hardware.ports.size(), 1U);
    EXPECT_TRUE(description.hardware.cards.empty());
}

} // namespace

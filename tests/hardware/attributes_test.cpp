#include "agent/hardware/Attributes.h"
#include "tests/hardware/MessageBytes.h"

#include <gtest/gtest.h>

namespace Orv::Agent::Hardware {
namespace {

using Test::MessageBytes;

TEST(Attributes, FindsEachBehindOthersOfOddLength) {
    const auto message = MessageBytes().text(1, "ab").number(2, std::uint8_t{7}).number(3, std::uint32_t{70000});
    const Attributes attributes(message.bytes());
    EXPECT_EQ(attributes.text(1), "ab");
    EXPECT_EQ(attributes.number<std::uint8_t>(2), 7);
    EXPECT_EQ(attributes.number<std::uint32_t>(3), 70000U);
    EXPECT_FALSE(attributes.find(4));
}

TEST(Attributes, IgnoresTheFlagsOfAType) {
    const auto message = MessageBytes().nest(5, MessageBytes().text(1, "inside"));
    EXPECT_EQ(Attributes(message.bytes()).nested(5).text(1), "inside");
}

TEST(Attributes, HasNoNumberOfAnotherSize) {
    const auto message = MessageBytes().number(1, std::uint32_t{5});
    EXPECT_FALSE(Attributes(message.bytes()).number<std::uint16_t>(1));
}

TEST(Attributes, ReadsATextThatLacksItsZero) {
    const auto message = MessageBytes().attribute(1, "eth0", 4);
    EXPECT_EQ(Attributes(message.bytes()).text(1), "eth0");
}

TEST(Attributes, EndAtWhatTheBytesDoNotHold) {
    const auto message = MessageBytes().text(1, "first").text(2, "second");
    for (std::size_t size = 0; size < message.bytes().size(); ++size) {
        const std::vector<std::byte> cut(message.bytes().begin(),
                                         message.bytes().begin() + static_cast<std::ptrdiff_t>(size));
        const Attributes attributes{Bytes(cut)};
        EXPECT_EQ(attributes.text(1).has_value(), size >= 10) << size; // header of 4, five letters, zero
        EXPECT_EQ(attributes.text(2).has_value(), size >= 12 + 11) << size;
    }
}

TEST(Attributes, EndAtALengthBelowAHeader) {
    auto message = MessageBytes(nlattr{2, 1}).text(2, "behind");
    EXPECT_FALSE(Attributes(message.bytes()).find(1));
    EXPECT_FALSE(Attributes(message.bytes()).find(2));
}

TEST(Attributes, AreVisitedInTheirOrderUpToWhatDoesNotFit) {
    auto message = MessageBytes().text(2, "a").nest(2, MessageBytes().text(1, "b")).number(1, std::uint8_t{7});
    message.attribute(3, "cut", 3);
    std::vector<std::pair<int, std::size_t>> visited;
    const Bytes bytes = message.bytes();
    Attributes(bytes.first(bytes.size() - 2)).forEach([&](std::uint16_t type, Bytes payload) {
        visited.emplace_back(type, payload.size());
    });
    EXPECT_EQ(visited, (std::vector<std::pair<int, std::size_t>>{{2, 2}, {2, 8}, {1, 1}}));
}

TEST(Attributes, OfAMissingNestAreNone) {
    EXPECT_FALSE(Attributes(Bytes()).nested(1).find(1));
}

} // namespace
} // namespace Orv::Agent::Hardware

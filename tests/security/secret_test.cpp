#include "host/security/Gatekeeper.h"
#include "host/security/PasswordCache.h"
#include "host/security/Secret.h"

#include <algorithm>
#include <cctype>
#include <chrono>
#include <set>
#include <string>

#include <gtest/gtest.h>

namespace {

using namespace std::chrono_literals;
using marlo::security::Digest;
using marlo::security::Digester;
using marlo::security::Identity;
using marlo::security::makePassword;
using marlo::security::PasswordCache;
using marlo::security::Role;

TEST(Wiping, OverwritesAllThatTheTextHeld) {
    std::string text = "a password that is longer than what fits into the object itself";
    text.resize(20); // the rest is spare capacity now
    const std::size_t capacity = text.capacity();
    marlo::security::wipe(text);
    EXPECT_TRUE(text.empty());
    ASSERT_EQ(text.capacity(), capacity);
    text.resize(0);
    const char* memory = text.data();
    EXPECT_TRUE(std::all_of(memory, memory + 20, [](char byte) { return byte == 0; }));
}

TEST(Digests, AreEqualForEqualTexts) {
    const Digester digester;
    EXPECT_TRUE(marlo::security::equal(digester.of({"user", "password"}), digester.of({"user", "password"})));
    EXPECT_FALSE(marlo::security::equal(digester.of({"user", "password"}), digester.of({"user", "passwore"})));
}

TEST(Digests, TellWhichTextHasWhat) {
    const Digester digester;
    EXPECT_FALSE(marlo::security::equal(digester.of({"us", "erpassword"}), digester.of({"user", "password"})));
    EXPECT_FALSE(marlo::security::equal(digester.of({"", "ab"}), digester.of({"ab", ""})));
}

TEST(Digests, AreWorthNothingToAnotherDigester) {
    EXPECT_FALSE(marlo::security::equal(Digester().of({"user"}), Digester().of({"user"})));
}

TEST(MadePasswords, AreLettersAndDigitsAndNeverTheSame) {
    std::set<std::string> passwords;
    std::set<char> characters;
    for (int count = 0; count < 200; ++count) {
        const std::string password = makePassword();
        EXPECT_EQ(password.size(), 22U);
        characters.insert(password.begin(), password.end());
        passwords.insert(password);
    }
    EXPECT_EQ(passwords.size(), 200U);
    EXPECT_EQ(characters.size(), 62U); // of 4,400 characters one is missing once in 10^29 times
    EXPECT_TRUE(std::all_of(characters.begin(), characters.end(),
                            [](unsigned char character) { return std::isalnum(character) != 0; }));
}

class RememberedCredentials : public testing::Test {
  protected:
    PasswordCache _cache;
    Digester _digester;
    Digest _good = _digester.of({"alice", "good"});
    Digest _bad = _digester.of({"alice", "bad"});
    Identity _alice{"alice", {Role::read}};
    PasswordCache::Time _now{1h};
};

TEST_F(RememberedCredentials, AreFoundForAWhile) {
    _cache.keep("alice", _good, _alice, _now);
    const auto found = _cache.find("alice", _good, _now + PasswordCache::lifetime - 1ms);
    ASSERT_TRUE(found.has_value());
    EXPECT_EQ(found->name(), "alice");
    EXPECT_TRUE(found->may(Role::read));
    EXPECT_FALSE(found->may(Role::change));
    EXPECT_FALSE(_cache.find("alice", _good, _now + PasswordCache::lifetime).has_value());
}

TEST_F(RememberedCredentials, AreThoseAndNoOthers) {
    _cache.keep("alice", _good, _alice, _now);
    EXPECT_FALSE(_cache.find("alice", _bad, _now).has_value());
    EXPECT_FALSE(_cache.find("bob", _good, _now).has_value());
    EXPECT_TRUE(_cache.find("alice", _good, _now).has_value());
}

TEST_F(RememberedCredentials, CanBeForgotten) {
    _cache.keep("alice", _good, _alice, _now);
    _cache.keep("bob", _bad, _alice, _now);
    _cache.forget("alice");
    EXPECT_FALSE(_cache.find("alice", _good, _now).has_value());
    EXPECT_TRUE(_cache.find("bob", _bad, _now).has_value());
    _cache.clear();
    EXPECT_FALSE(_cache.find("bob", _bad, _now).has_value());
}

TEST_F(RememberedCredentials, AreOfALimitedNumberOfUsers) {
    for (std::size_t count = 0; count < PasswordCache::capacity; ++count) {
        _cache.keep(std::to_string(count), _good, _alice, _now);
    }
    EXPECT_TRUE(_cache.find("0", _good, _now).has_value());
    _cache.keep("0", _good, _alice, _now); // known already
    EXPECT_TRUE(_cache.find("1", _good, _now).has_value());
    _cache.keep("one more", _good, _alice, _now);
    EXPECT_TRUE(_cache.find("one more", _good, _now).has_value());
    EXPECT_FALSE(_cache.find("0", _good, _now).has_value());
}

} // namespace

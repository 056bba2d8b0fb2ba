#include "tests/security/GatekeeperFixture.h"

#include <chrono>
#include <optional>
#include <thread>

#include <gmock/gmock.h>

namespace {

using namespace std::chrono_literals;
using namespace marlo::test;
using marlo::http::Answer;
using marlo::http::Peer;
using marlo::security::Admission;
using marlo::security::Role;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

TEST_F(GatekeeperTest, LetsTheTrialUserDoEverything) {
    const Admission admission = admit({basic("trial:p")});
    EXPECT_FALSE(admission.refusal.has_value());
    EXPECT_EQ(admission.identity.name(), "trial");
    EXPECT_TRUE(admission.identity.may(Role::read));
    EXPECT_TRUE(admission.identity.may(Role::change));
    EXPECT_TRUE(admission.identity.may(Role::subscribe));
    EXPECT_EQ(_accounts->asked, 0);
    EXPECT_THAT(_log, IsEmpty());
}

TEST_F(GatekeeperTest, KnowsOneTrialPasswordOnly) {
    for (const char* credentials : {"trial:q", "trial:P", "trial:pp", "tria:lp", "Trial:p", "trial:p "}) {
        EXPECT_EQ(outcome({basic(credentials)}), "401") << credentials;
    }
}

TEST_F(GatekeeperTest, HasNoTrialUserUnlessThereIsOne) {
    _options.trialUser.clear();
    _options.trialPassword.clear();
    EXPECT_EQ(outcome({basic("trial:p")}), "401");
    EXPECT_EQ(outcome({basic(":")}), "401");
}

TEST_F(GatekeeperTest, AsksForCredentialsWhereThereAreNone) {
    const Admission admission = admit({});
    ASSERT_TRUE(admission.refusal.has_value());
    EXPECT_TRUE(admission.identity.isNobody());
    EXPECT_EQ(admission.refusal->status, 401U);
    EXPECT_EQ(fieldOf(*admission.refusal, "WWW-Authenticate"), "Basic realm=\"marlo\", charset=\"UTF-8\"");
    EXPECT_EQ(admission.refusal->body, "Unauthorized\n");
    EXPECT_EQ(admission.refusal->delay, 0ms);
    EXPECT_THAT(_log, IsEmpty()) << "many clients send none at first";
}

TEST_F(GatekeeperTest, QuotesTheRealm) {
    _options.realm = "a \"b\" \\ c\r\nd";
    EXPECT_EQ(fieldOf(*admit({}).refusal, "WWW-Authenticate"),
              "Basic realm=\"a \\\"b\\\" \\\\ c  d\", charset=\"UTF-8\"");
}

TEST_F(GatekeeperTest, TellsStrangersOneAndTheSame) {
    const Answer unknown = *admit({basic("nobody-known:x")}, tcpPeer("192.0.2.1")).refusal;
    const Answer wrong = *admit({basic("root:x")}, tcpPeer("192.0.2.2")).refusal;
    const Answer trial = *admit({basic("trial:x")}, tcpPeer("192.0.2.3")).refusal;
    const Answer roleless = *admit({basic("bin:good")}, tcpPeer("192.0.2.4")).refusal;
    for (const Answer* answer : {&unknown, &trial, &roleless}) {
        EXPECT_EQ(answer->status, wrong.status);
        EXPECT_EQ(answer->body, wrong.body);
        EXPECT_EQ(fieldOf(*answer, "WWW-Authenticate"), fieldOf(wrong, "WWW-Authenticate"));
        EXPECT_EQ(answer->fields.size(), wrong.fields.size());
    }
}

TEST_F(GatekeeperTest, RefusesFieldsThatAreNoBasicCredentials) {
    for (const std::string& value :
         {std::string(), std::string("Basic"), std::string("Basic !!!!"), std::string("Bearer abc"),
          std::string("Digest username=\"trial\""), std::string("Negotiate YII="), basic("trial"), basic("trial:"),
          basic("trial:p") + "=", basic(std::string("trial:p\0", 8)), std::string(100000, 'A')}) {
        const Admission admission = admit({value});
        ASSERT_TRUE(admission.refusal.has_value());
        EXPECT_EQ(admission.refusal->status, 401U);
        EXPECT_TRUE(admission.identity.isNobody());
    }
    EXPECT_EQ(_accounts->asked, 0);
}

TEST_F(GatekeeperTest, RefusesTwoFieldsEvenIfBothAreGood) {
    EXPECT_EQ(outcome({basic("trial:p"), basic("trial:p")}), "401");
    EXPECT_EQ(outcome({basic("trial:p"), ""}), "401");
    EXPECT_THAT(_log, ElementsAre(HasSubstr("more than one Authorization field"),
                                  HasSubstr("more than one Authorization field")));
}

TEST_F(GatekeeperTest, LetsAccountsInWithTheirRoles) {
    const Admission reader = admit({basic("daemon:good")});
    EXPECT_EQ(reader.identity.name(), "daemon");
    EXPECT_TRUE(reader.identity.may(Role::read));
    EXPECT_FALSE(reader.identity.may(Role::change));
    EXPECT_FALSE(reader.identity.may(Role::subscribe));
    EXPECT_TRUE(admit({basic("root:good")}).identity.may(Role::change));
    EXPECT_EQ(outcome({basic("daemon:bad")}), "401");
}

TEST_F(GatekeeperTest, AsksNothingAboutAccountsWithoutARole) {
    EXPECT_EQ(outcome({basic("bin:good")}), "401");
    EXPECT_EQ(outcome({basic("no-such-user:good")}), "401");
    EXPECT_EQ(_accounts->asked, 0);
}

TEST_F(GatekeeperTest, HasNoAccountsUnlessTold) {
    _options.accounts.reset();
    EXPECT_EQ(outcome({basic("root:good")}), "401");
    EXPECT_EQ(outcome({basic("trial:p")}), "trial");
}

TEST_F(GatekeeperTest, RemembersGoodCredentials) {
    for (int count = 0; count < 10; ++count) {
        EXPECT_EQ(outcome({basic("daemon:good")}), "daemon");
    }
    EXPECT_EQ(_accounts->asked, 1);
}

TEST_F(GatekeeperTest, RemembersNoBadCredentials) {
    EXPECT_EQ(outcome({basic("daemon:later")}), "401");
    _accounts->isTheGoodOne = "later";
    EXPECT_EQ(outcome({basic("daemon:later")}), "daemon");
}

TEST_F(GatekeeperTest, AsksAnewAfterAFailure) {
    outcome({basic("daemon:good")});
    outcome({basic("daemon:bad")});
    _accounts->isTheGoodOne = "changed";
    EXPECT_EQ(outcome({basic("daemon:good")}), "401");
    EXPECT_EQ(_accounts->asked, 3);
}

TEST_F(GatekeeperTest, TakesANewAccessAtOnce) {
    outcome({basic("daemon:good")});
    keeper().setAccess({{"root"}, {}, {"daemon"}});
    EXPECT_TRUE(admit({basic("daemon:good")}).identity.may(Role::subscribe));
    EXPECT_FALSE(admit({basic("root:good")}).identity.may(Role::change));
    keeper().setAccess({});
    EXPECT_EQ(outcome({basic("daemon:good")}), "401");
}

TEST_F(GatekeeperTest, DoesNotRememberRolesThatChangedMeanwhile) {
    _accounts->onAsked = [this] { keeper().setAccess({{"daemon"}, {}, {"daemon"}}); };
    EXPECT_FALSE(admit({basic("daemon:good")}).identity.may(Role::subscribe));
    _accounts->onAsked = nullptr;
    EXPECT_TRUE(admit({basic("daemon:good")}).identity.may(Role::subscribe));
}

TEST_F(GatekeeperTest, KeepsItsAccessWhenTheNewOneIsWrong) {
    EXPECT_THROW(keeper().setAccess({{"no-such-user"}, {}, {}}), std::runtime_error);
    EXPECT_EQ(outcome({basic("daemon:good")}), "daemon");
}

TEST_F(GatekeeperTest, TakesAccountsThatCannotTellForANo) {
    const Admission admission = admit({basic("daemon:throw")});
    ASSERT_TRUE(admission.refusal.has_value());
    EXPECT_EQ(admission.refusal->status, 401U);
    EXPECT_GT(admission.refusal->delay, 0ms);
    EXPECT_THAT(_log, testing::Contains(HasSubstr("the accounts are away")));
}

TEST_F(GatekeeperTest, HoldsAnswersToFailuresBack) {
    const auto first = admit({basic("root:x")}).refusal->delay;
    EXPECT_GT(first, 0ms);
    EXPECT_LE(first, 500ms);
    const auto second = admit({basic("root:x")}).refusal->delay;
    EXPECT_GT(second, 500ms);
    EXPECT_LE(second, 1500ms);
    EXPECT_LE(admit({basic("root:x")}, tcpPeer("192.0.2.2")).refusal->delay, 500ms);
    EXPECT_FALSE(admit({basic("root:good")}).refusal.has_value()) << "only failures are slow";
}

TEST_F(GatekeeperTest, CountsTheTimeOfTheCheckIn) {
    _options.failureDelay = 200ms;
    _accounts->onAsked = [] { std::this_thread::sleep_for(150ms); };
    EXPECT_LE(admit({basic("root:x")}).refusal->delay, 50ms);
}

TEST_F(GatekeeperTest, ShutsOutWhoFailsTooOften) {
    std::optional<Answer> last;
    int failures = 0;
    do {
        last = admit({basic("root:x")}).refusal;
    } while (last->status == 401 && ++failures < 100);
    EXPECT_EQ(last->status, 429U);
    EXPECT_EQ(fieldOf(*last, "WWW-Authenticate"), "none");
    EXPECT_GE(std::stoi(fieldOf(*last, "Retry-After")), 1);
    EXPECT_LE(std::stoi(fieldOf(*last, "Retry-After")), 5);
    EXPECT_EQ(_accounts->asked, failures);

    EXPECT_EQ(outcome({basic("root:good")}), "429") << "no way to tell a right guess from a wrong one";
    EXPECT_EQ(outcome({}), "401");
    EXPECT_EQ(outcome({basic("trial:p")}), "trial");
    EXPECT_EQ(outcome({basic("root:good")}, tcpPeer("192.0.2.2")), "root");
}

TEST_F(GatekeeperTest, LogsWhoWasRefused) {
    outcome({basic("ro\"ot:x")});
    outcome({basic(std::string(70, 'u') + "\xC3\xA9:x")});
    EXPECT_THAT(_log, ElementsAre("refused 192.0.2.1:4711: user \"ro\\x22ot\": wrong name or password",
                                  "refused 192.0.2.1:4711: user \"" + std::string(64, 'u') +
                                      "\"...: wrong name or password"));
}

TEST_F(GatekeeperTest, RefusesToBeMadeForUsersThatDoNotExist) {
    _options.access.change = {"@no-such-group"};
    EXPECT_THROW(keeper(), std::runtime_error);
}

TEST_F(GatekeeperTest, ServesManyThreads) {
    _options.failureDelay = 1ms;
    keeper();
    std::vector<std::thread> threads;
    std::atomic<int> wrong = 0;
    for (int number = 0; number < 4; ++number) {
        threads.emplace_back([&, number] {
            const Peer peer = tcpPeer("192.0.2." + std::to_string(number));
            for (int count = 0; count < 200; ++count) {
                wrong += outcome({basic("daemon:good")}, peer) != "daemon" ? 1 : 0;
                wrong += outcome({basic("trial:p")}, peer) != "trial" ? 1 : 0;
                wrong += outcome({basic("root:bad")}, peer) != "401" ? 1 : 0;
                keeper().setAccess({{"daemon"}, {"root"}, {}});
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(wrong, 0);
}

} // namespace

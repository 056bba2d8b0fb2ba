#include "host/security/Gatekeeper.h"
#include "tests/support/Namespace.h"

#include <atomic>
#include <chrono>
#include <functional>
#include <memory>
#include <mutex>
#include <optional>
#include <stdexcept>
#include <string>
#include <string_view>
#include <thread>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <openssl/evp.h>
#include <unistd.h>

namespace {

using namespace std::chrono_literals;
using marlo::http::Answer;
using marlo::http::Peer;
using marlo::http::RequestHead;
using marlo::http::Transport;
using marlo::security::Admission;
using marlo::security::Gatekeeper;
using marlo::security::GatekeeperOptions;
using marlo::security::PasswordCheck;
using marlo::security::Role;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

/** Accounts that all have the password "good". */
class Accounts final : public PasswordCheck {
  public:
    bool isGood(const std::string& user, const std::string& password) override {
        ++asked;
        if (onAsked) {
            onAsked();
        }
        if (password == "throw") {
            throw std::runtime_error("the accounts are away");
        }
        return !user.empty() && password == isTheGoodOne;
    }

    std::atomic<int> asked = 0;
    std::string isTheGoodOne = "good";
    std::function<void()> onAsked;
};

std::string basic(const std::string& text) {
    std::vector<unsigned char> encoded(text.size() * 2 + 8);
    const int length = EVP_EncodeBlock(encoded.data(), reinterpret_cast<const unsigned char*>(text.data()),
                                       static_cast<int>(text.size()));
    return "Basic " + std::string(encoded.begin(), encoded.begin() + length);
}

RequestHead headWith(const std::vector<std::string>& authorizations) {
    RequestHead head;
    head.method = "POST";
    head.target = "/cimom";
    head.fields = {{"Host", "localhost"}};
    for (const std::string& value : authorizations) {
        head.fields.push_back({"authorization", value});
    }
    return head;
}

Peer tcpPeer(const std::string& address = "192.0.2.1") {
    Peer peer;
    peer.address = address;
    peer.port = 4711;
    return peer;
}

Peer localPeer(std::optional<unsigned> user) {
    Peer peer;
    peer.transport = Transport::local;
    peer.address = "local";
    peer.userId = user;
    return peer;
}

Peer tlsPeer(const std::string& commonName) {
    Peer peer = tcpPeer();
    peer.transport = Transport::tls;
    peer.commonName = commonName;
    return peer;
}

std::string fieldOf(const Answer& answer, std::string_view name) {
    for (const auto& field : answer.fields) {
        if (field.name == name) {
            return field.value;
        }
    }
    return "none";
}

class GatekeeperTest : public testing::Test {
  protected:
    GatekeeperTest() {
        _options.accounts = _accounts;
        _options.access = {{"daemon"}, {"root"}, {}};
        _options.trialUser = "trial";
        _options.trialPassword = "p";
    }

    Gatekeeper& keeper() {
        if (!_keeper) {
            _keeper = std::make_unique<Gatekeeper>(_options, [this](const std::string& line) {
                const std::lock_guard<std::mutex> lock(_logMutex);
                _log.push_back(line);
            });
        }
        return *_keeper;
    }

    Admission admit(const std::vector<std::string>& authorizations, const Peer& peer = tcpPeer()) {
        return keeper().admit(headWith(authorizations), peer);
    }

    /** Who is let in, or the status of the refusal. */
    std::string outcome(const std::vector<std::string>& authorizations, const Peer& peer = tcpPeer()) {
        return outcomeOf(admit(authorizations, peer));
    }

    static std::string outcomeOf(const Admission& admission) {
        if (!admission.refusal) {
            return admission.identity.name();
        }
        EXPECT_TRUE(admission.identity.isNobody());
        return std::to_string(admission.refusal->status);
    }

    std::shared_ptr<Accounts> _accounts = std::make_shared<Accounts>();
    GatekeeperOptions _options;
    std::vector<std::string> _log;

  private:
    std::mutex _logMutex;
    std::unique_ptr<Gatekeeper> _keeper;
};

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

TEST_F(GatekeeperTest, KnowsLocalPeersByTheirUserId) {
    const Admission root = admit({}, localPeer(0));
    EXPECT_EQ(root.identity.name(), "root");
    EXPECT_TRUE(root.identity.may(Role::change));
    EXPECT_TRUE(root.identity.may(Role::subscribe));
    EXPECT_TRUE(admit({}, localPeer(geteuid())).identity.may(Role::change));
    const Admission daemon = admit({}, localPeer(1));
    EXPECT_EQ(daemon.identity.name(), "daemon");
    EXPECT_TRUE(daemon.identity.may(Role::read));
    EXPECT_FALSE(daemon.identity.may(Role::change));
    EXPECT_EQ(_accounts->asked, 0);
}

TEST_F(GatekeeperTest, RefusesLocalPeersWithoutARole) {
    EXPECT_EQ(outcome({}, localPeer(2)), "401");
    EXPECT_EQ(outcome({}, localPeer(4294967294U)), "401");
    EXPECT_EQ(outcome({}, localPeer(std::nullopt)), "401");
    EXPECT_EQ(outcome({basic("trial:p")}, localPeer(2)), "401") << "nobody is asked for a name here";
    EXPECT_EQ(_log.size(), 4U);
}

TEST_F(GatekeeperTest, KnowsCertificatesByTheirCommonName) {
    const Admission admission = admit({}, tlsPeer("daemon"));
    EXPECT_EQ(admission.identity.name(), "daemon");
    EXPECT_FALSE(admission.identity.may(Role::change));
    EXPECT_EQ(outcome({}, tlsPeer("bin")), "401");
    EXPECT_EQ(outcome({}, tlsPeer("no-such-user")), "401");
    EXPECT_EQ(outcome({}, tlsPeer("trial")), "401");
    EXPECT_EQ(outcome({}, tlsPeer("")), "401");
}

TEST_F(GatekeeperTest, KnowsNoCertificateWithoutTls) {
    Peer peer = tlsPeer("root");
    peer.transport = Transport::tcp;
    EXPECT_EQ(outcome({}, peer), "401");
}

TEST_F(GatekeeperTest, GoesByTheFieldWhereThereIsACertificateToo) {
    EXPECT_EQ(outcome({basic("root:good")}, tlsPeer("daemon")), "root");
    EXPECT_EQ(outcome({basic("root:bad")}, tlsPeer("daemon")), "401");
    EXPECT_EQ(outcome({"Bearer x"}, tlsPeer("daemon")), "401");
}

TEST_F(GatekeeperTest, KnowsNoUserIdBeyondTheLocalSocket) {
    Peer peer = tcpPeer();
    peer.userId = 0;
    EXPECT_EQ(outcome({}, peer), "401");
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

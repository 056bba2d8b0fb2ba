/**
 * @file
 * A gatekeeper over accounts of the test's own, and the requests that it is asked about.
 */
#pragma once

#include "host/security/Gatekeeper.h"

#include <atomic>
#include <functional>
#include <memory>
#include <mutex>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include <gtest/gtest.h>
#include <openssl/evp.h>

namespace marlo::test {

/** Accounts that all have the password "good". */
class Accounts final : public security::PasswordCheck {
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

/** The value of the field Authorization for "NAME:PASSWORD". */
inline std::string basic(const std::string& text) {
    std::vector<unsigned char> encoded(text.size() * 2 + 8);
    const int length = EVP_EncodeBlock(encoded.data(), reinterpret_cast<const unsigned char*>(text.data()),
                                       static_cast<int>(text.size()));
    return "Basic " + std::string(encoded.begin(), encoded.begin() + length);
}

inline http::RequestHead headWith(const std::vector<std::string>& authorizations) {
    http::RequestHead head;
    head.method = "POST";
    head.target = "/cimom";
    head.fields = {{"Host", "localhost"}};
    for (const std::string& value : authorizations) {
        head.fields.push_back({"authorization", value});
    }
    return head;
}

inline http::Peer tcpPeer(const std::string& address = "192.0.2.1") {
    http::Peer peer;
    peer.address = address;
    peer.port = 4711;
    return peer;
}

/** The value of a field of an answer; "none" where it has no such. */
inline std::string fieldOf(const http::Answer& answer, std::string_view name) {
    for (const auto& field : answer.fields) {
        if (field.name == name) {
            return field.value;
        }
    }
    return "none";
}

/** A gatekeeper whose options a test may change before it first calls for it. */
class GatekeeperTest : public testing::Test {
  protected:
    GatekeeperTest() {
        _options.accounts = _accounts;
        _options.access = {{"daemon"}, {"root"}, {}};
        _options.trialUser = "trial";
        _options.trialPassword = "p";
    }

    security::Gatekeeper& keeper() {
        if (!_keeper) {
            _keeper = std::make_unique<security::Gatekeeper>(_options, [this](const std::string& line) {
                const std::lock_guard<std::mutex> lock(_logMutex);
                _log.push_back(line);
            });
        }
        return *_keeper;
    }

    security::Admission admit(const std::vector<std::string>& authorizations, const http::Peer& peer = tcpPeer()) {
        return keeper().admit(headWith(authorizations), peer);
    }

    /** Who is let in, or the status of the refusal. */
    std::string outcome(const std::vector<std::string>& authorizations, const http::Peer& peer = tcpPeer()) {
        return outcomeOf(admit(authorizations, peer));
    }

    static std::string outcomeOf(const security::Admission& admission) {
        if (!admission.refusal) {
            return admission.identity.name();
        }
        EXPECT_TRUE(admission.identity.isNobody());
        return std::to_string(admission.refusal->status);
    }

    std::shared_ptr<Accounts> _accounts = std::make_shared<Accounts>();
    security::GatekeeperOptions _options;
    std::vector<std::string> _log;

  private:
    std::mutex _logMutex;
    std::unique_ptr<security::Gatekeeper> _keeper;
};

} // namespace marlo::test

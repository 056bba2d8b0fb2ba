/**
 * @file
 * Tells who is asking from what a request brings along.
 */
#pragma once

#include "host/http/Message.h"
#include "host/security/Identity.h"

#include <chrono>
#include <cstddef>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace marlo::security {

/** Users, and groups of the system as "@name"; "*" is everyone who has an account. All of them have to exist. */
struct Access {
    std::vector<std::string> read;
    std::vector<std::string> change;    ///< may read as well
    std::vector<std::string> subscribe; ///< may read as well
};

/**
 * Whether a name and a password are of an account that may log in. May take its time, and should not tell by it; any
 * thread. What it throws counts as no, and is logged.
 */
class PasswordCheck {
  public:
    virtual ~PasswordCheck() = default;
    [[nodiscard]] virtual bool isGood(const std::string& user, const std::string& password) = 0;

  protected:
    PasswordCheck() = default;
    PasswordCheck(const PasswordCheck&) = default;
    PasswordCheck& operator=(const PasswordCheck&) = default;
};

/**
 * The accounts of the system, through PAM (pam(3)) with a service's rules for "auth" and "account", from /etc/pam.d
 * unless a directory is named. One question at a time in the whole process: modules need not be fit for threads.
 */
std::unique_ptr<PasswordCheck> makePamCheck(const std::string& service, const std::string& directory = {});

struct GatekeeperOptions {
    Access access;
    std::shared_ptr<PasswordCheck> accounts; ///< none: no system accounts
    std::size_t mostWaiting = 4;             ///< requests that wait for the accounts at once, each with a worker
    std::string trialUser;                   ///< with the password below it may do everything; empty: there is none
    std::string trialPassword;
    std::string realm = "marlo";
    std::chrono::milliseconds failureDelay{500}; ///< of the first failure of a peer; grows with each
};

/** What came of looking at a request. */
struct Admission {
    Identity identity; ///< nobody where `refusal` is set
    /** 401 with WWW-Authenticate; 429 with Retry-After after too many failures; 503 with it, for now, see below. */
    std::optional<http::Answer> refusal;
};

/**
 * The one place where an identity comes from. On TCP and TLS: Basic credentials (RFC 7617) of one well-formed
 * Authorization field; where there is no such field, a verified client certificate whose common name is a user. On a
 * Unix domain socket: the peer's user id; root and the user that the server runs as may do everything, others what
 * the access says. Who has an account but no role is refused like a stranger.
 *
 * The answers to wrong credentials are held back (http::Answer::delay), those of one peer one after the other: the
 * first by `failureDelay`, the next ones by up to eight times as much, forgiven one a minute. A peer whose answers
 * pile up is answered 429 without a look at what it brings, unless it is the trial password. What was good at an
 * account is remembered for half a minute.
 *
 * Accounts are asked one question at a time, and may take theirs. While as many wait for them as may, others are
 * answered 503 for now (http::Answer::isForNow): whoever does not need the accounts gets in meanwhile. That goes for
 * names without a role as well, or it would tell who has one. Any thread; waits for nothing but the accounts.
 */
class Gatekeeper {
  public:
    /** `log` is called from any thread. Throws std::runtime_error for a user or group that does not exist. */
    Gatekeeper(GatekeeperOptions options, std::function<void(const std::string&)> log);
    ~Gatekeeper();
    Gatekeeper(const Gatekeeper&) = delete;
    Gatekeeper& operator=(const Gatekeeper&) = delete;

    /** Refusals of whoever brought something are logged, with peer and user. */
    [[nodiscard]] Admission admit(const http::RequestHead& head, const http::Peer& peer);

    /** Whether a user who was admitted, by this name, at some time or other has a role now. */
    [[nodiscard]] bool may(const std::string& user, Role role) const;

    /** Other users from now on. Throws as the constructor does, and keeps what it had. */
    void setAccess(const Access& access);

  private:
    struct State;
    std::unique_ptr<State> _state;
};

/** A password of 128 random bits in letters and digits, for a session of trying things. */
std::string makePassword();

} // namespace marlo::security

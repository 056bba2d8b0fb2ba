#include "host/security/Gatekeeper.h"

#include "host/security/AccessList.h"
#include "host/security/Credentials.h"
#include "host/security/PasswordCache.h"
#include "host/security/Secret.h"
#include "host/security/Throttle.h"

#include <algorithm>
#include <atomic>
#include <chrono>
#include <cstdio>
#include <exception>
#include <mutex>
#include <string_view>

#include <unistd.h>

namespace marlo::security {

namespace {

constexpr std::size_t longestLoggedName = 64;

/** In quotes, in one line, in ASCII: what a stranger sent must not look like a line of the log. */
std::string shown(std::string_view name) {
    std::string text = "\"";
    for (const char character : name.substr(0, longestLoggedName)) {
        if (character >= 0x20 && character < 0x7F && character != '"' && character != '\\') {
            text += character;
        } else {
            char escape[5];
            static_cast<void>(std::snprintf(escape, sizeof escape, "\\x%02x",
                                            static_cast<unsigned>(static_cast<unsigned char>(character))));
            text += escape;
        }
    }
    return text + (name.size() > longestLoggedName ? "\"..." : "\"");
}

/** As a quoted-string (RFC 9110, 5.6.4). */
std::string quoted(std::string_view text) {
    std::string result = "\"";
    for (const char character : text) {
        if (character == '"' || character == '\\') {
            result += '\\';
        }
        result += static_cast<unsigned char>(character) < 0x20 ? ' ' : character;
    }
    return result + '"';
}

http::Answer plainAnswer(unsigned status, const char* body) {
    http::Answer answer;
    answer.status = status;
    answer.fields = {{"Content-Type", "text/plain; charset=utf-8"}};
    answer.body = body;
    return answer;
}

/** One of a few who may wait for something at once. */
class Place {
  public:
    Place(std::atomic<std::size_t>& taken, std::size_t most) : _taken(taken), _isGood(taken++ < most) {}

    ~Place() { --_taken; }

    Place(const Place&) = delete;
    Place& operator=(const Place&) = delete;

    [[nodiscard]] bool isGood() const { return _isGood; }

  private:
    std::atomic<std::size_t>& _taken;
    const bool _isGood;
};

Identity withAllRoles(const std::string& name) {
    return {name, {Role::read, Role::change, Role::subscribe}};
}

} // namespace

struct Gatekeeper::State {
    State(GatekeeperOptions& options, std::function<void(const std::string&)>&& sink)
        : accounts(std::move(options.accounts)),
          mostWaiting(options.mostWaiting),
          trialUser(std::move(options.trialUser)),
          trial(trialUser.empty() ? Digest() : digester.of({trialUser, options.trialPassword})),
          challenge("Basic realm=" + quoted(options.realm) + ", charset=\"UTF-8\""),
          log(std::move(sink)),
          throttle(options.failureDelay),
          access(std::make_shared<const AccessList>(options.access)) {
        wipe(options.trialPassword);
    }

    Admission admitLocal(const http::Peer& peer) const;
    Admission admitCertificate(const http::Peer& peer) const;
    Admission admitField(std::string_view field, const http::Peer& peer);
    Admission admitCredentials(const Credentials& credentials, const http::Peer& peer);

    /** Nobody when they are not good. Waits until those who came before have asked. */
    Identity identify(const Credentials& credentials, const Digest& digest);
    Identity askAccounts(const Credentials& credentials, const Digest& digest);
    [[nodiscard]] bool isGood(const Credentials& credentials) const;
    [[nodiscard]] Identity localIdentity(uid_t user) const;
    [[nodiscard]] std::shared_ptr<const AccessList> currentAccess() const;

    [[nodiscard]] Admission refuse() const;
    [[nodiscard]] Admission refuse(const http::Peer& peer, const std::string& reason) const;
    [[nodiscard]] static Admission shutOut(Clock::duration away);
    [[nodiscard]] static Admission putOff();
    [[nodiscard]] Admission identified(Identity&& identity, const http::Peer& peer, const std::string& reason) const;

    const std::shared_ptr<PasswordCheck> accounts;
    const std::size_t mostWaiting;
    const Digester digester;
    const std::string trialUser;
    const Digest trial; ///< of the trial user's credentials
    const std::string challenge;
    const std::function<void(const std::string&)> log;
    const uid_t ownUser = geteuid();
    Throttle throttle;
    PasswordCache cache;
    std::atomic<std::size_t> waiting{0};
    std::mutex asking;              ///< held while the accounts are asked
    mutable std::mutex accessMutex; ///< guards the one below
    std::shared_ptr<const AccessList> access;
};

Admission Gatekeeper::State::refuse() const {
    http::Answer answer = plainAnswer(401, "Unauthorized\n");
    answer.fields.push_back({"WWW-Authenticate", challenge});
    return {Identity(), std::move(answer)};
}

Admission Gatekeeper::State::refuse(const http::Peer& peer, const std::string& reason) const {
    log("refused " + peer.toString() + ": " + reason);
    return refuse();
}

Admission Gatekeeper::State::shutOut(Clock::duration away) {
    http::Answer answer = plainAnswer(429, "Too Many Requests\n");
    answer.fields.push_back({"Retry-After", std::to_string(std::chrono::ceil<std::chrono::seconds>(away).count())});
    return {Identity(), std::move(answer)};
}

Admission Gatekeeper::State::putOff() {
    http::Answer answer = plainAnswer(503, "Service Unavailable\n");
    answer.fields.push_back({"Retry-After", "1"});
    answer.isForNow = true;
    return {Identity(), std::move(answer)};
}

Admission Gatekeeper::State::identified(Identity&& identity, const http::Peer& peer,
                                        const std::string& reason) const {
    return identity.isNobody() ? refuse(peer, reason) : Admission{std::move(identity), std::nullopt};
}

std::shared_ptr<const AccessList> Gatekeeper::State::currentAccess() const {
    const std::lock_guard<std::mutex> lock(accessMutex);
    return access;
}

Identity Gatekeeper::State::localIdentity(uid_t user) const {
    const std::optional<Account> account = findAccount(user);
    if (user == 0 || user == ownUser) {
        return withAllRoles(account ? account->name : "uid " + std::to_string(user));
    }
    return account ? currentAccess()->identityOf(*account) : Identity();
}

Admission Gatekeeper::State::admitLocal(const http::Peer& peer) const {
    if (!peer.userId) {
        return refuse(peer, "a local peer without a user id");
    }
    return identified(localIdentity(*peer.userId), peer, "a user without a role");
}

Admission Gatekeeper::State::admitCertificate(const http::Peer& peer) const {
    if (peer.transport != http::Transport::tls || !peer.commonName || peer.commonName->empty()) {
        return refuse();
    }
    return identified(currentAccess()->identityOf(*peer.commonName), peer,
                      "certificate of " + shown(*peer.commonName) + ": a user without an account or a role");
}

bool Gatekeeper::State::isGood(const Credentials& credentials) const {
    try {
        return accounts->isGood(credentials.user, credentials.password);
    } catch (const std::exception& error) {
        log("no answer about user " + shown(credentials.user) + ": " + error.what());
        return false;
    }
}

Identity Gatekeeper::State::askAccounts(const Credentials& credentials, const Digest& digest) {
    const std::shared_ptr<const AccessList> list = currentAccess();
    Identity identity = list->identityOf(credentials.user);
    if (identity.isNobody() || !isGood(credentials)) {
        cache.forget(credentials.user);
        return {};
    }
    const std::lock_guard<std::mutex> lock(accessMutex);
    if (list == access) { // else these roles are out of date already
        cache.keep(credentials.user, digest, identity, Clock::now());
    }
    return identity;
}

Identity Gatekeeper::State::identify(const Credentials& credentials, const Digest& digest) {
    if (!accounts) {
        return {};
    }
    const std::lock_guard<std::mutex> lock(asking);
    // Clients with many connections come with all at once: the answer to the first one is good for the others.
    if (std::optional<Identity> known = cache.find(credentials.user, digest, Clock::now())) {
        return *std::move(known);
    }
    return askAccounts(credentials, digest);
}

Admission Gatekeeper::State::admitCredentials(const Credentials& credentials, const http::Peer& peer) {
    const Clock::time_point since = Clock::now();
    const Digest digest = digester.of({credentials.user, credentials.password});
    if (!trialUser.empty() && equal(digest, trial)) {
        return {withAllRoles(trialUser), std::nullopt}; // nobody guesses it, so it is never shut out
    }
    const std::string key = peerKey(peer.address);
    if (const Clock::duration away = throttle.shutOut(key, since); away.count() > 0) {
        return shutOut(away);
    }
    if (std::optional<Identity> known = cache.find(credentials.user, digest, since)) {
        return {*std::move(known), std::nullopt};
    }
    const Place place(waiting, mostWaiting);
    if (!place.isGood()) {
        return putOff();
    }
    Identity identity = identify(credentials, digest);
    if (!identity.isNobody()) {
        return {std::move(identity), std::nullopt};
    }
    Admission refusal = refuse(peer, "user " + shown(credentials.user) + ": wrong name or password");
    // Counted from when they came: how long a check took does not show.
    const Clock::duration delay = throttle.fail(key, since) - Clock::now();
    refusal.refusal->delay =
        std::max(std::chrono::ceil<std::chrono::milliseconds>(delay), std::chrono::milliseconds(0));
    return refusal;
}

Admission Gatekeeper::State::admitField(std::string_view field, const http::Peer& peer) {
    Credentials credentials;
    const std::string_view reason = readBasic(field, credentials);
    return reason.empty() ? admitCredentials(credentials, peer) : refuse(peer, std::string(reason));
}

Gatekeeper::Gatekeeper(GatekeeperOptions options, std::function<void(const std::string&)> log)
    : _state(std::make_unique<State>(options, std::move(log))) {}

Gatekeeper::~Gatekeeper() = default;

Admission Gatekeeper::admit(const http::RequestHead& head, const http::Peer& peer) {
    try {
        if (peer.transport == http::Transport::local) {
            return _state->admitLocal(peer);
        }
        const std::vector<std::string_view> fields = head.values("Authorization");
        if (fields.empty()) {
            return _state->admitCertificate(peer);
        }
        return fields.size() == 1 ? _state->admitField(fields.front(), peer)
                                  : _state->refuse(peer, "more than one Authorization field");
    } catch (const std::exception& error) {
        return _state->refuse(peer, error.what());
    }
}

bool Gatekeeper::may(const std::string& user, Role role) const {
    const bool mayEverything = (!_state->trialUser.empty() && user == _state->trialUser) ||
                               user == _state->localIdentity(0).name() ||
                               user == _state->localIdentity(_state->ownUser).name();
    return mayEverything || _state->currentAccess()->identityOf(user).may(role);
}

void Gatekeeper::setAccess(const Access& access) {
    auto list = std::make_shared<const AccessList>(access);
    const std::lock_guard<std::mutex> lock(_state->accessMutex);
    _state->access = std::move(list);
    _state->cache.clear();
}

} // namespace marlo::security

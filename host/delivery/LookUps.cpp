#include "host/delivery/LookUps.h"

#include "host/model/Instance.h"

#include <array>
#include <deque>
#include <mutex>
#include <system_error>
#include <thread>
#include <utility>

#include <netdb.h>
#include <sys/socket.h>

namespace marlo::delivery {
namespace {

constexpr int atOnce = 16;

struct Free {
    void operator()(addrinfo* list) const { ::freeaddrinfo(list); }
};

std::string lookUp(const std::string& host, std::vector<std::string>& addresses) {
    addrinfo hints{};
    hints.ai_socktype = SOCK_STREAM;
    hints.ai_flags = AI_ADDRCONFIG;
    addrinfo* list = nullptr;
    if (const int result = ::getaddrinfo(host.c_str(), nullptr, &hints, &list); result != 0) {
        if (equalNames(host, "localhost")) { // on a host whose files do not say what it is (RFC 6761)
            addresses = {"127.0.0.1", "::1"};
            return {};
        }
        return "no address of " + host + ": " + ::gai_strerror(result);
    }
    const std::unique_ptr<addrinfo, Free> owner(list);
    for (const addrinfo* each = list; each != nullptr; each = each->ai_next) {
        std::array<char, NI_MAXHOST> text{};
        if (::getnameinfo(each->ai_addr, each->ai_addrlen, text.data(), text.size(), nullptr, 0, NI_NUMERICHOST) ==
            0) {
            addresses.emplace_back(text.data());
        }
    }
    return addresses.empty() ? "no address of " + host : std::string();
}

bool isNumeric(const std::string& host) {
    addrinfo hints{};
    hints.ai_flags = AI_NUMERICHOST;
    addrinfo* list = nullptr;
    if (::getaddrinfo(host.c_str(), nullptr, &hints, &list) != 0) {
        return false;
    }
    ::freeaddrinfo(list);
    return true;
}

} // namespace

/** Shared with threads that nobody waits for. */
struct LookUps::State {
    explicit State(Post itsPost) : post(std::move(itsPost)) {}

    std::mutex mutex; ///< guards all below; held while an answer is given
    Post post;        ///< empty: nobody is interested any more
    int running = 0;
    std::deque<std::pair<std::string, Done>> waiting;
};

LookUps::LookUps(Post post) : _state(std::make_shared<State>(std::move(post))) {}

LookUps::~LookUps() {
    const std::lock_guard lock(_state->mutex);
    _state->post = nullptr;
    _state->waiting.clear();
}

void LookUps::find(const std::string& host, Done done) {
    const std::lock_guard lock(_state->mutex);
    if (isNumeric(host)) {
        _state->post([host, done = std::move(done)] { done({host}, {}); });
    } else if (_state->running == atOnce) {
        _state->waiting.emplace_back(host, std::move(done));
    } else {
        begin(_state, host, std::move(done));
    }
}

void LookUps::begin(const std::shared_ptr<State>& state, std::string host, Done done) {
    try {
        std::thread(work, state, host, done).detach();
        ++state->running;
    } catch (const std::system_error& error) {
        state->post([done = std::move(done), why = std::string(error.what())] { done({}, "no thread: " + why); });
    }
}

void LookUps::work(const std::shared_ptr<State>& state, std::string host, Done done) {
    std::vector<std::string> addresses;
    std::string problem = lookUp(host, addresses);
    const std::lock_guard lock(state->mutex);
    --state->running;
    if (!state->post) {
        return;
    }
    state->post([done = std::move(done), addresses = std::move(addresses), problem = std::move(problem)] {
        done(addresses, problem);
    });
    if (!state->waiting.empty()) {
        auto [next, nextDone] = std::move(state->waiting.front());
        state->waiting.pop_front();
        begin(state, std::move(next), std::move(nextDone));
    }
}

} // namespace marlo::delivery

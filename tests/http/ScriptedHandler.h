/**
 * @file
 * A handler that does what a test says. Unless told otherwise it admits everybody and answers with what it was asked.
 */
#pragma once

#include "host/http/Server.h"

#include <atomic>
#include <condition_variable>
#include <functional>
#include <mutex>
#include <string>
#include <vector>

namespace marlo::http {

/** A door that is shut until a test opens it. */
class Gate {
  public:
    void open() {
        const std::lock_guard lock(_mutex);
        _isOpen = true;
        _changed.notify_all();
    }

    void pass() {
        std::unique_lock lock(_mutex);
        ++_waiting;
        _changed.notify_all();
        _changed.wait(lock, [this] { return _isOpen; });
    }

    /** Until so many have come to the door. */
    bool awaitWaiting(int count) {
        std::unique_lock lock(_mutex);
        return _changed.wait_for(lock, std::chrono::seconds(20), [this, count] { return _waiting >= count; });
    }

  private:
    std::mutex _mutex;
    std::condition_variable _changed;
    int _waiting = 0;
    bool _isOpen = false;
};

class ScriptedHandler : public Handler {
  public:
    std::function<std::optional<Answer>(const RequestHead&, const Peer&, std::any&)> onAdmit;
    std::function<void(Request&&, Responder&)> onHandle;
    std::function<void()> onRefuse;

    std::optional<Answer> admit(const RequestHead& head, const Peer& peer, std::any& admission) override {
        return onAdmit ? onAdmit(head, peer, admission) : std::nullopt;
    }

    void handle(Request&& request, Responder& responder) override {
        if (onHandle) {
            onHandle(std::move(request), responder);
            return;
        }
        responder.send({200, {}, request.head.method + " " + request.head.target + " " + request.body, false, {}});
    }

    Answer refuse(unsigned status, const std::string& reason) override {
        if (onRefuse) {
            onRefuse();
        }
        return {status, {{"Content-Type", "text/plain"}}, reason, false, {}};
    }
};

/** What a server logged. */
class Lines {
  public:
    Server::Log sink() {
        return [this](const std::string& line) {
            const std::lock_guard lock(_mutex);
            _lines.push_back(line);
        };
    }

    std::vector<std::string> all() const {
        const std::lock_guard lock(_mutex);
        return _lines;
    }

    std::size_t count(const std::string& text) const {
        const auto lines = all();
        return static_cast<std::size_t>(std::count_if(lines.begin(), lines.end(), [&text](const std::string& line) {
            return line.find(text) != std::string::npos;
        }));
    }

  private:
    mutable std::mutex _mutex;
    std::vector<std::string> _lines;
};

} // namespace marlo::http

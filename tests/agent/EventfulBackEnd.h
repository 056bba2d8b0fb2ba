/**
 * @file
 * A back end that reports the events that a test posts.
 */
#pragma once

#include "tests/agent/FakeBackEnd.h"

#include <atomic>
#include <mutex>

namespace Orv::Test {

class EventfulBackEnd : public FakeBackEnd {
  public:
    std::unique_ptr<Agent::EventWatch> watch(Agent::EventSink& sink) override {
        if (refuses) {
            throw std::runtime_error("nothing is to be seen");
        }
        return std::make_unique<Watch>(*this, sink);
    }

    /** Nothing while nobody watches. */
    void post(const Agent::Event& event) {
        const std::lock_guard lock(_mutex);
        if (_sink != nullptr) {
            _sink->post(event);
        }
    }

    void postStatus(const std::string& name, unsigned int status, Agent::EventCode code = Agent::EventCode::status) {
        post(eventOf(name, status, code));
    }

    [[nodiscard]] bool isWatched() {
        const std::lock_guard lock(_mutex);
        return _sink != nullptr;
    }

    /** An event of an adapter below one device. */
    static Agent::Event eventOf(const std::string& name, unsigned int status,
                                Agent::EventCode code = Agent::EventCode::status) {
        return {code,
                std::chrono::system_clock::now(),
                makeNode("a:" + name, "d:" + name, NodeLexicon::NODE_NETWORK_ADAPTER, name,
                         {{NodeLexicon::PROP_NODE_STRING, name}, {NodeLexicon::PROP_STATUS, status}}),
                {makeNode("d:" + name, "", std::nullopt, "Device")}};
    }

    std::atomic<bool> refuses{false};
    std::atomic<int> failures{0}; ///< so often collecting will fail

  private:
    class Watch : public Agent::EventWatch {
      public:
        Watch(EventfulBackEnd& backEnd, Agent::EventSink& sink) : _backEnd(backEnd) {
            const std::lock_guard lock(_backEnd._mutex);
            _backEnd._sink = &sink;
        }

        ~Watch() override {
            const std::lock_guard lock(_backEnd._mutex);
            _backEnd._sink = nullptr;
        }

        [[nodiscard]] int descriptor() const override { return -1; }

        void collect() override {
            if (_backEnd.failures > 0) {
                --_backEnd.failures;
                throw std::runtime_error("nothing can be collected");
            }
        }

      private:
        EventfulBackEnd& _backEnd;
    };

    std::mutex _mutex; ///< guards _sink
    Agent::EventSink* _sink = nullptr;
};

} // namespace Orv::Test

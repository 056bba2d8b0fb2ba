// The monitor over a back end whose events the test posts.
#include "agent/events/Monitor.h"
#include "tests/agent/EventReader.h"
#include "tests/agent/FakeBackEnd.h"

#include <atomic>
#include <filesystem>
#include <stdexcept>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace Orv::Agent;
using namespace Orv::NodeLexicon;
using namespace std::chrono_literals;
using Orv::Test::Collection;
using Orv::Test::EventReader;
using Orv::Test::makeNode;
using Orv::Test::readEvent;
using Orv::Test::SeenEvent;
using testing::ElementsAre;

/** A back end that reports what a test posts through it. */
class EventfulBackEnd : public Orv::Test::FakeBackEnd {
  public:
    std::unique_ptr<EventWatch> watch(EventSink& sink) override {
        ++watches;
        return std::make_unique<Watch>(*this, sink);
    }

    void post(const Event& event) {
        const std::lock_guard lock(_mutex);
        if (_sink != nullptr) {
            _sink->post(event);
        }
    }

    void postStatus(const std::string& name, unsigned int status, EventCode code = EventCode::status) {
        post({code, std::chrono::system_clock::now(), node(name, status), {makeNode("d:" + name, "", std::nullopt)}});
    }

    static Tree::NodePointer node(const std::string& name, unsigned int status) {
        return makeNode("a:" + name, "d:" + name, NODE_NETWORK_ADAPTER, name,
                        {{PROP_NODE_STRING, name}, {PROP_STATUS, status}});
    }

    std::atomic<int> watches{0};
    std::atomic<bool> fails{false};

  private:
    class Watch : public EventWatch {
      public:
        Watch(EventfulBackEnd& backEnd, EventSink& sink) : _backEnd(backEnd) {
            const std::lock_guard lock(_backEnd._mutex);
            _backEnd._sink = &sink;
        }

        ~Watch() override {
            const std::lock_guard lock(_backEnd._mutex);
            _backEnd._sink = nullptr;
        }

        [[nodiscard]] int descriptor() const override { return -1; }

        void collect() override {
            if (_backEnd.fails) {
                throw std::runtime_error("nothing can be collected");
            }
        }

      private:
        EventfulBackEnd& _backEnd;
    };

    std::mutex _mutex;
    EventSink* _sink = nullptr;
};

struct MonitorTest : testing::Test {
    Monitor::Key key(std::uintptr_t callback) const { return {NODE_NETWORK_ADAPTER, callback, this}; }

    Handover::Report report() {
        return [this](int level, const std::string& text) { reports.add(std::to_string(level) + ' ' + text); };
    }

    Collection<std::string> reports;
    EventfulBackEnd backEnd;
    Monitor monitor{backEnd, report()};
};

TEST_F(MonitorTest, HandsOverTenThousandEventsToAReceiverWithRoomForOne) {
    EventReader reader(backEnd, monitor);
    std::vector<SeenEvent> expected;
    for (unsigned int i = 0; i < 10000; ++i) {
        const std::string name = "eth" + std::to_string(i % 7);
        backEnd.postStatus(name, i);
        expected.push_back({name, i, EventCode::status});
    }
    EXPECT_EQ(reader.seen.await(expected.size()), expected);
    EXPECT_THAT(reports.now(), ElementsAre());
}

} // namespace

#include "instrumentation/LumLog.h"

#include "agent/library/Log.h"

#include <memory>
#include <utility>

namespace LumLog {

using Orv::Agent::Log;

/** The text, and the next of the states that wait to be used again. Hidden: its class is exported, this is not. */
struct __attribute__((visibility("hidden"))) LumMessageBuffer::State {
    std::string text;
    std::unique_ptr<State> next;

    /**
     * States of ended buffers, for the next ones on the same thread: most lines are discarded, and should not cost
     * an allocation first.
     */
    class Pool {
      public:
        ~Pool() { isGone = true; }

        std::unique_ptr<State> take() {
            if (_first == nullptr) {
                return std::make_unique<State>();
            }
            auto state = std::move(_first);
            _first = std::move(state->next);
            --_count;
            return state;
        }

        void put(std::unique_ptr<State> state) {
            if (_count == capacity) {
                return;
            }
            state->text.clear();
            state->next = std::move(_first);
            _first = std::move(state);
            ++_count;
        }

        /** True on a thread that has destroyed its pool and is about to end. */
        static thread_local bool isGone;

      private:
        static constexpr int capacity = 4;

        std::unique_ptr<State> _first;
        int _count = 0;
    };

    static Pool& pool() {
        thread_local Pool pool;
        return pool;
    }
};

thread_local bool LumMessageBuffer::State::Pool::isGone = false;

LumMessageBuffer::LumMessageBuffer()
    : _state((State::Pool::isGone ? std::make_unique<State>() : State::pool().take()).release()) {}

LumMessageBuffer::~LumMessageBuffer() {
    std::unique_ptr<State> state(_state);
    if (!State::Pool::isGone) {
        State::pool().put(std::move(state));
    }
}

LumMessageBuffer& LumMessageBuffer::operator<<(const char* text) {
    if (text != nullptr) {
        _state->text += text;
    }
    return *this;
}

std::string LumMessageBuffer::str(LumMessageBuffer& buffer) {
    std::string text(buffer._state->text); // copied: the state keeps its memory for the next line
    buffer._state->text.clear();
    return text;
}

void LumLogger::logLevelMessage(const char* function, const char* file, int line, const std::string& logger,
                                int level, char* /*reserved*/, int /*reserved1*/, int /*reserved2*/,
                                const std::string& message) {
    Log::instance().log({function, file, line, logger, level, message});
}

void LumLogger::traceLevelMessage(const char* function, const char* file, int line, const std::string& logger,
                                  int level, char* /*reserved*/, int /*reserved1*/, int /*reserved2*/,
                                  const std::string& message) {
    Log::instance().trace({function, file, line, logger, level, message});
}

} // namespace LumLog

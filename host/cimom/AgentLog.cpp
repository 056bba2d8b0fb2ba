#include "host/cimom/AgentLog.h"

#include "agent/OrvAgentControl.h"

#include <algorithm>
#include <exception>
#include <mutex>
#include <utility>

#include <dlfcn.h>

namespace marlo {

namespace {

constexpr int failureLevel = 6000;
constexpr const char* agentLibrary = "libOrvAgent.so";

/** More than a person reads; a failure in a loop must not fill the memory. */
constexpr std::size_t mostMessages = 100;

thread_local AgentLogCollector* current = nullptr;

} // namespace

AgentLogCollector::AgentLogCollector() : _outermost(current == nullptr) {
    if (_outermost) {
        current = this;
    }
}

AgentLogCollector::~AgentLogCollector() {
    if (_outermost) {
        current = nullptr;
    }
}

std::vector<std::string> AgentLogCollector::take() {
    return std::exchange(_messages, {});
}

void AgentLogCollector::add(const char* message) {
    if (_messages.size() < mostMessages &&
        std::find(_messages.begin(), _messages.end(), message) == _messages.end()) {
        _messages.emplace_back(message);
    }
}

void AgentLogCollector::observe(int /*level*/, const char* /*logger*/, const char* message, void* /*context*/) {
    if (current != nullptr && message != nullptr) {
        try {
            current->add(message);
        } catch (const std::exception&) {
            // Memory is out: the line is in the agent's own log all the same.
            return;
        }
    }
}

void AgentLogCollector::connect() {
    static std::mutex mutex;
    static bool connected = false;
    const std::lock_guard lock(mutex);
    if (connected) {
        return;
    }
    // The library is never unmapped from here on, so that its symbols stay good.
    void* agent = dlopen(agentLibrary, RTLD_NOLOAD | RTLD_LAZY);
    if (agent == nullptr) {
        return;
    }
    using ObserveLog = decltype(&OrvAgent_observeLog);
    if (auto observeLog = reinterpret_cast<ObserveLog>(dlsym(agent, "OrvAgent_observeLog"))) {
        observeLog(failureLevel, observe, nullptr);
    }
    connected = true;
}

} // namespace marlo

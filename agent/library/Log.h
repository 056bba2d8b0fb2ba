/**
 * @file
 * Where the lines of the log and of the trace go.
 */
#pragma once

#include "agent/OrvAgentControl.h"
#include "agent/config/Configuration.h"

#include <atomic>
#include <memory>
#include <mutex>
#include <string>
#include <string_view>
#include <vector>

namespace spdlog::sinks {
class sink;
}

namespace Orv::Agent {

/** One line as its caller gave it. Null texts count as empty. */
struct LogLine {
    const char* function;
    const char* file;
    int line;
    std::string_view logger;
    int level;
    std::string_view text;
};

/** One stream of lines with a threshold and sinks. Safe to use from any thread; a failing sink never throws. */
class LogChannel {
  public:
    LogChannel();
    ~LogChannel();
    LogChannel(const LogChannel&) = delete;
    LogChannel& operator=(const LogChannel&) = delete;

    /** `pattern` is spdlog's. A sink that cannot be opened is reported on the standard error stream and left out. */
    void configure(const ChannelConfiguration& configuration, const std::string& pattern);

    [[nodiscard]] bool keeps(int level) const { return level >= _threshold.load(std::memory_order_relaxed); }

    /** Gives the line to every sink; to all but the standard error stream when `shownElsewhere`. */
    void write(const LogLine& line, bool shownElsewhere);

  private:
    struct Sink;
    using Sinks = std::vector<std::shared_ptr<Sink>>;

    std::atomic<int> _threshold;
    std::mutex _mutex; ///< guards _sinks
    std::shared_ptr<const Sinks> _sinks;
};

/**
 * The log and the trace of this process. Until a configuration is given, the one in force for the process is loaded
 * with the first line, and the default one when that fails: who uses the agent is told so, the log is not the place.
 */
class Log {
  public:
    static Log& instance();

    /** Nothing happens when the configuration is the one in force already. */
    void configure(const Configuration& configuration);

    /** See OrvAgent_observeLog. */
    void observe(int level, OrvAgentLogObserver observer, void* context);

    void log(const LogLine& line) noexcept;
    void trace(const LogLine& line) noexcept;

  private:
    struct Observer {
        OrvAgentLogObserver function = nullptr;
        void* context = nullptr;
        int level = 0;
    };

    Log();
    void ensureConfigured();
    void apply(const Configuration& configuration);
    bool show(const LogLine& line);

    std::atomic<bool> _isConfigured{false};
    std::mutex _configurationMutex; ///< guards _inForce
    Configuration _inForce;
    LogChannel _log;
    LogChannel _trace;
    std::atomic<int> _observedLevel;
    std::mutex _observerMutex; ///< guards _observer
    Observer _observer;
};

} // namespace Orv::Agent

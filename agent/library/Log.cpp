#include "agent/library/Log.h"

#include "agent/text/Text.h"

#include <climits>
#include <cstdio>
#include <exception>
#include <utility>

#include <spdlog/details/log_msg.h>
#include <spdlog/pattern_formatter.h>
#include <spdlog/sinks/base_sink.h>
#include <spdlog/sinks/basic_file_sink.h>
#include <spdlog/sinks/stdout_sinks.h>
#include <syslog.h>

namespace Orv::Agent {

namespace {

constexpr int failureLevel = 6000;
constexpr int routineLevel = 4000;
constexpr int nothing = INT_MAX; ///< the threshold of a channel without sinks; no caller has such a level

constexpr const char* logPattern = "%Y-%m-%d %H:%M:%S.%e %l [%n] %v";
constexpr const char* tracePattern = "%Y-%m-%d %H:%M:%S.%e %l [%n] %s:%# %!(): %v";

spdlog::level::level_enum severityOf(int level) {
    if (level >= failureLevel) {
        return spdlog::level::err;
    }
    return level >= routineLevel ? spdlog::level::info : spdlog::level::debug;
}

int priorityOf(spdlog::level::level_enum severity) {
    switch (severity) {
    case spdlog::level::err:
        return LOG_ERR;
    case spdlog::level::info:
        return LOG_INFO;
    default:
        return LOG_DEBUG;
    }
}

/** The system log under the name of the process. spdlog's own sink calls openlog, which is the process's to call. */
class SystemLogSink : public spdlog::sinks::base_sink<std::mutex> {
  protected:
    void sink_it_(const spdlog::details::log_msg& message) override {
        ::syslog(LOG_DAEMON | priorityOf(message.level), "[%.*s] %.*s", static_cast<int>(message.logger_name.size()),
                 message.logger_name.data(), static_cast<int>(message.payload.size()), message.payload.data());
    }

    void flush_() override {}
};

std::shared_ptr<spdlog::sinks::sink> makeSink(const std::string& name) {
    if (name == "stderr") {
        return std::make_shared<spdlog::sinks::stderr_sink_mt>();
    }
    if (name == "syslog") {
        return std::make_shared<SystemLogSink>();
    }
    return std::make_shared<spdlog::sinks::basic_file_sink_mt>(name.substr(name.find(':') + 1));
}

const char* orEmpty(const char* text) {
    return text == nullptr ? "" : text;
}

} // namespace

/** A sink with what is known of its health. */
struct LogChannel::Sink {
    std::string name;
    std::shared_ptr<spdlog::sinks::sink> output;
    std::atomic<bool> hasFailed{false};

    Sink(const std::string& sinkName, const std::string& pattern) : name(sinkName), output(makeSink(sinkName)) {
        output->set_formatter(std::make_unique<spdlog::pattern_formatter>(pattern));
    }

    /** Says once that lines are lost: a full disk must neither stop the agent nor go by unnoticed. */
    void reportOnce(const char* reason) noexcept {
        if (!hasFailed.exchange(true)) {
            (void)std::fprintf(stderr, "log sink %s: lines are lost: %s\n", name.c_str(), reason);
        }
    }

    void write(const spdlog::details::log_msg& message) noexcept {
        try {
            output->log(message);
            output->flush();
            hasFailed = false;
        } catch (const std::exception& failure) {
            reportOnce(failure.what());
        } catch (...) {
            reportOnce("unknown cause");
        }
    }
};

LogChannel::LogChannel() : _threshold(nothing) {}

LogChannel::~LogChannel() = default;

void LogChannel::configure(const ChannelConfiguration& configuration, const std::string& pattern) {
    auto sinks = std::make_shared<Sinks>();
    for (const std::string& name : configuration.sinks) {
        try {
            sinks->push_back(std::make_shared<Sink>(name, pattern));
        } catch (const std::exception& failure) {
            (void)std::fprintf(stderr, "log sink %s: not opened: %s\n", name.c_str(), failure.what());
        }
    }
    const int threshold = sinks->empty() ? nothing : configuration.level;
    const std::lock_guard lock(_mutex);
    _sinks = std::move(sinks);
    _threshold.store(threshold, std::memory_order_relaxed);
}

void LogChannel::write(const LogLine& line, bool shownElsewhere) {
    std::shared_ptr<const Sinks> sinks;
    {
        const std::lock_guard lock(_mutex);
        sinks = _sinks;
    }
    if (sinks == nullptr) {
        return;
    }
    const std::string text = cleanText(line.text); // one line stays one line, whatever a client has put into it
    const spdlog::source_loc place{orEmpty(line.file), line.line, orEmpty(line.function)};
    const spdlog::details::log_msg message(place, {line.logger.data(), line.logger.size()}, severityOf(line.level),
                                           {text.data(), text.size()});
    for (const auto& sink : *sinks) {
        if (!shownElsewhere || sink->name != "stderr") {
            sink->write(message);
        }
    }
}

Log::Log() : _observedLevel(nothing) {}

Log& Log::instance() {
    static Log* const log = std::unique_ptr<Log>(new Log).release(); // outlives every thread that may still log
    return *log;
}

void Log::apply(const Configuration& configuration) {
    _inForce = configuration;
    _log.configure(configuration.log, logPattern);
    _trace.configure(configuration.trace, tracePattern);
    _isConfigured.store(true, std::memory_order_release);
}

void Log::configure(const Configuration& configuration) {
    const std::lock_guard lock(_configurationMutex);
    const bool same = configuration.log == _inForce.log && configuration.trace == _inForce.trace;
    if (!same || !_isConfigured.load(std::memory_order_relaxed)) {
        apply(configuration);
    }
}

void Log::ensureConfigured() {
    if (_isConfigured.load(std::memory_order_acquire)) {
        return;
    }
    const std::lock_guard lock(_configurationMutex);
    if (_isConfigured.load(std::memory_order_relaxed)) {
        return;
    }
    Configuration configuration;
    try {
        configuration = loadConfiguration();
    } catch (const std::exception&) {
        configuration = {};
    }
    apply(configuration);
}

void Log::observe(int level, OrvAgentLogObserver observer, void* context) {
    const std::lock_guard lock(_observerMutex);
    _observer = {observer, context, level};
    _observedLevel.store(observer == nullptr ? nothing : level, std::memory_order_relaxed);
}

/** True when an observer was shown the line. */
bool Log::show(const LogLine& line) {
    Observer observer;
    {
        const std::lock_guard lock(_observerMutex);
        observer = _observer;
    }
    if (observer.function == nullptr || line.level < observer.level) {
        return false;
    }
    const std::string logger(line.logger);
    const std::string text = cleanText(line.text);
    observer.function(line.level, logger.c_str(), text.c_str(), observer.context);
    return true;
}

void Log::log(const LogLine& line) noexcept {
    try {
        ensureConfigured();
        const bool isShown = line.level >= _observedLevel.load(std::memory_order_relaxed) && show(line);
        if (_log.keeps(line.level)) {
            _log.write(line, isShown);
        }
    } catch (...) {
        // Logging must not fail its caller; without memory for the line there is nothing left to tell it with.
        return;
    }
}

void Log::trace(const LogLine& line) noexcept {
    try {
        ensureConfigured();
        if (_trace.keeps(line.level)) {
            _trace.write(line, false);
        }
    } catch (...) {
        return;
    }
}

} // namespace Orv::Agent

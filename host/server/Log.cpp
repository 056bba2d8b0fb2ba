#include "host/server/Log.h"

#include "agent/text/Text.h"

#include <algorithm>
#include <array>
#include <atomic>
#include <cstdio>
#include <ctime>
#include <exception>
#include <mutex>
#include <new>
#include <utility>

#include <spdlog/details/log_msg.h>
#include <spdlog/pattern_formatter.h>
#include <spdlog/sinks/base_sink.h>
#include <spdlog/sinks/basic_file_sink.h>
#include <spdlog/sinks/stdout_sinks.h>
#include <syslog.h>

namespace marlo::server {

namespace {

constexpr std::array<std::pair<std::string_view, LogLevel>, 4> levelNames{{
    {"debug", LogLevel::debug},
    {"info", LogLevel::info},
    {"warning", LogLevel::warning},
    {"error", LogLevel::error},
}};

std::string_view nameOf(LogLevel level) {
    return levelNames.at(static_cast<std::size_t>(level)).first;
}

/** The system log under the name of the process. spdlog's own sink calls openlog, which is the process's to call. */
class SystemLogSink : public spdlog::sinks::base_sink<std::mutex> {
  protected:
    void sink_it_(const spdlog::details::log_msg& message) override {
        const int priority = message.level >= spdlog::level::err    ? LOG_ERR
                             : message.level == spdlog::level::warn ? LOG_WARNING
                             : message.level == spdlog::level::info ? LOG_INFO
                                                                    : LOG_DEBUG;
        ::syslog(LOG_DAEMON | priority, "%.*s", static_cast<int>(message.payload.size()), message.payload.data());
    }

    void flush_() override {}
};

/** Throws what spdlog throws: the file and the reason. */
std::shared_ptr<spdlog::sinks::sink> openSink(const std::string& name) {
    std::shared_ptr<spdlog::sinks::sink> sink;
    if (name == "stderr") {
        sink = std::make_shared<spdlog::sinks::stderr_sink_mt>();
    } else if (name == "syslog") {
        sink = std::make_shared<SystemLogSink>();
    } else {
        sink = std::make_shared<spdlog::sinks::basic_file_sink_mt>(name.substr(name.find(':') + 1));
    }
    sink->set_formatter(std::make_unique<spdlog::pattern_formatter>("%v"));
    return sink;
}

spdlog::level::level_enum severityOf(LogLevel level) {
    constexpr std::array severities{spdlog::level::debug, spdlog::level::info, spdlog::level::warn,
                                    spdlog::level::err};
    return severities.at(static_cast<std::size_t>(level));
}

/** In UTC, to the millisecond. */
std::string timeNow() {
    timespec now{};
    ::clock_gettime(CLOCK_REALTIME, &now);
    tm parts{};
    ::gmtime_r(&now.tv_sec, &parts);
    std::array<char, 32> text{};
    const std::size_t length = std::strftime(text.data(), text.size(), "%Y-%m-%dT%H:%M:%S", &parts);
    constexpr long nanosecondsPerMillisecond = 1'000'000;
    const int rest =
        std::snprintf(text.data() + length, text.size() - length, ".%03ldZ", now.tv_nsec / nanosecondsPerMillisecond);
    return {text.data(), length + static_cast<std::size_t>(rest)};
}

void appendQuoted(std::string& line, std::string_view text) {
    line += '"';
    for (const char character : Orv::Agent::cleanText(text)) { // leaves no control characters to be escaped
        if (character == '"' || character == '\\') {
            line += '\\';
        }
        line += character;
    }
    line += '"';
}

/** Whether logfmt lets a text stand without quotes. */
bool isBare(std::string_view text) {
    return !text.empty() && std::all_of(text.begin(), text.end(), [](char character) {
        return character > ' ' && character < 0x7F && character != '"' && character != '=' && character != '\\';
    });
}

void appendField(std::string& line, LogFormat format, const LogField& field) {
    const bool json = format == LogFormat::json;
    line += line.empty() || line.back() == '{' ? "" : json ? "," : " ";
    if (json) {
        appendQuoted(line, field.name);
    } else {
        line += field.name;
    }
    line += json ? ':' : '=';
    if (const auto* const number = std::get_if<std::uint64_t>(&field.value)) {
        line += std::to_string(*number);
        return;
    }
    const std::string_view text = std::get<std::string_view>(field.value);
    if (!json && isBare(text)) {
        line += text;
    } else {
        appendQuoted(line, text);
    }
}

} // namespace

std::optional<LogLevel> logLevelOf(std::string_view name) {
    const auto* const found =
        std::find_if(levelNames.begin(), levelNames.end(), [name](const auto& entry) { return entry.first == name; });
    return found == levelNames.end() ? std::nullopt : std::optional(found->second);
}

std::string formatLogLine(LogFormat format, std::string_view time, LogLevel level, std::string_view event,
                          const LogFields& fields) {
    std::string line(format == LogFormat::json ? "{" : "");
    appendField(line, format, {"time", time});
    appendField(line, format, {"level", nameOf(level)});
    appendField(line, format, {"event", event});
    for (const LogField& field : fields) {
        appendField(line, format, field);
    }
    line += format == LogFormat::json ? "}" : "";
    return line;
}

namespace {

/** Where lines go by now. */
struct Target {
    LogOptions options;
    std::shared_ptr<spdlog::sinks::sink> sink;
};

} // namespace

struct Log::State {
    std::mutex mutex; ///< guards the pointer below
    std::shared_ptr<const Target> target;

    std::atomic<std::uint64_t> lost{0};
    std::atomic<bool> failing{false};

    std::shared_ptr<const Target> current() {
        const std::lock_guard lock(mutex);
        return target;
    }

    /** Said once on standard error until a line is taken again: a full disk is not to go by unnoticed. */
    void lose(const Target& inForce, const char* reason) noexcept {
        ++lost;
        if (!failing.exchange(true)) {
            (void)std::fprintf(stderr, "marlo: log %s: lines are lost: %s\n", inForce.options.sink.c_str(), reason);
        }
    }
};

Log::Log(const LogOptions& options) : _state(std::make_unique<State>()) {
    reopen(options);
}

Log::~Log() = default;

void Log::reopen(const LogOptions& options) {
    auto target = std::make_shared<const Target>(Target{options, openSink(options.sink)});
    const std::lock_guard lock(_state->mutex);
    _state->target = std::move(target);
}

void Log::write(LogLevel level, std::string_view event, const LogFields& fields) noexcept {
    const std::shared_ptr<const Target> target = _state->current();
    if (level < target->options.level) {
        return;
    }
    try {
        const std::string line = formatLogLine(target->options.format, timeNow(), level, event, fields);
        target->sink->log(spdlog::details::log_msg({}, "marlo", severityOf(level), {line.data(), line.size()}));
        target->sink->flush();
        _state->failing = false;
    } catch (const std::exception& failure) {
        _state->lose(*target, failure.what());
    }
}

void Log::write(LogLevel level, std::string_view event, std::string_view text) noexcept {
    try {
        write(level, event, LogFields{{"text", text}});
    } catch (const std::bad_alloc&) {
        ++_state->lost; // without memory for the line there is nothing left to tell it with
    }
}

std::uint64_t Log::lost() const {
    return _state->lost;
}

bool Log::isFailing() const {
    return _state->failing;
}

} // namespace marlo::server

/**
 * @file
 * The server's log: a line for each request and each event, in a form that programs read.
 */
#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <variant>
#include <vector>

namespace marlo::server {

enum class LogLevel { debug, info, warning, error };
enum class LogFormat { logfmt, json };

/** By its name in the configuration: "debug", "info", "warning", "error". */
std::optional<LogLevel> logLevelOf(std::string_view name);

struct LogOptions {
    LogLevel level = LogLevel::info; ///< and above
    LogFormat format = LogFormat::logfmt;
    std::string sink = "stderr"; ///< or "syslog", or "file:PATH", appended to
};

struct LogField {
    std::string_view name;
    std::variant<std::string_view, std::uint64_t> value;
};

using LogFields = std::vector<LogField>;

/**
 * A line: `time=2026-11-21T08:00:00.000Z level=info event=request id=1 ...` or the same as a JSON object; of time,
 * level and event those come first. Texts are made valid UTF-8 and stay on their line.
 */
std::string formatLogLine(LogFormat format, std::string_view time, LogLevel level, std::string_view event,
                          const LogFields& fields);

/** Lines from any thread. A sink that takes no more lines costs the lines, and nothing else. */
class Log {
  public:
    /** Throws std::exception with the reason when the sink cannot be opened. */
    explicit Log(const LogOptions& options);
    ~Log();
    Log(const Log&) = delete;
    Log& operator=(const Log&) = delete;

    void write(LogLevel level, std::string_view event, const LogFields& fields) noexcept;
    /** A line with the field "text". */
    void write(LogLevel level, std::string_view event, std::string_view text) noexcept;

    /** Opens the sink anew, the same or another; throws std::exception and goes on as before. */
    void reopen(const LogOptions& options);

    /** Lines that no sink took. */
    [[nodiscard]] std::uint64_t lost() const;
    /** True when the latest line was lost. */
    [[nodiscard]] bool isFailing() const;

  private:
    struct State;
    std::unique_ptr<State> _state;
};

} // namespace marlo::server

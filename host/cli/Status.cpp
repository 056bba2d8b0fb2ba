#include "host/cli/Status.h"

#include "host/cli/Table.h"
#include "host/cli/Text.h"
#include "host/server/Configuration.h"
#include "host/server/LocalClient.h"

#include <array>
#include <chrono>
#include <cstdio>
#include <map>
#include <stdexcept>
#include <utility>

namespace marlo::cli {

namespace {

constexpr std::chrono::seconds Patience(5);
constexpr unsigned HttpOk = 200;

/** "3 d 4 h", "12 min 5 s". */
std::string showDuration(std::uint64_t seconds) {
    constexpr std::array<std::pair<std::uint64_t, const char*>, 4> units{
        {{86400, " d"}, {3600, " h"}, {60, " min"}, {1, " s"}}};
    for (std::size_t i = 0; i + 1 < units.size(); ++i) {
        const auto [length, name] = units.at(i);
        if (seconds >= length) {
            const auto [next, nextName] = units.at(i + 1);
            return std::to_string(seconds / length) + name + " " + std::to_string(seconds % length / next) + nextName;
        }
    }
    return std::to_string(seconds) + " s";
}

std::string showDecimal(double number, const char* unit) {
    std::array<char, 64> text{};
    static_cast<void>(std::snprintf(text.data(), text.size(), "%.1f %s", number, unit));
    return text.data();
}

std::string showMicroseconds(std::uint64_t microseconds) {
    constexpr double perMillisecond = 1000.0;
    return showDecimal(static_cast<double>(microseconds) / perMillisecond, "ms");
}

/** The facts that are one of a kind, as a table without meaningful titles. */
std::string showFacts(const server::StatusReport& report, std::size_t width, bool colours) {
    constexpr double bytesPerMebibyte = 1024.0 * 1024.0;
    const bool ok = report.reasons.empty();
    Table table({"SERVER", "marlo " + report.version});
    const auto add = [&table](const std::string& name, Cell cell) { table.add({{{name}, {}}, std::move(cell)}); };
    std::vector<std::string> health = report.reasons;
    health.insert(health.begin(), ok ? "ok" : "degraded");
    add("health", {health, ok ? Style::Good : Style::Bad});
    add("process", {{std::to_string(report.process) + ", up " + showDuration(report.uptimeSeconds)}, {}});
    add("configuration", {{report.configuration.empty() ? "-" : makePrintable(report.configuration)}, {}});
    add("listens", {report.listeners, {}});
    const http::Counters& counters = report.counters;
    add("connections", {{std::to_string(counters.connections) + " open, " + std::to_string(counters.accepted) +
                         " accepted, " + std::to_string(counters.refusedConnections) + " refused, " +
                         std::to_string(counters.tooSlow) + " too slow"},
                        {}});
    add("requests", {{std::to_string(counters.requests) + " received, " + std::to_string(counters.busy) + " busy, " +
                      std::to_string(counters.aside) + " of them for slow clients"},
                     {}});
    add("answers", {{showMicroseconds(report.latency.median) + " median, " + showMicroseconds(report.latency.high) +
                     " 99 of 100, " + showMicroseconds(report.latency.highest) + " longest"},
                    {}});
    add("enumerations", {{std::to_string(report.openEnumerations) + " open"}, {}});
    add("memory", {{showDecimal(static_cast<double>(report.residentBytes) / bytesPerMebibyte, "MiB")}, {}});
    add("log", {{std::to_string(report.lostLogLines) + " lines lost"}, {}});
    return table.render(width, colours);
}

std::string showProviders(const server::StatusReport& report, std::size_t width, bool colours) {
    Table table({"PROVIDER", "STATE", "LIBRARY", "FAILURE"});
    const std::map<std::string, Style> styles{{"loaded", Style::Good}, {"failed", Style::Bad}};
    for (const server::ProviderState& each : report.providers) {
        const auto style = styles.find(each.state);
        table.add({{{makePrintable(each.name)}, {}},
                   {{makePrintable(each.state)}, style == styles.end() ? Style::Faint : style->second},
                   {{makePrintable(each.library)}, {}},
                   {{each.failure.empty() ? "-" : makePrintable(each.failure)}, {}}});
    }
    return table.render(width, colours);
}

std::string showDeliveries(const server::StatusReport& report, std::size_t width, bool colours) {
    Table table({"LISTENER", "URL", "QUEUED", "SENT", "RETRIED", "DROPPED", "MEDIAN", "99 OF 100", "LAST ERROR"});
    for (const server::DeliveryState& each : report.deliveries) {
        const Style style = each.failingSince != 0 || each.dropped != 0 ? Style::Bad : Style::Plain;
        table.add({{{makePrintable(each.destination)}, {}},
                   {{makePrintable(each.url)}, {}},
                   {{std::to_string(each.queued)}, {}},
                   {{std::to_string(each.sent)}, Style::Good},
                   {{std::to_string(each.retried)}, {}},
                   {{std::to_string(each.dropped)}, each.dropped != 0 ? Style::Bad : Style::Plain},
                   {{showMicroseconds(each.latency.median)}, {}},
                   {{showMicroseconds(each.latency.high)}, {}},
                   {{each.lastError.empty() ? "-" : makePrintable(each.lastError)}, style}});
    }
    return table.render(width, colours);
}

std::string showRequests(const server::StatusReport& report, std::size_t width, bool colours) {
    Table table({"OPERATION", "RESULT", "COUNT"});
    for (const server::RequestCount& each : report.requests) {
        table.add({{{makePrintable(each.operation)}, {}},
                   {{makePrintable(each.result)}, each.result == "ok" ? Style::Good : Style::Plain},
                   {{std::to_string(each.count)}, {}}});
    }
    return table.render(width, colours);
}

server::LocalAnswer ask(const std::string& socket) {
    server::LocalAnswer answer = server::askLocally(socket, "/status", Patience);
    if (answer.status != HttpOk) {
        throw std::runtime_error(socket + ": the server answers " + std::to_string(answer.status) + ": " +
                                 makePrintable(answer.body));
    }
    return answer;
}

} // namespace

std::string findSocket(const ServerOptions& options) {
    if (options.socket) {
        return *options.socket;
    }
    const server::Configuration configuration = server::loadConfiguration(options.configurationFile);
    std::string socket = configuration.listen.socket.value_or(server::usualPlaces().socket);
    if (socket.empty()) {
        throw server::NotRunning("there is no socket to ask at: name it with --socket");
    }
    return socket;
}

std::string showStatus(const server::StatusReport& report, std::size_t width, bool colours) {
    std::string text = showFacts(report, width, colours);
    if (!report.providers.empty()) {
        text += "\n" + showProviders(report, width, colours);
    }
    if (!report.deliveries.empty()) {
        text += "\n" + showDeliveries(report, width, colours);
    }
    if (!report.requests.empty()) {
        text += "\n" + showRequests(report, width, colours);
    }
    return text;
}

ExitCode runStatus(const Options& options, Output& output) {
    try {
        const server::LocalAnswer answer = ask(findSocket(options.server));
        const server::StatusReport report = server::parseStatusReport(answer.body);
        output.write(options.json ? answer.body + "\n" : showStatus(report, terminalWidth(), showsColours()));
        output.finish();
        for (const std::string& reason : report.reasons) {
            complain("degraded: " + makePrintable(reason));
        }
        return report.reasons.empty() ? Answered : Failed;
    } catch (const server::NotRunning& error) {
        complain(std::string("not running: ") + error.what());
        return Failed;
    }
}

} // namespace marlo::cli

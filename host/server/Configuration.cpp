#include "host/server/Configuration.h"

#include "agent/config/TextFile.h"
#include "agent/config/TomlReader.h"
#include "host/server/Endpoints.h"

#include <chrono>
#include <cstdlib>
#include <filesystem>
#include <stdexcept>
#include <system_error>

#include <pwd.h>
#include <unistd.h>

namespace marlo::server {

namespace {

namespace fs = std::filesystem;
using Orv::Agent::TomlReader;

constexpr const char* DefaultFile = "/etc/marlo/server.toml";
constexpr const char* SystemSocket = "/run/marlo/marlo.sock";
constexpr const char* SystemState = "/var/lib/marlo";

/** Reads one file, a method for each of its tables. */
class FileReader {
  public:
    explicit FileReader(const std::string& file) : _file(file) { _configuration.file = file; }

    Configuration read() {
        toml::table document = Orv::Agent::parseToml(Orv::Agent::readTextFile(_file).text, _file);
        TomlReader reader(document, _file, "");
        inTable(reader, "listen", [this](TomlReader& table) { readListening(table); });
        inTable(reader, "access", [this](TomlReader& table) { readAccess(table); });
        inTable(reader, "tls", [this](TomlReader& table) { readTls(table); });
        inTable(reader, "directories", [this](TomlReader& table) { readDirectories(table); });
        inTable(reader, "indications", [this](TomlReader& table) { readIndications(table); });
        inTable(reader, "log", [this](TomlReader& table) { readLog(table); });
        inTable(reader, "limits", [this](TomlReader& table) { readLimits(table); });
        reader.refuseOtherKeys();
        return _configuration;
    }

  private:
    template <typename Work>
    void inTable(TomlReader& parent, std::string_view name, const Work& work) {
        if (toml::table* const table = parent.table(name)) {
            const std::string prefix = std::string(name) + ".";
            TomlReader reader(*table, _file, prefix);
            work(reader);
            reader.refuseOtherKeys();
        }
    }

    [[nodiscard]] std::string absolute(const std::string& path) const {
        return (fs::absolute(_file).parent_path() / path).lexically_normal().string();
    }

    void readPath(TomlReader& reader, std::string_view key, std::string& path) const {
        if (const auto text = reader.text(key)) {
            if (text->empty()) {
                reader.refuseKey(key, "must not be empty");
            }
            path = absolute(*text);
        }
    }

    void readPaths(TomlReader& reader, std::string_view key, std::vector<std::string>& paths) const {
        for (const std::string& text : reader.texts(key).value_or(std::vector<std::string>{})) {
            const std::string path = absolute(text);
            std::error_code ignored;
            if (!fs::is_directory(path, ignored)) {
                reader.refuseKey(key, path + " is no directory");
            }
            paths.push_back(path);
        }
    }

    static std::optional<std::vector<http::Endpoint>> readEndpoints(TomlReader& reader, std::string_view key,
                                                                    http::Transport transport) {
        const auto texts = reader.texts(key);
        if (!texts) {
            return std::nullopt;
        }
        std::vector<http::Endpoint> endpoints;
        for (const std::string& text : *texts) {
            try {
                endpoints.push_back(parseEndpoint(text, transport));
            } catch (const std::invalid_argument& error) {
                reader.refuseKey(key, error.what());
            }
        }
        return endpoints;
    }

    void readListening(TomlReader& reader) {
        _configuration.listen.http = readEndpoints(reader, "http", http::Transport::tcp);
        _configuration.listen.https = readEndpoints(reader, "https", http::Transport::tls);
        if (const auto socket = reader.text("socket")) {
            _configuration.listen.socket = socket->empty() ? *socket : absolute(*socket);
        }
    }

    void readAccess(TomlReader& reader) {
        const auto readNames = [&reader](std::string_view key, std::vector<std::string>& names) {
            names = reader.texts(key).value_or(names);
        };
        readNames("read", _configuration.access.read);
        readNames("change", _configuration.access.change);
        readNames("subscribe", _configuration.access.subscribe);
        if (const auto service = reader.text("pam_service")) {
            if (service->empty() || service->find('/') != std::string::npos) {
                reader.refuseKey("pam_service", "expected the name of a file in /etc/pam.d");
            }
            _configuration.pamService = *service;
        }
    }

    void readTls(TomlReader& reader) {
        http::TlsOptions& tls = _configuration.tls;
        readPath(reader, "certificate", tls.certificateFile);
        readPath(reader, "key", tls.keyFile);
        readPath(reader, "client_ca", tls.clientCaFile);
        tls.clientCertificate = reader.boolean("require_client_certificate").value_or(false);
        if (tls.certificateFile.empty() != tls.keyFile.empty()) {
            reader.refuseKey(tls.keyFile.empty() ? "certificate" : "key", "certificate and key go together");
        }
        if (tls.clientCertificate && tls.clientCaFile.empty()) {
            reader.refuseKey("require_client_certificate", "needs client_ca, to know a good one");
        }
    }

    void readDirectories(TomlReader& reader) {
        readPaths(reader, "schema", _configuration.schema);
        readPaths(reader, "providers", _configuration.providers);
        readPath(reader, "state", _configuration.stateDirectory);
    }

    void readIndications(TomlReader& reader) {
        IndicationOptions& indications = _configuration.indications;
        constexpr std::uint64_t longestQueue = 10'000'000;
        constexpr std::uint64_t leastBytes = 65536;
        constexpr std::uint64_t mostBytes = std::uint64_t{1} << 40U;
        readPath(reader, "authorities", indications.authorityFile);
        if (std::error_code ignored;
            !indications.authorityFile.empty() && !fs::is_regular_file(indications.authorityFile, ignored)) {
            reader.refuseKey("authorities", indications.authorityFile + " is no file");
        }
        indications.unverified = reader.texts("unverified").value_or(indications.unverified);
        readLimit(reader, "queue_length", indications.queueLength, 1, longestQueue);
        readLimit(reader, "queue_bytes", indications.queueBytes, leastBytes, mostBytes);
    }

    void readLog(TomlReader& reader) {
        LogOptions& log = _configuration.log;
        if (const auto level = reader.text("level")) {
            const auto known = logLevelOf(*level);
            if (!known) {
                reader.refuseKey("level",
                                 R"(expected "error", "warning", "info" or "debug", found ")" + *level + '"');
            }
            log.level = *known;
        }
        if (const auto format = reader.text("format")) {
            if (*format != "logfmt" && *format != "json") {
                reader.refuseKey("format", R"(expected "logfmt" or "json", found ")" + *format + '"');
            }
            log.format = *format == "json" ? LogFormat::json : LogFormat::logfmt;
        }
        if (const auto sink = reader.text("sink")) {
            readSink(reader, *sink);
        }
    }

    void readSink(TomlReader& reader, const std::string& sink) {
        constexpr std::string_view filePrefix = "file:";
        const bool isFile = sink.starts_with(filePrefix) && sink.size() > filePrefix.size();
        if (!isFile && sink != "stderr" && sink != "syslog") {
            reader.refuseKey("sink", R"(expected "stderr", "syslog" or "file:PATH", found ")" + sink + '"');
        }
        _configuration.log.sink = isFile ? std::string(filePrefix) + absolute(sink.substr(filePrefix.size())) : sink;
    }

    template <typename Number>
    static void readLimit(TomlReader& reader, std::string_view key, Number& limit, std::uint64_t least,
                          std::uint64_t most) {
        if (const auto value = reader.integer(key, most)) {
            if (*value < least) {
                reader.refuseKey(key, "expected at least " + std::to_string(least));
            }
            limit = static_cast<Number>(*value);
        }
    }

    static void readSeconds(TomlReader& reader, std::string_view key, std::chrono::milliseconds& time) {
        constexpr std::uint64_t longest = 86400;
        std::uint64_t seconds = 0;
        readLimit(reader, key, seconds, 1, longest);
        time = seconds == 0 ? time : std::chrono::seconds(seconds);
    }

    void readLimits(TomlReader& reader) {
        http::Limits& limits = _configuration.limits;
        constexpr std::uint64_t mostConnections = 100'000;
        constexpr std::uint64_t mostWorkers = 256;
        constexpr std::uint64_t leastBytes = 1024;
        constexpr std::uint64_t mostBytes = std::uint64_t{1} << 30U;
        readLimit(reader, "connections", limits.connections, 1, mostConnections);
        readLimit(reader, "connections_per_peer", limits.connectionsPerPeer, 1, mostConnections);
        readLimit(reader, "workers", limits.workers, 1, mostWorkers);
        readLimit(reader, "head_bytes", limits.headBytes, leastBytes, mostBytes);
        readLimit(reader, "body_bytes", limits.bodyBytes, leastBytes, mostBytes);
        readSeconds(reader, "head_seconds", limits.headTime);
        readSeconds(reader, "body_seconds", limits.bodyTime);
        readSeconds(reader, "idle_seconds", limits.idleTime);
        readSeconds(reader, "send_seconds", limits.sendTime);
    }

    const std::string& _file;
    Configuration _configuration;
};

/** A variable's value; empty when it is not set, or not to be trusted. */
std::string variable(const char* name) {
    const char* const value = ::secure_getenv(name);
    return value == nullptr ? "" : value;
}

std::string homeDirectory() {
    const std::string home = variable("HOME");
    const passwd* const entry = home.empty() ? ::getpwuid(::geteuid()) : nullptr;
    return entry == nullptr ? home : entry->pw_dir;
}

std::string usualState() {
    const std::string ofUnit = variable("STATE_DIRECTORY"); // systemd.exec(5)
    if (!ofUnit.empty()) {
        return ofUnit.substr(0, ofUnit.find(':'));
    }
    if (::geteuid() == 0) {
        return SystemState;
    }
    const std::string states = variable("XDG_STATE_HOME");
    return (states.empty() ? homeDirectory() + "/.local/state" : states) + "/marlo";
}

} // namespace

Configuration readConfiguration(const std::string& file) {
    return FileReader(file).read();
}

Configuration loadConfiguration(const std::string& named) {
    try {
        return readConfiguration(named.empty() ? DefaultFile : named);
    } catch (const std::system_error& error) {
        if (named.empty() && error.code() == std::errc::no_such_file_or_directory) {
            return {};
        }
        throw;
    }
}

Places usualPlaces() {
    const std::string runtime = variable("XDG_RUNTIME_DIR");
    const std::string ofUser = runtime.empty() ? "" : runtime + "/marlo.sock";
    return {usualState(), ::geteuid() == 0 ? SystemSocket : ofUser};
}

} // namespace marlo::server

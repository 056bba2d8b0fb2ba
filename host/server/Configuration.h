/**
 * @file
 * How the server is set up: one optional file in TOML, read strictly.
 */
#pragma once

#include "host/http/Server.h"
#include "host/security/Gatekeeper.h"
#include "host/server/Log.h"

#include <optional>
#include <string>
#include <vector>

namespace marlo::server {

/** Where there is none, the usual ones; an empty list: none at all. */
struct Listening {
    std::optional<std::vector<http::Endpoint>> http;
    std::optional<std::vector<http::Endpoint>> https;
    std::optional<std::string> socket; ///< path of the Unix domain socket; empty: none
};

/** How indications go to their listeners. */
struct IndicationOptions {
    std::string authorityFile;                               ///< for listeners with https; empty: the system's
    std::vector<std::string> unverified;                     ///< hosts whose certificates are not looked at
    std::size_t queueLength = 100000;                        ///< of one listener
    std::size_t queueBytes = std::size_t{256} * 1024 * 1024; ///< the same
    bool operator==(const IndicationOptions&) const = default;
};

struct Configuration {
    std::string file; ///< that it was read from; empty: there is none
    Listening listen;
    security::Access access{{"root"}, {"root"}, {"root"}};
    std::string pamService = "marlo";
    http::TlsOptions tls;               ///< without a certificate file: one of the server's own making
    std::vector<std::string> schema;    ///< directories of the site, on top of the shipped one
    std::vector<std::string> providers; ///< the same
    std::string stateDirectory;         ///< empty: the usual one
    IndicationOptions indications;
    LogOptions log;
    http::Limits limits;
};

/**
 * Reads a configuration file. Relative paths in it are relative to its directory. Throws std::runtime_error, or
 * std::system_error when the file cannot be read, with file, line, key and reason for whatever does not belong.
 */
Configuration readConfiguration(const std::string& file);

/** The same of the named file, or of /etc/marlo/server.toml, which alone may be missing. */
Configuration loadConfiguration(const std::string& named);

/** What a server of this process's user uses where its configuration names nothing. */
struct Places {
    /** /var/lib/marlo of root, `$STATE_DIRECTORY` of a systemd unit; else below `$XDG_STATE_HOME` or ~/.local/state.
     */
    std::string state;
    /** /run/marlo/marlo.sock of root, else `$XDG_RUNTIME_DIR/marlo.sock`; empty where there is no such directory. */
    std::string socket;
};

Places usualPlaces();

} // namespace marlo::server

#include "host/cli/Serve.h"

#include "host/cli/Environment.h"
#include "host/server/Daemon.h"
#include "host/server/Endpoints.h"

#include <filesystem>
#include <stdexcept>
#include <utility>

namespace marlo::cli {

namespace {

constexpr const char* None = "none";

std::vector<http::Endpoint> parseEndpoints(const std::string& option, const std::vector<std::string>& texts,
                                           http::Transport transport) {
    std::vector<http::Endpoint> endpoints;
    for (const std::string& text : texts) {
        if (text != None) {
            try {
                endpoints.push_back(server::parseEndpoint(text, transport));
            } catch (const std::invalid_argument& error) {
                throw UsageError(option + ": " + error.what());
            }
        }
    }
    return endpoints;
}

/** What the command line says to the places that are listened on. */
server::Listening listeningOf(const ServerOptions& options) {
    server::Listening listening;
    if (options.http) {
        listening.http = parseEndpoints("--http", *options.http, http::Transport::tcp);
    }
    if (options.https) {
        listening.https = parseEndpoints("--https", *options.https, http::Transport::tls);
    }
    if (options.socket) {
        listening.socket = *options.socket == None ? "" : *options.socket;
    }
    return listening;
}

void append(std::vector<std::string>& directories, const std::vector<std::string>& more) {
    for (const std::string& each : more) {
        directories.push_back(std::filesystem::absolute(each).string());
    }
}

/** The configuration file, overruled by the command line. */
server::Configuration configure(const ServerOptions& options, const server::Listening& named) {
    server::Configuration configuration = server::loadConfiguration(options.configurationFile);
    server::Listening& listen = configuration.listen;
    listen.http = named.http ? named.http : listen.http;
    listen.https = named.https ? named.https : listen.https;
    listen.socket = named.socket ? named.socket : listen.socket;
    append(configuration.schema, options.schema);
    append(configuration.providers, options.providers);
    return configuration;
}

/** A command that a client who has nothing but this line can use at once. */
std::string trialCommand(const server::Announcement& announcement, const http::Endpoint& endpoint) {
    const std::string url = server::nameOf(endpoint.transport) + "://" + announcement.user + ":" +
                            announcement.password + "@" + server::toString(endpoint) +
                            "/root/tavis:MARLO_NetworkAdapterConfiguration";
    const bool tls = endpoint.transport == http::Transport::tls;
    return "wbemcli ei -nl" + std::string(tls ? " -noverify" : "") + " '" + url + "'";
}

std::string describe(const server::Announcement& announcement) {
    std::string text;
    for (const http::Endpoint& endpoint : announcement.endpoints) {
        text += "listening: " + server::nameOf(endpoint.transport) + " " + server::toString(endpoint) + "\n";
    }
    if (!announcement.fingerprint.empty()) {
        text += "certificate: " + announcement.fingerprint + "\n";
    }
    for (const std::string& note : announcement.notes) {
        text += note + "\n";
    }
    if (!announcement.user.empty()) {
        text += "user: " + announcement.user + "\npassword: " + announcement.password + "\n";
        for (const http::Transport transport : {http::Transport::tcp, http::Transport::tls}) {
            for (const http::Endpoint& endpoint : announcement.endpoints) {
                if (endpoint.transport == transport) {
                    text += "try: " + trialCommand(announcement, endpoint) + "\n";
                    break;
                }
            }
        }
    }
    return text + "serving; interrupt to end\n";
}

} // namespace

ExitCode runServe(const Options& options, Output& output) {
    server::DaemonOptions daemonOptions;
    daemonOptions.version = MARLO_VERSION;
    daemonOptions.objectManager = findDirectories(options.directories);
    daemonOptions.trial = options.server.trial;
    daemonOptions.configure = [server = options.server, named = listeningOf(options.server)] {
        return configure(server, named);
    };
    server::Daemon daemon(std::move(daemonOptions));
    try {
        output.write(describe(daemon.announcement()));
        output.finish();
    } catch (const OutputError& error) { // nobody reads it, and clients are served all the same
        complain(error.what());
    }
    return daemon.run() ? Answered : Failed;
}

} // namespace marlo::cli

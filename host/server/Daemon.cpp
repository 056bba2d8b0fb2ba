#include "host/server/Daemon.h"

#include "host/security/Certificate.h"
#include "host/security/Privileges.h"
#include "host/server/Endpoints.h"
#include "host/server/Health.h"
#include "host/server/Indications.h"
#include "host/server/Listeners.h"
#include "host/server/Notify.h"
#include "host/server/RequestLog.h"
#include "host/server/Signals.h"
#include "host/server/Stop.h"

#include <algorithm>
#include <array>
#include <atomic>
#include <csignal>
#include <optional>
#include <stdexcept>
#include <utility>

#include <malloc.h>
#include <poll.h>
#include <unistd.h>

namespace marlo::server {

namespace {

constexpr const char* TrialUser = "marlo";

/** How long indications that wait may go on being sent at the end; the others go out after the next start. */
constexpr std::chrono::seconds IndicationPatience(2);

std::string hostName() {
    constexpr std::size_t longest = 256;
    std::array<char, longest> name{};
    return ::gethostname(name.data(), name.size() - 1) == 0 ? name.data() : "localhost";
}

bool usesTls(const std::vector<http::Endpoint>& endpoints) {
    return std::any_of(endpoints.begin(), endpoints.end(),
                       [](const http::Endpoint& each) { return each.transport == http::Transport::tls; });
}

std::string stateDirectoryOf(const Configuration& configuration) {
    return configuration.stateDirectory.empty() ? usualPlaces().state : configuration.stateDirectory;
}

/** The files of the configuration, or the server's own, which are made where they are missing. */
http::TlsOptions findCertificate(const Configuration& configuration) {
    http::TlsOptions tls = configuration.tls;
    if (tls.certificateFile.empty()) {
        const security::CertificateFiles files = security::ownCertificate(stateDirectoryOf(configuration)).files;
        tls.certificateFile = files.certificate;
        tls.keyFile = files.key;
    } else {
        security::checkCertificate({tls.certificateFile, tls.keyFile});
    }
    return tls;
}

/** The shipped directories and those of the site. */
ObjectManagerOptions completed(ObjectManagerOptions options, const Configuration& configuration, Log& log) {
    const auto append = [](std::vector<std::string>& list, const std::vector<std::string>& more) {
        list.insert(list.end(), more.begin(), more.end());
    };
    append(options.schemaDirectories, configuration.schema);
    append(options.providerDirectories, configuration.providers);
    options.log = [&log](const std::string& line) { log.write(LogLevel::warning, "provider", line); };
    return options;
}

/** Keys whose new values a running server does not take. */
std::string changedForNextStart(const Configuration& before, const Configuration& now) {
    std::string names;
    const auto compare = [&names](const std::string& name, bool same) {
        names += same ? "" : (names.empty() ? "" : ", ") + name;
    };
    const auto sameEndpoints = [](const auto& left, const auto& right) {
        const auto sameEndpoint = [](const http::Endpoint& one, const http::Endpoint& other) {
            return toString(one) == toString(other);
        };
        return left.has_value() == right.has_value() &&
               (!left || std::equal(left->begin(), left->end(), right->begin(), right->end(), sameEndpoint));
    };
    compare("listen", sameEndpoints(before.listen.http, now.listen.http) &&
                          sameEndpoints(before.listen.https, now.listen.https) &&
                          before.listen.socket == now.listen.socket);
    compare("access.pam_service", before.pamService == now.pamService);
    compare("directories", before.schema == now.schema && before.providers == now.providers &&
                               before.stateDirectory == now.stateDirectory);
    compare("indications.queue_length", before.indications.queueLength == now.indications.queueLength);
    compare("indications.queue_bytes", before.indications.queueBytes == now.indications.queueBytes);
    compare("limits", before.limits == now.limits);
    return names;
}

} // namespace

struct Daemon::State {
    explicit State(DaemonOptions&& given);

    security::GatekeeperOptions gatekeeperOptions();
    wbem::ServiceOptions serviceOptions();
    void startIndications();
    std::function<void(const std::string&)> logTo(const char* event);
    http::Answer answerStatus();
    void reload();
    void takeConfiguration(const Configuration& fresh);
    bool stop();

    DaemonOptions options;
    Announcement announcement;
    Signals signals{SIGTERM, SIGINT, SIGHUP};
    Configuration configuration;
    Log log;
    Health health;
    Statistics statistics;
    RequestLog requestLog;
    Listeners listeners;
    std::optional<http::TlsOptions> tls;
    std::optional<security::Gatekeeper> gatekeeper;
    std::optional<ObjectManager> manager;
    std::string whyNoIndications;
    std::optional<Indications> indications;
    std::optional<wbem::Service> service;
    std::optional<http::Server> server;
    std::atomic<bool> isComplete{false}; ///< requests come as soon as the server listens
};

Daemon::State::State(DaemonOptions&& given)
    : options(std::move(given)),
      configuration(options.configure()),
      log(configuration.log),
      requestLog(log, statistics),
      listeners(chooseListeners(configuration.listen, usualPlaces().socket, options.trial)) {
    // One heap for all threads: a large answer leaves its memory to the next one, whichever thread makes that.
    ::mallopt(M_ARENA_MAX, 1);
    static_cast<void>(::signal(
        SIGPIPE, SIG_IGN)); // a client or a reader of the log that goes away is an error where it is written to
    if (usesTls(listeners.endpoints)) {
        tls = findCertificate(configuration);
        announcement.fingerprint = security::fingerprint(tls->certificateFile);
    }
    log.write(LogLevel::info, "start", security::dropPrivileges()); // the first thread is started below
    gatekeeper.emplace(gatekeeperOptions(), logTo("access"));
    manager.emplace(completed(options.objectManager, configuration, log));
    startIndications();
    service.emplace(*manager, serviceOptions());
    server.emplace(*service, listeners.endpoints, tls, configuration.limits, logTo("http"));
    announcement.endpoints = server->endpoints();
    announcement.notes.insert(announcement.notes.begin(), listeners.notes.begin(), listeners.notes.end());
    health.configured(configuration.file, "");
    isComplete = true;
}

security::GatekeeperOptions Daemon::State::gatekeeperOptions() {
    security::GatekeeperOptions gate;
    if (options.trial) {
        gate.trialUser = announcement.user = TrialUser;
        gate.trialPassword = announcement.password = security::makePassword();
        gate.access = {};
    } else if (::geteuid() == 0) {
        gate.access = configuration.access;
        gate.accounts = security::makePamCheck(configuration.pamService);
        gate.mostWaiting = std::max<std::size_t>(configuration.limits.workers / 4, 1);
    } else {
        announcement.notes.emplace_back(
            "this is not root, which alone may check passwords: only the user that serves "
            "gets in, by the local socket; --trial makes a password to try things with");
    }
    return gate;
}

wbem::ServiceOptions Daemon::State::serviceOptions() {
    wbem::ServiceOptions wbem;
    wbem.admit = [this](const http::RequestHead& head, const http::Peer& peer) {
        security::Admission admission = gatekeeper->admit(head, peer);
        if (admission.refusal && !admission.refusal->isForNow) {
            statistics.count("admission", "HTTP " + std::to_string(admission.refusal->status));
        }
        return admission;
    };
    wbem.host = hostName();
    wbem.routes.push_back({"GET", "/status", security::Role::read,
                           [this](const http::Request&, const security::Identity&) { return answerStatus(); }});
    wbem.log = [this](const wbem::Record& record) { requestLog.write(record); };
    return wbem;
}

/** A server on trial does without, since another one may be using the database. */
void Daemon::State::startIndications() {
    Indications::Options indicationOptions;
    indicationOptions.stateDirectory = stateDirectoryOf(configuration);
    indicationOptions.mayRead = [this](const std::string& user) {
        return gatekeeper->may(user, security::Role::read);
    };
    indicationOptions.log = logTo("indication");
    try {
        indications.emplace(*manager, configuration.indications, indicationOptions);
    } catch (const std::exception& error) {
        if (!options.trial) {
            throw;
        }
        whyNoIndications = std::string("nobody can subscribe: ") + error.what();
        announcement.notes.push_back(whyNoIndications);
    }
}

std::function<void(const std::string&)> Daemon::State::logTo(const char* event) {
    return [this, event](const std::string& line) { log.write(LogLevel::warning, event, line); };
}

http::Answer Daemon::State::answerStatus() {
    if (!isComplete) {
        return {503, {{"Content-Type", "text/plain"}}, "the server is starting\n"};
    }
    StatusReport report;
    report.version = options.version;
    report.process = static_cast<std::uint64_t>(::getpid());
    report.configuration = health.configuration();
    for (const http::Endpoint& endpoint : announcement.endpoints) {
        report.listeners.push_back(nameOf(endpoint.transport) + " " + toString(endpoint));
    }
    report.counters = server->counters();
    report.requests = statistics.requests();
    report.latency = statistics.latency();
    for (const ProviderHealth& each : manager->providerHealth()) {
        const std::string state = !each.failure.empty() ? "failed" : each.isLoaded ? "loaded" : "idle";
        report.providers.push_back({each.name, each.library, state, each.failure});
    }
    report.openEnumerations = service->openEnumerations();
    if (indications) {
        report.deliveries = indications->deliveries();
    } else {
        report.reasons.push_back(whyNoIndications);
    }
    report.residentBytes = residentBytes();
    report.lostLogLines = log.lost();
    health.complete(report, log.isFailing(), configuration.limits.workers);
    return {200, {{"Content-Type", "application/json"}, {"Cache-Control", "no-store"}}, toJson(report)};
}

void Daemon::State::takeConfiguration(const Configuration& fresh) {
    // Whatever may refuse what is new comes first, so that a file is taken whole or not at all.
    std::optional<http::TlsOptions> freshTls;
    if (tls) {
        freshTls = findCertificate(fresh);
    }
    Indications::check(fresh.indications);
    if (!options.trial && ::geteuid() == 0) {
        gatekeeper->setAccess(fresh.access);
    }
    if (freshTls) {
        server->reloadTls(*freshTls);
        tls = freshTls;
    }
    if (indications) {
        indications->configure(fresh.indications);
    }
    log.reopen(fresh.log);
    if (const std::string names = changedForNextStart(configuration, fresh); !names.empty()) {
        log.write(LogLevel::warning, "reload", "takes effect at the next start: " + names);
    }
}

void Daemon::State::reload() {
    notifyReloading();
    try {
        const Configuration fresh = options.configure();
        takeConfiguration(fresh);
        health.configured(fresh.file, "");
        log.write(LogLevel::info, "reload", "configuration and certificates are read anew");
    } catch (const std::exception& error) {
        health.configured(configuration.file, error.what());
        log.write(LogLevel::error, "reload", std::string("goes on with what it had: ") + error.what());
    }
    notifyManager("READY=1");
}

bool Daemon::State::stop() {
    notifyManager("STOPPING=1");
    log.write(LogLevel::info, "stop", "no new requests; " + std::to_string(server->counters().busy) + " under way");
    const bool whole = stopServer(*server, signals, log);
    if (indications) {
        indications->stop(IndicationPatience);
    }
    log.write(LogLevel::info, "stop", "ended");
    return whole;
}

Daemon::Daemon(DaemonOptions options) : _state(std::make_unique<State>(std::move(options))) {
    State& state = *_state;
    for (const http::Endpoint& endpoint : state.announcement.endpoints) {
        state.log.write(LogLevel::info, "listen", nameOf(endpoint.transport) + " " + toString(endpoint));
    }
    for (const std::string& note : state.announcement.notes) {
        state.log.write(LogLevel::warning, "start", note);
    }
    state.log.write(LogLevel::info, "start", "marlo " + state.options.version);
    notifyManager("READY=1");
    ::malloc_trim(0); // a server may idle for days with what only its start needed
}

Daemon::~Daemon() = default;

const Announcement& Daemon::announcement() const {
    return _state->announcement;
}

bool Daemon::run() {
    for (;;) {
        pollfd polled{_state->signals.descriptor(), POLLIN, 0};
        static_cast<void>(::poll(&polled, 1, -1));
        const std::optional<int> signal = _state->signals.take();
        if (signal == SIGHUP) {
            _state->reload();
        } else if (signal) {
            return _state->stop();
        }
    }
}

} // namespace marlo::server

/**
 * @file
 * The server as a whole: object manager, gatekeeper, CIM-XML and HTTP put together, from start to stop.
 */
#pragma once

#include "host/cimom/ObjectManager.h"
#include "host/server/Configuration.h"

#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace marlo::server {

/** What a server is made of. */
struct DaemonOptions {
    std::string version;
    ObjectManagerOptions objectManager; ///< where the shipped classes and providers are; its log is not used
    bool trial = false;                 ///< one user more, with a password of this start; free ports for busy ones
    /** Reads the configuration, at the start and at each hang-up. Throws std::exception with the reason. */
    std::function<Configuration()> configure;
};

/** What people want to know who are to use it. */
struct Announcement {
    std::vector<http::Endpoint> endpoints;
    std::string fingerprint; ///< of the certificate, "SHA-256 AB:CD:..."; empty without TLS
    std::string user;        ///< of the trial; empty: there is none
    std::string password;
    std::vector<std::string> notes; ///< what else is worth a line
};

/**
 * One per process: it changes the process's privileges and handles its signals. Listens from construction on.
 */
class Daemon {
  public:
    /**
     * Called on the process's first thread, before it starts others: privileges and the signal mask are a thread's
     * own, and handed down. Throws std::exception with the reason when it cannot be.
     */
    explicit Daemon(DaemonOptions options);
    ~Daemon();
    Daemon(const Daemon&) = delete;
    Daemon& operator=(const Daemon&) = delete;

    [[nodiscard]] const Announcement& announcement() const;

    /**
     * Serves until SIGTERM or SIGINT. Then requests that are under way end, within StopPatience, and their answers go
     * out (Stop.h). True when none was cut short. SIGHUP has the configuration and the
     * certificates read anew, and the log opened anew; connections stay, and so does what cannot be read.
     */
    bool run();

  private:
    struct State;
    std::unique_ptr<State> _state;
};

} // namespace marlo::server

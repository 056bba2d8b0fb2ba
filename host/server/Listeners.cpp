#include "host/server/Listeners.h"

#include "host/server/Endpoints.h"

#include <filesystem>
#include <stdexcept>
#include <system_error>

namespace marlo::server {

namespace {

void addPorts(Listeners& listeners, const std::vector<http::Endpoint>& endpoints, bool trial) {
    for (http::Endpoint endpoint : endpoints) {
        if (trial && endpoint.port != 0 && isBusy(endpoint)) {
            listeners.notes.push_back("port " + std::to_string(endpoint.port) + " of " + endpoint.address +
                                      " is busy, another one is taken");
            endpoint.port = 0;
        }
        listeners.endpoints.push_back(endpoint);
    }
}

/** Anybody of this host may enter the directory: who may do what is decided by the user at the other end. */
void makeDirectoryOf(const std::string& socket) {
    const std::filesystem::path directory = std::filesystem::absolute(socket).parent_path();
    std::error_code error;
    std::filesystem::create_directories(directory, error);
    if (error) {
        throw std::runtime_error("cannot make " + directory.string() + ": " + error.message());
    }
}

void addSocket(Listeners& listeners, const std::string& path, bool trial) {
    const http::Endpoint endpoint{http::Transport::local, path, 0};
    if (trial && isBusy(endpoint)) {
        listeners.notes.push_back("another server has " + path + ", this one has no local socket");
        return;
    }
    makeDirectoryOf(path);
    listeners.endpoints.push_back(endpoint);
}

} // namespace

Listeners chooseListeners(const Listening& wanted, const std::string& usualSocket, bool trial) {
    Listeners listeners;
    addPorts(listeners, wanted.http ? *wanted.http : loopbackEndpoints(http::Transport::tcp), trial);
    addPorts(listeners, wanted.https ? *wanted.https : loopbackEndpoints(http::Transport::tls), trial);
    const std::string socket = wanted.socket.value_or(usualSocket);
    if (!socket.empty()) {
        addSocket(listeners, socket, trial);
    }
    if (listeners.endpoints.empty()) {
        throw std::runtime_error("there is nowhere to listen: neither http, https nor a socket is wanted");
    }
    return listeners;
}

} // namespace marlo::server

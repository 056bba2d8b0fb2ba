/**
 * @file
 * Asking a server on this host over its Unix domain socket.
 */
#pragma once

#include <chrono>
#include <stdexcept>
#include <string>

namespace marlo::server {

/** Nobody answers on a socket; the text says which one, and why. */
class NotRunning : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

struct LocalAnswer {
    unsigned status = 0;
    std::string body;
};

/**
 * GETs a path from the server behind a socket. Throws NotRunning when none answers there, or when it takes longer
 * than `patience`.
 */
LocalAnswer askLocally(const std::string& socket, const std::string& path, std::chrono::milliseconds patience);

/** POSTs a CIM operation (DSP0200) to the server behind a socket; throws as askLocally does. */
LocalAnswer operateLocally(const std::string& socket, const std::string& method, const std::string& nameSpace,
                           const std::string& document, std::chrono::milliseconds patience);

} // namespace marlo::server

/**
 * @file
 * CIM operations in root/interop at the server of this host, over its Unix domain socket.
 */
#pragma once

#include "host/model/Instance.h"

#include <stdexcept>
#include <string>
#include <vector>

#include <cmpidt.h>

namespace marlo::cli {

/** The server answered an error; the text has its name and reason. */
class Refused : public std::runtime_error {
  public:
    Refused(CMPIrc code, const std::string& what) : std::runtime_error(what), _code(code) {}

    [[nodiscard]] CMPIrc code() const { return _code; }

  private:
    CMPIrc _code;
};

/**
 * All operations throw Refused; server::NotRunning where nobody answers; std::runtime_error for what is no answer.
 * Paths come, within instances too, with their namespace and without a host.
 */
class LocalCim {
  public:
    explicit LocalCim(std::string socket) : _socket(std::move(socket)) {}

    /** Instances of a class and of its subclasses. */
    [[nodiscard]] std::vector<Instance> enumerate(const std::string& className) const;

    [[nodiscard]] ObjectPath create(const Instance& instance) const;
    void remove(const ObjectPath& path) const;

  private:
    std::string _socket;
};

} // namespace marlo::cli

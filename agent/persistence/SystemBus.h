/**
 * @file
 * Calls to services on the system bus.
 */
#pragma once

#include <functional>
#include <memory>
#include <string>

struct sd_bus;
struct sd_bus_message;

namespace Orv::Agent::Persistence {

/** An object of a service, with the interface that is meant. */
struct BusObject {
    const char* service;
    const char* path;
    const char* interface;
};

/** One connection; for one thread at a time. Failures are thrown as std::runtime_error with the service's own words.
 */
class SystemBus {
  public:
    /** `address` as in Environment. */
    explicit SystemBus(const std::string& address);
    ~SystemBus();
    SystemBus(const SystemBus&) = delete;
    SystemBus& operator=(const SystemBus&) = delete;

    /**
     * Calls a method and waits for its end, some seconds at most. `append` puts the arguments into the message with
     * the functions of sd-bus; it returns their result, below 0 when one failed.
     */
    void call(const BusObject& object, const char* method, const std::function<int(sd_bus_message*)>& append);

    /** Whether somebody has this name on the bus now. */
    bool hasService(const char* name);

  private:
    struct Closer {
        void operator()(sd_bus* bus) const;
    };

    std::unique_ptr<sd_bus, Closer> _bus;
};

} // namespace Orv::Agent::Persistence

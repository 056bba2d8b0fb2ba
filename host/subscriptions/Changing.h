/**
 * @file
 * The right to change what a Service has.
 */
#pragma once

#include "host/cimom/ClassChecks.h"
#include "host/subscriptions/Service.h"

namespace marlo::subscriptions {

/**
 * Held by one thread at a time. Refused to a provider that wants to change subscriptions while it is being told of
 * one on this thread, and before the start and after the stop.
 */
class Service::Changing {
  public:
    explicit Changing(Service& service) : _service(service) {
        if (service._changingThread == std::this_thread::get_id()) {
            throw RequestError(CMPI_RC_ERR_FAILED, "a provider is being told of another subscription");
        }
        service._changing.lock();
        service._changingThread = std::this_thread::get_id();
    }

    ~Changing() {
        _service._changingThread = std::thread::id();
        _service._changing.unlock();
    }

    Changing(const Changing&) = delete;
    Changing& operator=(const Changing&) = delete;

    /** Throws RequestError unless the service is between its start and its stop. */
    void requireOpen() const {
        if (!_service._isOpen) {
            throw RequestError(CMPI_RC_ERR_FAILED, "the indication service does not run");
        }
    }

  private:
    Service& _service;
};

} // namespace marlo::subscriptions

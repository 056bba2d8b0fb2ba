/**
 * @file
 * A D-Bus of the test's own, with services that are not there.
 */
#pragma once

#include "tests/linux/TemporaryHost.h"
#include "tests/support/Require.h"

#include <atomic>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include <sys/types.h>

struct sd_bus;
struct sd_bus_message;

namespace Orv::Test {

/** Why there can be no bus here; empty when there can. */
std::string whyNoBus();

/** A bus daemon that ends with the object. */
class PrivateBus {
  public:
    PrivateBus();
    ~PrivateBus();
    PrivateBus(const PrivateBus&) = delete;
    PrivateBus& operator=(const PrivateBus&) = delete;

    [[nodiscard]] std::string address() const;

  private:
    TemporaryHost _files;
    pid_t _daemon = -1;
};

/** The services of systemd-networkd and systemd-resolved, which take down what they are asked for. */
class MockServices {
  public:
    explicit MockServices(const PrivateBus& bus);
    ~MockServices();
    MockServices(const MockServices&) = delete;
    MockServices& operator=(const MockServices&) = delete;

    /** Each call as one line: "SetLinkDNS 2 192.0.2.53 2001:db8::53", "SetLinkDomains 2 a.org", "Reload". */
    std::vector<std::string> calls();

    /** Calls are answered with this error from now on; empty: with success. */
    void failWith(const std::string& text);

    /** For the handlers: takes a call down. Returns the error to answer with. */
    std::string record(const std::string& call);

  private:
    sd_bus* _bus = nullptr;
    std::thread _thread;
    std::atomic<bool> _ends{false};
    std::mutex _mutex; ///< guards what follows
    std::vector<std::string> _calls;
    std::string _error;
};

} // namespace Orv::Test

/** Goes on only where a bus can be: elsewhere the test is skipped with the reason, or fails under CI. */
#define REQUIRE_BUS() GO_ON_UNLESS(Orv::Test::whyNoBus())

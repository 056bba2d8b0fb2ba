#include "agent/persistence/SystemBus.h"

#include "agent/text/Text.h"

#include <cstdint>
#include <stdexcept>
#include <system_error>

#include <systemd/sd-bus.h>

namespace Orv::Agent::Persistence {

namespace {

constexpr std::uint64_t callTimeout = 10'000'000; ///< microseconds

void require(int result, const std::string& what) {
    if (result < 0) {
        throw std::system_error(-result, std::generic_category(), what);
    }
}

struct MessageCloser {
    void operator()(sd_bus_message* message) const { sd_bus_message_unref(message); }
};

using Message = std::unique_ptr<sd_bus_message, MessageCloser>;

/** What a service answers when it refuses. */
class Refusal {
  public:
    Refusal() = default;
    Refusal(const Refusal&) = delete;
    Refusal& operator=(const Refusal&) = delete;

    ~Refusal() { sd_bus_error_free(&_error); }

    sd_bus_error* raw() { return &_error; }

    [[nodiscard]] std::string text() const { return cleanText(_error.message == nullptr ? "" : _error.message); }

  private:
    sd_bus_error _error{};
};

Message newCall(sd_bus* bus, const BusObject& object, const char* method) {
    sd_bus_message* message = nullptr;
    require(sd_bus_message_new_method_call(bus, &message, object.service, object.path, object.interface, method),
            method);
    return Message(message);
}

Message answerTo(sd_bus* bus, sd_bus_message* message, const std::string& what) {
    Refusal refusal;
    sd_bus_message* answer = nullptr;
    const int result = sd_bus_call(bus, message, callTimeout, refusal.raw(), &answer);
    if (result < 0) {
        throw std::runtime_error(what + " failed: " + refusal.text());
    }
    return Message(answer);
}

} // namespace

void SystemBus::Closer::operator()(sd_bus* bus) const {
    sd_bus_flush_close_unref(bus);
}

SystemBus::SystemBus(const std::string& address) {
    sd_bus* bus = nullptr;
    if (address.empty()) {
        require(sd_bus_open_system(&bus), "the system bus cannot be reached");
        _bus.reset(bus);
        return;
    }
    require(sd_bus_new(&bus), "the system bus");
    _bus.reset(bus);
    require(sd_bus_set_address(bus, address.c_str()), "the system bus");
    require(sd_bus_set_bus_client(bus, 1), "the system bus");
    require(sd_bus_start(bus), "the system bus cannot be reached");
}

SystemBus::~SystemBus() = default;

void SystemBus::call(const BusObject& object, const char* method, const std::function<int(sd_bus_message*)>& append) {
    const std::string what = std::string(object.service) + ": " + method;
    const Message message = newCall(_bus.get(), object, method);
    // Somebody who does not run is not to be started for this.
    require(sd_bus_message_set_auto_start(message.get(), 0), what);
    require(append(message.get()), what);
    answerTo(_bus.get(), message.get(), what);
}

bool SystemBus::hasService(const char* name) {
    constexpr BusObject bus{"org.freedesktop.DBus", "/org/freedesktop/DBus", "org.freedesktop.DBus"};
    const Message message = newCall(_bus.get(), bus, "NameHasOwner");
    require(sd_bus_message_append(message.get(), "s", name), "NameHasOwner");
    const Message answer = answerTo(_bus.get(), message.get(), "NameHasOwner");
    int has = 0;
    require(sd_bus_message_read(answer.get(), "b", &has), "NameHasOwner");
    return has != 0;
}

} // namespace Orv::Agent::Persistence

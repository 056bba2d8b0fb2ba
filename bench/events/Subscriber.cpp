#include "bench/events/Subscriber.h"

#include <atomic>
#include <fstream>
#include <stdexcept>

#include <unistd.h>

namespace marlo::bench {

namespace {

std::atomic<Subscriber*> inForce = nullptr;

const char* const EVENTS[] = {"Online", "Offline", "SwitchOver", "SwitchBack"};

std::string classOf(const char* event) {
    return std::string("MARLO_NetworkAdapter") + event + "Event";
}

void registerTimedProvider(const std::filesystem::path& directory) {
    std::filesystem::create_directory(directory);
    std::ofstream file(directory / "timed.toml");
    file << "library = \"" << MARLO_TIMED_PROVIDER << "\"\n[[provider]]\nname = \"NetworkAdapterProvider\"\n"
         << "kinds = [\"indication\"]\nnamespaces = [\"root/tavis\"]\nclasses = [";
    for (const char* event : EVENTS) {
        file << '"' << classOf(event) << "\", ";
    }
    file << "]\n";
}

} // namespace

Subscriber::Subscriber()
    : _registrations(std::filesystem::temp_directory_path() / ("marlo-bench-" + std::to_string(::getpid()))) {
    inForce = this;
    registerTimedProvider(_registrations);
    _manager = std::make_unique<ObjectManager>(ObjectManagerOptions{
        {MARLO_SHARE_DIRECTORY "/schema"}, {_registrations.string()}, MARLO_LIBRARY_DIRECTORY, {}, false});
    for (const char* event : EVENTS) {
        SubscriptionId id = 0;
        const Status status = _manager->subscribe(
            "root/tavis", "SELECT * FROM " + classOf(event), "WQL",
            [this](Instance&& indication) { receive(indication); }, id);
        if (!status.ok()) {
            throw std::runtime_error(status.message);
        }
    }
}

Subscriber::~Subscriber() {
    _manager.reset();
    inForce = nullptr;
    std::error_code ignored;
    std::filesystem::remove_all(_registrations, ignored);
}

Clock::time_point Subscriber::await(std::size_t count) {
    std::unique_lock lock(_mutex);
    while (_delivered < count) {
        const std::size_t before = _delivered;
        if (!_changed.wait_for(lock, std::chrono::seconds(10),
                               [&] { return _delivered >= count || _delivered >= before + 1000; })) {
            if (_delivered == before) {
                throw std::runtime_error("only " + std::to_string(before) + " events of " + std::to_string(count));
            }
        }
    }
    return _latest;
}

std::size_t Subscriber::count() const {
    const std::lock_guard lock(_mutex);
    return _delivered;
}

void Subscriber::expectAlternation() const {
    const std::lock_guard lock(_mutex);
    if (_outOfTurn != 0 || _received != _delivered) {
        throw std::runtime_error(std::to_string(_outOfTurn) + " events out of turn");
    }
}

void Subscriber::delivered() {
    const Clock::time_point now = Clock::now();
    const std::lock_guard lock(_mutex);
    _latest = now;
    ++_delivered;
    _changed.notify_all();
}

void Subscriber::receive(const Instance& indication) {
    const NamedValue* found = findName(indication.properties, "EventID");
    const std::lock_guard lock(_mutex);
    const char* expected = _received++ % 2 == 0 ? "NetworkPort:eth0Offline" : "NetworkPort:eth0Online";
    if (found == nullptr || found->value != Value::string(expected)) {
        ++_outOfTurn;
    }
}

} // namespace marlo::bench

extern "C" __attribute__((visibility("default"))) void marloBenchDelivered();

void marloBenchDelivered() {
    if (marlo::bench::Subscriber* subscriber = marlo::bench::inForce; subscriber != nullptr) {
        subscriber->delivered();
    }
}

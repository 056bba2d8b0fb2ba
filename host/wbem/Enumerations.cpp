#include "host/wbem/Enumerations.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <system_error>

#include <sys/random.h>

namespace marlo::wbem {

namespace {

[[noreturn]] void exceeded(const std::string& reason) {
    throw RequestError(CMPI_RC_ERR_SERVER_LIMITS_EXCEEDED, reason);
}

/** What a text needs beside its object: short ones lie within it. */
std::size_t bytesOf(const std::string& text) {
    constexpr std::size_t within = 15;
    return text.capacity() > within ? text.capacity() : 0;
}

std::size_t bytesOf(const std::vector<NamedValue>& values);

std::size_t bytesOf(const ObjectPath& path) {
    return bytesOf(path.host) + bytesOf(path.nameSpace) + bytesOf(path.className) + bytesOf(path.keys);
}

std::size_t bytesOf(const Value& value) {
    if (const auto* text = std::get_if<std::string>(&value.data)) {
        return bytesOf(*text);
    }
    if (const auto* moment = std::get_if<DateTime>(&value.data)) {
        return bytesOf(moment->text);
    }
    if (const auto* path = std::get_if<std::shared_ptr<const ObjectPath>>(&value.data)) {
        return sizeof(ObjectPath) + bytesOf(**path);
    }
    if (const auto* instance = std::get_if<std::shared_ptr<const Instance>>(&value.data)) {
        return sizeof(Instance) + bytesOf((*instance)->path) + bytesOf((*instance)->properties);
    }
    std::size_t bytes = 0;
    if (const auto* elements = std::get_if<Value::Array>(&value.data)) {
        for (const Value& element : *elements) {
            bytes += sizeof(Value) + bytesOf(element);
        }
    }
    return bytes;
}

std::size_t bytesOf(const std::vector<NamedValue>& values) {
    std::size_t bytes = values.capacity() * sizeof(NamedValue);
    for (const NamedValue& value : values) {
        bytes += bytesOf(value.name) + bytesOf(value.value);
    }
    return bytes;
}

std::size_t bytesOf(const Instance& instance) {
    return sizeof(Instance) + bytesOf(instance.path) + bytesOf(instance.properties);
}

std::string makeContext() {
    std::array<unsigned char, 16> random{};
    for (std::size_t filled = 0; filled < random.size();) {
        const ssize_t count = getrandom(random.data() + filled, random.size() - filled, 0);
        if (count < 0 && errno != EINTR) {
            throw std::system_error(errno, std::generic_category(), "getrandom");
        }
        filled += count > 0 ? static_cast<std::size_t>(count) : 0;
    }
    constexpr std::string_view digits = "0123456789abcdef";
    std::string context;
    for (const unsigned char byte : random) {
        context += {digits[byte >> 4U], digits[byte & 0xFU]};
    }
    return context;
}

} // namespace

Enumerations::Held::Held(Enumerations& all, EnumerationOwner owner, bool classOrigin)
    : _all(all), _owner(std::move(owner)), _classOrigin(classOrigin) {}

Enumerations::Held::~Held() {
    _all._bytes -= _bytes;
    const std::lock_guard lock(_all._mutex);
    --_all._count;
    const auto user = _all._users.find(_owner.user);
    if (--user->second == 0) {
        _all._users.erase(user);
    }
}

void Enumerations::Held::add(Instance&& object) {
    const std::size_t bytes = bytesOf(object);
    if (_all._bytes.fetch_add(bytes) + bytes > _all._limits.heldBytes) {
        _all._bytes -= bytes;
        exceeded("the results of all open enumerations together are larger than " +
                 std::to_string(_all._limits.heldBytes) + " bytes: pull or close some, or ask without opening one");
    }
    _bytes += bytes;
    _objects.push_back(std::move(object));
}

Enumerations::Batch Enumerations::Held::take(std::size_t most) {
    Batch batch;
    batch.classOrigin = _classOrigin;
    for (; !_objects.empty() && batch.objects.size() < most; _objects.pop_front()) {
        const std::size_t bytes = bytesOf(_objects.front());
        _bytes -= bytes;
        _all._bytes -= bytes;
        batch.objects.push_back(std::move(_objects.front()));
    }
    batch.last = _objects.empty();
    return batch;
}

Enumerations::Enumerations(const Limits& limits) : _limits(limits) {}

Enumerations::~Enumerations() {
    {
        const std::lock_guard lock(_mutex);
        _ended = true;
    }
    _changed.notify_all();
    if (_watch.joinable()) {
        _watch.join();
    }
    while (!_contexts.empty()) {
        _contexts.extract(_contexts.begin()); // what it held takes the lock
    }
}

std::unique_ptr<Enumerations::Held> Enumerations::begin(const EnumerationOwner& owner, bool classOrigin) {
    const std::lock_guard lock(_mutex);
    if (_count >= _limits.enumerations) {
        exceeded("there are " + std::to_string(_count) + " open enumerations, and may not be more");
    }
    std::size_t& ofUser = _users[owner.user];
    if (ofUser >= _limits.enumerationsPerUser) {
        exceeded("user '" + owner.user + "' has " + std::to_string(ofUser) +
                 " open enumerations, and may not have more");
    }
    auto held = std::make_unique<Held>(*this, owner, classOrigin);
    ++ofUser;
    ++_count;
    return held;
}

std::string Enumerations::keep(std::unique_ptr<Held> held, std::chrono::seconds timeout) {
    std::string context = makeContext();
    const std::lock_guard lock(_mutex);
    if (!_watch.joinable()) {
        _watch = std::thread([this] { watch(); });
    }
    _contexts.emplace(context, Open{std::move(held), timeout, Clock::time_point::max()});
    return context;
}

Enumerations::Contexts::iterator Enumerations::find(const std::string& context, const EnumerationOwner& owner) {
    const auto found = _contexts.find(context);
    // Of another user's enumeration nobody learns more than that it is not theirs.
    if (found == _contexts.end() || found->second.deadline <= Clock::now() ||
        found->second.held->_owner.user != owner.user ||
        !equalNames(found->second.held->_owner.nameSpace, owner.nameSpace)) {
        throw RequestError(
            invalidEnumerationContext,
            "there is no such enumeration: it has been pulled to its end or closed, or its time is over");
    }
    return found;
}

Enumerations::Batch Enumerations::pull(const std::string& context, const EnumerationOwner& owner, std::size_t most) {
    std::unique_ptr<Held> finished; // destroyed behind the lock, which it takes
    const std::lock_guard lock(_mutex);
    const auto found = find(context, owner);
    if (found->second.held->_owner.pulled != owner.pulled) {
        throw RequestError(invalidEnumerationContext, "the enumeration is pulled by another operation");
    }
    Batch batch = found->second.held->take(most);
    found->second.deadline = Clock::time_point::max();
    if (batch.last) {
        finished = std::move(found->second.held);
        _contexts.erase(found);
    }
    return batch;
}

void Enumerations::await(const std::string& context) {
    {
        const std::lock_guard lock(_mutex);
        const auto found = _contexts.find(context);
        if (found == _contexts.end()) {
            return;
        }
        found->second.deadline = Clock::now() + found->second.timeout;
    }
    _changed.notify_all();
}

void Enumerations::close(const std::string& context, const EnumerationOwner& owner) {
    Contexts::node_type closed;
    const std::lock_guard lock(_mutex);
    closed = _contexts.extract(find(context, owner));
}

void Enumerations::drop(const std::string& context) {
    Contexts::node_type dropped;
    const std::lock_guard lock(_mutex);
    dropped = _contexts.extract(context);
}

std::size_t Enumerations::size() const {
    const std::lock_guard lock(_mutex);
    return _contexts.size();
}

std::vector<Enumerations::Open> Enumerations::takeExpired(Clock::time_point now) {
    std::vector<Open> expired;
    for (auto open = _contexts.begin(); open != _contexts.end();) {
        if (open->second.deadline <= now) {
            expired.push_back(std::move(open->second));
            open = _contexts.erase(open);
        } else {
            ++open;
        }
    }
    return expired;
}

void Enumerations::watch() {
    std::unique_lock lock(_mutex);
    while (!_ended) {
        auto expired = takeExpired(Clock::now());
        if (!expired.empty()) {
            lock.unlock();
            expired.clear(); // what they held takes the lock
            lock.lock();
            continue;
        }
        const auto first =
            std::min_element(_contexts.begin(), _contexts.end(), [](const auto& left, const auto& right) {
                return left.second.deadline < right.second.deadline;
            });
        if (first == _contexts.end() || first->second.deadline == Clock::time_point::max()) {
            _changed.wait(lock);
        } else {
            const auto deadline = first->second.deadline; // the entry may go meanwhile
            _changed.wait_until(lock, deadline);
        }
    }
}

} // namespace marlo::wbem

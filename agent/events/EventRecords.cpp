#include "agent/events/EventRecords.h"

#include <charconv>
#include <utility>

namespace Orv::Agent {

namespace {

constexpr std::string_view prefix = "event/";

/** An event path in its two parts. */
struct EventPath {
    std::uint64_t number;
    std::string_view nodePath;
};

std::optional<EventPath> parse(std::string_view path) {
    if (!path.starts_with(prefix)) {
        return std::nullopt;
    }
    path.remove_prefix(prefix.size());
    EventPath parsed{0, {}};
    const char* end = path.data() + path.size();
    const auto [rest, error] = std::from_chars(path.data(), end, parsed.number);
    if (error != std::errc() || rest == end || *rest != ':') {
        return std::nullopt;
    }
    parsed.nodePath = path.substr(static_cast<std::size_t>(rest + 1 - path.data()));
    return parsed;
}

/** The events that a thread has picked up, the latest of each receiver; tells the receivers of the thread's end. */
class ThreadsWork {
  public:
    ThreadsWork() = default;

    ~ThreadsWork() {
        for (const auto& [receiver, number] : _latest) {
            if (const auto alive = receiver.lock()) {
                alive->addThreadEnd(number);
            }
        }
    }

    ThreadsWork(const ThreadsWork&) = delete;
    ThreadsWork& operator=(const ThreadsWork&) = delete;

    void add(const std::shared_ptr<PickUps>& receiver, std::uint64_t number) {
        std::erase_if(_latest, [&](const auto& entry) {
            const auto known = entry.first.lock();
            return known == nullptr || known == receiver;
        });
        _latest.emplace_back(receiver, number);
    }

  private:
    std::vector<std::pair<std::weak_ptr<PickUps>, std::uint64_t>> _latest;
};

ThreadsWork& thisThreadsWork() {
    thread_local ThreadsWork work;
    return work;
}

std::shared_ptr<const Tree> treeOf(const Event& event) {
    std::vector<Tree::NodePointer> nodes(event.ancestors.rbegin(), event.ancestors.rend());
    nodes.push_back(event.node);
    return std::make_shared<const Tree>(std::move(nodes));
}

} // namespace

void PickUps::addPickUp() {
    _count.fetch_add(1);
    if (_wakesOnPickUp.load()) {
        _wakeUp->signal();
    }
}

void PickUps::addThreadEnd(std::uint64_t number) {
    std::uint64_t last = _lastThreadEnd.load();
    while (last < number && !_lastThreadEnd.compare_exchange_weak(last, number)) {
    }
    _wakeUp->signal();
}

EventRecords::Ticket EventRecords::open(Event event, std::shared_ptr<PickUps> receiver) {
    const std::lock_guard lock(_mutex);
    const std::uint64_t number = ++_last;
    Ticket ticket{number, std::string(prefix) + std::to_string(number) + ':' + event.node->path};
    _records.emplace(number, Record{std::move(event), std::move(receiver), std::nullopt});
    return ticket;
}

std::optional<std::thread::id> EventRecords::pickedUpBy(std::uint64_t number) const {
    const std::lock_guard lock(_mutex);
    const auto found = _records.find(number);
    return found == _records.end() ? std::nullopt : found->second.pickedUpBy;
}

void EventRecords::close(std::uint64_t number) {
    const std::lock_guard lock(_mutex);
    _closed.push_back(number);
    if (_closed.size() > keptRecords) {
        _records.erase(_closed.front());
        _closed.pop_front();
    }
}

std::optional<EventRecords::Moment> EventRecords::pickUp(std::string_view path) {
    const auto wanted = parse(path);
    if (!wanted) {
        return std::nullopt;
    }
    Event event;
    std::shared_ptr<PickUps> toTell;
    {
        const std::lock_guard lock(_mutex);
        const auto found = _records.find(wanted->number);
        if (found == _records.end() || found->second.event.node->path != wanted->nodePath) {
            return std::nullopt;
        }
        event = found->second.event;
        if (!found->second.pickedUpBy) {
            found->second.pickedUpBy = std::this_thread::get_id();
            toTell = found->second.receiver;
        }
    }
    if (toTell != nullptr) {
        thisThreadsWork().add(toTell, wanted->number);
        toTell->addPickUp();
    }
    return Moment{treeOf(event), event.node->path};
}

std::string_view EventRecords::livePath(std::string_view path) {
    const auto parsed = parse(path);
    return parsed ? parsed->nodePath : path;
}

} // namespace Orv::Agent

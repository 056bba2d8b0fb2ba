#include "host/delivery/Queue.h"

#include <algorithm>
#include <iterator>
#include <utility>

namespace marlo::delivery {

const Item& Queue::append(std::shared_ptr<Event> event, std::int64_t subscription, std::int64_t posted) {
    _bytes += event->bytes;
    ++event->waiting;
    return _items.emplace_back(Item{_next++, std::move(event), subscription, posted});
}

void Queue::restore(Item&& item) {
    _bytes += item.event->bytes;
    ++item.event->waiting;
    _next = std::max(_next, item.number + 1);
    _kept = item.number + 1;
    _items.push_back(std::move(item));
}

const Item* Queue::begin() {
    if (_isOnItsWay || _items.empty() || _items.front().number >= _kept) {
        return nullptr;
    }
    _isOnItsWay = true;
    return &_items.front();
}

std::optional<Item> Queue::end(std::int64_t number) {
    if (!_isOnItsWay || _items.empty() || _items.front().number != number) {
        return std::nullopt;
    }
    _isOnItsWay = false;
    return takeOldest();
}

std::optional<Item> Queue::takeOldest() {
    const std::size_t place = _isOnItsWay ? 1 : 0;
    if (_items.size() <= place) {
        return std::nullopt;
    }
    return takeAt(place);
}

Item Queue::takeAt(std::size_t place) {
    Item item = std::move(_items[place]);
    _items.erase(_items.begin() + static_cast<std::ptrdiff_t>(place));
    _bytes -= item.event->bytes;
    return item;
}

template <typename Predicate>
std::vector<Item> Queue::takeIf(Predicate isWanted) {
    if (!_items.empty() && isWanted(_items.front())) {
        _isOnItsWay = false;
    }
    const auto taken = std::stable_partition(_items.begin(), _items.end(),
                                             [&isWanted](const Item& item) { return !isWanted(item); });
    std::vector<Item> result(std::make_move_iterator(taken), std::make_move_iterator(_items.end()));
    _items.erase(taken, _items.end());
    for (const Item& item : result) {
        _bytes -= item.event->bytes;
    }
    return result;
}

std::vector<Item> Queue::takeOf(std::int64_t subscription) {
    return takeIf([subscription](const Item& item) { return item.subscription == subscription; });
}

std::optional<Item> Queue::take(std::int64_t number) {
    const auto found = std::ranges::lower_bound(_items, number, {}, &Item::number);
    if (found == _items.end() || found->number != number) {
        return std::nullopt;
    }
    _isOnItsWay = _isOnItsWay && found != _items.begin();
    return takeAt(static_cast<std::size_t>(found - _items.begin()));
}

std::vector<Item> Queue::takeAll() {
    return takeIf([](const Item& /*item*/) { return true; });
}

} // namespace marlo::delivery

#include "host/cimom/Subscription.h"

#include "host/broker/InstanceSubject.h"
#include "host/broker/Scope.h"

#include <algorithm>
#include <utility>

namespace marlo {

/** One run of the sink. Those of a thread are chained, so that it can be told whether a closing thread is within. */
class Subscription::Delivery {
  public:
    explicit Delivery(Subscription& subscription) : _subscription(subscription), _outer(innermost) {
        const std::lock_guard lock(_subscription._mutex);
        _open = !_subscription._closed;
        _subscription._running += _open ? 1 : 0;
        innermost = this;
    }

    ~Delivery() {
        innermost = _outer;
        if (_open) {
            const std::lock_guard lock(_subscription._mutex);
            --_subscription._running;
            _subscription._sinkReturned.notify_all();
        }
    }

    Delivery(const Delivery&) = delete;
    Delivery& operator=(const Delivery&) = delete;

    /** False when the subscription was closed before. */
    [[nodiscard]] bool isOpen() const { return _open; }

    static int countOnThisThread(const Subscription& subscription) {
        int count = 0;
        for (const Delivery* each = innermost; each != nullptr; each = each->_outer) {
            count += each->_open && &each->_subscription == &subscription ? 1 : 0;
        }
        return count;
    }

  private:
    static thread_local const Delivery* innermost;

    Subscription& _subscription;
    const Delivery* _outer;
    bool _open;
};

thread_local const Subscription::Delivery* Subscription::Delivery::innermost = nullptr;

Subscription::Subscription(const broker::Broker& broker, filter::Filter filter, std::string nameSpace,
                           std::string fromClass, ObjectManager::RoundSink sink)
    : _filter(std::move(filter)),
      _nameSpace(std::move(nameSpace)),
      _fromClass(std::move(fromClass)),
      _sink(std::move(sink)),
      _filterHandle(makeHandle(broker, _filter)) {}

/** A clone: it lives longer than the call in which it is made. */
std::unique_ptr<CMPISelectExp, Subscription::Release> Subscription::makeHandle(const broker::Broker& broker,
                                                                               const filter::Filter& filter) {
    const broker::CallScope scope;
    const CMPISelectExp* made = broker.newSelectExp(filter);
    return std::unique_ptr<CMPISelectExp, Release>(made->ft->clone(made, nullptr));
}

bool Subscription::wants(const Instance& indication, const broker::SchemaView& schema) const {
    return equalNames(indication.path.nameSpace, _nameSpace) &&
           _filter.matches(broker::InstanceSubject(indication, schema));
}

void Subscription::deliver(const Instance& indication, DeliveryRound& round) {
    const Delivery delivery(*this);
    if (!delivery.isOpen()) {
        return;
    }
    Instance copy{indication.path, {}};
    const auto& selected = _filter.properties();
    for (const NamedValue& property : indication.properties) {
        const bool isSelected = std::any_of(selected.begin(), selected.end(), [&property](const std::string& name) {
            return equalNames(name, property.name);
        });
        if (selected.empty() || isSelected) {
            copy.properties.push_back(property);
        }
    }
    _sink(std::move(copy), round);
}

void Subscription::close() {
    std::unique_lock lock(_mutex);
    _closed = true;
    _sinkReturned.wait(lock, [this] { return _running == Delivery::countOnThisThread(*this); });
}

} // namespace marlo

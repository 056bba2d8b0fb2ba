#include "host/subscriptions/Objects.h"

#include "host/model/DateTimeText.h"

namespace marlo::subscriptions {

std::optional<Kind> kindOf(const std::string& className) {
    if (equalNames(className, filterClass)) {
        return Kind::filter;
    }
    if (equalNames(className, destinationClass) || equalNames(className, handlerClass)) {
        return Kind::destination;
    }
    return equalNames(className, subscriptionClass) ? std::optional(Kind::subscription) : std::nullopt;
}

std::vector<std::string> namespacesOf(const Instance& filter) {
    return textsOf(filter, "SourceNamespaces");
}

bool isWanted(const Object& subscription) {
    return numberOf(subscription.instance, "SubscriptionState") == stateEnabled;
}

std::optional<Time> endOf(const Instance& subscription) {
    const auto duration = numberOf(subscription, "SubscriptionDuration");
    const NamedValue* start = findName(subscription.properties, "SubscriptionStartTime");
    const auto* text = start == nullptr ? nullptr : std::get_if<DateTime>(&start->value.data);
    const auto began = text == nullptr ? std::nullopt : readDateTime(text->text);
    constexpr std::uint64_t longest = 3'000'000'000; // seconds, near enough to for good and within every clock
    if (!duration || *duration >= longest || !began) {
        return std::nullopt;
    }
    return Time(std::chrono::microseconds(began->microseconds)) + std::chrono::seconds(*duration);
}

std::string targetOf(const Object& subscription, const char* role) {
    const ObjectPath* target = referenceOf(subscription.instance, role);
    return target == nullptr ? "" : target->toString();
}

} // namespace marlo::subscriptions

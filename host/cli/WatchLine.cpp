#include "host/cli/WatchLine.h"

#include "host/cli/Text.h"

#include <algorithm>
#include <stdexcept>

namespace marlo::cli {

namespace {

const Value* find(const Instance& indication, std::string_view name) {
    const NamedValue* found = findName(indication.properties, name);
    return found == nullptr || found->value.isNull() ? nullptr : &found->value;
}

std::string textOf(const Instance& indication, std::string_view name) {
    const Value* value = find(indication, name);
    return value == nullptr ? "" : showPlainly(*value);
}

/** `yyyymmddhhmmss...` of DSP0004 as `yyyy-mm-dd hh:mm:ss`. */
std::string showTime(const Instance& indication) {
    const Value* value = find(indication, "EventTime");
    value = value == nullptr ? find(indication, "IndicationTime") : value;
    const auto* time = value == nullptr ? nullptr : std::get_if<DateTime>(&value->data);
    constexpr std::size_t toSeconds = 14;
    if (time == nullptr || time->text.size() < toSeconds) {
        return "";
    }
    const std::string& text = time->text;
    return text.substr(0, 4) + "-" + text.substr(4, 2) + "-" + text.substr(6, 2) + " " + text.substr(8, 2) + ":" +
           text.substr(10, 2) + ":" + text.substr(12, 2);
}

std::string showAdapter(const Instance& indication) {
    std::string element = textOf(indication, "AlertingManagedElement");
    try {
        const ObjectPath path = ObjectPath::parse(element);
        if (const NamedValue* tag = findName(path.keys, "Tag")) {
            return showPlainly(tag->value);
        }
    } catch (const std::invalid_argument&) {
        return element; // not every alert is about an object
    }
    return element;
}

std::string showEvent(const Instance& indication) {
    constexpr std::string_view prefix = "MARLO_NetworkAdapter";
    constexpr std::string_view suffix = "Event";
    const std::string& name = indication.path.className;
    if (name.size() <= prefix.size() + suffix.size() || !name.starts_with(prefix) || !name.ends_with(suffix)) {
        return name;
    }
    return name.substr(prefix.size(), name.size() - prefix.size() - suffix.size());
}

/** The word that the schema has for a number (ValueMap and Values); the number itself where it has none. */
std::string showSeverity(const Schema& schema, const Instance& indication) {
    std::string number = textOf(indication, "PerceivedSeverity");
    const Class* definition = schema.findClass(indication.path.nameSpace, indication.path.className);
    const Property* property = definition == nullptr ? nullptr : definition->findProperty("PerceivedSeverity");
    if (property == nullptr) {
        return number;
    }
    const Qualifier* numbers = findQualifier(property->qualifiers, "ValueMap");
    const Qualifier* words = findQualifier(property->qualifiers, "Values");
    const auto* all = numbers == nullptr ? nullptr : std::get_if<Value::Array>(&numbers->value.data);
    const auto* meanings = words == nullptr ? nullptr : std::get_if<Value::Array>(&words->value.data);
    if (all == nullptr || meanings == nullptr) {
        return number;
    }
    const auto found =
        std::find_if(all->begin(), all->end(), [&](const Value& each) { return showPlainly(each) == number; });
    const auto index = static_cast<std::size_t>(found - all->begin());
    return index < meanings->size() ? showPlainly((*meanings)[index]) : number;
}

std::string pad(const std::string& text, std::size_t width) {
    std::string padded = text.empty() ? "-" : makePrintable(text);
    const std::size_t taken = displayWidth(padded);
    return padded + std::string(taken < width ? width - taken : 0, ' ');
}

} // namespace

std::string showIndication(const Schema& schema, const Instance& indication) {
    // Wide enough for what adapters tell: lines come one at a time, so no column can wait for its widest text.
    std::string message = textOf(indication, "Message");
    if (message.empty()) {
        message = textOf(indication, "Description");
    }
    return pad(showTime(indication), 19) + "  " + pad(showAdapter(indication), 8) + "  " +
           pad(showEvent(indication), 10) + "  " + pad(showSeverity(schema, indication), 16) + "  " + pad(message, 0);
}

} // namespace marlo::cli

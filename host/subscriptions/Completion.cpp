#include "host/subscriptions/Completion.h"

#include "host/cimom/ClassChecks.h"
#include "host/cimom/Interop.h"
#include "host/cimom/QueryText.h"
#include "host/cimom/References.h"
#include "host/delivery/Url.h"

#include <algorithm>
#include <stdexcept>

namespace marlo::subscriptions {

namespace {

constexpr std::size_t longestKey = 256; ///< MaxLen of the keys
constexpr std::uint64_t protocolCimXml = 2;
constexpr std::uint64_t ignoreErrors = 2;
constexpr std::uint64_t removeOnErrors = 4;
constexpr std::uint64_t repeatAlways = 2;

[[noreturn]] void refuse(const std::string& reason) {
    throw RequestError(CMPI_RC_ERR_INVALID_PARAMETER, reason);
}

/** Puts a number where there is none; gives what there is then. */
std::uint64_t setDefault(Instance& instance, const std::string& name, std::uint64_t number) {
    if (const auto given = numberOf(instance, name)) {
        return *given;
    }
    set(instance, name, number16(number));
    return number;
}

void setDefault(Instance& instance, const std::string& name, const std::string& text) {
    if (textOf(instance, name).empty()) {
        set(instance, name, Value::string(text));
    }
}

std::size_t bytesOf(const Value& value) {
    if (const auto* text = std::get_if<std::string>(&value.data)) {
        return text->size();
    }
    if (const auto* path = std::get_if<std::shared_ptr<const ObjectPath>>(&value.data)) {
        return (*path)->toString().size();
    }
    std::size_t bytes = 0;
    if (const auto* elements = std::get_if<Value::Array>(&value.data)) {
        for (const Value& element : *elements) {
            bytes += 1 + bytesOf(element);
        }
    }
    return bytes;
}

void requireShort(const Instance& instance) {
    std::size_t bytes = 0;
    for (const NamedValue& property : instance.properties) {
        bytes += bytesOf(property.value);
    }
    if (bytes > longestObject) {
        refuse("the texts of the instance are longer than " + std::to_string(longestObject) + " bytes together");
    }
}

/** The namespaces that a filter names, else its own. */
std::vector<std::string> namedNamespaces(const Schema& schema, const Instance& filter) {
    std::vector<std::string> names = textsOf(filter, "SourceNamespaces");
    const std::string single = textOf(filter, "SourceNamespace");
    if (names.empty() && !single.empty()) {
        names.push_back(single);
    }
    for (std::string& name : names) {
        name = spellNameSpace(schema, name);
    }
    std::sort(names.begin(), names.end());
    names.erase(std::unique(names.begin(), names.end()), names.end());
    return names;
}

/** Refuses a statement that cannot be had from a namespace. */
void checkQuery(const Schema& schema, const std::string& nameSpace, const std::string& text,
                const std::string& language) {
    const filter::Filter query = readQuery(schema, nameSpace, text, language, "the filter");
    if (const Class& definition = *schema.findClass(nameSpace, query.className()); !definition.isIndication) {
        throw RequestError(CMPI_RC_ERR_INVALID_CLASS, definition.name + " is not a class of indications");
    }
}

} // namespace

void completeKeys(const Schema& schema, Object& object) {
    Instance& instance = object.instance;
    ObjectPath& path = instance.path;
    const Class& definition = *schema.findClass(interop, path.className);
    path = {"", interop, definition.name, {}};
    if (object.kind != Kind::subscription) {
        setDefault(instance, "SystemCreationClassName", "CIM_ComputerSystem");
        setDefault(instance, "SystemName", systemName());
        setDefault(instance, "CreationClassName", definition.name);
        setDefault(instance, "Name", "marlo:" + object.key());
        if (!equalNames(textOf(instance, "CreationClassName"), definition.name)) {
            refuse("CreationClassName is not " + definition.name);
        }
        set(instance, "CreationClassName", Value::string(definition.name));
    }
    for (const Property* key : definition.keys()) {
        const NamedValue* value = findName(instance.properties, key->name);
        if (value == nullptr || value->value.isNull()) {
            refuse(definition.name + "." + key->name + " is missing");
        }
        if (key->type == CMPI_string && textOf(instance, key->name).size() > longestKey) {
            refuse(definition.name + "." + key->name + " is longer than " + std::to_string(longestKey) + " bytes");
        }
        path.keys.push_back({key->name, value->value});
    }
    requireShort(instance);
}

void completeFilter(const Schema& schema, Instance& filter) {
    const std::string text = textOf(filter, "Query");
    const std::string language = textOf(filter, "QueryLanguage");
    if (text.empty() || language.empty()) {
        refuse("a filter needs Query and QueryLanguage");
    }
    requireShort(filter);
    std::vector<std::string> names = namedNamespaces(schema, filter);
    const bool isNamed = !names.empty();
    if (!isNamed) {
        names.emplace_back(interop);
    }
    for (const std::string& name : names) {
        try {
            checkQuery(schema, name, text, language);
        } catch (const RequestError& error) {
            const char* hint = isNamed ? "" : " (the filter names no SourceNamespaces, so its own is meant)";
            throw RequestError(error.code(), std::string(error.what()) + hint);
        }
    }
    set(filter, "SourceNamespaces", textArray(names));
    set(filter, "SourceNamespace", names.size() == 1 ? Value::string(names[0]) : Value::null(CMPI_string));
}

void completeDestination(Instance& destination) {
    try {
        delivery::Url::parse(textOf(destination, "Destination"));
    } catch (const std::invalid_argument& error) {
        refuse(std::string("Destination: ") + error.what());
    }
    requireShort(destination);
    if (setDefault(destination, "Protocol", protocolCimXml) != protocolCimXml) {
        refuse("Protocol: indications are sent by CIM-XML (2) only");
    }
    if (const auto persistence = setDefault(destination, "PersistenceType", 2);
        persistence == 0 || persistence > persistenceTransient) {
        refuse("PersistenceType: 2 is permanent, 3 transient");
    }
}

void completeSubscription(Instance& subscription, Time now) {
    setDefault(subscription, "OnFatalErrorPolicy", ignoreErrors);
    setDefault(subscription, "SubscriptionState", stateEnabled);
    if (setDefault(subscription, "RepeatNotificationPolicy", repeatAlways) != repeatAlways) {
        refuse("RepeatNotificationPolicy: every indication is sent (2)");
    }
    set(subscription, "TimeOfLastStateChange", timeValue(now));
    set(subscription, "SubscriptionStartTime", timeValue(now));
    checkSubscription(subscription);
}

void checkSubscription(const Instance& subscription) {
    const auto policy = numberOf(subscription, "OnFatalErrorPolicy");
    if (policy && (*policy < ignoreErrors || *policy > removeOnErrors)) {
        refuse("OnFatalErrorPolicy: 2 ignores, 3 disables, 4 removes");
    }
    const auto state = numberOf(subscription, "SubscriptionState");
    if (state && *state != stateEnabled && *state != stateDisabled) {
        refuse("SubscriptionState: 2 is enabled, 4 disabled");
    }
    if (numberOf(subscription, "SubscriptionDuration") == 0U) {
        refuse("SubscriptionDuration: a subscription of no length; without a value it lasts");
    }
    requireShort(subscription);
}

} // namespace marlo::subscriptions

#include "host/cli/Subscribe.h"

#include "host/cli/LocalCim.h"
#include "host/cli/Status.h"
#include "host/cli/Table.h"
#include "host/cli/Text.h"
#include "host/server/LocalClient.h"
#include "host/subscriptions/Properties.h"

#include <algorithm>
#include <functional>
#include <memory>
#include <nlohmann/json.hpp>
#include <set>
#include <utility>

namespace marlo::cli {

namespace {

using subscriptions::numberOf;
using subscriptions::referenceOf;
using subscriptions::textOf;
using subscriptions::textsOf;

/** What this program names so, it removes with the last subscription. */
constexpr const char* OwnListeners = "marlo:listener-";
constexpr const char* OwnFilters = "marlo:filter-";

/** Everything that the server has about subscriptions. */
struct Holdings {
    explicit Holdings(const LocalCim& cim)
        : listeners(cim.enumerate("CIM_ListenerDestination")),
          filters(cim.enumerate("CIM_IndicationFilter")),
          subscriptions(cim.enumerate("CIM_IndicationSubscription")) {}

    std::vector<Instance> listeners;
    std::vector<Instance> filters;
    std::vector<Instance> subscriptions;
};

/** One subscription with both its ends, as it is shown. */
struct Row {
    ObjectPath path;
    std::string listener;
    std::string url;
    std::string filter;
    std::string query;
    std::vector<std::string> nameSpaces;
    bool isEnabled = false;
};

const Instance* find(const std::vector<Instance>& instances, const ObjectPath* path) {
    const auto found = std::find_if(instances.begin(), instances.end(), [path](const Instance& each) {
        return path != nullptr && each.path.toString() == path->toString();
    });
    return found == instances.end() ? nullptr : &*found;
}

std::vector<Row> rowsOf(const Holdings& holdings) {
    constexpr std::uint64_t enabled = 2;
    std::vector<Row> rows;
    for (const Instance& each : holdings.subscriptions) {
        Row row;
        row.path = each.path;
        row.isEnabled = numberOf(each, "SubscriptionState") == enabled;
        if (const Instance* listener = find(holdings.listeners, referenceOf(each, "Handler"))) {
            row.listener = textOf(*listener, "Name");
            row.url = textOf(*listener, "Destination");
        }
        if (const Instance* filter = find(holdings.filters, referenceOf(each, "Filter"))) {
            row.filter = textOf(*filter, "Name");
            row.query = textOf(*filter, "Query");
            row.nameSpaces = textsOf(*filter, "SourceNamespaces");
        }
        rows.push_back(std::move(row));
    }
    return rows;
}

void show(const std::vector<Row>& rows, const Options& options, Output& output) {
    if (options.json) {
        auto list = nlohmann::ordered_json::array();
        for (const Row& each : rows) {
            list.push_back({{"listener", each.listener},
                            {"url", each.url},
                            {"filter", each.filter},
                            {"query", each.query},
                            {"namespaces", each.nameSpaces},
                            {"enabled", each.isEnabled},
                            {"path", each.path.toString()}});
        }
        output.write(list.dump(2, ' ', false, nlohmann::ordered_json::error_handler_t::replace) + "\n");
    } else {
        Table table({"LISTENER", "URL", "FILTER", "QUERY", "NAMESPACE", "STATE"});
        for (const Row& each : rows) {
            table.add({{{makePrintable(each.listener)}, {}},
                       {{makePrintable(each.url)}, {}},
                       {{makePrintable(each.filter)}, {}},
                       {{makePrintable(each.query)}, {}},
                       {each.nameSpaces, {}},
                       {{each.isEnabled ? "enabled" : "disabled"}, each.isEnabled ? Style::Good : Style::Bad}});
        }
        output.write(table.render(terminalWidth(), showsColours()));
    }
    output.finish();
}

/** "marlo:filter-1" and so on: the first one that nobody has. */
std::string freeName(const std::string& prefix, const std::vector<Instance>& taken) {
    std::set<std::string> names;
    for (const Instance& each : taken) {
        names.insert(textOf(each, "Name"));
    }
    unsigned number = 1;
    while (names.count(prefix + std::to_string(number)) != 0) {
        ++number;
    }
    return prefix + std::to_string(number);
}

/** Makes what is needed for one listener; all of it goes again unless it is kept. */
class Subscriber {
  public:
    Subscriber(const LocalCim& cim, const Options& options) : _cim(cim), _options(options), _before(cim) {}

    ~Subscriber() {
        for (; !_made.empty(); _made.pop_back()) {
            try {
                _cim.remove(_made.back());
            } catch (const std::exception& error) {
                complain("could not be taken back: " + _made.back().toString() + ": " + error.what());
            }
        }
    }

    Subscriber(const Subscriber&) = delete;
    Subscriber& operator=(const Subscriber&) = delete;

    /** The paths of all subscriptions that there are now of what the options say. */
    std::vector<std::string> subscribe() {
        const ObjectPath listener = findListener();
        std::vector<std::string> paths;
        for (const std::string& query : queries()) {
            const ObjectPath filter = findFilter(query);
            paths.push_back(connect(filter, listener).toString());
        }
        return paths;
    }

    void keep() { _made.clear(); }

  private:
    [[nodiscard]] std::vector<std::string> queries() const {
        if (!_options.watch.filter.empty()) {
            return {_options.watch.filter};
        }
        std::vector<std::string> all;
        for (const std::string& each : _options.watch.classes) {
            all.push_back("SELECT * FROM " + each);
        }
        return all;
    }

    ObjectPath make(const std::string& className, std::vector<NamedValue> properties) {
        ObjectPath path = _cim.create({{"", "", className, {}}, std::move(properties)});
        _made.push_back(path);
        return path;
    }

    ObjectPath findListener() {
        for (const Instance& each : _before.listeners) {
            if (textOf(each, "Destination") == _options.argument) {
                return each.path;
            }
        }
        return make("CIM_ListenerDestinationCIMXML",
                    {{"Name", Value::string(freeName(OwnListeners, _before.listeners))},
                     {"Destination", Value::string(_options.argument)}});
    }

    ObjectPath findFilter(const std::string& query) {
        for (const Instance& each : _before.filters) {
            const auto nameSpaces = textsOf(each, "SourceNamespaces");
            if (textOf(each, "Query") == query && textOf(each, "QueryLanguage") == _options.watch.language &&
                nameSpaces.size() == 1 && equalNames(nameSpaces.front(), _options.nameSpace)) {
                return each.path;
            }
        }
        Instance filter{{},
                        {{"Name", Value::string(freeName(OwnFilters, _before.filters))},
                         {"Query", Value::string(query)},
                         {"QueryLanguage", Value::string(_options.watch.language)},
                         {"SourceNamespaces", subscriptions::textArray({_options.nameSpace})}}};
        filter.path = make("CIM_IndicationFilter", filter.properties);
        _before.filters.push_back(filter); // its name is taken
        return filter.path;
    }

    /** What there is already stays as it is. */
    ObjectPath connect(const ObjectPath& filter, const ObjectPath& listener) {
        for (const Instance& each : _before.subscriptions) {
            const ObjectPath* knownFilter = referenceOf(each, "Filter");
            const ObjectPath* knownListener = referenceOf(each, "Handler");
            if (knownFilter != nullptr && knownListener != nullptr && knownFilter->toString() == filter.toString() &&
                knownListener->toString() == listener.toString()) {
                return each.path;
            }
        }
        return make("CIM_IndicationSubscription",
                    {{"Filter", subscriptions::reference(filter)}, {"Handler", subscriptions::reference(listener)}});
    }

    const LocalCim& _cim;
    const Options& _options;
    Holdings _before;
    std::vector<ObjectPath> _made;
};

ExitCode subscribe(const LocalCim& cim, const Options& options, Output& output) {
    Subscriber subscriber(cim, options);
    const std::vector<std::string> paths = subscriber.subscribe();
    subscriber.keep();
    std::vector<Row> rows = rowsOf(Holdings(cim));
    rows.erase(std::remove_if(rows.begin(), rows.end(),
                              [&paths](const Row& each) {
                                  return std::find(paths.begin(), paths.end(), each.path.toString()) == paths.end();
                              }),
               rows.end());
    show(rows, options, output);
    return Answered;
}

/** Removes what `subscribe` made and nobody is subscribed with any more. */
void tidyUp(const LocalCim& cim) {
    const Holdings holdings(cim);
    std::set<std::string> used;
    for (const Row& each : rowsOf(holdings)) {
        used.insert({each.listener, each.filter});
    }
    const auto tidy = [&](const std::vector<Instance>& instances, const char* prefix) {
        for (const Instance& each : instances) {
            const std::string name = textOf(each, "Name");
            if (name.starts_with(prefix) && used.count(name) == 0) {
                cim.remove(each.path);
            }
        }
    };
    tidy(holdings.listeners, OwnListeners);
    tidy(holdings.filters, OwnFilters);
}

ExitCode unsubscribe(const LocalCim& cim, const Options& options, Output& output) {
    if (!options.all && options.argument.empty()) {
        throw UsageError("NAME is required, or --all");
    }
    std::vector<Row> ended;
    for (Row& each : rowsOf(Holdings(cim))) {
        const std::string& name = options.argument;
        if (options.all || name == each.listener || name == each.url || name == each.filter) {
            cim.remove(each.path);
            ended.push_back(std::move(each));
        }
    }
    tidyUp(cim);
    if (ended.empty() && !options.all) {
        complain("nobody is subscribed by the name of " + makePrintable(options.argument));
        return Failed;
    }
    show(ended, options, output);
    return Answered;
}

} // namespace

bool isAboutSubscriptions(Command command) {
    return command == Command::Subscribe || command == Command::Subscriptions || command == Command::Unsubscribe;
}

ExitCode runSubscriptions(const Options& options, Output& output) {
    try {
        const LocalCim cim(findSocket(options.server));
        if (options.command == Command::Subscribe) {
            return subscribe(cim, options, output);
        }
        if (options.command == Command::Unsubscribe) {
            return unsubscribe(cim, options, output);
        }
        show(rowsOf(Holdings(cim)), options, output);
        return Answered;
    } catch (const server::NotRunning& error) {
        complain(std::string("not running: ") + error.what());
    } catch (const Refused& error) {
        complain(error.what());
    }
    return Failed;
}

} // namespace marlo::cli

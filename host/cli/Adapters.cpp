#include "host/cli/Adapters.h"

#include "host/cli/Json.h"
#include "host/cli/Table.h"
#include "host/cli/Text.h"

#include <algorithm>
#include <array>
#include <map>

namespace marlo::cli {

namespace {

constexpr const char* ConfigurationClass = "MARLO_NetworkAdapterConfiguration";
constexpr const char* PortClass = "MARLO_LogicalNetworkAdapter";
constexpr const char* Identity = "SettingID";
constexpr const char* PortStatus = "Status";

struct Heading {
    const char* property;
    const char* title;
};

/** The columns of the table where no others are asked for. */
constexpr std::array<Heading, 8> Headings = {{{Identity, "NAME"},
                                              {PortStatus, "STATUS"},
                                              {"MACAddress", "MAC"},
                                              {"IPAddress", "ADDRESSES"},
                                              {"IPSubnet", "MASK"},
                                              {"DefaultIPGateway", "GATEWAY"},
                                              {"DHCPEnabled", "DHCP"},
                                              {"DNSServerSearchOrder", "DNS"}}};

bool isStatus(const std::string& property) {
    return equalNames(property, PortStatus);
}

/** The text of a property that is a text, else an empty one. */
std::string textOf(const Instance& instance, const char* property) {
    const NamedValue* const found = findName(instance.properties, property);
    const auto* const text = found == nullptr ? nullptr : std::get_if<std::string>(&found->value.data);
    return text == nullptr ? std::string() : *text;
}

/** The properties to be shown, spelled as the class spells them. */
std::vector<std::string> chooseProperties(const Schema& schema, const Options& options) {
    std::vector<std::string> chosen;
    std::vector<std::string> ofConfiguration;
    const Class* const configuration = schema.findClass(options.nameSpace, ConfigurationClass);
    for (const std::string& name : options.properties) {
        const Property* const known = configuration == nullptr ? nullptr : configuration->findProperty(name);
        chosen.push_back(isStatus(name) ? PortStatus : known == nullptr ? name : known->name);
        if (!isStatus(name)) {
            ofConfiguration.push_back(name);
        }
    }
    requireProperties(schema, options.nameSpace, ConfigurationClass, ofConfiguration);
    return chosen;
}

/** The status of each port, by each of the names under which a configuration may know it. */
Status readPortStatus(ObjectManager& manager, const Options& options, std::map<std::string, Value>& statusOfPort) {
    return manager.enumerateInstances(options.nameSpace, PortClass, {{"DeviceID", "Name", PortStatus}},
                                      [&statusOfPort](Instance&& port) {
                                          const NamedValue* const status = findName(port.properties, PortStatus);
                                          if (status != nullptr && !status->value.isNull()) {
                                              statusOfPort[textOf(port, "Name")] = status->value;
                                              statusOfPort[textOf(port, "DeviceID")] = status->value;
                                          }
                                      });
}

/** Configurations with the status of their ports as one more property. */
class AdapterList {
  public:
    AdapterList(ObjectManager& manager, const Options& options, std::vector<std::string> properties)
        : _manager(manager), _options(options), _properties(std::move(properties)) {}

    /** Hands each adapter to `use`; the worse of the statuses of the two enumerations. */
    template <class Use>
    ExitCode read(const Use& use) {
        std::map<std::string, Value> statusOfPort;
        const bool needsPorts = wants(PortStatus);
        Status ports = needsPorts ? readPortStatus(_manager, _options, statusOfPort) : Status{};
        const Status status = _manager.enumerateInstances(_options.nameSpace, ConfigurationClass, requested(),
                                                          [&](Instance&& configuration) {
                                                              if (needsPorts) {
                                                                  addStatus(configuration, statusOfPort);
                                                              }
                                                              use(std::move(configuration));
                                                          });
        _answered = status.ok();
        const ExitCode code = report(status);
        // What was wrong for both is said once.
        const auto isSaid = [&status](const std::string& line) {
            return std::find(status.reported.begin(), status.reported.end(), line) != status.reported.end();
        };
        std::erase_if(ports.reported, isSaid);
        return !_answered || isSaid(ports.message) ? Failed : std::max(code, report(ports));
    }

    [[nodiscard]] bool answered() const { return _answered; }

  private:
    [[nodiscard]] bool wants(const char* property) const {
        return _properties.empty() ||
               std::find(_properties.begin(), _properties.end(), property) != _properties.end();
    }

    [[nodiscard]] PropertyList requested() const {
        if (_properties.empty()) {
            return std::nullopt;
        }
        std::vector<std::string> names = {Identity, "IPEnabled"};
        std::copy_if(_properties.begin(), _properties.end(), std::back_inserter(names), [&names](const auto& name) {
            return !isStatus(name) && std::find(names.begin(), names.end(), name) == names.end();
        });
        return names;
    }

    /** A configuration without a port, a bridge's for instance, can still tell whether it takes part in IP traffic.
     */
    static void addStatus(Instance& configuration, const std::map<std::string, Value>& statusOfPort) {
        const auto port = statusOfPort.find(textOf(configuration, Identity));
        const NamedValue* const ipEnabled = findName(configuration.properties, "IPEnabled");
        Value status = Value::null(CMPI_string);
        if (port != statusOfPort.end()) {
            status = port->second;
        } else if (ipEnabled != nullptr && !ipEnabled->value.isNull()) {
            status = Value::string(ipEnabled->value == Value::boolean(true) ? "IP enabled" : "IP disabled");
        }
        configuration.properties.push_back({PortStatus, std::move(status)});
    }

    ObjectManager& _manager;
    const Options& _options;
    std::vector<std::string> _properties;
    bool _answered = false;
};

Style styleOf(const std::string& property, const Value& value) {
    const auto* const text = std::get_if<std::string>(&value.data);
    if (!isStatus(property) || text == nullptr) {
        return Style::Plain;
    }
    if (*text == "OK" || *text == "IP enabled") {
        return Style::Good;
    }
    return *text == "Stopped" || *text == "IP disabled" ? Style::Faint : Style::Bad;
}

Cell makeCell(const Instance& adapter, const std::string& property) {
    const NamedValue* const found = findName(adapter.properties, property);
    const Value value = found == nullptr ? Value{} : found->value;
    return {showInCell(value), styleOf(property, value)};
}

std::string titleOf(const std::string& property) {
    const auto* const heading = std::find_if(
        Headings.begin(), Headings.end(), [&](const Heading& each) { return equalNames(property, each.property); });
    return heading == Headings.end() ? property : heading->title;
}

ExitCode printTable(AdapterList& adapters, std::vector<std::string> columns, Output& output) {
    if (columns.empty()) {
        for (const Heading& heading : Headings) {
            columns.emplace_back(heading.property);
        }
    }
    std::vector<std::string> titles;
    std::transform(columns.begin(), columns.end(), std::back_inserter(titles), titleOf);
    Table table(std::move(titles));
    const ExitCode code = adapters.read([&](Instance&& adapter) {
        std::vector<Cell> row;
        row.reserve(columns.size());
        for (const std::string& column : columns) {
            row.push_back(makeCell(adapter, column));
        }
        table.add(std::move(row));
    });
    if (!table.empty()) {
        output.write(table.render(terminalWidth(), showsColours()));
        output.finish();
    } else if (code == Answered) {
        complain("no network adapters");
    }
    return code;
}

ExitCode printJson(AdapterList& adapters, const Schema& schema, const std::vector<std::string>& chosen,
                   Output& output) {
    JsonArray array(output);
    const ExitCode code = adapters.read([&](Instance&& adapter) {
        if (!chosen.empty()) {
            std::erase_if(adapter.properties, [&chosen](const NamedValue& property) {
                return std::find(chosen.begin(), chosen.end(), property.name) == chosen.end();
            });
            addMissing(schema, adapter, chosen);
        }
        orderBySchema(schema, adapter);
        array.add(toJson(adapter));
    });
    array.close(adapters.answered());
    output.finish();
    return code;
}

} // namespace

ExitCode runAdapters(ObjectManager& manager, const Options& options, Output& output) {
    const std::vector<std::string> chosen = chooseProperties(manager.schema(), options);
    std::vector<std::string> read = chosen;
    if (chosen.empty() && !options.json) {
        for (const Heading& heading : Headings) {
            read.emplace_back(heading.property);
        }
    }
    AdapterList adapters(manager, options, read);
    return options.json ? printJson(adapters, manager.schema(), chosen, output) : printTable(adapters, read, output);
}

} // namespace marlo::cli

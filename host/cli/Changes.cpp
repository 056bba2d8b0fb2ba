#include "host/cli/Changes.h"

#include "host/cli/Assignments.h"
#include "host/cli/ChangeReport.h"
#include "host/cli/Json.h"
#include "host/cli/Text.h"

#include <algorithm>
#include <charconv>
#include <cstdlib>
#include <set>

#include <arpa/inet.h>

namespace marlo::cli {

namespace {

constexpr const char* ConfigurationClass = "MARLO_NetworkAdapterConfiguration";
constexpr const char* Identity = "SettingID";
constexpr const char* RestartMethod = "RestartNetwork";

using Arguments = std::vector<NamedValue>;

Value texts(const std::vector<std::string>& elements) {
    Value::Array array;
    std::transform(elements.begin(), elements.end(), std::back_inserter(array), Value::string);
    return {CMPI_stringA, std::move(array)};
}

/** Refused here, before the first of several steps, what could only fail at a later one. */
std::string requireIpv4(const std::string& text) {
    in_addr address{};
    if (inet_pton(AF_INET, text.c_str(), &address) != 1) {
        throw UsageError("no IPv4 address: \"" + text + "\"");
    }
    return text;
}

/** The restart is a command of the real host, whatever host the agent shows. */
void refuseRestartOfDescribedHost(const Options& options) {
    const char* const tree = std::getenv("ORV_AGENT_TREE");
    if (!options.agent.treeFile.empty() || (tree != nullptr && *tree != '\0')) {
        throw UsageError(std::string(RestartMethod) +
                         " restarts the networking of this host, not of the one that a tree file describes");
    }
}

/** One command: its calls one after the other, between two readings of all adapters. */
class Change {
  public:
    Change(ObjectManager& manager, const Options& options) : _manager(manager), _options(options) {}

    /** Reads what is there. False, and said why, when that fails or the named adapter is not there. */
    bool begin() { return read(_before) && (_options.argument.empty() || isThere(_options.argument)); }

    /** Calls a method of the named adapter, or of the class where none is named. False, and said why, for a failure.
     */
    bool invoke(const std::string& method, const Arguments& arguments) {
        Call call{method, {}, {}};
        call.status = _manager.invokeMethod(path(), method, arguments, call.answer);
        return conclude(std::move(call));
    }

    /** Sets properties of the named adapter. */
    bool modify(const Arguments& values) {
        std::vector<std::string> names;
        std::transform(values.begin(), values.end(), std::back_inserter(names),
                       [](const NamedValue& value) { return value.name; });
        return conclude({"ModifyInstance", _manager.modifyInstance({path(), values}, names), {}});
    }

    /** Reads again and prints; the exit code of the command. */
    ExitCode end(Output& output, bool showsResults) {
        std::vector<Instance> after;
        const bool isRead = read(after);
        const Class* const definition = _manager.schema().findClass(_options.nameSpace, ConfigurationClass);
        if (isRead && definition != nullptr) {
            _report.differences = compare(*definition, _before, after);
        }
        print(output, showsResults);
        output.finish();
        if (isRead && !_hasFailed && _report.differences.empty() && !_options.json) {
            complain("nothing has changed");
        }
        return isRead && !_hasFailed ? Answered : Failed;
    }

  private:
    [[nodiscard]] ObjectPath path() const {
        ObjectPath path{"", _options.nameSpace, ConfigurationClass, {}};
        if (!_options.argument.empty()) {
            path.keys.push_back({Identity, Value::string(_options.argument)});
        }
        return path;
    }

    /** What is logged for every reading of the adapters alike is said once, and is no failure of the change. */
    void sayOnce(const std::string& line) {
        if (_said.insert(line).second) {
            complain(line);
        }
    }

    bool read(std::vector<Instance>& adapters) {
        const Status status =
            _manager.enumerateInstances(_options.nameSpace, ConfigurationClass, std::nullopt,
                                        [&adapters](Instance&& adapter) { adapters.push_back(std::move(adapter)); });
        for (const std::string& line : status.reported) {
            sayOnce(line);
        }
        return status.ok() || report(status) == Answered;
    }

    bool isThere(const std::string& adapter) const {
        std::string known;
        for (const Instance& instance : _before) {
            const std::string name = showPlainly(instance.path.keys.front().value);
            if (instance.path.keys.front().value == Value::string(adapter)) {
                return true;
            }
            known += (known.empty() ? "; there are " : ", ") + name;
        }
        complain("there is no network adapter \"" + adapter + "\"" + (known.empty() ? "; there are none" : known));
        return false;
    }

    bool conclude(Call&& call) {
        std::vector<std::string> logged = call.status.reported;
        std::erase_if(logged, [this](const std::string& line) { return _said.contains(line); });
        for (const std::string& line : logged) {
            sayOnce(line);
        }
        if (!call.status.ok()) {
            // A reason that is what was logged has just been said.
            const bool isSaid = std::any_of(
                call.status.reported.begin(), call.status.reported.end(),
                [&call](const std::string& line) { return call.status.message.find(line) != std::string::npos; });
            complain(call.name + " failed: " + statusName(call.status.code) + " (" +
                     std::to_string(call.status.code) + ")" + (isSaid ? "" : ": " + call.status.message));
        }
        const bool isGood = call.status.ok() && logged.empty();
        _hasFailed = _hasFailed || !isGood;
        _report.calls.push_back(std::move(call));
        return isGood;
    }

    void print(Output& output, bool showsResults) const {
        if (_options.json) {
            output.write(toJson(_report) + "\n");
            return;
        }
        for (const Call& call : _report.calls) {
            if (showsResults && call.status.ok()) {
                output.write(call.name + " = " + showValue(call.answer.returned) + "\n");
                for (const NamedValue& out : call.answer.out) {
                    output.write("  " + out.name + " = " + showValue(out.value) + "\n");
                }
            }
        }
        if (!_report.differences.empty()) {
            output.write(showDifferences(_report.differences, terminalWidth(), showsColours()));
        }
    }

    ObjectManager& _manager;
    const Options& _options;
    std::vector<Instance> _before;
    std::set<std::string> _said;
    ChangeReport _report;
    bool _hasFailed = false;
};

const Class* configurationClass(const ObjectManager& manager, const Options& options) {
    return manager.schema().findClass(options.nameSpace, ConfigurationClass);
}

Arguments readArguments(const ObjectManager& manager, const Options& options) {
    const Class* const definition = configurationClass(manager, options);
    const Method* const method = definition == nullptr ? nullptr : definition->findMethod(options.method);
    return readAssignments(options.values, [method](std::string_view name) -> CMPIType {
        if (method == nullptr) {
            return CMPI_null;
        }
        const auto found =
            std::find_if(method->parameters.begin(), method->parameters.end(),
                         [name](const Parameter& parameter) { return equalNames(parameter.name, name); });
        return found == method->parameters.end() ? CMPIType{CMPI_null} : found->type;
    });
}

Arguments readProperties(const ObjectManager& manager, const Options& options) {
    const Class* const definition = configurationClass(manager, options);
    return readAssignments(options.values, [definition](std::string_view name) -> CMPIType {
        const Property* const found = definition == nullptr ? nullptr : definition->findProperty(name);
        return found == nullptr ? CMPIType{CMPI_null} : found->type;
    });
}

Arguments addressArguments(const Options& options) {
    auto [address, mask] = splitPrefix(options.address);
    if (!options.mask.empty()) {
        if (!mask.empty()) {
            throw UsageError("both a prefix length and --mask are given");
        }
        mask = options.mask;
    }
    Arguments arguments{{"IPAddress", texts({requireIpv4(address)})}};
    if (!mask.empty()) {
        arguments.push_back({"SubnetMask", texts({requireIpv4(mask)})});
    }
    if (!options.gateway.empty()) {
        requireIpv4(options.gateway);
    }
    return arguments;
}

bool setGateway(Change& change, const std::string& gateway) {
    return change.invoke("SetGateways", {{"DefaultIPGateway", texts({gateway})}});
}

/** Sets what is not empty; ends with the first failure. */
bool setTexts(Change& change, const char* method, const char* argument, const std::vector<std::string>& values) {
    return values.empty() || change.invoke(method, {{argument, texts(values)}});
}

bool setNameService(Change& change, const Options& options) {
    if (!setTexts(change, "SetDNSServerSearchOrder", "DNSServerSearchOrder", options.servers) ||
        !setTexts(change, "SetDNSSuffixSearchOrder", "DNSDomainSuffixSearchOrder", options.suffixes)) {
        return false;
    }
    return options.domain.empty() || change.invoke("SetDNSDomain", {{"DNSDomain", Value::string(options.domain)}});
}

/** What a command does, made ready before anything is read or changed, so that a wrong command line changes nothing.
 */
std::function<bool(Change&)> prepare(const ObjectManager& manager, const Options& options) {
    switch (options.command) {
    case Command::Invoke:
        if (equalNames(options.method, RestartMethod)) {
            refuseRestartOfDescribedHost(options);
        }
        return [&options, arguments = readArguments(manager, options)](Change& change) {
            return change.invoke(options.method, arguments);
        };
    case Command::Set:
        return [values = readProperties(manager, options)](Change& change) { return change.modify(values); };
    case Command::Static:
        return [&options, arguments = addressArguments(options)](Change& change) {
            return change.invoke("EnableStatic", arguments) &&
                   (options.gateway.empty() || setGateway(change, options.gateway));
        };
    case Command::Dhcp:
        return [](Change& change) { return change.invoke("EnableDHCP", {}); };
    case Command::Dns:
        if (options.servers.empty() && options.suffixes.empty() && options.domain.empty()) {
            throw UsageError("one of --server, --search and --domain is required");
        }
        return [&options](Change& change) { return setNameService(change, options); };
    case Command::Gateway:
        return [&options](Change& change) { return setGateway(change, options.gateway); };
    default:
        refuseRestartOfDescribedHost(options);
        return [](Change& change) { return change.invoke(RestartMethod, {}); };
    }
}

} // namespace

std::pair<std::string, std::string> splitPrefix(const std::string& address) {
    const std::size_t slash = address.find('/');
    if (slash == std::string::npos) {
        return {address, ""};
    }
    const std::string text = address.substr(slash + 1);
    constexpr unsigned longest = 32;
    unsigned length = 0;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), length);
    if (error != std::errc() || end != text.data() + text.size() || length == 0 || length > longest) {
        throw UsageError("a prefix length is 1 to 32, not \"" + text + "\"");
    }
    const std::uint32_t mask = ~std::uint32_t{0} << (longest - length);
    std::string dotted;
    for (const unsigned shift : {24U, 16U, 8U, 0U}) {
        dotted += (dotted.empty() ? "" : ".") + std::to_string(mask >> shift & 0xFFU);
    }
    return {address.substr(0, slash), dotted};
}

ExitCode runChange(ObjectManager& manager, const Options& options, Output& output) {
    const auto act = prepare(manager, options);
    Change change(manager, options);
    if (!change.begin()) {
        return Failed;
    }
    act(change);
    return change.end(output, options.command == Command::Invoke || options.command == Command::Restart);
}

} // namespace marlo::cli

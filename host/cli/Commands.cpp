#include "host/cli/Commands.h"

#include "host/cli/Adapters.h"
#include "host/cli/Changes.h"
#include "host/cli/Json.h"
#include "host/cli/Table.h"
#include "host/cli/Text.h"
#include "host/cli/Watch.h"

#include <algorithm>
#include <stdexcept>

namespace marlo::cli {

namespace {

PropertyList propertyList(const Options& options) {
    return options.properties.empty() ? PropertyList{} : PropertyList{options.properties};
}

/** Prints instances as they come: in JSON, or as paragraphs. */
class InstancePrinter {
  public:
    InstancePrinter(const Schema& schema, const Options& options, Output& output)
        : _schema(schema), _properties(options.properties), _json(options.json), _output(output), _array(output) {}

    void operator()(Instance&& instance) {
        addMissing(_schema, instance, _properties);
        orderBySchema(_schema, instance);
        if (_json) {
            _array.add(toJson(instance));
        } else {
            _output.write(_isEmpty ? "" : "\n");
            _output.write(showInstance(instance));
        }
        _isEmpty = false;
    }

    void close(bool answered) {
        if (_json) {
            _array.close(answered);
        }
    }

    [[nodiscard]] bool isEmpty() const { return _isEmpty; }

  private:
    const Schema& _schema;
    const std::vector<std::string>& _properties;
    bool _json;
    Output& _output;
    JsonArray _array;
    bool _isEmpty = true;
};

void hintThatNothingIsThere(bool isEmpty, const Status& status, const Options& options) {
    if (isEmpty && status.ok() && status.reported.empty() && !options.json) {
        complain("no instances of " + options.argument + " in " + options.nameSpace);
    }
}

ExitCode runEnumerate(ObjectManager& manager, const Options& options, Output& output) {
    requireProperties(manager.schema(), options.nameSpace, options.argument, options.properties);
    InstancePrinter print(manager.schema(), options, output);
    const Status status = manager.enumerateInstances(options.nameSpace, options.argument, propertyList(options),
                                                     [&print](Instance&& instance) { print(std::move(instance)); });
    print.close(status.ok());
    output.finish();
    hintThatNothingIsThere(print.isEmpty(), status, options);
    return report(status);
}

ExitCode runNames(ObjectManager& manager, const Options& options, Output& output) {
    JsonArray array(output);
    bool isEmpty = true;
    const Status status = manager.enumerateInstanceNames(options.nameSpace, options.argument, [&](ObjectPath&& path) {
        isEmpty = false;
        if (options.json) {
            array.add(toJson(path));
        } else {
            output.write(makePrintable(path.toString()) + "\n");
        }
    });
    if (options.json) {
        array.close(status.ok());
    }
    output.finish();
    hintThatNothingIsThere(isEmpty, status, options);
    return report(status);
}

ObjectPath parsePath(const Options& options) {
    try {
        ObjectPath path = ObjectPath::parse(options.argument);
        if (path.nameSpace.empty()) {
            path.nameSpace = options.nameSpace;
        }
        return path;
    } catch (const std::invalid_argument& error) {
        throw UsageError("not an object path: " + options.argument + ": " + error.what());
    }
}

ExitCode runGet(ObjectManager& manager, const Options& options, Output& output) {
    ObjectPath path = parsePath(options);
    path.nameSpace = manager.spell(path.nameSpace);
    requireProperties(manager.schema(), path.nameSpace, path.className, options.properties);
    InstancePrinter print(manager.schema(), options, output);
    const Status status = manager.getInstance(path, propertyList(options),
                                              [&print](Instance&& instance) { print(std::move(instance)); });
    print.close(status.ok());
    output.finish();
    return report(status);
}

void printClassTable(const std::vector<const Class*>& classes, Output& output) {
    Table table({"CLASS", "SUPERCLASS", "KEYS"});
    for (const Class* each : classes) {
        Cell keys;
        for (const Property* key : each->keys()) {
            keys.lines.push_back(key->name);
        }
        table.add({{{each->name}, each->isAbstract ? Style::Faint : Style::Plain}, {{each->superClass}, {}}, keys});
    }
    output.write(table.render(terminalWidth(), showsColours()));
}

ExitCode runClasses(ObjectManager& manager, const Options& options, Output& output) {
    if (!manager.schema().hasNameSpace(options.nameSpace)) {
        return report({CMPI_RC_ERR_INVALID_NAMESPACE, "there is no namespace " + options.nameSpace, {}});
    }
    const std::vector<const Class*> classes = manager.schema().classes(options.nameSpace);
    if (options.json) {
        JsonArray array(output);
        for (const Class* each : classes) {
            array.add(toJson(*each));
        }
        array.close(true);
    } else if (options.namesOnly) {
        for (const Class* each : classes) {
            output.write(each->name + "\n");
        }
    } else {
        printClassTable(classes, output);
    }
    output.finish();
    return Answered;
}

} // namespace

ExitCode report(const Status& status) {
    for (const std::string& line : status.reported) {
        if (status.message.find(line) == std::string::npos) {
            complain(line);
        }
    }
    if (!status.ok()) {
        const std::string reason = status.message.empty() ? "" : ": " + status.message;
        complain(statusName(status.code) + " (" + std::to_string(status.code) + ")" + reason);
    }
    return status.ok() && status.reported.empty() ? Answered : Failed;
}

void requireProperties(const Schema& schema, const std::string& nameSpace, const std::string& className,
                       const std::vector<std::string>& names) {
    const std::vector<const Class*> classes = schema.withSubclasses(nameSpace, className);
    for (const std::string& name : names) {
        const bool isKnown = std::any_of(classes.begin(), classes.end(),
                                         [&name](const Class* each) { return each->findProperty(name) != nullptr; });
        // A class that is unknown itself is for the object manager to answer.
        if (!isKnown && !classes.empty()) {
            throw UsageError(std::string("class ").append(className).append(" has no property \"").append(name) +
                             "\"");
        }
    }
}

void addMissing(const Schema& schema, Instance& instance, const std::vector<std::string>& names) {
    const Class* const definition = schema.findClass(instance.path.nameSpace, instance.path.className);
    for (const std::string& name : names) {
        const Property* const property = definition == nullptr ? nullptr : definition->findProperty(name);
        if (property != nullptr && findName(instance.properties, name) == nullptr) {
            instance.properties.push_back({property->name, Value::null(property->type)});
        }
    }
}

void orderBySchema(const Schema& schema, Instance& instance) {
    const Class* const found = schema.findClass(instance.path.nameSpace, instance.path.className);
    if (found == nullptr) {
        return;
    }
    const auto position = [found](const NamedValue& value) {
        const Property* const property = found->findProperty(value.name);
        return property == nullptr ? found->properties.size()
                                   : static_cast<std::size_t>(property - found->properties.data());
    };
    std::stable_sort(
        instance.properties.begin(), instance.properties.end(),
        [&position](const NamedValue& left, const NamedValue& right) { return position(left) < position(right); });
}

ExitCode run(ObjectManager& manager, const Options& given, Output& output) {
    Options options = given;
    options.nameSpace = manager.spell(given.nameSpace);
    switch (options.command) {
    case Command::Adapters:
        return runAdapters(manager, options, output);
    case Command::Enumerate:
        return runEnumerate(manager, options, output);
    case Command::Names:
        return runNames(manager, options, output);
    case Command::Get:
        return runGet(manager, options, output);
    case Command::Invoke:
    case Command::Set:
    case Command::Static:
    case Command::Dhcp:
    case Command::Dns:
    case Command::Gateway:
    case Command::Restart:
        return runChange(manager, options, output);
    case Command::Watch:
        return runWatch(manager, options, output);
    case Command::Classes:
        return runClasses(manager, options, output);
    case Command::Serve:
    case Command::Status:
    case Command::Subscribe:
    case Command::Subscriptions:
    case Command::Unsubscribe:
    case Command::Completion:
        break; // run without the object manager that the others share
    }
    return Answered;
}

} // namespace marlo::cli

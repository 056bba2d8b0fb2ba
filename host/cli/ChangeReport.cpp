#include "host/cli/ChangeReport.h"

#include "host/cli/Table.h"
#include "host/cli/Text.h"

#include <algorithm>

namespace marlo::cli {

namespace {

Value valueOf(const Instance* instance, const Property& property) {
    const NamedValue* const found = instance == nullptr ? nullptr : findName(instance->properties, property.name);
    return found == nullptr ? Value::null(property.type) : found->value;
}

const Instance* findPath(const std::vector<Instance>& instances, const ObjectPath& path) {
    const auto found = std::find_if(instances.begin(), instances.end(),
                                    [&path](const Instance& instance) { return instance.path == path; });
    return found == instances.end() ? nullptr : &*found;
}

void add(std::vector<Difference>& differences, const Class& definition, const Instance* before,
         const Instance* after) {
    const ObjectPath& path = before == nullptr ? after->path : before->path;
    const std::string adapter = path.keys.empty() ? path.toString() : showPlainly(path.keys.front().value);
    for (const Property& property : definition.properties) {
        Value was = valueOf(before, property);
        Value is = valueOf(after, property);
        if (!(was == is)) {
            differences.push_back({adapter, property.name, std::move(was), std::move(is)});
        }
    }
}

} // namespace

std::vector<Difference> compare(const Class& definition, const std::vector<Instance>& before,
                                const std::vector<Instance>& after) {
    std::vector<Difference> differences;
    for (const Instance& instance : before) {
        add(differences, definition, &instance, findPath(after, instance.path));
    }
    for (const Instance& instance : after) {
        if (findPath(before, instance.path) == nullptr) {
            add(differences, definition, nullptr, &instance);
        }
    }
    return differences;
}

std::string showDifferences(const std::vector<Difference>& differences, std::size_t width, bool colours) {
    Table table({"ADAPTER", "PROPERTY", "BEFORE", "AFTER"});
    for (const Difference& difference : differences) {
        table.add({{{makePrintable(difference.adapter)}, Style::Plain},
                   {{difference.property}, Style::Plain},
                   {showInCell(difference.before), Style::Faint},
                   {showInCell(difference.after), Style::Plain}});
    }
    return table.render(width, colours);
}

} // namespace marlo::cli

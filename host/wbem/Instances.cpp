#include "host/wbem/Instances.h"

#include "host/cimom/InstanceChecks.h"

#include <algorithm>

namespace marlo::wbem {

void InstanceOutput::write(const Instance& instance) {
    if (_lastName != instance.path.className) {
        _lastName = instance.path.className;
        _lastClass = _call.manager.schema().findClass(_call.nameSpace, _lastName);
    }
    _call.reply.returned().instance(instance, _wrap, _lastClass, _form);
}

cimxml::Form readForm(const Arguments& arguments) {
    cimxml::Form form;
    form.qualifiers = arguments.boolean("IncludeQualifiers", false);
    form.classOrigin = arguments.boolean("IncludeClassOrigin", false);
    return form;
}

PropertyList readProperties(const Call& call, const std::string& className) {
    PropertyList asked = call.arguments.propertyList();
    if (asked) {
        const auto classes = call.manager.schema().withSubclasses(call.nameSpace, className);
        std::erase_if(*asked, [&classes](const std::string& name) {
            return std::none_of(classes.begin(), classes.end(),
                                [&name](const Class* known) { return known->findProperty(name) != nullptr; });
        });
    }
    return asked;
}

void cutToClass(const Class& definition, Instance& instance) {
    std::erase_if(instance.properties, [&definition](const NamedValue& property) {
        return definition.findProperty(property.name) == nullptr;
    });
}

void cutToList(const PropertyList& properties, Instance& instance) {
    std::erase_if(instance.properties,
                  [&properties](const NamedValue& property) { return !isAsked(properties, property.name); });
}

} // namespace marlo::wbem

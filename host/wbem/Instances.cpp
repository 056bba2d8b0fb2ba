#include "host/wbem/Instances.h"

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
        asked->erase(std::remove_if(asked->begin(), asked->end(),
                                    [&classes](const std::string& name) {
                                        return std::none_of(classes.begin(), classes.end(), [&](const Class* known) {
                                            return known->findProperty(name) != nullptr;
                                        });
                                    }),
                     asked->end());
    }
    return asked;
}

void cutToClass(const Class& definition, Instance& instance) {
    auto& properties = instance.properties;
    properties.erase(std::remove_if(properties.begin(), properties.end(),
                                    [&definition](const NamedValue& property) {
                                        return definition.findProperty(property.name) == nullptr;
                                    }),
                     properties.end());
}

} // namespace marlo::wbem

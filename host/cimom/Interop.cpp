#include "host/cimom/Interop.h"

#include <array>
#include <utility>

#include <unistd.h>

namespace marlo {

namespace {

constexpr const char* interopNameSpace = "root/interop";
constexpr const char* systemClass = "CIM_ComputerSystem";
constexpr const char* managerClass = "CIM_ObjectManager";
constexpr const char* nameSpaceClass = "CIM_Namespace";
constexpr const char* profileClass = "CIM_RegisteredProfile";
constexpr const char* indicationServiceClass = "CIM_IndicationService";

/** A profile of the DMTF. */
struct Profile {
    const char* specification;
    const char* name;
    const char* version;
};

constexpr Profile profileRegistration{"DSP1033", "Profile Registration", "1.0.0"};
constexpr Profile indications{"DSP1054", "Indications", "1.2.2"};

NamedValue text(const char* name, std::string value) {
    return {name, Value::string(std::move(value))};
}

NamedValue number(const char* name, std::uint64_t value) {
    return {name, Value::uint(CMPI_uint16, value)};
}

NamedValue reference(const char* name, ObjectPath path) {
    return {name, {CMPI_ref, std::make_shared<const ObjectPath>(std::move(path))}};
}

/** The only one on this host that goes by this name. */
std::string managerName() {
    return "marlo:" + systemName();
}

std::vector<NamedValue> managerKeys() {
    return {text("SystemCreationClassName", systemClass), text("SystemName", systemName()),
            text("CreationClassName", managerClass), text("Name", managerName())};
}

std::vector<NamedValue> nameSpaceKeys(const std::string& nameSpace) {
    return {text("SystemCreationClassName", systemClass),
            text("SystemName", systemName()),
            text("ObjectManagerCreationClassName", managerClass),
            text("ObjectManagerName", managerName()),
            text("CreationClassName", nameSpaceClass),
            text("Name", nameSpace)};
}

ObjectPath pathOf(const char* className, std::vector<NamedValue> keys) {
    return {"", interopNameSpace, className, std::move(keys)};
}

ObjectPath profilePath(const Profile& profile) {
    return pathOf(profileClass,
                  {text("InstanceID", std::string("marlo:") + profile.specification + ":" + profile.version)});
}

Instance makeManager() {
    Instance manager{{}, managerKeys()};
    for (const NamedValue& property :
         {text("ElementName", "marlo"), text("Caption", "Object manager"),
          text("Description", "marlo, an object manager for CMPI providers, version " MARLO_VERSION),
          number("EnabledState", 2), number("RequestedState", 12)}) {
        manager.properties.push_back(property);
    }
    manager.properties.push_back({"Started", Value::boolean(true)});
    manager.properties.push_back({"GatherStatisticalData", Value::boolean(false)});
    return manager;
}

Instance makeNameSpace(const std::string& nameSpace) {
    const char* const model = "the part of CIM 2 that is served here; classes tell their versions";
    Instance made{{}, nameSpaceKeys(nameSpace)};
    for (const NamedValue& property :
         {text("ElementName", nameSpace), number("ClassInfo", 1), text("DescriptionOfClassInfo", model),
          number("ClassType", 2), text("DescriptionOfClassType", model)}) {
        made.properties.push_back(property);
    }
    return made;
}

Instance makeProfile(const Profile& profile) {
    Instance made{{}, profilePath(profile).keys};
    for (const NamedValue& property :
         {text("ElementName", profile.name), number("RegisteredOrganization", 2),
          text("RegisteredName", profile.name), text("RegisteredVersion", profile.version)}) {
        made.properties.push_back(property);
    }
    const Value notAdvertised = Value::uint(CMPI_uint16, 2);
    made.properties.push_back({"AdvertiseTypes", {CMPI_uint16A, Value::Array{notAdvertised}}});
    return made;
}

Instance makeConformance(const Profile& profile, const ObjectPath& element) {
    return {{}, {reference("ConformantStandard", profilePath(profile)), reference("ManagedElement", element)}};
}

class Interop final : public BuiltIn {
  public:
    Interop(const Schema& schema, InteropNeighbours neighbours, std::vector<std::string> classes)
        : _schema(schema), _neighbours(std::move(neighbours)), _classes(std::move(classes)) {}

    [[nodiscard]] std::string nameSpace() const override { return interopNameSpace; }

    [[nodiscard]] std::vector<std::string> classes() const override { return _classes; }

    Status enumerate(const Class& definition, const ObjectManager::InstanceSink& sink) override {
        if (definition.name == managerClass) {
            sink(makeManager());
        } else if (definition.name == profileClass) {
            enumerateProfiles(sink);
        } else if (definition.name == "CIM_ElementConformsToProfile") {
            enumerateConformance(sink);
        } else {
            for (const std::string& each : _schema.nameSpaces()) {
                sink(definition.name == nameSpaceClass ? makeNameSpace(each) : makeContainment(each));
            }
        }
        return {};
    }

  private:
    /** CIM_NamespaceInManager. */
    static Instance makeContainment(const std::string& nameSpace) {
        return {{},
                {reference("Antecedent", pathOf(managerClass, managerKeys())),
                 reference("Dependent", pathOf(nameSpaceClass, nameSpaceKeys(nameSpace)))}};
    }

    void enumerateProfiles(const ObjectManager::InstanceSink& sink) const {
        sink(makeProfile(profileRegistration));
        if (!_neighbours.namesOf(indicationServiceClass).empty()) {
            sink(makeProfile(indications));
        }
    }

    /** What a profile is about: registered profiles, in the case of their registration. */
    void enumerateConformance(const ObjectManager::InstanceSink& sink) const {
        sink(makeConformance(profileRegistration, profilePath(profileRegistration)));
        const auto services = _neighbours.namesOf(indicationServiceClass);
        if (!services.empty()) {
            sink(makeConformance(profileRegistration, profilePath(indications)));
        }
        for (const ObjectPath& service : services) {
            sink(makeConformance(indications, service));
        }
    }

    const Schema& _schema;
    const InteropNeighbours _neighbours;
    const std::vector<std::string> _classes;
};

} // namespace

std::string systemName() {
    std::array<char, 256> name{};
    return gethostname(name.data(), name.size() - 1) == 0 && name[0] != '\0' ? name.data() : "localhost";
}

std::shared_ptr<BuiltIn> makeInterop(const Schema& schema, InteropNeighbours neighbours) {
    std::vector<std::string> classes;
    for (const char* name :
         {nameSpaceClass, managerClass, "CIM_NamespaceInManager", profileClass, "CIM_ElementConformsToProfile"}) {
        if (schema.findClass(interopNameSpace, name) != nullptr && !neighbours.isServed(name)) {
            classes.emplace_back(name);
        }
    }
    return classes.empty() ? nullptr : std::make_shared<Interop>(schema, std::move(neighbours), std::move(classes));
}

} // namespace marlo

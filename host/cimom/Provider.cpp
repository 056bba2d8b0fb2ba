#include "host/cimom/Provider.h"

#include "host/broker/Broker.h"
#include "host/cimom/AgentLog.h"

#include <algorithm>
#include <cstdlib>
#include <memory>
#include <utility>

#include <cxxabi.h>
#include <dlfcn.h>

namespace marlo {

namespace {

bool containsName(const std::vector<std::string>& names, std::string_view name) {
    return std::any_of(names.begin(), names.end(), [name](const auto& entry) { return equalNames(entry, name); });
}

std::string dlerrorText() {
    const char* text = dlerror();
    return text == nullptr ? "no reason given" : text;
}

/** Tells an interface, if it was made, that the process ends. */
template <typename MI>
void tellEnd(MI*& mi, const CMPIContext& context) {
    if (mi == nullptr) {
        return;
    }
    try {
        if (mi->ft->cleanup != nullptr) {
            mi->ft->cleanup(mi, &context, 1);
        }
    } catch (...) {
        // Nobody is left to whom a failed cleanup would matter.
        static_cast<void>(currentExceptionText());
    }
    mi = nullptr;
}

/**
 * Function tables have grown at their end only, so that one of a later version than this object manager's can be
 * used; before 1.0 they were others, and what has no version at all is no table.
 */
constexpr CMPIVersion oldestTable = 100;

template <typename MI>
MI& requireTable(MI* mi, const std::string& where) {
    if (mi->ft == nullptr) {
        throw LoadError(where + " made an interface without a function table");
    }
    if (mi->ft->ftVersion < oldestTable) {
        throw LoadError(where + " made an interface whose function table is of version " +
                        std::to_string(mi->ft->ftVersion) + ", and not of " + std::to_string(oldestTable) +
                        " or later");
    }
    return *mi;
}

} // namespace

std::string currentExceptionText() {
    try {
        throw;
    } catch (const std::exception& error) {
        return error.what();
    } catch (...) {
        const std::type_info* type = abi::__cxa_current_exception_type();
        if (type == nullptr) {
            return "an exception of a foreign language";
        }
        int code = 0;
        const std::unique_ptr<char, decltype(&std::free)> name(
            abi::__cxa_demangle(type->name(), nullptr, nullptr, &code), &std::free);
        return std::string("an exception of type ") + (code == 0 ? name.get() : type->name());
    }
}

Provider::Provider(Registration registration, const CMPIBroker* broker)
    : _registration(std::move(registration)), _broker(broker) {}

bool Provider::serves(ProviderKind kind, std::string_view nameSpace, std::string_view className) const {
    const auto& kinds = _registration.kinds;
    return std::find(kinds.begin(), kinds.end(), kind) != kinds.end() &&
           containsName(_registration.nameSpaces, nameSpace) && containsName(_registration.classes, className);
}

void* Provider::symbol(const std::string& name) {
    if (_library == nullptr) {
        _library = dlopen(_registration.library.c_str(), RTLD_NOW | RTLD_LOCAL);
        if (_library == nullptr) {
            throw LoadError("provider " + _registration.name + ": cannot load " + _registration.library + ": " +
                            dlerrorText());
        }
        AgentLogCollector::connect();
    }
    void* found = dlsym(_library, name.c_str());
    if (found == nullptr) {
        throw LoadError("provider " + _registration.name + ": no factory " + name + " in " + _registration.library +
                        ": " + dlerrorText());
    }
    return found;
}

/** All factories have this type but for what they return, which is a pointer for all of them. */
template <typename MI>
MI& Provider::make(const std::string& kind, const CMPIContext& context) {
    const std::string factory = _registration.name + "_Create_" + kind;
    using Factory = void* (*)(const CMPIBroker*, const CMPIContext*, CMPIStatus*);
    const auto function = reinterpret_cast<Factory>(symbol(factory));
    const std::string where =
        "provider " + _registration.name + ": factory " + factory + " of " + _registration.library;
    CMPIStatus status{};
    void* made = nullptr;
    try {
        made = function(_broker, &context, &status);
    } catch (...) {
        throw LoadError(where + " threw: " + currentExceptionText());
    }
    if (made == nullptr) {
        const std::string reason = broker::messageOf(status);
        throw LoadError(where + " made nothing" + (reason.empty() ? "" : ": " + reason));
    }
    return requireTable(static_cast<MI*>(made), where);
}

/** Makes an interface where there is none yet, and remembers how that went. */
template <typename MI>
MI& Provider::require(MI*& mi, const std::string& kind, const CMPIContext& context) {
    const std::lock_guard lock(_mutex);
    if (mi == nullptr) {
        try {
            mi = &make<MI>(kind, context);
            remember("");
        } catch (const LoadError& error) {
            remember(error.what());
            throw;
        }
    }
    return *mi;
}

void Provider::remember(const std::string& failure) {
    const std::lock_guard lock(_healthMutex);
    _isLoaded = _library != nullptr;
    _failure = failure;
}

ProviderHealth Provider::health() const {
    const std::lock_guard lock(_healthMutex);
    return {_registration.name, _registration.library, _isLoaded, _failure};
}

CMPIInstanceMI& Provider::instanceMI(const CMPIContext& context) {
    return require(_instanceMI, "InstanceMI", context);
}

CMPIMethodMI& Provider::methodMI(const CMPIContext& context) {
    return require(_methodMI, "MethodMI", context);
}

CMPIIndicationMI& Provider::indicationMI(const CMPIContext& context) {
    return require(_indicationMI, "IndicationMI", context);
}

bool Provider::hasIndicationMI() {
    const std::lock_guard lock(_mutex);
    return _indicationMI != nullptr;
}

void Provider::cleanUp(const CMPIContext& context) {
    const std::lock_guard lock(_mutex);
    tellEnd(_indicationMI, context);
    tellEnd(_instanceMI, context);
    tellEnd(_methodMI, context);
}

} // namespace marlo

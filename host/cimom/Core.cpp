#include "host/cimom/Core.h"

#include "host/cimom/ClassChecks.h"
#include "host/cimom/Registration.h"

#include <algorithm>
#include <iostream>
#include <stdexcept>
#include <utility>

namespace marlo {

namespace {

void writeToStandardError(const std::string& line) {
    std::cerr << line + '\n'; // one write per line: threads log concurrently
}

broker::LogSink brokerLog(std::function<void(const std::string&)> log, bool trace) {
    return [log = std::move(log), trace](const broker::LogLine& line) {
        if (trace || !line.trace) {
            log(line.component + ": " + line.text);
        }
    };
}

bool containsName(const std::vector<std::string>& names, std::string_view name) {
    return std::any_of(names.begin(), names.end(), [name](const auto& entry) { return equalNames(entry, name); });
}

} // namespace

Core::Core(const ObjectManagerOptions& options, broker::UpCalls& upCalls)
    : schema(Schema::readDirectories(options.schemaDirectories)),
      knowledge(schema),
      gate(options.log ? options.log : writeToStandardError),
      log([this](const std::string& line) { gate.write(line); }),
      onceLog(log),
      broker(knowledge, &upCalls, brokerLog(log, options.trace)) {
    for (Registration& registration :
         readRegistrations(options.providerDirectories, options.libraryDirectory, schema)) {
        providers.push_back(std::make_unique<Provider>(std::move(registration), broker.handle()));
    }
}

void Core::add(std::shared_ptr<BuiltIn> builtIn) {
    Own own{std::move(builtIn), "", {}};
    own.nameSpace = own.builtIn->nameSpace();
    own.classes = own.builtIn->classes();
    for (const std::string& className : own.classes) {
        if (schema.findClass(own.nameSpace, className) == nullptr) {
            throw std::runtime_error("the schema has no class " + className + " in " + own.nameSpace);
        }
        for (const ProviderKind kind : {ProviderKind::instance, ProviderKind::method}) {
            if (const auto servant = findServant(kind, own.nameSpace, className)) {
                throw std::runtime_error(className + " in " + own.nameSpace +
                                         " is for the object manager itself to serve, and not for " +
                                         servant->name());
            }
        }
    }
    _own.push_back(std::move(own));
}

std::optional<Servant> Core::findServant(ProviderKind kind, const std::string& nameSpace,
                                         const std::string& className) const {
    for (const auto& provider : providers) {
        if (provider->serves(kind, nameSpace, className)) {
            return Servant(broker, *provider);
        }
    }
    for (const Own& own : _own) {
        if (equalNames(own.nameSpace, nameSpace) && containsName(own.classes, className)) {
            return Servant(schema, *own.builtIn);
        }
    }
    return std::nullopt;
}

std::vector<Core::Service> Core::servicesOf(const std::string& nameSpace, const Class& definition) const {
    std::vector<Service> services;
    for (const Class* candidate : schema.withSubclasses(nameSpace, definition.name)) {
        if (auto servant = findServant(ProviderKind::instance, nameSpace, candidate->name)) {
            services.push_back({*std::move(servant), candidate});
        }
    }
    if (services.empty()) {
        throw RequestError(CMPI_RC_ERR_NOT_SUPPORTED,
                           "no provider serves the instances of " + definition.name + " in " + nameSpace);
    }
    return services;
}

Servant Core::servantOf(ProviderKind kind, const std::string& nameSpace, const Class& definition, CMPIrc code,
                        const std::string& what) const {
    auto servant = findServant(kind, nameSpace, definition.name);
    if (!servant) {
        throw RequestError(code, "no provider serves the " + what + " of " + definition.name + " in " + nameSpace);
    }
    return *std::move(servant);
}

void Core::end() {
    const broker::CallScope scope;
    const CMPIContext* context = broker.newContext();
    for (const auto& provider : providers) {
        provider->cleanUp(*context);
    }
    gate.close();
}

bool Core::mayBeUsed() const {
    return std::any_of(providers.begin(), providers.end(),
                       [](const auto& provider) { return provider->hasIndicationMI(); });
}

} // namespace marlo

/**
 * @file
 * The object factory's enumerations on the object manager's own broker.
 */
#pragma once

#include "factory/NetworkAdapterObjectFactory.h"
#include "tests/provider/Broker.h"
#include "tests/provider/Tree.h"

#include <string>
#include <variant>
#include <vector>

#include <gtest/gtest.h>

namespace provider_test {

/** Null instances are shown by a class name of their own. */
inline const std::string NO_INSTANCE = "(null)";

class FactoryInstances : public testing::Test {
  protected:
    FactoryInstances() { scripted_agent::reset(); }

    using Factory = Orv::NetworkAdapterComposite::NetworkAdapterObjectFactory;
    using GetAll = int (Factory::*)(const CMPIBroker*, const CMPIContext*, const CMPIObjectPath*, const char*,
                                    const char**, bool, std::vector<CMPIInstance*>&, CMPIStatus*);

    struct Built {
        int result = -1;
        CMPIStatus status{};
        std::vector<marlo::Instance> instances;
    };

    /** Enumerates `className` with a factory of that class, `times` times into one vector. */
    Built enumerate(GetAll getAll, const std::string& className, PropertyList properties = {}, bool flag = false,
                    int times = 1, CMPIStatus status = {CMPI_RC_OK, nullptr}) {
        Built built;
        built.status = status;
        setup.call(classPath(className), [&](const CMPIContext* context, const CMPIResult*,
                                             const CMPIObjectPath* reference) {
            Factory factory(className.c_str());
            scripted_agent::clearRecord();
            std::vector<CMPIInstance*> instances;
            for (int i = 0; i < times; ++i) {
                built.result = (factory.*getAll)(setup.faulty.handle(), context, reference, className.c_str(),
                                                 properties.get(), flag, instances, &built.status);
            }
            for (const CMPIInstance* instance : instances) {
                built.instances.push_back(model(instance));
            }
            built.status.msg = nullptr;
            return built.status;
        });
        return built;
    }

    Built physical(PropertyList properties = {}) {
        return enumerate(&Factory::getAllPhysicalNetworkAdapterCMPIInstances, PHYSICAL, std::move(properties));
    }

    Built logical(PropertyList properties = {}) {
        return enumerate(&Factory::getAllLogicalNetworkAdapterCMPIInstances, LOGICAL, std::move(properties));
    }

    Built configuration(PropertyList properties = {}, bool flag = false) {
        return enumerate(&Factory::getAllNetworkAdapterCMPIInstances, CONFIGURATION, std::move(properties), flag);
    }

    static marlo::Instance model(const CMPIInstance* instance) {
        if (instance == nullptr) {
            marlo::Instance none;
            none.path.className = NO_INSTANCE;
            return none;
        }
        return marlo::broker::Broker::toModel(*instance);
    }

    std::vector<std::string> calls(const std::string& slot) const {
        std::vector<std::string> found = setup.faulty.calls();
        std::erase_if(found, [&](const std::string& call) { return !call.starts_with(slot); });
        return found;
    }

    BrokerSetup setup;
};

/** A text property of each instance. */
inline std::vector<std::string> texts(const std::vector<marlo::Instance>& instances, const std::string& property) {
    std::vector<std::string> found;
    for (const marlo::Instance& instance : instances) {
        const marlo::Value value = get(instance, property);
        found.push_back(value.isNull() ? "NULL" : std::get<std::string>(value.data));
    }
    return found;
}

} // namespace provider_test

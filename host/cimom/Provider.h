/**
 * @file
 * A registered provider: its library, its factories and its management interfaces.
 */
#pragma once

#include "host/cimom/ProviderHealth.h"
#include "host/cimom/Registration.h"

#include <mutex>
#include <stdexcept>

#include <cmpift.h>

namespace marlo {

/** Why a provider cannot be called: the library, the symbol and the cause. */
class LoadError : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

/**
 * Loads its library at the first use; a use that fails is tried anew by the next one. Any thread.
 *
 * Libraries stay mapped for good: threads of theirs and of what they stand on may still run after any cleanup, and
 * what a provider threw or returned may point into them.
 */
class Provider {
  public:
    Provider(Registration registration, const CMPIBroker* broker);
    Provider(const Provider&) = delete;
    Provider& operator=(const Provider&) = delete;

    [[nodiscard]] const Registration& registration() const { return _registration; }

    [[nodiscard]] bool serves(ProviderKind kind, std::string_view nameSpace, std::string_view className) const;

    /** The instance interface, made by its factory the first time, with a function table. Throws LoadError. */
    CMPIInstanceMI& instanceMI(const CMPIContext& context);
    /** The method interface; the same. */
    CMPIMethodMI& methodMI(const CMPIContext& context);

    /** The indication interface; the same. */
    CMPIIndicationMI& indicationMI(const CMPIContext& context);

    /** True once there is an indication interface: from then on the provider may use the broker at any time. */
    [[nodiscard]] bool hasIndicationMI();

    /** Waits for nobody, a provider that is being loaded least of all. */
    [[nodiscard]] ProviderHealth health() const;

    /** Tells the interfaces that were made that the process ends. Calls no provider that was never used. */
    void cleanUp(const CMPIContext& context);

  private:
    void* symbol(const std::string& name);
    template <typename MI>
    MI& make(const std::string& kind, const CMPIContext& context);
    template <typename MI>
    MI& require(MI*& mi, const std::string& kind, const CMPIContext& context);
    void remember(const std::string& failure);

    Registration _registration;
    const CMPIBroker* _broker;
    mutable std::mutex _healthMutex; ///< guards the two below; held for moments only
    bool _isLoaded = false;
    std::string _failure;
    std::mutex _mutex; ///< guards all below; held while a provider is loaded
    void* _library = nullptr;
    CMPIInstanceMI* _instanceMI = nullptr;
    CMPIMethodMI* _methodMI = nullptr;
    CMPIIndicationMI* _indicationMI = nullptr;
};

/** The text of the exception that is being handled, of whatever type it is. */
std::string currentExceptionText();

} // namespace marlo

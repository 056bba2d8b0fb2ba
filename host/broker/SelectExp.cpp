#include "host/broker/BrokerState.h"
#include "host/broker/Convert.h"
#include "host/broker/InstanceSubject.h"
#include "host/broker/Slot.h"
#include "host/broker/Unsupported.h"
#include "host/broker/Values.h"
#include "host/filter/Filter.h"

namespace marlo::broker {

namespace {

/** What a caller's function says the properties are. It tells no class. */
class AccessedSubject final : public filter::Subject {
  public:
    AccessedSubject(CMPIAccessor* accessor, void* parameter) : _accessor(accessor), _parameter(parameter) {}

    [[nodiscard]] const Value* property(std::string_view name) const override {
        const CMPIData data = _accessor(std::string(name).c_str(), _parameter);
        const bool isChars = data.type == CMPI_chars;
        const auto* value =
            isChars ? static_cast<const CMPIValue*>(static_cast<const void*>(data.value.chars)) : &data.value;
        CMPIData taken{};
        const bool isNull = (data.state & (CMPI_nullValue | CMPI_notFound | CMPI_badValue)) != 0;
        if (takeValue(currentArena(), isNull ? nullptr : value, data.type, Accepted::cim, taken) != CMPI_RC_OK) {
            return nullptr;
        }
        _value = toModel(taken);
        return &_value;
    }

    [[nodiscard]] std::string_view className() const override { return {}; }

    [[nodiscard]] bool isA(std::string_view className, std::string_view ancestor) const override {
        return equalNames(className, ancestor);
    }

  private:
    CMPIAccessor* _accessor;
    void* _parameter;
    mutable Value _value; ///< of the property that was asked for last
};

CMPIBoolean evaluate(CMPIStatus& status, SelectExpObject& expression, const CMPIInstance* handle) {
    const auto* object = objectOf<InstanceObject>(handle);
    if (object == nullptr) {
        status.rc = CMPI_RC_ERR_INVALID_HANDLE;
        return 0;
    }
    const Instance instance = toModel(*object);
    return expression.filter->matches(InstanceSubject(instance, expression.broker->schema())) ? 1 : 0;
}

CMPIBoolean evaluateUsingAccessor(CMPIStatus& status, SelectExpObject& expression, CMPIAccessor* accessor,
                                  void* parameter) {
    if (accessor == nullptr) {
        status.rc = CMPI_RC_ERR_INVALID_PARAMETER;
        return 0;
    }
    return expression.filter->evaluate(AccessedSubject(accessor, parameter)) == filter::Truth::yes ? 1 : 0;
}

CMPIString* getString(CMPIStatus& /*status*/, SelectExpObject& expression) {
    return &StringObject::make(currentArena(), expression.filter->text())->handle;
}

} // namespace

SelectExpObject* SelectExpObject::make(Arena& arena, const BrokerState& broker,
                                       std::shared_ptr<const filter::Filter> filter) {
    auto* object = arena.make<SelectExpObject>(arena, broker, filter.get());
    arena.keep(std::move(filter));
    return object;
}

SelectExpObject* SelectExpObject::copyTo(Arena& target) const {
    return make(target, *broker, std::make_shared<const filter::Filter>(*filter));
}

const CMPISelectExpFT selectExpTable = {
    CMPI_VERSION,
    releaseSlot<SelectExpObject>,
    slot<cloneOperation<SelectExpObject>>,
    slot<evaluate>,
    slot<getString>,
    unsupported<decltype(CMPISelectExpFT::getDOC)>,
    unsupported<decltype(CMPISelectExpFT::getCOD)>,
    slot<evaluateUsingAccessor>,
};

} // namespace marlo::broker

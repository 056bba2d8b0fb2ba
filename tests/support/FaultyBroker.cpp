#include "tests/support/FaultyBroker.h"

#include <stdexcept>
#include <tuple>
#include <type_traits>

namespace marlo::test {

namespace {

FaultyBroker* inForce = nullptr;

/** What passes through by value. */
template <typename T>
T adopted(T value) {
    return value;
}

CMPIObjectPath* adopted(CMPIObjectPath* path) {
    return FaultyBroker::current().adopt(path);
}

CMPIInstance* adopted(CMPIInstance* instance) {
    return FaultyBroker::current().adopt(instance);
}

CMPIArray* adopted(CMPIArray* array) {
    return FaultyBroker::current().adopt(array);
}

CMPIString* adopted(CMPIString* string) {
    return FaultyBroker::current().adopt(string);
}

CMPIEnumeration* adopted(CMPIEnumeration* enumeration) {
    return FaultyBroker::current().adopt(enumeration);
}

CMPIData adopted(CMPIData data) {
    if ((data.state & CMPI_nullValue) != 0) {
        return data;
    }
    switch (data.type) {
    case CMPI_string:
        adopted(data.value.string);
        break;
    case CMPI_instance:
        adopted(data.value.inst);
        break;
    case CMPI_ref:
        adopted(data.value.ref);
        break;
    default:
        if ((data.type & CMPI_ARRAY) != 0) {
            adopted(data.value.array);
        }
        break;
    }
    return data;
}

template <typename T>
void describe(std::string& call, const T& argument) {
    if constexpr (std::is_same_v<T, const char*>) {
        call += argument != nullptr ? std::string(" ") + argument : " null";
    } else if constexpr (std::is_same_v<T, CMPICount>) {
        call += " " + std::to_string(argument);
    }
}

/** The status that a slot's caller passes, if it has one; null where it has none or the caller passes none. */
template <typename... Arguments>
CMPIStatus* statusOf(const std::tuple<Arguments...>& arguments) {
    constexpr std::size_t last = sizeof...(Arguments) - 1;
    if constexpr (std::is_same_v<std::tuple_element_t<last, std::tuple<Arguments...>>, CMPIStatus*>) {
        return std::get<last>(arguments);
    } else {
        return nullptr;
    }
}

template <typename R>
R nothing(Failure failure) {
    R answer{};
    if constexpr (std::is_same_v<R, CMPIData>) {
        answer.state = CMPI_nullValue;
    } else if constexpr (std::is_same_v<R, CMPIStatus>) {
        answer.rc = failure == Failure::withStatus ? CMPI_RC_ERR_FAILED : CMPI_RC_OK;
    }
    return answer;
}

/** Stands in for one slot of one table. */
template <auto Member>
struct Slot;

template <typename Table, typename R, typename... Arguments, R (*Table::*Member)(Arguments...)>
struct Slot<Member> {
    static inline R (*real)(Arguments...) = nullptr;
    static inline const char* name = nullptr;

    static R call(Arguments... arguments) {
        std::string call = name;
        (describe(call, arguments), ...);
        Failure failure{};
        if (FaultyBroker::current().fails(name, call, failure)) {
            CMPIStatus* status = statusOf(std::tuple<Arguments...>(arguments...));
            if (failure == Failure::withStatus && status != nullptr) {
                *status = {CMPI_RC_ERR_FAILED, nullptr};
            }
            return nothing<R>(failure);
        }
        R answer = adopted(real(arguments...));
        if constexpr (std::is_same_v<R, CMPIData>) {
            if (FaultyBroker::current().alter) {
                FaultyBroker::current().alter(name, answer);
            }
        }
        return answer;
    }

    static void put(Table& table, const char* slotName) {
        real = table.*Member;
        name = slotName;
        table.*Member = &call;
    }
};

/** A copy of the table that `object` has, with its slots replaced; made from the first object of a kind. */
template <typename Handle, typename Table, typename Put>
Handle* withTable(Handle* object, const Table* Handle::*member, const Put& put) {
    if (object == nullptr) {
        return nullptr;
    }
    static const Table table = [&] {
        Table copy = *(object->*member);
        put(copy);
        return copy;
    }();
    object->*member = &table;
    return object;
}

// NOLINTNEXTLINE(cppcoreguidelines-macro-usage)
#define PUT(Table, member, prefix) Slot<&Table::member>::put(table, prefix #member)

void putAll(CMPIBrokerFT& table) {
    PUT(CMPIBrokerFT, prepareAttachThread, "");
    PUT(CMPIBrokerFT, attachThread, "");
    PUT(CMPIBrokerFT, detachThread, "");
    PUT(CMPIBrokerFT, deliverIndication, "");
    PUT(CMPIBrokerFT, enumerateInstances, "");
    PUT(CMPIBrokerFT, enumerateInstanceNames, "");
    PUT(CMPIBrokerFT, getInstance, "");
}

void putAll(CMPIBrokerEncFT& table) {
    PUT(CMPIBrokerEncFT, newInstance, "");
    PUT(CMPIBrokerEncFT, newObjectPath, "");
    PUT(CMPIBrokerEncFT, newString, "");
    PUT(CMPIBrokerEncFT, newArray, "");
    PUT(CMPIBrokerEncFT, newDateTimeFromChars, "");
    PUT(CMPIBrokerEncFT, trace, "");
}

void putAll(CMPIBrokerExtFT& table) {
    PUT(CMPIBrokerExtFT, newThread, "");
}

} // namespace

FaultyBroker::FaultyBroker(const broker::Broker& real)
    : _handle(*real.handle()), _broker(*_handle.bft), _factory(*_handle.eft), _threads(*_handle.xft) {
    if (inForce != nullptr) {
        throw std::logic_error("two faulty brokers at a time");
    }
    inForce = this;
    putAll(_broker);
    putAll(_factory);
    putAll(_threads);
    _handle.bft = &_broker;
    _handle.eft = &_factory;
    _handle.xft = &_threads;
}

FaultyBroker::~FaultyBroker() {
    inForce = nullptr;
}

FaultyBroker& FaultyBroker::current() {
    return *inForce;
}

CMPIObjectPath* FaultyBroker::adopt(CMPIObjectPath* path) {
    return withTable(path, &CMPIObjectPath::ft, [](CMPIObjectPathFT& table) {
        PUT(CMPIObjectPathFT, setNameSpace, "objectPath.");
        PUT(CMPIObjectPathFT, getNameSpace, "objectPath.");
        PUT(CMPIObjectPathFT, setHostname, "objectPath.");
        PUT(CMPIObjectPathFT, getClassName, "objectPath.");
        PUT(CMPIObjectPathFT, addKey, "objectPath.");
        PUT(CMPIObjectPathFT, getKey, "objectPath.");
        PUT(CMPIObjectPathFT, getKeyAt, "objectPath.");
        PUT(CMPIObjectPathFT, getKeyCount, "objectPath.");
        PUT(CMPIObjectPathFT, toString, "objectPath.");
    });
}

CMPIInstance* FaultyBroker::adopt(CMPIInstance* instance) {
    return withTable(instance, &CMPIInstance::ft, [](CMPIInstanceFT& table) {
        PUT(CMPIInstanceFT, getProperty, "instance.");
        PUT(CMPIInstanceFT, setProperty, "instance.");
        PUT(CMPIInstanceFT, getObjectPath, "instance.");
    });
}

CMPIArray* FaultyBroker::adopt(CMPIArray* array) {
    return withTable(array, &CMPIArray::ft, [](CMPIArrayFT& table) {
        PUT(CMPIArrayFT, getSize, "array.");
        PUT(CMPIArrayFT, getElementAt, "array.");
        PUT(CMPIArrayFT, setElementAt, "array.");
    });
}

CMPIArgs* FaultyBroker::adopt(CMPIArgs* arguments) {
    return withTable(arguments, &CMPIArgs::ft, [](CMPIArgsFT& table) {
        PUT(CMPIArgsFT, getArg, "args.");
        PUT(CMPIArgsFT, getArgCount, "args.");
    });
}

CMPIString* FaultyBroker::adopt(CMPIString* string) {
    return withTable(string, &CMPIString::ft, [](CMPIStringFT& table) { PUT(CMPIStringFT, getCharPtr, "string."); });
}

CMPIEnumeration* FaultyBroker::adopt(CMPIEnumeration* enumeration) {
    return withTable(enumeration, &CMPIEnumeration::ft, [](CMPIEnumerationFT& table) {
        PUT(CMPIEnumerationFT, getNext, "enumeration.");
        PUT(CMPIEnumerationFT, hasNext, "enumeration.");
    });
}

const CMPIResult* FaultyBroker::adopt(const CMPIResult* result) {
    return withTable(const_cast<CMPIResult*>(result), &CMPIResult::ft, [](CMPIResultFT& table) {
        PUT(CMPIResultFT, returnData, "result.");
        PUT(CMPIResultFT, returnInstance, "result.");
        PUT(CMPIResultFT, returnObjectPath, "result.");
        PUT(CMPIResultFT, returnDone, "result.");
    });
}

#undef PUT

void FaultyBroker::failAt(std::string slot, int nth, Failure failure) {
    const std::lock_guard lock(_mutex);
    _failing = std::move(slot);
    _nth = nth;
    _failure = failure;
    _counts.clear();
    _calls.clear();
}

void FaultyBroker::failNothing() {
    failAt({}, 0, Failure::withStatus);
}

std::vector<std::string> FaultyBroker::calls() const {
    const std::lock_guard lock(_mutex);
    return _calls;
}

std::map<std::string, int> FaultyBroker::counts() const {
    const std::lock_guard lock(_mutex);
    return _counts;
}

void FaultyBroker::forgetCalls() {
    const std::lock_guard lock(_mutex);
    _counts.clear();
    _calls.clear();
}

bool FaultyBroker::fails(const char* slot, const std::string& call, Failure& failure) {
    {
        const std::lock_guard lock(_mutex);
        _calls.push_back(call);
        const int count = ++_counts[slot];
        failure = _failure;
        if (_failing == slot && (_nth == 0 || _nth == count)) {
            if (failure == Failure::throwing) {
                throw 42; // no std::exception: a broker need not be C++ at all
            }
            return true;
        }
    }
    if (before) {
        before(call);
    }
    return false;
}

} // namespace marlo::test

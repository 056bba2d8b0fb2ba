#include "host/broker/Convert.h"

#include "host/broker/BrokerState.h"
#include "host/broker/Values.h"
#include "host/model/DateTimeText.h"

namespace marlo::broker {

namespace {

constexpr CMPIType plain(CMPIType type) {
    return static_cast<CMPIType>(type & ~CMPI_ARRAY);
}

std::optional<std::uint64_t> unsignedOf(const CMPIData& data) {
    switch (data.type) {
    case CMPI_uint8:
        return data.value.uint8;
    case CMPI_uint16:
        return data.value.uint16;
    case CMPI_uint32:
        return data.value.uint32;
    case CMPI_uint64:
        return data.value.uint64;
    default:
        return std::nullopt;
    }
}

std::optional<std::int64_t> signedOf(const CMPIData& data) {
    switch (data.type) {
    case CMPI_sint8:
        return data.value.sint8;
    case CMPI_sint16:
        return data.value.sint16;
    case CMPI_sint32:
        return data.value.sint32;
    case CMPI_sint64:
        return data.value.sint64;
    default:
        return std::nullopt;
    }
}

Value::Variant objectOfData(const CMPIData& data) {
    if ((data.type & CMPI_ARRAY) != 0) {
        const auto* array = objectOf<ArrayObject>(data.value.array);
        Value::Array elements;
        elements.reserve(array->count);
        for (CMPICount i = 0; i < array->count; ++i) {
            elements.push_back(toModel(array->elements[i]));
        }
        return elements;
    }
    switch (data.type) {
    case CMPI_string:
        return std::string(objectOf<StringObject>(data.value.string)->text());
    case CMPI_dateTime:
        return DateTime{std::string(objectOf<DateTimeObject>(data.value.dateTime)->text())};
    case CMPI_ref:
        return std::make_shared<const ObjectPath>(toModel(*objectOf<ObjectPathObject>(data.value.ref)));
    case CMPI_instance:
        return std::make_shared<const Instance>(toModel(*objectOf<InstanceObject>(data.value.inst)));
    default:
        return {}; // bare pointers have no value outside the process
    }
}

Value::Variant variantOf(const CMPIData& data) {
    if (const auto number = unsignedOf(data)) {
        return *number;
    }
    if (const auto number = signedOf(data)) {
        return *number;
    }
    switch (data.type) {
    case CMPI_boolean:
        return data.value.boolean != 0;
    case CMPI_char16:
        return static_cast<char16_t>(data.value.char16);
    case CMPI_real32:
        return static_cast<double>(data.value.real32);
    case CMPI_real64:
        return data.value.real64;
    default:
        return objectOfData(data);
    }
}

void setUnsigned(CMPIData& data, std::uint64_t number) {
    switch (data.type) {
    case CMPI_uint8:
        data.value.uint8 = static_cast<CMPIUint8>(number);
        break;
    case CMPI_uint16:
        data.value.uint16 = static_cast<CMPIUint16>(number);
        break;
    case CMPI_uint32:
        data.value.uint32 = static_cast<CMPIUint32>(number);
        break;
    case CMPI_uint64:
        data.value.uint64 = number;
        break;
    default:
        data = nullData(data.type);
    }
}

void setSigned(CMPIData& data, std::int64_t number) {
    switch (data.type) {
    case CMPI_sint8:
        data.value.sint8 = static_cast<CMPISint8>(number);
        break;
    case CMPI_sint16:
        data.value.sint16 = static_cast<CMPISint16>(number);
        break;
    case CMPI_sint32:
        data.value.sint32 = static_cast<CMPISint32>(number);
        break;
    case CMPI_sint64:
        data.value.sint64 = number;
        break;
    default:
        data = nullData(data.type);
    }
}

/** Sets the member of `data` that its type asks for, from the alternative that the model value has. */
class Setter {
  public:
    Setter(Arena& arena, const BrokerState& broker, CMPIData& data) : _arena(arena), _broker(broker), _data(data) {}

    void operator()(std::monostate) { setNull(); }

    void operator()(bool value) { set(CMPI_boolean, _data.value.boolean, static_cast<CMPIBoolean>(value)); }

    void operator()(char16_t value) { set(CMPI_char16, _data.value.char16, static_cast<CMPIChar16>(value)); }

    void operator()(std::uint64_t value) { setUnsigned(_data, value); }

    void operator()(std::int64_t value) { setSigned(_data, value); }

    void operator()(double value) {
        if (_data.type == CMPI_real32) {
            _data.value.real32 = static_cast<CMPIReal32>(value);
        } else {
            set(CMPI_real64, _data.value.real64, value);
        }
    }

    void operator()(const std::string& value) {
        set(CMPI_string, _data.value.string, &StringObject::make(_arena, value)->handle);
    }

    void operator()(const DateTime& value) {
        const auto read = readDateTime(value.text);
        if (!read) {
            setNull();
            return;
        }
        auto* dateTime = DateTimeObject::make(_arena, value.text, read->microseconds, read->interval);
        set(CMPI_dateTime, _data.value.dateTime, &dateTime->handle);
    }

    void operator()(const std::shared_ptr<const ObjectPath>& value) {
        if (value == nullptr) {
            setNull();
        } else {
            set(CMPI_ref, _data.value.ref, &toObject(_arena, _broker, *value)->handle);
        }
    }

    void operator()(const std::shared_ptr<const Instance>& value) {
        if (value == nullptr) {
            setNull();
        } else {
            set(CMPI_instance, _data.value.inst, &toObject(_arena, _broker, *value)->handle);
        }
    }

    void operator()(const Value::Array& value) {
        if ((_data.type & CMPI_ARRAY) == 0) {
            setNull();
            return;
        }
        auto* array = ArrayObject::make(_arena, static_cast<CMPICount>(value.size()), plain(_data.type));
        for (CMPICount i = 0; i < array->count; ++i) {
            const CMPIData element = toData(_arena, _broker, value[i]);
            array->elements[i] = element.type == array->elementType ? element : nullData(array->elementType);
        }
        _data.value.array = &array->handle;
    }

  private:
    void setNull() { _data = nullData(_data.type); }

    template <typename Member, typename T>
    void set(CMPIType type, Member& member, T value) {
        if (_data.type == type) {
            member = value;
        } else {
            setNull();
        }
    }

    Arena& _arena;
    const BrokerState& _broker;
    CMPIData& _data;
};

} // namespace

Value toModel(const CMPIData& data) {
    if ((data.state & CMPI_nullValue) != 0) {
        return Value::null(data.type);
    }
    return {data.type, variantOf(data)};
}

std::vector<NamedValue> toModel(const NamedList& list) {
    std::vector<NamedValue> values;
    values.reserve(list.size());
    for (const NamedData& entry : list) {
        values.push_back({std::string(entry.name->text()), broker::toModel(entry.data)});
    }
    return values;
}

ObjectPath toModel(const ObjectPathObject& path) {
    return {std::string(path.host == nullptr ? std::string_view() : path.host->text()),
            std::string(path.nameSpace->text()), std::string(path.className->text()), toModel(path.keys)};
}

Instance toModel(const InstanceObject& object) {
    Instance instance{toModel(*object.path), toModel(object.properties)};
    const auto* names = object.path->broker->schema().keys(instance.path.nameSpace, instance.path.className);
    if (names == nullptr) {
        return instance;
    }
    for (const std::string& name : *names) {
        const NamedData* property = object.properties.find(name);
        if (property != nullptr && canBeKey(property->data) && findName(instance.path.keys, name) == nullptr) {
            instance.path.keys.push_back({name, toModel(property->data)});
        }
    }
    return instance;
}

CMPIData toData(Arena& arena, const BrokerState& broker, const Value& value) {
    CMPIData data{};
    data.type = storedType(value.type);
    std::visit(Setter(arena, broker, data), value.data);
    return data;
}

ObjectPathObject* toObject(Arena& arena, const BrokerState& broker, const ObjectPath& path) {
    ObjectPathObject* object = ObjectPathObject::make(arena, broker, path.nameSpace, path.className);
    if (!path.host.empty()) {
        object->host = StringObject::make(arena, path.host);
    }
    for (const NamedValue& key : path.keys) {
        CMPIData data = toData(arena, broker, key.value);
        data.state = static_cast<CMPIValueState>(data.state | CMPI_keyValue);
        object->keys.set(key.name, data);
    }
    return object;
}

InstanceObject* toObject(Arena& arena, const BrokerState& broker, const Instance& instance) {
    InstanceObject* object = InstanceObject::make(arena, *toObject(arena, broker, instance.path));
    for (const NamedValue& property : instance.properties) {
        object->properties.set(property.name, toData(arena, broker, property.value));
    }
    return object;
}

} // namespace marlo::broker

#include "host/cimxml/ObjectReader.h"

namespace marlo::cimxml {

namespace {

std::optional<Value> embeddedIn(const std::string& text) {
    try {
        const Limits limits;
        return Value{CMPI_instance, readEmbedded(text, {limits})};
    } catch (const MessageError&) {
        return std::nullopt;
    }
}

/** Puts an argument of each kind into a type. */
class Conversion {
  public:
    explicit Conversion(CMPIType type) : _type(type) {}

    std::optional<Value> operator()(std::monostate) const { return Value::null(_type); }

    std::optional<Value> operator()(const Untyped& argument) const {
        return _type == CMPI_instance ? embeddedIn(argument.text) : readValue(argument.text, _type);
    }

    std::optional<Value> operator()(const UntypedArray& argument) const {
        if ((_type & CMPI_ARRAY) == 0) {
            return std::nullopt;
        }
        const Conversion convert(static_cast<CMPIType>(_type & ~CMPI_ARRAY));
        Value::Array elements;
        for (const auto& element : argument) {
            auto value = element ? convert(*element) : convert(std::monostate());
            if (!value) {
                return std::nullopt;
            }
            elements.push_back(*std::move(value));
        }
        return Value{_type, std::move(elements)};
    }

    /** The schema declares embedded objects as texts. */
    std::optional<Value> operator()(const Value& argument) const {
        const bool isText = _type == (CMPI_string | (argument.type & CMPI_ARRAY));
        const bool isEmbedded = (argument.type & ~CMPI_ARRAY) == CMPI_instance;
        return argument.type == _type || (isText && isEmbedded) ? std::optional(argument) : std::nullopt;
    }

    std::optional<Value> operator()(const ClassName& argument) const {
        return (*this)(ObjectPath{"", "", argument.name, {}});
    }

    std::optional<Value> operator()(const ObjectPath& argument) const {
        return _type == CMPI_ref ? std::optional(Value{_type, std::make_shared<const ObjectPath>(argument)})
                                 : std::nullopt;
    }

    std::optional<Value> operator()(const Instance& argument) const {
        return (*this)(Value{CMPI_instance, std::make_shared<const Instance>(argument)});
    }

    std::optional<Value> operator()(const Class& /*argument*/) const { return std::nullopt; }

    std::optional<Value> operator()(const QualifierType& /*argument*/) const { return std::nullopt; }

  private:
    CMPIType _type;
};

} // namespace

std::optional<Value> readArgument(const Argument& argument, CMPIType type) {
    return std::visit(Conversion(type), argument);
}

} // namespace marlo::cimxml

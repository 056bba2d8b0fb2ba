#include "host/http/Message.h"

#include "host/http/FieldText.h"

namespace marlo::http {

std::vector<std::string_view> RequestHead::values(std::string_view name) const {
    std::vector<std::string_view> found;
    for (const Field& field : fields) {
        if (equalsIgnoringCase(field.name, name)) {
            found.emplace_back(field.value);
        }
    }
    return found;
}

std::optional<std::string_view> RequestHead::value(std::string_view name) const {
    for (const Field& field : fields) {
        if (equalsIgnoringCase(field.name, name)) {
            return field.value;
        }
    }
    return std::nullopt;
}

std::string Peer::toString() const {
    if (transport == Transport::local) {
        return userId ? address + " uid " + std::to_string(*userId) : address;
    }
    const bool isV6 = address.find(':') != std::string::npos;
    return (isV6 ? "[" + address + "]" : address) + ":" + std::to_string(port);
}

} // namespace marlo::http

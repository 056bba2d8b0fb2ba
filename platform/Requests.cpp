#include "platform/Requests.h"

#include <stdexcept>
#include <string_view>

#include <cmpimacs.h>
#include <strings.h>

namespace Orv::Platform {

namespace {

/** A value as the broker's tables take it: a null pointer is a NULL of the type. */
struct Argument {
    CMPIType type;
    const void* value;
};

struct ToArgument {
    Argument operator()(const std::optional<std::string>& text) const {
        return text ? Argument{CMPI_chars, text->c_str()} : Argument{CMPI_string, nullptr};
    }

    Argument operator()(const std::optional<std::uint16_t>& number) const {
        return {CMPI_uint16, number ? &*number : nullptr};
    }

    Argument operator()(const std::optional<std::uint64_t>& number) const {
        return {CMPI_uint64, number ? &*number : nullptr};
    }

    /** CMPIBoolean is one octet of 0 or 1, as bool is on every system that has the CMPI. */
    Argument operator()(const std::optional<bool>& flag) const {
        static_assert(sizeof(bool) == sizeof(CMPIBoolean));
        return {CMPI_boolean, flag ? &*flag : nullptr};
    }
};

void require(bool good, const CMPIStatus& status, const char* what) {
    if (!good || status.rc != CMPI_RC_OK) {
        throw std::runtime_error(std::string("the object manager did not ") + what + " (status " +
                                 std::to_string(static_cast<int>(status.rc)) + ")");
    }
}

const char* keyText(const Property& key) {
    return std::get<std::optional<std::string>>(key.value)->c_str();
}

std::string nameSpaceOf(const CMPIObjectPath* reference) {
    CMPIStatus status{CMPI_RC_OK, nullptr};
    const CMPIString* nameSpace = CMGetNameSpace(reference, &status);
    const char* text = nameSpace == nullptr ? nullptr : CMGetCharPtr(nameSpace);
    require(text != nullptr, status, "name a namespace");
    return text;
}

const CMPIObjectPath* makePath(const Request& request, const std::string& nameSpace, const Object& object) {
    CMPIStatus status{CMPI_RC_OK, nullptr};
    const CMPIObjectPath* path = CMNewObjectPath(request.broker, nameSpace.c_str(), request.objects.name, &status);
    require(path != nullptr, status, "create an object path");
    for (std::size_t i = 0; i < object.keys; ++i) {
        const auto& key = object.properties[i];
        require(true, CMAddKey(path, key.name, keyText(key), CMPI_chars), "add a key");
    }
    return path;
}

bool isListed(const char* name, const char** properties) {
    for (; *properties != nullptr; ++properties) {
        if (strcasecmp(name, *properties) == 0) {
            return true;
        }
    }
    return false;
}

/** Keys are set whatever the list says: some object managers make the instance's path of its properties. */
const CMPIInstance* makeInstance(const Request& request, const std::string& nameSpace, const Object& object,
                                 const char** properties) {
    CMPIStatus status{CMPI_RC_OK, nullptr};
    const CMPIInstance* instance = CMNewInstance(request.broker, makePath(request, nameSpace, object), &status);
    require(instance != nullptr, status, "create an instance");
    for (std::size_t i = 0; i < object.properties.size(); ++i) {
        const auto& property = object.properties[i];
        if (i < object.keys || properties == nullptr || isListed(property.name, properties)) {
            const auto [type, value] = std::visit(ToArgument(), property.value);
            require(true, CMSetProperty(instance, property.name, value, type), "set a property");
        }
    }
    return instance;
}

/** True when the path has this text for the key. */
bool hasKey(const CMPIObjectPath* path, const Property& key) {
    CMPIStatus status{CMPI_RC_OK, nullptr};
    const CMPIData data = CMGetKey(path, key.name, &status);
    if (status.rc != CMPI_RC_OK || (data.state & CMPI_nullValue) != 0 || data.type != CMPI_string ||
        data.value.string == nullptr) {
        return false;
    }
    const char* text = CMGetCharPtr(data.value.string);
    return text != nullptr && std::string_view(text) == keyText(key);
}

bool hasKeys(const CMPIObjectPath* path, const Object& object) {
    for (std::size_t i = 0; i < object.keys; ++i) {
        if (!hasKey(path, object.properties[i])) {
            return false;
        }
    }
    return true;
}

CMPIStatus finish(const Request& request, CMPIStatus status) {
    return status.rc == CMPI_RC_OK ? CMReturnDone(request.result) : status;
}

} // namespace

CMPIStatus Request::enumerateNames() const {
    const std::string nameSpace = nameSpaceOf(reference);
    CMPIStatus status{CMPI_RC_OK, nullptr};
    objects.forEach(*currentInventory(), [&](const Object& object) {
        status = CMReturnObjectPath(result, makePath(*this, nameSpace, object));
        return status.rc == CMPI_RC_OK;
    });
    return finish(*this, status);
}

CMPIStatus Request::enumerate(const char** properties) const {
    const std::string nameSpace = nameSpaceOf(reference);
    CMPIStatus status{CMPI_RC_OK, nullptr};
    objects.forEach(*currentInventory(), [&](const Object& object) {
        status = CMReturnInstance(result, makeInstance(*this, nameSpace, object, properties));
        return status.rc == CMPI_RC_OK;
    });
    return finish(*this, status);
}

CMPIStatus Request::get(const char** properties) const {
    const std::string nameSpace = nameSpaceOf(reference);
    CMPIStatus status{CMPI_RC_ERR_NOT_FOUND, nullptr};
    objects.forEach(*currentInventory(), [&](const Object& object) {
        if (!hasKeys(reference, object)) {
            return true;
        }
        status = CMReturnInstance(result, makeInstance(*this, nameSpace, object, properties));
        return false;
    });
    return finish(*this, status);
}

} // namespace Orv::Platform

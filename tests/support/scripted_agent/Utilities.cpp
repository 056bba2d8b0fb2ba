#include "instrumentation/Utilities.h"

#include "tests/support/scripted_agent/Recorder.h"
#include "tests/support/scripted_agent/ScriptedAgent.h"

#include <algorithm>
#include <string>
#include <string_view>

#include <cmpimacs.h>

using scripted_agent::add;
using scripted_agent::announced;
using scripted_agent::quoted;
using scripted_agent::script;

namespace {

char lower(char letter) {
    return letter >= 'A' && letter <= 'Z' ? static_cast<char>(letter - 'A' + 'a') : letter;
}

bool equalNames(std::string_view left, std::string_view right) {
    return std::equal(left.begin(), left.end(), right.begin(), right.end(),
                      [](char l, char r) { return lower(l) == lower(r); });
}

std::string_view view(const CMPIString* text) {
    const char* characters = text != nullptr ? CMGetCharPtr(text) : nullptr;
    return characters != nullptr ? characters : "";
}

bool samePaths(const CMPIObjectPath* left, const CMPIObjectPath* right, bool compareNameSpace);

bool sameValues(const CMPIData& left, const CMPIData& right) {
    if (left.type != right.type || ((left.state ^ right.state) & CMPI_nullValue) != 0) {
        return false;
    }
    if ((left.state & CMPI_nullValue) != 0) {
        return true;
    }
    switch (left.type) {
    case CMPI_string:
        return view(left.value.string) == view(right.value.string);
    case CMPI_ref:
        return samePaths(left.value.ref, right.value.ref, true);
    case CMPI_boolean:
        return (left.value.boolean != 0) == (right.value.boolean != 0);
    case CMPI_uint8:
    case CMPI_sint8:
        return left.value.uint8 == right.value.uint8;
    case CMPI_uint16:
    case CMPI_sint16:
    case CMPI_char16:
        return left.value.uint16 == right.value.uint16;
    case CMPI_uint32:
    case CMPI_sint32:
        return left.value.uint32 == right.value.uint32;
    default:
        return left.value.uint64 == right.value.uint64;
    }
}

bool hasKey(const CMPIObjectPath* path, std::string_view name, const CMPIData& value) {
    const CMPICount count = CMGetKeyCount(path, nullptr);
    for (CMPICount i = 0; i < count; ++i) {
        CMPIString* candidate = nullptr;
        const CMPIData data = CMGetKeyAt(path, i, &candidate, nullptr);
        if (equalNames(view(candidate), name)) {
            return sameValues(data, value);
        }
    }
    return false;
}

bool samePaths(const CMPIObjectPath* left, const CMPIObjectPath* right, bool compareNameSpace) {
    if (left == nullptr || right == nullptr ||
        !equalNames(view(CMGetClassName(left, nullptr)), view(CMGetClassName(right, nullptr)))) {
        return false;
    }
    if (compareNameSpace && !equalNames(view(CMGetNameSpace(left, nullptr)), view(CMGetNameSpace(right, nullptr)))) {
        return false;
    }
    const CMPICount count = CMGetKeyCount(left, nullptr);
    if (count != CMGetKeyCount(right, nullptr)) {
        return false;
    }
    for (CMPICount i = 0; i < count; ++i) {
        CMPIString* name = nullptr;
        const CMPIData data = CMGetKeyAt(left, i, &name, nullptr);
        if (!hasKey(right, view(name), data)) {
            return false;
        }
    }
    return true;
}

CMPIType cmpiType(Orv::DataType type) {
    switch (type) {
    case Orv::DATA_TYPE_UINT16:
        return CMPI_uint16;
    case Orv::DATA_TYPE_UINT64:
        return CMPI_uint64;
    case Orv::DATA_TYPE_BOOLEAN:
        return CMPI_boolean;
    case Orv::DATA_TYPE_STRING:
        return CMPI_string;
    }
    return CMPI_null;
}

CMPIStatus copyProperty(const CMPIData& source, CMPIInstance* target, const char* name, CMPIType type) {
    if (target == nullptr) {
        return {CMPI_RC_ERR_INVALID_PARAMETER, nullptr};
    }
    CMPIData data = {};
    data.state = CMPI_nullValue;
    if ((source.state & CMPI_nullValue) == 0 && source.value.inst != nullptr) {
        data = CMGetProperty(source.value.inst, name, nullptr);
    }
    if ((data.state & CMPI_nullValue) != 0) {
        return target->ft->setProperty(target, name, nullptr, type);
    }
    if (data.type != type) {
        return {CMPI_RC_ERR_TYPE_MISMATCH, nullptr};
    }
    return target->ft->setProperty(target, name, &data.value, type);
}

} // namespace

namespace Orv {

bool textEqual(const char* left, const char* right) {
    const std::string call = announced([&] { return "textEqual(" + quoted(left) + ", " + quoted(right) + ")"; });
    const bool equal = script().textEqual                    ? script().textEqual(left, right)
                       : left == nullptr || right == nullptr ? left == right
                                                             : equalNames(left, right);
    add(call + (equal ? " = true" : " = false"));
    return equal;
}

std::string stripSpaces(std::string text) {
    const std::string call = announced([&] { return "stripSpaces(" + quoted(text.c_str()) + ")"; });
    if (script().stripSpaces) {
        text = script().stripSpaces(text);
    } else {
        std::erase(text, ' ');
    }
    add(call + " = " + quoted(text.c_str()));
    return text;
}

std::string getSystemName() {
    (void)announced([] { return std::string("getSystemName()"); });
    add("getSystemName() = " + quoted(script().systemName.c_str()));
    return script().systemName;
}

bool isObjPathsEqual(const CMPIObjectPath* left, const CMPIObjectPath* right, bool compareNameSpace) {
    const std::string call =
        announced([&] { return std::string("isObjPathsEqual(") + (compareNameSpace ? "true)" : "false)"); });
    const bool equal = script().isObjPathsEqual ? script().isObjPathsEqual(left, right, compareNameSpace)
                                                : samePaths(left, right, compareNameSpace);
    add(call + (equal ? " = true" : " = false"));
    return equal;
}

void mapProperty(CMPIData source, CMPIInstance* target, const char* name, DataType type, CMPIStatus* status) {
    const std::string call =
        announced([&] { return "mapProperty(" + quoted(name) + ", " + std::to_string(type) + ")"; });
    add(call);
    if (script().mapProperty) {
        script().mapProperty(source, target, name, type, status);
        return;
    }
    const CMPIStatus written = copyProperty(source, target, name, cmpiType(type));
    if (status != nullptr) {
        *status = written;
    }
}

} // namespace Orv

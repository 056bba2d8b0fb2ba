#include "host/model/Instance.h"

#include <algorithm>

namespace marlo {

namespace {

constexpr char lower(char c) {
    return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
}

} // namespace

bool equalNames(std::string_view left, std::string_view right) {
    return left.size() == right.size() && std::equal(left.begin(), left.end(), right.begin(),
                                                     [](char a, char b) { return a == b || lower(a) == lower(b); });
}

const NamedValue* findName(const std::vector<NamedValue>& values, std::string_view name) {
    const auto found = std::find_if(values.begin(), values.end(),
                                    [name](const NamedValue& value) { return equalNames(value.name, name); });
    return found == values.end() ? nullptr : &*found;
}

} // namespace marlo

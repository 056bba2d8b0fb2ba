#include "agent/config/TomlReader.h"

#include "agent/text/Text.h"

#include <algorithm>
#include <stdexcept>
#include <utility>

namespace Orv::Agent {

namespace {

std::string nameOf(toml::node_type type) {
    switch (type) {
    case toml::node_type::table:
        return "a table";
    case toml::node_type::array:
        return "a list";
    case toml::node_type::string:
        return "a string";
    case toml::node_type::integer:
        return "an integer";
    case toml::node_type::floating_point:
        return "a floating-point number";
    case toml::node_type::boolean:
        return "a boolean";
    case toml::node_type::none:
        return "nothing";
    default:
        return "a date or time";
    }
}

} // namespace

toml::table parseToml(std::string_view text, const std::string& file, std::size_t firstLine) {
    try {
        return toml::parse(text);
    } catch (const toml::parse_error& error) {
        throw std::runtime_error(file + ":" + std::to_string(firstLine - 1 + error.source().begin.line) + ": " +
                                 cleanText(error.description()));
    }
}

void refuse(const std::string& file, std::size_t line, const std::string& key, const std::string& reason) {
    throw std::runtime_error(file + ":" + std::to_string(line) + ": " + cleanText(key) + ": " + reason);
}

toml::node* TomlReader::find(std::string_view key) {
    _known.push_back(key);
    return _table.get(key);
}

std::size_t TomlReader::lineOf(const toml::source_region& where) const {
    return _firstLine - 1 + where.begin.line;
}

std::size_t TomlReader::lineOf(std::string_view key) const {
    const toml::node* value = _table.get(key);
    return lineOf(value != nullptr ? value->source() : _table.source());
}

void TomlReader::refuseKey(std::string_view key, const std::string& reason) const {
    refuse(_file, lineOf(key), std::string(_prefix).append(key), reason);
}

void TomlReader::refuseType(std::string_view key, const toml::node& value, std::string_view expected) const {
    refuse(_file, lineOf(value.source()), std::string(_prefix).append(key),
           "expected " + std::string(expected) + ", found " + nameOf(value.type()));
}

const std::string& TomlReader::requireText(std::string_view key, const toml::node& value) const {
    const auto* text = value.as_string();
    if (text == nullptr) {
        refuseType(key, value, "a string");
    }
    return text->get();
}

std::optional<std::string> TomlReader::text(std::string_view key) {
    const toml::node* value = find(key);
    return value == nullptr ? std::nullopt : std::optional(cleanText(requireText(key, *value)));
}

std::optional<std::uint64_t> TomlReader::integer(std::string_view key, std::uint64_t highest) {
    const toml::node* value = find(key);
    if (value == nullptr) {
        return std::nullopt;
    }
    // TOML's integers are signed, of 64 bits.
    highest = std::min<std::uint64_t>(highest, std::numeric_limits<std::int64_t>::max());
    const std::string expected = "an integer from 0 to " + std::to_string(highest);
    const auto* number = value->as_integer();
    if (number == nullptr) {
        refuseType(key, *value, expected);
    }
    if (number->get() < 0 || static_cast<std::uint64_t>(number->get()) > highest) {
        refuseKey(key, "expected " + expected + ", found " + std::to_string(number->get()));
    }
    return static_cast<std::uint64_t>(number->get());
}

std::optional<bool> TomlReader::boolean(std::string_view key) {
    const toml::node* value = find(key);
    if (value == nullptr) {
        return std::nullopt;
    }
    const auto* truth = value->as_boolean();
    if (truth == nullptr) {
        refuseType(key, *value, "true or false");
    }
    return truth->get();
}

std::optional<std::vector<std::string>> TomlReader::texts(std::string_view key) {
    const toml::node* value = find(key);
    if (value == nullptr) {
        return std::nullopt;
    }
    const toml::array* list = value->as_array();
    if (list == nullptr) {
        refuseType(key, *value, "a list of strings");
    }
    std::vector<std::string> result;
    result.reserve(list->size());
    for (const toml::node& element : *list) {
        if (!element.is_string()) {
            refuseType(key, element, "a list of strings");
        }
        result.push_back(cleanText(requireText(key, element)));
    }
    return result;
}

toml::table* TomlReader::table(std::string_view key) {
    toml::node* value = find(key);
    if (value != nullptr && !value->is_table()) {
        refuseType(key, *value, "a table");
    }
    return value == nullptr ? nullptr : value->as_table();
}

std::vector<toml::table*> TomlReader::tables(std::string_view key) {
    std::vector<toml::table*> result;
    toml::node* value = find(key);
    if (value == nullptr) {
        return result;
    }
    const std::string expected = "[[" + std::string(key) + "]] tables";
    if (!value->is_array()) {
        refuseType(key, *value, expected);
    }
    for (toml::node& element : *value->as_array()) {
        if (!element.is_table()) {
            refuseType(key, element, expected);
        }
        result.push_back(element.as_table());
    }
    return result;
}

void TomlReader::refuseOtherKeys() const {
    const toml::key* first = nullptr;
    for (auto&& [key, value] : _table) {
        const bool known = std::find(_known.begin(), _known.end(), key.str()) != _known.end();
        if (!known && (first == nullptr || key.source().begin.line < first->source().begin.line)) {
            first = &key;
        }
    }
    if (first != nullptr) {
        refuse(_file, lineOf(first->source()), std::string(_prefix).append(first->str()), "unknown key");
    }
}

} // namespace Orv::Agent

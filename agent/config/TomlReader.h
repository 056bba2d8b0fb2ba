/**
 * @file
 * Reading TOML strictly: what does not belong is refused with file, line, key and reason.
 *
 * For source files only: it brings the whole TOML library with it.
 */
#pragma once

#include <cstdint>
#include <limits>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#define TOML_ENABLE_FORMATTERS 0
#include <toml++/toml.h>

namespace Orv::Agent {

/**
 * Parses a document, or a part of one that starts with line `firstLine` of the file. Throws std::runtime_error with
 * file, line and reason.
 */
toml::table parseToml(std::string_view text, const std::string& file, std::size_t firstLine = 1);

/** Throws std::runtime_error "FILE:LINE: KEY: REASON". */
[[noreturn]] void refuse(const std::string& file, std::size_t line, const std::string& key,
                         const std::string& reason);

/**
 * One table whose keys are read by name. Every read throws, as refuse does, when the value is of another type or out
 * of range; none is returned when the key is absent. Texts come out clean.
 */
class TomlReader {
  public:
    /**
     * `prefix` stands before the table's keys in messages: "adapter." or nothing. `firstLine` as for parseToml. The
     * table, both texts and every key that is asked for must outlive the reader.
     */
    TomlReader(toml::table& table, const std::string& file, std::string_view prefix, std::size_t firstLine = 1)
        : _table(table), _file(file), _prefix(prefix), _firstLine(firstLine) {}

    std::optional<std::string> text(std::string_view key);
    std::optional<std::uint64_t> integer(std::string_view key, std::uint64_t highest);
    std::optional<bool> boolean(std::string_view key);
    std::optional<std::vector<std::string>> texts(std::string_view key);

    /** The table under a key. */
    toml::table* table(std::string_view key);

    /** The tables of an array of tables; the array may be absent. */
    std::vector<toml::table*> tables(std::string_view key);

    /** Throws for the first key of the table that no read has asked for. */
    void refuseOtherKeys() const;

    /** Throws about one key of this table, at the place of its value or else at the table's own. */
    [[noreturn]] void refuseKey(std::string_view key, const std::string& reason) const;

    /** The line of a key's value, or else of the table. */
    [[nodiscard]] std::size_t lineOf(std::string_view key) const;

  private:
    toml::node* find(std::string_view key);
    [[nodiscard]] std::size_t lineOf(const toml::source_region& where) const;
    [[noreturn]] void refuseType(std::string_view key, const toml::node& value, std::string_view expected) const;
    const std::string& requireText(std::string_view key, const toml::node& value) const;

    toml::table& _table;
    const std::string& _file;
    const std::string_view _prefix;
    const std::size_t _firstLine;
    std::vector<std::string_view> _known;
};

/** An unsigned of `Number`'s range under a key. */
template <typename Number>
std::optional<Number> readNumber(TomlReader& reader, std::string_view key) {
    const auto value = reader.integer(key, std::numeric_limits<Number>::max());
    return value ? std::optional<Number>(static_cast<Number>(*value)) : std::nullopt;
}

} // namespace Orv::Agent

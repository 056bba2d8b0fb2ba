#include "agent/file/DescriptionEditor.h"

#include "agent/config/TextEdit.h"
#include "agent/config/TomlReader.h"

#include <algorithm>
#include <array>
#include <cstdio>
#include <stdexcept>
#include <utility>

namespace Orv::Agent {

namespace {

constexpr std::string_view byteOrderMark = "\xEF\xBB\xBF";

struct Range {
    std::size_t begin;
    std::size_t end;
};

/** A key of a table with its places in the text. */
struct Entry {
    std::string key;
    Range keyRange;
    Range value;
};

bool isContinuation(char byte) {
    return (static_cast<unsigned char>(byte) & 0xC0U) == 0x80U;
}

/** From the parser's lines and columns, which count characters from 1, to bytes of the text. */
class Places {
  public:
    explicit Places(std::string_view text) : _text(text) {
        _lines.push_back(text.starts_with(byteOrderMark) ? byteOrderMark.size() : 0);
        for (std::size_t at = text.find('\n'); at != std::string_view::npos; at = text.find('\n', at + 1)) {
            _lines.push_back(at + 1);
        }
    }

    [[nodiscard]] Range of(const toml::source_region& region) const { return {at(region.begin), at(region.end)}; }

  private:
    [[nodiscard]] std::size_t at(const toml::source_position& position) const {
        std::size_t place = _lines.at(position.line - 1);
        for (unsigned column = 1; column < position.column && place < _text.size(); ++column) {
            do {
                ++place;
            } while (place < _text.size() && isContinuation(_text[place]));
        }
        return place;
    }

    std::string_view _text;
    std::vector<std::size_t> _lines; ///< where each begins
};

/** Edits one table. */
class TableEditor {
  public:
    TableEditor(std::string_view text, const toml::table& table) : _text(text), _places(text), _table(table) {
        for (auto&& [key, value] : table) {
            _entries.push_back({std::string(key.str()), _places.of(key.source()), _places.of(value.source())});
        }
        std::sort(_entries.begin(), _entries.end(),
                  [](const Entry& left, const Entry& right) { return left.keyRange.begin < right.keyRange.begin; });
    }

    std::string edit(const std::vector<KeyEdit>& edits) {
        if (_table.is_inline()) {
            editInline(edits);
        } else {
            for (const KeyEdit& edit : edits) {
                editKey(edit);
            }
        }
        return _edit.applied(_text);
    }

  private:
    [[nodiscard]] std::string_view piece(const Range& range) const {
        return _text.substr(range.begin, range.end - range.begin);
    }

    [[nodiscard]] std::size_t lineBegin(std::size_t place) const {
        const std::size_t before = place == 0 ? std::string_view::npos : _text.rfind('\n', place - 1);
        const std::size_t first = _text.starts_with(byteOrderMark) ? byteOrderMark.size() : 0;
        return before == std::string_view::npos ? first : before + 1;
    }

    /** Behind the end of the line, or the end of the text. */
    [[nodiscard]] std::size_t lineEnd(std::size_t place) const {
        return std::min(_text.find('\n', place), _text.size() - 1) + 1;
    }

    void editKey(const KeyEdit& edit) {
        const auto entry = std::find_if(_entries.begin(), _entries.end(),
                                        [&](const Entry& candidate) { return candidate.key == edit.key; });
        if (entry != _entries.end() && edit.value) {
            _edit.replace(entry->value.begin, entry->value.end, *edit.value);
        } else if (entry != _entries.end()) {
            remove(*entry);
        } else if (edit.value) {
            add(edit.key + " = " + *edit.value);
        }
    }

    void remove(const Entry& entry) {
        const std::size_t begin = lineBegin(entry.keyRange.begin);
        const std::size_t end = lineEnd(entry.value.end);
        const bool hasComment = piece({entry.value.end, end}).find('#') != std::string_view::npos;
        const std::size_t comment = _text.find('#', entry.value.end);
        _edit.replace(hasComment ? entry.keyRange.begin : begin, hasComment ? comment : end, {});
    }

    /** Behind the last key's line, with the blanks in front that this line has. */
    void add(const std::string& assignment) {
        const Range last = _entries.empty() ? _places.of(_table.source()) : lastEntry();
        const std::size_t begin = lineBegin(last.begin);
        const std::size_t place = lineEnd(last.end);
        const bool hasEnd = place > 0 && _text[place - 1] == '\n';
        const std::string newline = _text.find("\r\n") != std::string_view::npos ? "\r\n" : "\n";
        _edit.insert(place, (hasEnd ? "" : newline) + std::string(piece({begin, last.begin})) + assignment + newline);
    }

    [[nodiscard]] Range lastEntry() const { return {_entries.back().keyRange.begin, _entries.back().value.end}; }

    void editInline(const std::vector<KeyEdit>& edits) {
        std::vector<std::string> assignments;
        for (const Entry& entry : _entries) {
            const auto edit = std::find_if(edits.begin(), edits.end(),
                                           [&](const KeyEdit& candidate) { return candidate.key == entry.key; });
            if (edit == edits.end() || edit->value) {
                assignments.push_back(std::string(piece(entry.keyRange)) + " = " +
                                      (edit == edits.end() ? std::string(piece(entry.value)) : *edit->value));
            }
        }
        for (const KeyEdit& edit : edits) {
            if (edit.value && !_table.contains(edit.key)) {
                assignments.push_back(edit.key + " = " + *edit.value);
            }
        }
        std::string text;
        for (const std::string& assignment : assignments) {
            text += (text.empty() ? "{ " : ", ") + assignment;
        }
        const Range whole = _places.of(_table.source());
        _edit.replace(whole.begin, whole.end, text.empty() ? "{}" : text + " }");
    }

    std::string_view _text;
    Places _places;
    const toml::table& _table;
    std::vector<Entry> _entries; ///< in the order of the text
    TextEdit _edit;
};

} // namespace

std::string tomlText(std::string_view text) {
    std::string quoted = "\"";
    for (const char character : text) {
        if (character == '"' || character == '\\') {
            quoted += '\\';
            quoted += character;
        } else if (static_cast<unsigned char>(character) < 0x20 || character == 0x7F) {
            std::array<char, 8> escape{};
            (void)std::snprintf(escape.data(), escape.size(), "\\u%04X", static_cast<unsigned>(character));
            quoted += escape.data();
        } else {
            quoted += character;
        }
    }
    return quoted + '"';
}

std::string tomlList(const std::vector<std::string>& texts) {
    std::string list;
    for (const std::string& text : texts) {
        list += (list.empty() ? "" : ", ") + tomlText(text);
    }
    return '[' + list + ']';
}

std::string editAdapter(std::string_view text, const std::string& file, std::size_t number,
                        const std::vector<KeyEdit>& edits) {
    const toml::table document = parseToml(text, file);
    const toml::node* adapter = document["adapter"][number].node();
    if (adapter == nullptr || !adapter->is_table()) {
        throw std::runtime_error(file + ": there is no adapter number " + std::to_string(number + 1));
    }
    return TableEditor(text, *adapter->as_table()).edit(edits);
}

} // namespace Orv::Agent

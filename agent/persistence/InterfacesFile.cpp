#include "agent/persistence/InterfacesFile.h"

#include <algorithm>
#include <array>

namespace Orv::Agent::Persistence {

namespace {

constexpr std::string_view blanks = " \t\r\v\f";
constexpr std::array<std::string_view, 8> openers{"iface",      "mapping", "auto",   "no-auto-down",
                                                  "no-scripts", "rename",  "source", "source-directory"};

bool isBlank(char character) {
    return blanks.find(character) != std::string_view::npos;
}

bool opensStanza(std::string_view keyword) {
    return keyword.starts_with("allow-") || std::find(openers.begin(), openers.end(), keyword) != openers.end();
}

/** A backslash that is the very last of its line. */
bool continues(std::string_view text, std::size_t place) {
    return text[place] == '\\' && place + 1 < text.size() && text[place + 1] == '\n';
}

std::vector<InterfacesFile::Word> wordsIn(std::string_view text, std::size_t begin, std::size_t end) {
    std::vector<InterfacesFile::Word> words;
    bool isInWord = false;
    for (std::size_t place = begin; place < end; ++place) {
        if (continues(text, place)) {
            ++place; // the next line goes on in the same word
        } else if (isBlank(text[place]) || text[place] == '\n') {
            isInWord = false;
        } else {
            if (!isInWord) {
                words.push_back({place, place, {}});
            }
            isInWord = true;
            words.back().text += text[place];
            words.back().end = place + 1;
        }
    }
    return words;
}

} // namespace

std::string InterfacesFile::Statement::value() const {
    std::string value;
    for (auto word = words.begin() + 1; word != words.end(); ++word) {
        value += (value.empty() ? "" : " ") + word->text;
    }
    return value;
}

InterfacesFile::InterfacesFile(std::string text) : _text(std::move(text)) {
    for (std::size_t begin = 0; begin < _text.size();) {
        const std::size_t first = _text.find_first_not_of(blanks, begin);
        if (first == std::string::npos || _text[first] == '\n' || _text[first] == '#') {
            begin = lineEnd(begin); // a comment does not go on in the next line, whatever it ends with
        } else {
            readStatement(begin);
            begin = _statements.empty() ? _text.size() : std::max(_statements.back().end, lineEnd(begin));
        }
    }
}

std::size_t InterfacesFile::lineEnd(std::size_t place) const {
    const std::size_t end = _text.find('\n', place);
    return end == std::string::npos ? _text.size() : end + 1;
}

void InterfacesFile::readStatement(std::size_t begin) {
    std::size_t end = lineEnd(begin);
    while (end >= begin + 2 && end < _text.size() && continues(_text, end - 2)) {
        end = lineEnd(end);
    }
    Statement statement{begin, end, wordsIn(_text, begin, end)};
    if (statement.words.empty()) {
        statement.words.push_back({begin, begin, {}}); // nothing but continuations
    }
    const std::size_t number = _statements.size();
    if (opensStanza(statement.keyword())) {
        _stanzas.push_back({number, number + 1});
    } else if (!_stanzas.empty()) {
        _stanzas.back().end = number + 1;
    }
    _statements.push_back(std::move(statement));
}

std::string InterfacesFile::newline() const {
    const std::size_t end = _text.find('\n');
    return end != std::string::npos && end > 0 && _text[end - 1] == '\r' ? "\r\n" : "\n";
}

std::string InterfacesFile::indentation(const Stanza& stanza) const {
    const auto indentationOf = [&](const Stanza& candidate) {
        const Statement& option = _statements[candidate.header + 1];
        return _text.substr(option.begin, option.words.front().begin - option.begin);
    };
    if (stanza.end > stanza.header + 1) {
        return indentationOf(stanza);
    }
    const auto other = std::find_if(_stanzas.begin(), _stanzas.end(),
                                    [](const Stanza& candidate) { return candidate.end > candidate.header + 1; });
    return other == _stanzas.end() ? "    " : indentationOf(*other);
}

std::vector<const StanzaEditor::Statement*> StanzaEditor::find(std::string_view option) const {
    std::vector<const Statement*> found;
    for (std::size_t number = _stanza.header + 1; number < _stanza.end; ++number) {
        if (_file.statements()[number].keyword() == option) {
            found.push_back(&_file.statements()[number]);
        }
    }
    return found;
}

std::optional<std::string> StanzaEditor::value(std::string_view option) const {
    const auto found = find(option);
    return found.empty() ? std::nullopt : std::optional(found.front()->value());
}

void StanzaEditor::setHeaderWord(std::size_t number, const std::string& text) {
    const InterfacesFile::Word& word = _file.header(_stanza).words[number];
    if (word.text != text) {
        _edit.replace(word.begin, word.end, text);
    }
}

void StanzaEditor::insertBehind(const Statement& statement, std::string_view option, const std::string& value) {
    const bool isOpen = !_file.text().substr(0, statement.end).ends_with('\n');
    const std::string line = _file.indentation(_stanza) + std::string(option) + " " + value;
    _edit.insert(statement.end, isOpen ? _file.newline() + line : line + _file.newline());
}

void StanzaEditor::set(std::string_view option, const std::string& value,
                       const std::vector<std::string_view>& after) {
    const auto found = find(option);
    if (found.empty()) {
        std::size_t behind = _stanza.header;
        for (std::size_t number = _stanza.header + 1; number < _stanza.end; ++number) {
            const bool isAnchor =
                std::find(after.begin(), after.end(), _file.statements()[number].keyword()) != after.end();
            behind = isAnchor ? number : behind;
        }
        insertBehind(_file.statements()[behind], option, value);
        return;
    }
    const Statement& first = *found.front();
    if (first.words.size() == 1) {
        _edit.insert(first.words.front().end, " " + value);
    } else if (first.value() != value) {
        _edit.replace(first.words[1].begin, first.words.back().end, value);
    }
    std::for_each(found.begin() + 1, found.end(),
                  [&](const Statement* other) { _edit.remove(other->begin, other->end); });
}

void StanzaEditor::remove(std::string_view option) {
    for (const Statement* statement : find(option)) {
        _edit.remove(statement->begin, statement->end);
    }
}

void StanzaEditor::append(std::string_view option, const std::string& value) {
    insertBehind(_file.statements()[_stanza.end - 1], option, value);
}

} // namespace Orv::Agent::Persistence

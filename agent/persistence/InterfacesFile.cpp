#include "agent/persistence/InterfacesFile.h"

#include <algorithm>
#include <array>

namespace Orv::Agent::Persistence {

namespace {

constexpr std::string_view blanks = " \t\r\v\f";
constexpr std::array<std::string_view, 8> openers{"iface",      "mapping", "auto",   "no-auto-down",
                                                  "no-scripts", "rename",  "source", "source-directory"};

bool isBlank(char character) {
    return character == ' ' || (character >= '\t' && character <= '\r' && character != '\n');
}

bool opensStanza(std::string_view keyword) {
    return keyword.starts_with("allow-") || std::find(openers.begin(), openers.end(), keyword) != openers.end();
}

/** A backslash that is the very last of its line. */
bool continues(std::string_view text, std::size_t place) {
    return text[place] == '\\' && place + 1 < text.size() && text[place + 1] == '\n';
}

/** Appends a word with a piece that stands behind it, or begins one. */
void addPiece(std::vector<InterfacesFile::Word>& words, std::string_view text, std::size_t begin, std::size_t end,
              bool goesOn) {
    if (!goesOn) {
        words.push_back({begin, end, {}});
    }
    words.back().text += text.substr(begin, end - begin);
    words.back().end = end;
}

std::vector<InterfacesFile::Word> wordsIn(std::string_view text, std::size_t begin, std::size_t end) {
    std::vector<InterfacesFile::Word> words;
    words.reserve(4);
    bool goesOn = false; // the next piece belongs to the word before
    for (std::size_t place = begin; place < end;) {
        if (continues(text, place)) {
            place += 2;
        } else if (isBlank(text[place]) || text[place] == '\n') {
            goesOn = false;
            ++place;
        } else {
            const std::size_t first = place;
            while (place < end && !isBlank(text[place]) && text[place] != '\n' && !continues(text, place)) {
                ++place;
            }
            addPiece(words, text, first, place, goesOn);
            goesOn = true;
        }
    }
    return words;
}

/** As the first of wordsIn; empty when there is none. */
std::string firstWord(std::string_view text, std::size_t begin, std::size_t end) {
    std::size_t first = begin;
    while (first < end && isBlank(text[first])) {
        ++first;
    }
    std::size_t behind = first;
    while (behind < end && !isBlank(text[behind]) && text[behind] != '\n' && text[behind] != '\\') {
        ++behind;
    }
    if (behind < end && text[behind] == '\\') {
        const auto words = wordsIn(text, begin, end); // the word may go on in the next line
        return words.empty() ? "" : words.front().text;
    }
    return std::string(text.substr(first, behind - first));
}

} // namespace

std::vector<InterfacesFile::Word> InterfacesFile::wordsOf(const Statement& statement) const {
    std::vector<Word> words = wordsIn(_text, statement.begin, statement.end);
    if (words.empty()) {
        words.push_back({statement.begin, statement.begin, {}}); // nothing but continuations
    }
    return words;
}

std::string InterfacesFile::valueOf(const Statement& statement) const {
    const std::vector<Word> words = wordsOf(statement);
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
    Statement statement{begin, end, firstWord(_text, begin, end)};
    const std::size_t number = _statements.size();
    if (opensStanza(statement.keyword)) {
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
        return _text.substr(option.begin, wordsOf(option).front().begin - option.begin);
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
        if (_file.statements()[number].keyword == option) {
            found.push_back(&_file.statements()[number]);
        }
    }
    return found;
}

std::optional<std::string> StanzaEditor::value(std::string_view option) const {
    const auto found = find(option);
    return found.empty() ? std::nullopt : std::optional(_file.valueOf(*found.front()));
}

void StanzaEditor::setHeaderWord(std::size_t number, const std::string& text) {
    const InterfacesFile::Word word = _file.wordsOf(_file.header(_stanza)).at(number);
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
                std::find(after.begin(), after.end(), _file.statements()[number].keyword) != after.end();
            behind = isAnchor ? number : behind;
        }
        insertBehind(_file.statements()[behind], option, value);
        return;
    }
    const std::vector<InterfacesFile::Word> words = _file.wordsOf(*found.front());
    if (words.size() == 1) {
        _edit.insert(words.front().end, " " + value);
    } else if (_file.valueOf(*found.front()) != value) {
        _edit.replace(words[1].begin, words.back().end, value);
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

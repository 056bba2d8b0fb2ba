/**
 * @file
 * One file of interfaces(5), so that parts of it can be changed and the rest stays byte for byte.
 */
#pragma once

#include "agent/config/TextEdit.h"

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace Orv::Agent::Persistence {

/** Any text can be taken apart; what ifupdown itself would refuse is left as it stands. */
class InterfacesFile {
  public:
    /** A word with its place in the text; a backslash at the end of a line within it is no part of it. */
    struct Word {
        std::size_t begin;
        std::size_t end;
        std::string text;
    };

    /** A line that says something, with the lines that continue it. */
    struct Statement {
        std::size_t begin;   ///< of its first line
        std::size_t end;     ///< behind the end of its last line
        std::string keyword; ///< its first word
    };

    /** A statement that opens a stanza, with the options that follow; both by number. */
    struct Stanza {
        std::size_t header;
        std::size_t end; ///< the statement behind the last option
    };

    explicit InterfacesFile(std::string text);

    [[nodiscard]] const std::string& text() const { return _text; }

    [[nodiscard]] const std::vector<Statement>& statements() const { return _statements; }

    [[nodiscard]] const std::vector<Stanza>& stanzas() const { return _stanzas; }

    [[nodiscard]] const Statement& header(const Stanza& stanza) const { return _statements[stanza.header]; }

    /** The words of a statement, one at least. Taken apart when they are asked for: most never are. */
    [[nodiscard]] std::vector<Word> wordsOf(const Statement& statement) const;

    /** The words behind the first, with a blank between each. */
    [[nodiscard]] std::string valueOf(const Statement& statement) const;

    /** The end of line that the file has. */
    [[nodiscard]] std::string newline() const;

    /** What stands in front of the options: in the stanza, else in the file, else four blanks. */
    [[nodiscard]] std::string indentation(const Stanza& stanza) const;

  private:
    void readStatement(std::size_t begin);
    [[nodiscard]] std::size_t lineEnd(std::size_t place) const;

    std::string _text;
    std::vector<Statement> _statements;
    std::vector<Stanza> _stanzas;
};

/** Changes options of one stanza; what it changes is gathered in `edit`. File and edit must outlive it. */
class StanzaEditor {
  public:
    StanzaEditor(const InterfacesFile& file, const InterfacesFile::Stanza& stanza, TextEdit& edit)
        : _file(file), _stanza(stanza), _edit(edit) {}

    /** The value of the first option of this name. */
    [[nodiscard]] std::optional<std::string> value(std::string_view option) const;

    /** Changes a word of the header, which must have it. */
    void setHeaderWord(std::size_t number, const std::string& text);

    /**
     * The value of the first option of this name; others of this name go. A new option stands behind the last of the
     * options `after` that there is, else behind the header.
     */
    void set(std::string_view option, const std::string& value, const std::vector<std::string_view>& after = {});

    void remove(std::string_view option);

    /** A new option at the end of the stanza. */
    void append(std::string_view option, const std::string& value);

  private:
    using Statement = InterfacesFile::Statement;

    [[nodiscard]] std::vector<const Statement*> find(std::string_view option) const;
    void insertBehind(const Statement& statement, std::string_view option, const std::string& value);

    const InterfacesFile& _file;
    const InterfacesFile::Stanza& _stanza;
    TextEdit& _edit;
};

} // namespace Orv::Agent::Persistence

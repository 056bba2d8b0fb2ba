#include "agent/persistence/ResolvConf.h"

#include "agent/config/TextEdit.h"
#include "agent/linux/Words.h"
#include "agent/persistence/Joined.h"

#include <algorithm>
#include <filesystem>
#include <stdexcept>

namespace Orv::Agent::Persistence {

namespace {

/** A line that means something to the resolver. */
struct Line {
    std::size_t begin;
    std::size_t end; ///< behind the end of the line
    std::string_view keyword;
    std::vector<std::string_view> values;
};

/** The lines that are settings: the keyword stands at the very beginning and has a value. */
std::vector<Line> settingsIn(std::string_view text) {
    std::vector<Line> lines;
    for (std::size_t begin = 0; begin < text.size();) {
        const std::size_t newline = text.find('\n', begin);
        const std::size_t end = newline == std::string_view::npos ? text.size() : newline + 1;
        std::string_view content = text.substr(begin, end - begin);
        content = content.substr(0, content.find('\n'));
        std::vector<std::string_view> words = Linux::wordsOf(content);
        if (words.size() >= 2 && words.front().data() == content.data()) {
            const std::string_view keyword = words.front();
            words.erase(words.begin());
            lines.push_back({begin, end, keyword, std::move(words)});
        }
        begin = end;
    }
    return lines;
}

std::vector<Line> linesOf(const std::vector<Line>& lines, std::string_view keyword) {
    std::vector<Line> found;
    std::copy_if(lines.begin(), lines.end(), std::back_inserter(found),
                 [&](const Line& line) { return line.keyword == keyword; });
    return found;
}

class ResolvConfEditor {
  public:
    explicit ResolvConfEditor(std::string_view text) : _text(text), _lines(settingsIn(text)) {}

    /** The n-th server goes into the n-th line; further ones behind it, lines left over go. */
    void setServers(const std::vector<std::string>& servers) {
        const std::vector<Line> lines = linesOf(_lines, "nameserver");
        for (std::size_t number = 0; number < lines.size(); ++number) {
            if (number >= servers.size()) {
                _edit.remove(lines[number].begin, lines[number].end);
            } else {
                setWord(lines[number].values.front(), servers[number]);
            }
        }
        const std::size_t place = lines.empty() ? _text.size() : lines.back().end;
        for (std::size_t number = lines.size(); number < servers.size(); ++number) {
            insert(place, "nameserver " + servers[number]);
        }
    }

    /** What the last line says counts; the others only make it hard to read. */
    void setOne(std::string_view keyword, const std::string& value, std::size_t newPlace) {
        const std::vector<Line> lines = linesOf(_lines, keyword);
        for (const Line& line : lines) {
            const bool stays = &line == &lines.back() && !value.empty();
            if (stays && keyword == "domain") {
                setWord(line.values.front(), value);
            } else if (stays) {
                setWords(line.values, value);
            } else {
                _edit.remove(line.begin, line.end);
            }
        }
        if (lines.empty() && !value.empty()) {
            insert(newPlace, std::string(keyword) + " " + value);
        }
    }

    /** Where a `domain` may come so that a `search` stays behind it. */
    [[nodiscard]] std::size_t placeOfDomain() const {
        const std::vector<Line> searches = linesOf(_lines, "search");
        return searches.empty() ? _text.size() : searches.back().begin;
    }

    [[nodiscard]] std::size_t end() const { return _text.size(); }

    [[nodiscard]] std::string result() const { return _edit.applied(_text); }

  private:
    [[nodiscard]] std::size_t placeOf(std::string_view piece) const {
        return static_cast<std::size_t>(piece.data() - _text.data());
    }

    void setWord(std::string_view before, const std::string& after) {
        if (before != after) {
            _edit.replace(placeOf(before), placeOf(before) + before.size(), after);
        }
    }

    void setWords(const std::vector<std::string_view>& before, const std::string& after) {
        const std::string_view last = before.back();
        if (joined({before.begin(), before.end()}) != after) {
            _edit.replace(placeOf(before.front()), placeOf(last) + last.size(), after);
        }
    }

    void insert(std::size_t place, const std::string& line) {
        const bool isOpen = place > 0 && _text[place - 1] != '\n';
        _edit.insert(place, isOpen ? "\n" + line : line + "\n");
    }

    std::string_view _text;
    std::vector<Line> _lines;
    TextEdit _edit;
};

/** Whether a `domain` stands behind the last `search` and so overrules it. */
bool domainOverrulesSearch(std::string_view text) {
    const std::vector<Line> lines = settingsIn(text);
    const auto isEither = [](const Line& line) { return line.keyword == "domain" || line.keyword == "search"; };
    const auto last = std::find_if(lines.rbegin(), lines.rend(), isEither);
    return last != lines.rend() && last->keyword == "domain" && !linesOf(lines, "search").empty();
}

/** What lies below /run is made by a program that would make it anew. */
void refuseGenerated(const std::string& path, const std::string& generated) {
    std::error_code error;
    const std::filesystem::path target = std::filesystem::weakly_canonical(path, error);
    if (!error && target.string().starts_with(generated)) {
        throw std::runtime_error(path + " leads to " + target.string() + ", which another program writes");
    }
}

} // namespace

std::string editResolvConf(std::string_view text, const NameSettings& wanted) {
    std::string before(text);
    // A search that did not count must not begin to because it is moved; one that is wanted must count.
    if (domainOverrulesSearch(before) && (wanted.suffixes || wanted.domain)) {
        ResolvConfEditor cleaning(before);
        cleaning.setOne("search", "", 0);
        before = cleaning.result();
    }
    ResolvConfEditor editor(before);
    if (wanted.domain) {
        editor.setOne("domain", *wanted.domain, editor.placeOfDomain());
    }
    if (wanted.suffixes) {
        editor.setOne("search", joined(*wanted.suffixes), editor.end());
    }
    if (wanted.servers) {
        editor.setServers(*wanted.servers);
    }
    return editor.result();
}

FileEdits ResolvConf::plan(const NameSettings& wanted) const {
    const std::string path = _environment.root + "/etc/resolv.conf";
    refuseGenerated(path, _environment.root + "/run/");
    const std::optional<std::string> before = contentOf(path);
    std::string after = editResolvConf(before.value_or(""), wanted);
    const bool isSame = after == before.value_or("");
    return isSame ? FileEdits{} : FileEdits{{path, before, std::move(after)}};
}

void ResolvConf::apply(const InterfaceFacts& /*interface*/, const NameSettings& /*whole*/) {}

} // namespace Orv::Agent::Persistence

#include "host/filter/Pattern.h"

#include "host/schema/Utf8.h"

#include <algorithm>

namespace marlo::filter {

bool Pattern::Element::accepts(char32_t character) const {
    const bool within = std::any_of(ranges.begin(), ranges.end(), [character](const auto& range) {
        return range.first <= character && character <= range.second;
    });
    return within != negated;
}

/** Takes `[...]` off a text; nothing, and the text as it was, where the set does not end. */
std::optional<Pattern::Element> Pattern::readSet(std::string_view& text) {
    std::string_view rest = text.substr(1);
    Element element;
    if (rest.starts_with('^')) {
        element.negated = true;
        rest.remove_prefix(1);
    }
    // A bracket that comes first stands for itself: a set has at least one member.
    for (bool first = true; first || !rest.starts_with(']'); first = false) {
        const auto from = takeUtf8(rest);
        if (!from) {
            return std::nullopt;
        }
        auto to = from;
        if (rest.size() > 1 && rest[0] == '-' && rest[1] != ']') {
            rest.remove_prefix(1);
            to = takeUtf8(rest);
        }
        element.ranges.emplace_back(*from, to.value_or(*from));
    }
    text = rest.substr(1);
    return element;
}

Pattern Pattern::read(std::string_view text, char many, char one) {
    const Element any{{}, true, false}; // all but none
    Pattern pattern;
    while (!text.empty()) {
        std::optional<Element> element;
        if (text.front() == '[') {
            element = readSet(text);
        } else if (text.front() == one || (text.front() == many && many == '%')) {
            element = any;
            element->repeated = text.front() == many;
            text.remove_prefix(1);
        } else if (text.front() == many && !pattern._elements.empty() && !pattern._elements.back().repeated) {
            pattern._elements.back().repeated = true;
            text.remove_prefix(1);
            continue;
        }
        if (!element) {
            if (text.front() == '\\' && text.size() > 1) {
                text.remove_prefix(1);
            }
            const auto character = takeUtf8(text);
            element = Element{{{character.value_or(0), character.value_or(0)}}, false, false};
        }
        pattern._elements.push_back(*std::move(element));
    }
    return pattern;
}

/** Repeated elements may match nothing: what follows one is reached with it. */
void Pattern::skipRepeated(std::vector<bool>& reached) const {
    for (std::size_t i = 0; i < _elements.size(); ++i) {
        if (reached[i] && _elements[i].repeated) {
            reached[i + 1] = true;
        }
    }
}

bool Pattern::matches(std::string_view text) const {
    std::vector<bool> reached(_elements.size() + 1);
    reached[0] = true;
    skipRepeated(reached);
    while (!text.empty()) {
        const auto character = takeUtf8(text);
        if (!character) {
            return false;
        }
        std::vector<bool> next(_elements.size() + 1);
        for (std::size_t i = 0; i < _elements.size(); ++i) {
            if (reached[i] && _elements[i].accepts(*character)) {
                next[_elements[i].repeated ? i : i + 1] = true;
            }
        }
        reached = std::move(next);
        skipRepeated(reached);
    }
    return reached.back();
}

} // namespace marlo::filter

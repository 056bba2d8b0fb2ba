#include "agent/file/DocumentParts.h"

#include <algorithm>

namespace Orv::Agent {

namespace {

constexpr std::size_t tablesPerPart = 200; ///< a part takes some hundred kilobytes when it is parsed

bool isArrayHeader(std::string_view line) {
    return line.starts_with("[[") && line.substr(0, line.find(']')).find('.') == std::string_view::npos;
}

} // namespace

std::vector<DocumentPart> cutDocument(std::string_view text) {
    std::vector<DocumentPart> parts{{text, 1}};
    std::size_t tables = tablesPerPart;
    std::size_t line = 1;
    for (std::size_t start = 0; start < text.size(); ++line) {
        const std::size_t end = std::min(text.find('\n', start), text.size() - 1) + 1;
        if (isArrayHeader(text.substr(start, end - start)) && tables++ == tablesPerPart) {
            DocumentPart& last = parts.back();
            last.text = last.text.substr(0, last.text.size() - (text.size() - start));
            parts.push_back({text.substr(start), line});
            tables = 1;
        }
        start = end;
    }
    return parts;
}

} // namespace Orv::Agent

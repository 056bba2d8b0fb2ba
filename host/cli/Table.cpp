#include "host/cli/Table.h"

#include "host/cli/Text.h"

#include <algorithm>
#include <numeric>
#include <string_view>

namespace marlo::cli {

namespace {

constexpr std::size_t Gap = 2;
/** A column narrower than this helps nobody. */
constexpr std::size_t LeastWidth = 8;

const char* openStyle(Style style) {
    switch (style) {
    case Style::Good:
        return "\x1b[32m";
    case Style::Bad:
        return "\x1b[33m";
    case Style::Faint:
        return "\x1b[2m";
    case Style::Plain:
        break;
    }
    return "";
}

/** How much of a text goes on this line: up to the last separator in the second half of it, else as much as fits. */
std::size_t breakAt(std::string_view text, std::size_t width) {
    const std::size_t fitting = fittingLength(text, width);
    if (fitting == text.size()) {
        return fitting;
    }
    const std::size_t separator = text.substr(0, fitting).find_last_of(" :.-/,");
    return separator != std::string_view::npos && separator >= fitting / 2 ? separator + 1 : fitting;
}

std::vector<std::string> wrap(const std::vector<std::string>& lines, std::size_t width) {
    std::vector<std::string> wrapped;
    for (std::string_view rest : lines) {
        do {
            const std::size_t length = breakAt(rest, width);
            wrapped.emplace_back(rest.substr(0, length));
            rest.remove_prefix(length);
        } while (!rest.empty());
    }
    return wrapped;
}

/** One row as lines of text. */
std::string renderRow(const std::vector<Cell>& row, const std::vector<std::size_t>& widths, bool colours) {
    std::vector<std::vector<std::string>> columns;
    std::size_t height = 0;
    for (std::size_t i = 0; i < row.size(); ++i) {
        columns.push_back(wrap(row[i].lines, widths[i]));
        height = std::max(height, columns.back().size());
    }
    std::string text;
    for (std::size_t line = 0; line < height; ++line) {
        std::size_t blanks = 0; // owed before the next text, so that none are left at the end of the line
        for (std::size_t i = 0; i < columns.size(); ++i) {
            const std::string_view value = line < columns[i].size() ? std::string_view(columns[i][line]) : "";
            const bool styled = colours && row[i].style != Style::Plain && !value.empty();
            if (!value.empty()) {
                text.append(blanks, ' ');
                blanks = 0;
                text.append(styled ? openStyle(row[i].style) : "").append(value).append(styled ? "\x1b[0m" : "");
            }
            const std::size_t width = displayWidth(value);
            blanks += Gap + (widths[i] > width ? widths[i] - width : 0);
        }
        text += '\n';
    }
    return text;
}

} // namespace

std::vector<std::size_t> Table::columnWidths(std::size_t width) const {
    std::vector<std::size_t> widths;
    for (const std::string& title : _titles) {
        widths.push_back(displayWidth(title));
    }
    for (const std::vector<Cell>& row : _rows) {
        for (std::size_t i = 0; i < widths.size(); ++i) {
            for (const std::string& line : row[i].lines) {
                widths[i] = std::max(widths[i], displayWidth(line));
            }
        }
    }
    std::size_t total = std::accumulate(widths.begin(), widths.end(), Gap * (widths.size() - 1));
    while (width != 0 && total > width) {
        const auto widest = std::max_element(widths.begin(), widths.end());
        if (*widest <= LeastWidth) {
            break;
        }
        --*widest;
        --total;
    }
    return widths;
}

std::string Table::render(std::size_t width, bool colours) const {
    const std::vector<std::size_t> widths = columnWidths(width);
    std::vector<Cell> titles;
    for (const std::string& title : _titles) {
        titles.push_back({{title}, Style::Faint});
    }
    std::string text = renderRow(titles, widths, colours);
    for (const std::vector<Cell>& row : _rows) {
        text += renderRow(row, widths, colours);
    }
    return text;
}

} // namespace marlo::cli

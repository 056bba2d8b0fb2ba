/**
 * @file
 * A table in columns for a terminal or a file.
 */
#pragma once

#include <cstddef>
#include <string>
#include <vector>

namespace marlo::cli {

enum class Style { Plain, Good, Bad, Faint };

/** Values that stand below each other in one row. Texts are printable. */
struct Cell {
    std::vector<std::string> lines;
    Style style = Style::Plain;
};

class Table {
  public:
    explicit Table(std::vector<std::string> titles) : _titles(std::move(titles)) {}

    /** As many cells as there are titles. */
    void add(std::vector<Cell> row) { _rows.push_back(std::move(row)); }

    [[nodiscard]] bool empty() const { return _rows.empty(); }

    /**
     * Titles and rows in aligned columns, without blanks at the ends of lines. In a terminal of `width` columns (0:
     * of any width) the widest columns give way, and their values go on in the next line; below the least that a
     * table can be, lines are longer than the terminal.
     */
    [[nodiscard]] std::string render(std::size_t width, bool colours) const;

  private:
    [[nodiscard]] std::vector<std::size_t> columnWidths(std::size_t width) const;

    std::vector<std::string> _titles;
    std::vector<std::vector<Cell>> _rows;
};

} // namespace marlo::cli

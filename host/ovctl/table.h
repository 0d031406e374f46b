#pragma once
// Tables for people: columns two blanks apart, under headings. On a terminal that is too narrow the
// widest columns are cut (terminal.h); elsewhere everything is printed whole.

#include <cstddef>
#include <iosfwd>
#include <string>
#include <vector>

namespace ovhost
{

struct Column {
    std::string heading;
    bool right = false;        ///< numbers stand at the right of their column
    std::size_t min_width = 0; ///< so that short numbers stand below longer ones of another table
};

class Table
{
  public:
    explicit Table(std::vector<Column> columns) : columns_(std::move(columns)) {}

    /// As many cells as there are columns.
    void add(std::vector<std::string> cells) { rows_.push_back(std::move(cells)); }

    [[nodiscard]] bool empty() const { return rows_.empty(); }

    void print(std::ostream &out) const;

  private:
    [[nodiscard]] std::vector<std::size_t> natural_widths() const;
    [[nodiscard]] std::string line_of(const std::vector<std::string> &cells,
                                      const std::vector<std::size_t> &widths) const;

    std::vector<Column> columns_;
    std::vector<std::vector<std::string>> rows_;
};

} // namespace ovhost

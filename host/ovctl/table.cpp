#include "host/ovctl/table.h"

#include "host/ovctl/terminal.h"
#include "host/ovctl/text_width.h"

#include <algorithm>
#include <numeric>
#include <ostream>

namespace ovhost
{

namespace
{

constexpr std::size_t gap = 2;

/// A column that is cut shows at least this much: less would tell nothing.
constexpr std::size_t narrowest = 8;

/// Takes room from the widest column, again and again, until the table fits or nothing is left to
/// take.
void fit(std::vector<std::size_t> &widths, std::size_t available)
{
    std::size_t needed = std::accumulate(widths.begin(), widths.end(), gap * (widths.size() - 1));
    while (needed > available) {
        const auto widest = std::ranges::max_element(widths);
        if (*widest <= narrowest) {
            return;
        }
        --*widest;
        --needed;
    }
}

} // namespace

std::vector<std::size_t> Table::natural_widths() const
{
    std::vector<std::size_t> widths;
    for (const Column &column : columns_) {
        widths.push_back(std::max(width_of(column.heading), column.min_width));
    }
    for (const std::vector<std::string> &row : rows_) {
        for (std::size_t i = 0; i < row.size(); ++i) {
            widths[i] = std::max(widths[i], width_of(row[i]));
        }
    }
    return widths;
}

std::string Table::line_of(const std::vector<std::string> &cells,
                           const std::vector<std::size_t> &widths) const
{
    std::string line;
    for (std::size_t i = 0; i < cells.size(); ++i) {
        const std::string cell = fitted(cells[i], widths[i]);
        const std::string blanks(widths[i] - std::min(widths[i], width_of(cell)), ' ');
        const bool last = i + 1 == cells.size();
        if (columns_[i].right) {
            line += blanks + cell;
        } else {
            line += last ? cell : cell + blanks;
        }
        line.append(last ? 0 : gap, ' ');
    }
    return line;
}

void Table::print(std::ostream &out) const
{
    std::vector<std::size_t> widths = natural_widths();
    if (const std::size_t width = terminal_of(out).width; width > 0) {
        fit(widths, width);
    }
    std::vector<std::string> headings;
    for (const Column &column : columns_) {
        headings.push_back(column.heading);
    }
    out << styled(out, Style::heading, line_of(headings, widths)) << '\n';
    for (const std::vector<std::string> &row : rows_) {
        out << line_of(row, widths) << '\n';
    }
}

} // namespace ovhost

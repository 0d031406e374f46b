#include "host/ovctl/render_parts.h"

#include "host/support/printable.h"

#include <nlohmann/json.hpp>

#include <algorithm>
#include <iomanip>
#include <ostream>

namespace ovhost
{

using nlohmann::json;

std::string text_of(const json &object, const char *member)
{
    return printable(object.at(member).get_ref<const std::string &>());
}

long count_of(const json &object, const char *member)
{
    return object.at(member).get<long>();
}

std::string counted(long count, const char *one, const char *many)
{
    return std::to_string(count) + " " + (count == 1 ? one : many);
}

void print_fact(std::ostream &out, const char *name, const std::string &value)
{
    out << std::left << std::setw(20) << name << value << '\n';
}

std::string text_or(const json &object, const char *member, const char *otherwise)
{
    return object.at(member).is_null() ? otherwise : text_of(object, member);
}

std::size_t width_of(const std::string &text)
{
    return static_cast<std::size_t>(std::ranges::count_if(
        text, [](char byte) { return (static_cast<unsigned char>(byte) & 0xc0) != 0x80; }));
}

void print_table(std::ostream &out, const TableRows &rows)
{
    std::vector<std::size_t> widths(rows.front().size());
    for (const std::vector<std::string> &row : rows)
        for (std::size_t i = 0; i < row.size(); ++i)
            widths[i] = std::max(widths[i], width_of(row[i]));
    for (const std::vector<std::string> &row : rows) {
        for (std::size_t i = 0; i + 1 < row.size(); ++i)
            out << row[i] << std::string(widths[i] - width_of(row[i]) + 2, ' ');
        out << row.back() << '\n';
    }
}

} // namespace ovhost

#include "host/ovctl/render_parts.h"

#include "host/ovctl/table.h"
#include "host/support/printable.h"

#include <nlohmann/json.hpp>

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

void print_table(std::ostream &out, const TableRows &rows)
{
    std::vector<Column> columns;
    for (const std::string &heading : rows.front()) {
        columns.push_back({.heading = heading});
    }
    Table table(std::move(columns));
    for (auto row = rows.begin() + 1; row != rows.end(); ++row) {
        table.add(*row);
    }
    table.print(out);
}

} // namespace ovhost

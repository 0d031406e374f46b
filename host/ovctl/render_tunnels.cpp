#include "host/ovctl/render_tunnels.h"

#include "host/ovctl/render_parts.h"
#include "host/ovctl/table.h"

#include <nlohmann/json.hpp>

#include <algorithm>
#include <ostream>
#include <string>

namespace ovhost
{

using nlohmann::json;

namespace
{

std::string number_or(const json &object, const char *member, const char *otherwise)
{
    return object.at(member).is_null() ? otherwise : std::to_string(count_of(object, member));
}

std::string id_of(const json &tunnel)
{
    return number_or(tunnel, "id", "none");
}

std::string alias_of(const json &tunnel)
{
    const bool ambiguous = tunnel.at("alias_is_ambiguous").get<bool>();
    return text_of(tunnel, "alias") + (ambiguous ? " (ambiguous)" : "");
}

void print_list(const json &tunnels, std::ostream &out)
{
    Table table({{.heading = "NAME"},
                 {.heading = "ID", .right = true, .min_width = 5},
                 {.heading = "ALIAS"}});
    for (const json &tunnel : tunnels) {
        table.add({text_of(tunnel, "name"), id_of(tunnel), alias_of(tunnel)});
    }
    table.print(out);
}

void print_table_fact(std::ostream &out, const char *name, const json &result, const char *member)
{
    std::string names = std::to_string(count_of(result.at("names"), member));
    names.resize(std::max<std::size_t>(names.size() + 1, 8), ' ');
    print_fact(out, name, names + std::to_string(count_of(result.at("aliases"), member)));
}

std::string held_back(const json &held)
{
    if (held.empty()) {
        return "0";
    }
    const json &first = held.front();
    return std::to_string(held.size()) + ", the first (ID " +
           std::to_string(count_of(first, "id")) + ") for " +
           counted(count_of(first, "seconds"), "second", "seconds") + " more";
}

} // namespace

void render_tunnels(const json &result, std::ostream &out)
{
    const json &tunnels = result.at("tunnels");
    if (tunnels.empty()) {
        out << "no tunnels\n";
    } else {
        print_list(tunnels, out);
    }
}

void render_tunnel(const json &result, std::ostream &out)
{
    const json &tunnels = result.at("tunnels");
    if (result.at("ambiguous").get<bool>()) {
        out << "the " << text_of(result, "by") << " \"" << text_of(result, "value")
            << "\" is ambiguous: " << tunnels.size() << " tunnels claim it\n";
        print_list(tunnels, out);
        return;
    }
    const json &tunnel = tunnels.at(0);
    print_fact(out, "name", text_of(tunnel, "name"));
    print_fact(out, "id", id_of(tunnel));
    print_fact(out, "alias", alias_of(tunnel));
    print_fact(out, "remote", text_or(tunnel, "remote", "not set"));
    print_fact(out, "bandwidth", number_or(tunnel, "bandwidth", "not set"));
}

void render_tunnel_tables(const json &result, std::ostream &out)
{
    print_fact(out, "table", "names   aliases");
    print_table_fact(out, "slots", result, "slots");
    print_table_fact(out, "occupied", result, "occupied");
    print_table_fact(out, "collision marks", result, "collision_marks");
    print_table_fact(out, "holes", result, "holes");
    print_table_fact(out, "longest probe", result, "longest_probe");
    const json &ids = result.at("ids");
    print_fact(out, "IDs allowed", std::to_string(count_of(ids, "allowed")));
    print_fact(out, "IDs in use", std::to_string(count_of(ids, "in_use")));
    print_fact(out, "IDs in reserve", std::to_string(count_of(ids, "reserve")));
    print_fact(out, "IDs held back", held_back(ids.at("held_back")));
}

} // namespace ovhost

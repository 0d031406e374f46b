#include "host/ovctl/render_interfaces.h"

#include "host/ovctl/render_parts.h"

#include <nlohmann/json.hpp>

#include <ostream>
#include <string>

namespace ovhost
{

using nlohmann::json;

namespace
{

std::string enabled_of(const json &interface)
{
    const json &enabled = interface.at("enabled");
    return enabled.is_null() ? "-" : enabled.get<bool>() ? "yes" : "no";
}

std::string users_of(const json &interface)
{
    std::string list;
    for (const json &user : interface.at("users")) {
        list += (list.empty() ? "" : ", ") + text_of(user, "text");
    }
    return list.empty() ? "-" : list;
}

} // namespace

void render_interfaces(const json &result, std::ostream &out)
{
    TableRows rows{{"NAME", "KIND", "ENABLED", "USED BY"}};
    for (const json &interface : result.at("interfaces")) {
        rows.push_back({text_of(interface, "name"), text_of(interface, "kind"),
                        enabled_of(interface), users_of(interface)});
    }
    if (rows.size() == 1) {
        out << "no interfaces\n";
    } else {
        print_table(out, rows);
    }
}

void render_budget(const json &result, std::ostream &out)
{
    const auto print = [&](const char *name, const char *member) {
        print_fact(out, name, std::to_string(count_of(result, member)));
    };
    print("configured", "configured");
    print("model's limit", "allowed");
    print("in the kernel", "in_kernel");
    print("index budget", "index_budget");
    print("each takes", "each_takes");
    print("left", "left");
}

void render_clear(const json &result, std::ostream &out)
{
    out << "removed " << counted(count_of(result, "removed"), "child", "children") << '\n';
}

} // namespace ovhost

#include "host/ovctl/render_maps.h"

#include "host/ovctl/render_parts.h"

#include <nlohmann/json.hpp>

#include <ostream>

namespace ovhost
{

using nlohmann::json;

namespace
{

std::string match_of(const json &entry)
{
    const bool has_acl = !entry.at("acl").is_null();
    const bool has_matchstr = !entry.at("matchstr").is_null();
    std::string match = has_acl ? "acl " + text_of(entry, "acl") : "";
    if (has_matchstr) {
        match += (has_acl ? ", " : "") + text_of(entry, "matchstr");
    }
    return match.empty() ? "-" : match;
}

void add_map(const json &map, TableRows &rows)
{
    const std::string kind = text_of(map, "kind");
    const std::string name = text_of(map, "name");
    const json &entries = map.at("entries");
    if (entries.empty()) {
        rows.push_back({kind, name, "-", "-"});
    }
    for (const json &entry : entries) {
        rows.push_back({kind, name, text_of(entry, "priority"), match_of(entry)});
    }
}

/// "route-map m1, entry 10"
std::string entry_of(const json &reference)
{
    return text_of(reference, "kind") + " " + text_of(reference, "map") + ", entry " +
           text_of(reference, "priority");
}

void print_acl_entry(const json &entry, std::ostream &out)
{
    std::string name = "entry " + text_of(entry, "number");
    const json &fields = entry.at("fields");
    if (fields.empty()) {
        print_fact(out, name.c_str(), "nothing set");
    }
    for (const json &field : fields) {
        print_fact(out, name.c_str(), text_of(field, "name") + " " + text_of(field, "value"));
        name.clear();
    }
}

void print_check(const json &result, std::ostream &out)
{
    const json &faults = result.at("faults");
    for (const json &fault : faults) {
        out << entry_of(fault) << ", ACL " << text_of(fault, "acl") << ": "
            << text_of(fault, "message") << '\n';
    }
    out << counted(count_of(result, "records"), "record", "records") << ", "
        << counted(static_cast<long>(faults.size()), "inconsistency", "inconsistencies") << '\n';
}

} // namespace

void render_maps(const json &result, std::ostream &out)
{
    TableRows rows{{"KIND", "MAP", "PRIORITY", "MATCH"}};
    for (const json &map : result.at("maps")) {
        add_map(map, rows);
    }
    if (rows.size() == 1) {
        out << "no maps\n";
    } else {
        print_table(out, rows);
    }
}

void render_acl(const json &result, std::ostream &out)
{
    print_fact(out, "name", text_of(result, "name"));
    for (const json &entry : result.at("entries")) {
        print_acl_entry(entry, out);
    }
    const json &references = result.at("references");
    if (references.empty()) {
        print_fact(out, "used by", "no map");
    }
    const char *name = "used by";
    for (const json &reference : references) {
        print_fact(out, name, entry_of(reference));
        name = "";
    }
}

void render_references(const json &result, std::ostream &out)
{
    if (result.contains("faults")) {
        print_check(result, out);
        return;
    }
    TableRows rows{{"ACL", "KIND", "MAP", "PRIORITY"}};
    for (const json &reference : result.at("references")) {
        rows.push_back({text_of(reference, "acl"), text_of(reference, "kind"),
                        text_of(reference, "map"), text_of(reference, "priority")});
    }
    if (rows.size() == 1) {
        out << "no references\n";
    } else {
        print_table(out, rows);
    }
}

bool has_reference_faults(const json &result)
{
    return result.contains("faults") && !result.at("faults").empty();
}

} // namespace ovhost

#include "host/mgmtd/show_maps.h"

#include "host/control/arguments.h"
#include "host/control/request_error.h"
#include "host/mgmtd/answers.h"
#include "host/mgmtd/configuration.h"
#include "host/modules/map_lookup.h"

#include <nlohmann/json.hpp>

namespace ovhost
{
namespace
{

using nlohmann::json;

json entry_json(const MapEntry &entry)
{
    return {{"kind", entry.kind->name}, {"map", entry.map}, {"priority", entry.priority}};
}

json acl_entry_json(const AclEntryFacts &entry)
{
    auto fields = json::array();
    for (const auto &[name, value] : entry.fields) {
        fields.push_back({{"name", name}, {"value", value}});
    }
    return {{"number", entry.number}, {"fields", std::move(fields)}};
}

json check_json(const mdb_db *db)
{
    const ReferenceCheck check = check_references(db);
    auto faults = json::array();
    for (const ReferenceFault &fault : check.faults) {
        json described = entry_json(fault.entry);
        described["acl"] = fault.acl;
        described["message"] = fault.message;
        faults.push_back(std::move(described));
    }
    return {{"records", check.records}, {"faults", std::move(faults)}};
}

} // namespace

json show_maps(Configuration &configuration, const json &)
{
    auto maps = json::array();
    for (const MapFacts &map : list_maps(configuration.running_db())) {
        auto entries = json::array();
        for (const EntryFacts &entry : map.entries) {
            entries.push_back({{"priority", entry.priority},
                               {"acl", or_null(entry.acl)},
                               {"matchstr", or_null(entry.matchstr)}});
        }
        maps.push_back({{"kind", map.kind}, {"name", map.name}, {"entries", std::move(entries)}});
    }
    return {{"maps", std::move(maps)}};
}

json show_acl(Configuration &configuration, const json &request)
{
    const std::string name = required_text(request, "name");
    const std::optional<AclFacts> acl = find_acl(configuration.running_db(), name);
    if (!acl) {
        throw RequestError(error_code::not_found, "there is no ACL \"" + name + "\"");
    }
    auto entries = json::array();
    for (const AclEntryFacts &entry : acl->entries) {
        entries.push_back(acl_entry_json(entry));
    }
    auto references = json::array();
    for (const MapEntry &entry : acl->references) {
        references.push_back(entry_json(entry));
    }
    return {{"name", name}, {"entries", std::move(entries)}, {"references", std::move(references)}};
}

json show_references(Configuration &configuration, const json &request)
{
    const mdb_db *const db = configuration.running_db();
    if (optional_flag(request, "check")) {
        return check_json(db);
    }
    auto references = json::array();
    for (const std::string &acl : list_acls(db)) {
        for (const MapEntry &entry : recorded_references(db, acl)) {
            json described = entry_json(entry);
            described["acl"] = acl;
            references.push_back(std::move(described));
        }
    }
    return {{"references", std::move(references)}};
}

} // namespace ovhost

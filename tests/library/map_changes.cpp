#include "tests/library/map_changes.h"

#include "host/tree/name.h"
#include "tests/support/fault_layer.h"

#include <stdexcept>

namespace ovtest
{

void set_node(mdb_db &db, const std::string &name, const std::string &value, bn_type type)
{
    const bool writable = db.writable;
    db.writable = true;
    const int status =
        mdb_set_node_str(nullptr, &db, bsso_create, 0, type, value.c_str(), "%s", name.c_str());
    db.writable = writable;
    if (status != 0) {
        throw std::invalid_argument("cannot set " + name + ": " + std::to_string(status));
    }
}

std::vector<std::string> nodes(const mdb_db &db, const std::string &below)
{
    std::vector<std::string> found;
    db.tree.visit(
        [&](ovhost::Tree::Parts name, const ovhost::Value &value) {
            found.push_back(ovhost::join_name(name) + ' ' +
                            lc_enum_to_string_quiet_null(bn_type_map, value.type) + ' ' +
                            value.text);
        },
        ovhost::split_name(below).value());
    return found;
}

std::string written(const std::string &component)
{
    return ovhost::escape_component(component);
}

MapCommit::MapCommit() : dbinfo{.commit = &commit, .olddb = &olddb, .newdb = &newdb}
{
    newdb.writable = true;
}

void MapCommit::set_old(const std::string &name, const std::string &value)
{
    set_node(olddb, name, value);
}

void MapCommit::set_new(const std::string &name, const std::string &value)
{
    set_node(newdb, name, value);
}

void MapCommit::set_both(const std::string &name, const std::string &value)
{
    set_old(name, value);
    set_new(name, value);
}

void MapCommit::name_handles()
{
    name_object(dbinfo.commit, "commit");
    name_object(&olddb, "olddb");
    name_object(&newdb, "newdb");
}

MapChange::MapChange(int change_type, const std::string &name,
                     const std::optional<std::string> &new_value)
{
    record_.mdc_change_type = change_type;
    if (ts_new_str(&record_.mdc_name, name.c_str()) != 0 ||
        bn_binding_name_to_parts(name.c_str(), &record_.mdc_name_parts, false) != 0) {
        throw std::invalid_argument("no node name: " + name);
    }
    if (new_value) {
        new_attribs_.attribs[ba_value] = {.type = bt_string, .text = *new_value};
        record_.mdc_new_attribs = &new_attribs_;
    }
}

MapChange::~MapChange()
{
    ts_free(&record_.mdc_name);
    tstr_array_free(&record_.mdc_name_parts);
}

} // namespace ovtest

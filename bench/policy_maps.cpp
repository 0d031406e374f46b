#include "bench/policy_maps.h"

#include "framework/appliance.h"

namespace ovbench
{

std::vector<EntryName> entry_names(int num_entries)
{
    const int per_map = num_entries / num_maps;
    std::vector<EntryName> names;
    for (int map = 0; map < num_maps; ++map) {
        for (int i = 1; i <= per_map; ++i) {
            names.push_back({"branch-office-" + std::to_string(map), std::to_string(i * 5)});
        }
    }
    return names;
}

void allow_many_entries()
{
    mdb_db db;
    set(db, "/ov/model/limits/max_rmap_entries", bt_uint32, "100000");
    require(init_model_info(&db) == 0, "the model cannot be read");
}

int CountingCommit::refuse(int /*code*/, std::string /*message*/)
{
    ++refusals;
    return 0;
}

NodeChange::NodeChange(int change_type, const std::string &node, const char *new_value)
{
    require(ts_new_str(name_.out(), node.c_str()) == 0, "out of memory");
    require(bn_binding_name_to_parts(node.c_str(), parts_.out(), false) == 0, "not a node name");
    record_.mdc_name = name_.get();
    record_.mdc_name_parts = parts_.get();
    record_.mdc_change_type = change_type;
    if (new_value != nullptr) {
        new_attribs_.attribs[ba_value] = {bt_string, new_value};
        record_.mdc_new_attribs = &new_attribs_;
    }
}

} // namespace ovbench

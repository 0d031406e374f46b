#include "host/commit/change_list.h"

#include "host/tree/name.h"

#include <string_view>
#include <unordered_map>
#include <utility>

namespace ovhost
{

namespace
{

/// A record with everything it points to.
struct OwnedRecord : mdb_db_change {
    tstring full_name;
    tstr_array parts;
    bn_attrib_array before;
    bn_attrib_array after;
};

using RecordOwner = std::unique_ptr<mdb_db_change, void (*)(mdb_db_change *)>;

void free_record(mdb_db_change *record)
{
    delete static_cast<OwnedRecord *>(record);
}

bn_attrib_array *fill(bn_attrib_array &attribs, const std::optional<Value> &value)
{
    if (!value) {
        return nullptr;
    }
    attribs.attribs.emplace(ba_value, *value);
    return &attribs;
}

int kind_of(const Change &change)
{
    if (!change.before) {
        return mdct_add;
    }
    return change.after ? mdct_modify : mdct_delete;
}

RecordOwner make_record(const Change &change, std::string name)
{
    auto record = std::make_unique<OwnedRecord>();
    record->full_name.text = std::move(name);
    record->parts = tstr_array(change.parts);
    record->mdc_name = &record->full_name;
    record->mdc_name_parts = &record->parts;
    record->mdc_change_type = kind_of(change);
    record->mdc_old_attribs = fill(record->before, change.before);
    record->mdc_new_attribs = fill(record->after, change.after);
    return {record.release(), free_record};
}

} // namespace

ChangeListUpdate ChangeList::replace(std::vector<Change> changes)
{
    ChangeListUpdate update;
    std::unordered_map<std::string, std::size_t> present;
    for (std::size_t position = 0; position < changes_.size(); ++position) {
        present.emplace(name(position), position);
    }

    std::vector<RecordOwner> records;
    records.reserve(changes.size());
    for (std::size_t position = 0; position < changes.size(); ++position) {
        std::string full_name = join_name(changes[position].parts);
        const auto old = present.extract(full_name);
        if (!old.empty() && changes_[old.mapped()] == changes[position]) {
            records.push_back(std::move(records_.changes[old.mapped()]));
            continue;
        }
        records.push_back(make_record(changes[position], std::move(full_name)));
        update.fresh.push_back(position);
    }
    for (const auto &[full_name, position] : present) {
        update.withdrawn.push_back(changes_[position].parts);
    }
    changes_ = std::move(changes);
    records_.changes = std::move(records);
    return update;
}

const std::string &ChangeList::name(std::size_t position) const
{
    return records_.changes[position]->mdc_name->text;
}

mdb_db_change *ChangeList::record(std::size_t position) const
{
    return records_.changes[position].get();
}

} // namespace ovhost

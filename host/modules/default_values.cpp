#include "host/modules/default_values.h"

#include "orvale/md_db_default.h"

#include <cstdlib>
#include <span>
#include <utility>
#include <vector>

namespace ovhost
{
namespace
{

/// The appliance as it is without any file: a bridge with nothing enabled.
const Edit compiled_in_defaults[] = {
    {"/ov/tunneld/system/config/mode", bt_string, "bridge"},
    {"/ov/tunneld/system/config/submode", bt_string, "normal"},
    {"/ov/tunneld/system/config/routing_inline", bt_bool, "false"},
    {"/ov/tunneld/system/config/10g", bt_bool, "false"},
    {"/ov/tunneld/system/config/bonding", bt_bool, "false"},
    {"/ov/tunneld/system/config/limits/mem_size", bt_uint32, "2048"},
    {"/ov/tunneld/system/config/limits/system_bw", bt_uint32, "10000"},
    {"/ov/tunneld/system/config/limits/total_flows", bt_uint32, "10000"},
    {"/ov/tunneld/system/config/limits/cifs_flows", bt_uint32, "500"},
    {"/ov/tunneld/system/config/limits/ssl_flows", bt_uint32, "500"},
    {"/ov/tunneld/system/config/limits/nm_ram_size", bt_uint32, "128"},
};

/// An array that the library has handed out.
struct EntryArray {
    bn_str_value *entries = nullptr;
    uint32 count = 0;

    EntryArray() = default;
    EntryArray(const EntryArray &) = delete;
    EntryArray &operator=(const EntryArray &) = delete;
    ~EntryArray()
    {
        if (count != 0) {
            (void)bn_str_value_free(&entries, count);
        } else {
            std::free(entries); // the library leaves an array of no good entries to its owner
        }
    }

    [[nodiscard]] std::span<const bn_str_value> view() const { return {entries, count}; }
};

int read_preserved(bn_str_value **values, uint32 *num_values, bn_str_value **removals,
                   uint32 *num_removals)
{
    return db_preserved_get_all(values, num_values, removals, num_removals, false);
}

struct FileSource {
    const char *name;
    int (*read)(bn_str_value **, uint32 *, bn_str_value **, uint32 *);
    bool must_be_whole;
};

constexpr FileSource file_sources[] = {
    {"model defaults", db_model_def_get_all, true},
    {"debugging defaults", db_default_get_all, false},
    {"preserved values", read_preserved, false},
};

void report_fault(const FileSource &source, const std::string &fault, const DefaultsReport &report)
{
    if (source.must_be_whole) {
        throw DefaultsError(std::string(source.name) + ": " + fault +
                            "; mend the file and start again");
    }
    report.warning(std::string(source.name) + ": " + fault + "; left out");
}

/// Values first: what a file removes is gone whatever else it says.
void apply_source(const FileSource &source, Candidate &candidate, const DefaultsReport &report)
{
    EntryArray values;
    EntryArray removals;
    const int err = source.read(&values.entries, &values.count, &removals.entries, &removals.count);
    if (err != 0) {
        report_fault(source, "a line cannot be read (error code " + std::to_string(err) + ")",
                     report);
    }
    DefaultsSummary summary{source.name, 0, 0};
    for (const bn_str_value &value : values.view()) {
        if (const auto fault = candidate.set(value.bv_name, value.bv_type, value.bv_value)) {
            report_fault(source, *fault, report);
        } else {
            ++summary.set;
        }
    }
    for (const bn_str_value &removal : removals.view()) {
        // A node that is not there needs no removing.
        summary.removed += !candidate.erase(removal.bv_name).has_value();
    }
    report.summary(summary);
}

void apply_compiled_in(Candidate &candidate, const DefaultsReport &report)
{
    const auto faults = candidate.load(compiled_in_defaults);
    if (!faults.empty()) {
        throw std::logic_error(faults.front());
    }
    report.summary({"compiled-in defaults", std::size(compiled_in_defaults), 0});
}

} // namespace

void apply_default_values(Candidate &candidate, const DefaultsReport &report)
{
    apply_compiled_in(candidate, report);
    for (const FileSource &source : file_sources) {
        apply_source(source, candidate, report);
    }
}

void retire_preserved_values()
{
    EntryArray values;
    EntryArray removals;
    // Read once more for the sake of the move; a bad line was reported the first time.
    (void)db_preserved_get_all(&values.entries, &values.count, &removals.entries, &removals.count,
                               true);
}

} // namespace ovhost

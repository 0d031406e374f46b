#include "host/modules/default_values.h"

#include "framework/appliance.h"
#include "framework/files.h"
#include "host/modules/load_text.h"
#include "host/modules/node_access.h"
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
    /// Where the library finds it; for the model, what the model's name is appended to.
    const char *path;
    int (*read)(bn_str_value **, uint32 *, bn_str_value **, uint32 *);
    bool is_model;
};

constexpr FileSource file_sources[] = {
    {"model defaults", "/opt/orvale/defdb.conf.", db_model_def_get_all, true},
    {"debugging defaults", "/var/opt/tms/.debug_default_db", db_default_get_all, false},
    {"preserved values", "/var/opt/tms/.preserved_db", read_preserved, false},
};

std::string path_of(const FileSource &source)
{
    const char *const model = source.is_model ? get_config_name() : nullptr;
    return std::string(source.path) + (model != nullptr ? model : "");
}

/// The lines of a file as the library reads them; none when it cannot be read.
std::string read_lines(const std::string &path)
{
    tstr_array *read = nullptr;
    (void)lf_read_file_lines(path.c_str(), &read);
    const TstrArrayPtr lines(read);
    const int32 count = read != nullptr ? tstr_array_length_quick(read) : 0;
    std::string text;
    for (int32 i = 0; i < count; ++i) {
        text.append(tstr_array_get_str_quick(read, static_cast<uint32>(i))).append("\n");
    }
    return text;
}

/// Every line of a file that is no good, and why. The library logs a code for each of them and
/// answers that of the last line alone, which neither finds a bad line in the middle nor tells its
/// number.
std::vector<std::string> find_faults(const std::string &path)
{
    Candidate scratch;
    std::vector<std::string> faults;
    for (const LineFault &fault : load_text(scratch, read_lines(path)).faults) {
        faults.push_back("line " + std::to_string(fault.line) + ": " +
                         (fault.node.empty() ? "" : fault.node + ": ") + fault.message);
    }
    return faults;
}

void report_faults(const FileSource &source, const std::vector<std::string> &faults,
                   const DefaultsReport &report)
{
    const std::string path = path_of(source);
    if (!source.is_model) {
        for (const std::string &fault : faults) {
            report.warning(path + ", " + fault + "; left out");
        }
        return;
    }
    if (!faults.empty()) {
        std::string message = path + " has faults; mend it and start again";
        for (const std::string &fault : faults) {
            message += "\n  " + fault;
        }
        throw DefaultsError(message);
    }
}

/// The library takes a model's file that is missing, or may not be used, for one without values. To
/// a daemon that was told its model it is a fault: the store would begin with half the appliance.
void check_model_file(const FileSource &source)
{
    if (!source.is_model || get_config_name() == nullptr) {
        return;
    }
    const std::string path = path_of(source);
    if (!conf_file_okay(path.c_str())) {
        throw DefaultsError("the model's default file " + path +
                            " cannot be used (the log says why); mend it or name another --model");
    }
}

/// Values first: what a file removes is gone whatever else it says.
void apply_source(const FileSource &source, Candidate &candidate, const DefaultsReport &report)
{
    check_model_file(source);
    EntryArray values;
    EntryArray removals;
    const int err = source.read(&values.entries, &values.count, &removals.entries, &removals.count);
    std::vector<std::string> faults;
    if (err != 0 || values.count != 0 || removals.count != 0) {
        faults = find_faults(path_of(source));
    }
    if (err != 0 && faults.empty()) {
        faults.push_back("the file cannot be read (error code " + std::to_string(err) + ")");
    }
    report_faults(source, faults, report);
    DefaultsSummary summary{source.name, 0, 0};
    for (const bn_str_value &value : values.view()) {
        // A value that does not fit was among the faults.
        summary.set += !candidate.set(value.bv_name, value.bv_type, value.bv_value).has_value();
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

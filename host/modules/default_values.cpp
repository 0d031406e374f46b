#include "host/modules/default_values.h"

#include "framework/appliance.h"
#include "framework/logging.h"
#include "host/framework/conf_file.h"
#include "host/framework/log_config.h"
#include "host/support/printable.h"

#include <algorithm>
#include <iterator>
#include <string_view>
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

int read_preserved(bn_str_value **values, uint32 *num_values, bn_str_value **removals,
                   uint32 *num_removals)
{
    return db_preserved_get_all(values, num_values, removals, num_removals, false);
}

int move_preserved(bn_str_value **values, uint32 *num_values, bn_str_value **removals,
                   uint32 *num_removals)
{
    return db_preserved_get_all(values, num_values, removals, num_removals, true);
}

struct FileSource {
    const char *name;
    /// Where the library finds it; for the model, what the model's name is appended to.
    const char *path;
    DefaultFile::Reader read;
    bool is_model;
};

constexpr FileSource model_source = {"model defaults", "/opt/orvale/defdb.conf.",
                                     db_model_def_get_all, true};
constexpr FileSource debug_source = {"debugging defaults", "/var/opt/tms/.debug_default_db",
                                     db_default_get_all, false};
constexpr FileSource preserved_source = {"preserved values", "/var/opt/tms/.preserved_db",
                                         read_preserved, false};

std::string path_of(const FileSource &source)
{
    const char *const model = source.is_model ? get_config_name() : nullptr;
    return std::string(source.path) + (model != nullptr ? model : "");
}

/// Fit for a terminal: what is wrong with a text may be what it would do there.
std::string describe(const LineFault &fault)
{
    return printable("line " + std::to_string(fault.line) + ": " +
                     (fault.node.empty() ? "" : fault.node + ": ") + fault.message);
}

void report_faults(const FileSource &source, const std::vector<LineFault> &faults,
                   const DefaultsReport &report)
{
    const std::string path = path_of(source);
    if (!source.is_model) {
        for (const LineFault &fault : faults) {
            report.warning(path + ", " + describe(fault) + "; left out");
        }
        return;
    }
    if (!faults.empty()) {
        std::string message = path + " has faults; mend it and start again";
        for (const LineFault &fault : faults) {
            message += "\n  " + describe(fault);
        }
        throw DefaultsError(message);
    }
}

/// The library takes a model's file that is missing, or may not be used, for one without values. To
/// a daemon that was told its model it is a fault: the store would begin with half the appliance.
void check_model_file(const std::string &path)
{
    if (const auto reason = conf_file_refusal(path.c_str())) {
        throw DefaultsError("the model's default file " + path + " cannot be used: " + *reason +
                            "; mend it or name another --model");
    }
}

/// Values first: what a file removes is gone whatever else it says.
void apply_source(const FileSource &source, Candidate &candidate, const DefaultsReport &report)
{
    DefaultsSummary summary{source.name, 0, 0};
    if (source.is_model && get_config_name() == nullptr) {
        report.summary(summary);
        return;
    }
    const std::string path = path_of(source);
    if (source.is_model) {
        check_model_file(path);
    }
    const DefaultFile file(path, source.read);
    report_faults(source, file.faults(), report);
    for (const LineFault &cut : file.cut_values()) {
        report.warning(path + ", " + describe(cut) + "; it ends before the comma");
    }
    for (const auto &[line, value] : file.values()) {
        summary.set += !candidate.set(value->bv_name, value->bv_type, value->bv_value).has_value();
    }
    for (const auto &[line, removal] : file.removals()) {
        // A node that is not there needs no removing.
        summary.removed += !candidate.erase(removal->bv_name).has_value();
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
    for (const FileSource *source : {&model_source, &debug_source, &preserved_source}) {
        apply_source(*source, candidate, report);
    }
}

std::optional<std::string> model_name_fault(const std::string &name)
{
    // The library has room for so much of the path, and takes the rest for no part of it.
    constexpr std::size_t longest_path = 127;
    const std::size_t longest = longest_path - std::string_view(model_source.path).size();
    const bool has_bad_character = std::ranges::any_of(name, [](unsigned char character) {
        return character == '/' || character < 0x20 || character == 0x7f;
    });
    if (!name.empty() && name.size() <= longest && !has_bad_character) {
        return std::nullopt;
    }
    return "a model's name is 1 to " + std::to_string(longest) +
           " bytes long, without slashes and control characters";
}

void retire_preserved_values()
{
    const std::string path = path_of(preserved_source);
    const auto warn = [](const std::string &text) { log_host_line(ov_log_warning, "mgmtd", text); };
    try {
        const DefaultFile file(path, read_preserved);
        if (!file.faults().empty()) {
            warn(path + " stays where it is, for lines of it were left out: set what they were to "
                        "say with ovctl, then remove it");
            return;
        }
        // Read once more for the sake of the move.
        const DefaultFile moved(path, move_preserved);
    } catch (const DefaultsError &error) {
        warn(error.what());
    }
}

} // namespace ovhost

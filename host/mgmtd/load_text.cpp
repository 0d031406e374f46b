#include "host/mgmtd/load_text.h"

#include "framework/errors.h"
#include "host/tree/name.h"
#include "orvale/ov_defdb_line.h"

#include <optional>

namespace ovhost
{
namespace
{

std::string to_string(const ov_defdb_field &field)
{
    return {field.text, field.length};
}

/// The code of a type name, or what is wrong with it.
std::optional<std::string> find_type(const std::string &name, bn_type &ret_type)
{
    if (lc_string_to_enum(bn_type_map, name.c_str(), &ret_type) != 0) {
        return "unknown type \"" + name + "\"";
    }
    return std::nullopt;
}

/// One entry line applied; answers what is wrong with it.
std::optional<std::string> apply_value(Candidate &candidate, const ov_defdb_fields &fields)
{
    if (fields.name.length == 0 || fields.type.length == 0) {
        return "a value line needs a name and a type: NAME,TYPE,VALUE";
    }
    bn_type type = 0;
    if (auto fault = find_type(to_string(fields.type), type)) {
        return fault;
    }
    return candidate.set(to_string(fields.name), type, to_string(fields.value));
}

std::optional<std::string> apply_removal(Candidate &candidate, const ov_defdb_fields &fields)
{
    bn_type type = 0;
    if (fields.name.length == 0) {
        return "a removal line needs a name: -NAME";
    }
    if (fields.type.length != 0) {
        if (auto fault = find_type(to_string(fields.type), type)) {
            return fault;
        }
    }
    const auto parts = split_name(to_string(fields.name));
    if (!parts || candidate.tree().exists(*parts)) {
        return candidate.erase(to_string(fields.name));
    }
    return std::nullopt;
}

void apply_line(Candidate &candidate, const std::string &line, long number, LoadResult &result)
{
    if (line.find('\0') != std::string::npos) {
        result.faults.push_back({number, "", "the line holds a NUL byte"});
        return;
    }
    const char *const start = ov_defdb_line_start(line.c_str());
    const ov_defdb_line_kind kind = ov_defdb_kind(start);
    if (kind == ov_defdb_comment) {
        return;
    }
    const bool is_value = kind == ov_defdb_value;
    const ov_defdb_fields fields = ov_defdb_split(is_value ? start : start + 1);
    if (auto fault = is_value ? apply_value(candidate, fields) : apply_removal(candidate, fields)) {
        result.faults.push_back({number, to_string(fields.name), *fault});
        return;
    }
    ++(is_value ? result.set : result.removed);
}

} // namespace

LoadResult load_text(Candidate &candidate, std::string_view text)
{
    LoadResult result;
    Candidate edited = candidate;
    long number = 0;
    while (!text.empty()) {
        const std::size_t end = text.find('\n');
        apply_line(edited, std::string(text.substr(0, end)), ++number, result);
        text.remove_prefix(end == std::string_view::npos ? text.size() : end + 1);
    }
    if (result.faults.empty()) {
        candidate = std::move(edited);
    }
    return result;
}

} // namespace ovhost

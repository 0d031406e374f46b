#include "host/modules/load_text.h"

#include "host/modules/node_access.h"
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

std::string unknown_type(const ov_defdb_field &type)
{
    return "unknown type \"" + to_string(type) + "\"";
}

/// One entry line applied; answers what is wrong with it.
std::optional<std::string> apply_value(Candidate &candidate, const ov_defdb_fields &fields)
{
    if (fields.name.length == 0 || fields.type.length == 0) {
        return "a value line needs a name and a type: NAME,TYPE,VALUE";
    }
    const std::optional<bn_type> type = find_type(to_string(fields.type));
    if (!type) {
        return unknown_type(fields.type);
    }
    return candidate.set(to_string(fields.name), *type, to_string(fields.value));
}

std::optional<std::string> apply_removal(Candidate &candidate, const ov_defdb_fields &fields)
{
    if (fields.name.length == 0) {
        return "a removal line needs a name: -NAME";
    }
    if (fields.type.length != 0 && !find_type(to_string(fields.type))) {
        return unknown_type(fields.type);
    }
    const auto parts = split_name(to_string(fields.name));
    if (!parts || candidate.tree().exists(*parts)) {
        return candidate.erase(to_string(fields.name));
    }
    return std::nullopt;
}

/// A fault names its node beside the message, where some messages begin with it too.
std::string without_name(std::string message, const std::string &name)
{
    return message.starts_with(name + ": ") ? message.substr(name.size() + 2) : message;
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
        const std::string name = to_string(fields.name);
        result.faults.push_back({number, name, without_name(*std::move(fault), name)});
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

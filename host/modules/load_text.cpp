#include "host/modules/load_text.h"

#include "host/modules/node_access.h"
#include "host/support/utf8.h"
#include "host/tree/name.h"

#include <algorithm>
#include <iterator>
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

/// The fields of a line that is no comment.
ov_defdb_fields fields_of(const char *start)
{
    return ov_defdb_split(ov_defdb_kind(start) == ov_defdb_value ? start : start + 1);
}

/// Why a line is no entry, whatever its name and value say.
std::optional<std::string> form_fault(ov_defdb_line_kind kind, const ov_defdb_fields &fields)
{
    const bool is_value = kind == ov_defdb_value;
    if (is_value && (fields.name.length == 0 || fields.type.length == 0)) {
        return "a value line needs a name and a type: NAME,TYPE,VALUE";
    }
    if (fields.name.length == 0) {
        return "a removal line needs a name: -NAME";
    }
    if (fields.type.length != 0 && !find_type(to_string(fields.type))) {
        return unknown_type(fields.type);
    }
    return std::nullopt;
}

std::optional<std::string> apply_removal(Candidate &candidate, const std::string &name)
{
    const auto parts = split_name(name);
    if (!parts || candidate.tree().exists(*parts)) {
        return candidate.erase(name);
    }
    return std::nullopt;
}

/// One entry line applied; answers what is wrong with it.
std::optional<std::string> apply_entry(Candidate &candidate, ov_defdb_line_kind kind,
                                       const ov_defdb_fields &fields)
{
    if (auto fault = form_fault(kind, fields)) {
        return fault;
    }
    const std::string name = to_string(fields.name);
    if (!is_utf8(name)) {
        return "the node's name is not UTF-8: convert the file first";
    }
    return kind == ov_defdb_value
               ? candidate.set(name, *find_type(to_string(fields.type)), to_string(fields.value))
               : apply_removal(candidate, name);
}

/// A fault names its node beside the message, where some messages begin with it too.
std::string without_name(const std::string &message, const std::string &name)
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
    if (line.back() == '\r') {
        result.faults.push_back({number, "",
                                 "the line ends with a carriage return: save the file with plain "
                                 "line ends"});
        return;
    }
    const ov_defdb_fields fields = fields_of(start);
    if (auto fault = apply_entry(candidate, kind, fields)) {
        const std::string name = to_string(fields.name);
        result.faults.push_back({number, name, without_name(*std::move(fault), name)});
        return;
    }
    if (kind == ov_defdb_value && fields.value.text[fields.value.length] == ',') {
        result.cut.push_back({number, to_string(fields.name),
                              "a value in a file cannot hold a comma; use ovctl set"});
    }
    ++(kind == ov_defdb_value ? result.set : result.removed);
}

/// In the order of lines.
void make_faults_of_cuts(LoadResult &result)
{
    std::ranges::move(result.cut, std::back_inserter(result.faults));
    result.cut.clear();
    std::ranges::sort(result.faults, {}, &LineFault::line);
}

} // namespace

ov_defdb_line_kind entry_kind(const char *line)
{
    const char *const start = ov_defdb_line_start(line);
    const ov_defdb_line_kind kind = ov_defdb_kind(start);
    return kind == ov_defdb_comment || form_fault(kind, fields_of(start)) ? ov_defdb_comment : kind;
}

LoadResult load_text(Candidate &candidate, std::string_view text, CommaRule rule)
{
    LoadResult result;
    Candidate edited = candidate;
    long number = 0;
    while (!text.empty()) {
        const std::size_t end = text.find('\n');
        apply_line(edited, std::string(text.substr(0, end)), ++number, result);
        text.remove_prefix(end == std::string_view::npos ? text.size() : end + 1);
    }
    if (rule == CommaRule::is_fault) {
        make_faults_of_cuts(result);
    }
    if (result.faults.empty()) {
        candidate = std::move(edited);
    }
    return result;
}

} // namespace ovhost

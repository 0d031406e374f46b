#include "libovmd/md_db_default/file_parser.h"

#include "framework/bail.h"
#include "framework/files.h"
#include "libovmd/frame/owners.h"
#include "libovmd/md_db_default/entry_array.h"
#include "libovmd/md_db_default/type_memo.h"
#include "libovmd/md_db_default/unit.h"
#include "orvale/ov_defdb_line.h"

#include <cstring>

using namespace ovmd;

namespace
{

struct line_counts {
    uint32 values = 0;
    uint32 removals = 0;
};

char *copy_field(const ov_defdb_field &source)
{
    auto *const text = static_cast<char *>(malloc(source.length + 1));
    if (text != nullptr) {
        memcpy(text, source.text, source.length);
        text[source.length] = '\0';
    }
    return text;
}

// The code of a type name, on behalf of `function`, which the error lines name. `ret_name` receives
// the name as text when the host was asked for it.
int look_up_type(const char *function, type_memo &memo, const ov_defdb_field &name,
                 bn_type &ret_type, owned_text &ret_name)
{
    if (memo.find(name, ret_type)) {
        return 0;
    }
    *ret_name.out() = copy_field(name);
    if (ret_name.get() == nullptr) {
        return bail_report_null(function, bail_unit, __LINE__);
    }
    const int err = lc_string_to_enum(bn_type_map, ret_name.get(), &ret_type);
    if (err == 0) {
        memo.remember(name, ret_type);
    }
    return err;
}

// Fills an entry, on behalf of `function` likewise; `value` null means that the entry has none. On
// failure nothing stays allocated.
int make_entry(const char *function, const ov_defdb_field &name, bn_type type,
               const ov_defdb_field *value, bn_str_value &ret_entry)
{
    bn_str_value entry = {copy_field(name), type, value != nullptr ? copy_field(*value) : nullptr};
    if (entry.bv_name == nullptr || (value != nullptr && entry.bv_value == nullptr)) {
        free_entry_texts(entry);
        return bail_report_null(function, bail_unit, __LINE__);
    }
    ret_entry = entry;
    return 0;
}

int convert_line_to_bn_str_value(const char *line, type_memo &memo, bn_str_value &ret_entry)
{
    const ov_defdb_fields fields = ov_defdb_split(line);
    if (fields.name.length == 0 || fields.type.length == 0) {
        return lc_err_parse_error;
    }
    bn_type type = 0;
    owned_text type_name;
    const int err = look_up_type(__func__, memo, fields.type, type, type_name);
    if (err != 0) {
        // A lookup that was cancelled has not found the type unknown.
        if (type_name.get() != nullptr && err != lc_err_cancelled) {
            BAIL_LOG("Unable to convert %s type", type_name.get());
        }
        return err;
    }
    return make_entry(__func__, fields.name, type, &fields.value, ret_entry);
}

// A removal needs its name alone. Without a type a value says nothing and is dropped.
int convert_removal(const char *line, type_memo &memo, bn_str_value &ret_entry)
{
    const ov_defdb_fields fields = ov_defdb_split(line);
    if (fields.name.length == 0) {
        return lc_err_parse_error;
    }
    if (fields.type.length == 0) {
        return make_entry(__func__, fields.name, 0, nullptr, ret_entry);
    }
    bn_type type = 0;
    owned_text type_name;
    const int err = look_up_type(__func__, memo, fields.type, type, type_name);
    if (err != 0) {
        return err;
    }
    return make_entry(__func__, fields.name, type,
                      fields.value.length == 0 ? nullptr : &fields.value, ret_entry);
}

line_counts count_lines(const tstr_array *lines, uint32 num_lines)
{
    line_counts counts;
    for (uint32 i = 0; i < num_lines; ++i) {
        const ov_defdb_line_kind kind =
            ov_defdb_kind(ov_defdb_line_start(tstr_array_get_str_quick(lines, i)));
        counts.values += kind == ov_defdb_value;
        counts.removals += kind == ov_defdb_removal;
    }
    return counts;
}

} // namespace

int db_default_get_file_default(const char *path, bn_str_value **ret_values, uint32 *ret_num_values,
                                bn_str_value **ret_deletes, uint32 *ret_num_deletes)
{
    tbool exists = false;
    BAIL_ERROR(lf_test_exists(path, &exists));
    if (!exists) {
        return 0;
    }
    owned_tstr_array lines;
    BAIL_ERROR(lf_read_file_lines(path, lines.out()));
    const auto num_lines =
        static_cast<uint32>(lines.get() != nullptr ? tstr_array_length_quick(lines.get()) : 0);
    if (num_lines == 0) {
        return 0;
    }

    const line_counts counts = count_lines(lines.get(), num_lines);
    entry_array values;
    entry_array removals;
    if (!values.reserve(counts.values) || !removals.reserve(counts.removals)) {
        return 0; // defaults are optional: the host starts without them
    }

    int result = 0;
    type_memo memo;
    for (uint32 i = 0; i < num_lines; ++i) {
        const char *const start = ov_defdb_line_start(tstr_array_get_str_quick(lines.get(), i));
        const ov_defdb_line_kind kind = ov_defdb_kind(start);
        if (kind == ov_defdb_comment) {
            continue;
        }
        bn_str_value entry = {};
        result = kind == ov_defdb_value ? convert_line_to_bn_str_value(start, memo, entry)
                                        : convert_removal(start + 1, memo, entry);
        if (result != 0) {
            (void)BAIL_REPORT(result);
            continue;
        }
        (kind == ov_defdb_value ? values : removals).append(entry);
    }
    values.hand_over(ret_values, ret_num_values);
    removals.hand_over(ret_deletes, ret_num_deletes);
    return result;
}

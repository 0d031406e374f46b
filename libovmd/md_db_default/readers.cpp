// The three sources of default values, and what becomes of the arrays they deliver.
#include "orvale/md_db_default.h"

#include "framework/appliance.h"
#include "framework/bail.h"
#include "framework/files.h"
#include "libovmd/md_db_default/entry_array.h"
#include "libovmd/md_db_default/file_parser.h"
#include "libovmd/md_db_default/unit.h"

#include <cstdio>

namespace
{

constexpr char debug_path[] = "/var/opt/tms/.debug_default_db";
constexpr char model_path_format[] = "/opt/orvale/defdb.conf.%s";
constexpr char preserved_path[] = "/var/opt/tms/.preserved_db";
constexpr char preserved_read_path[] = "/var/opt/tms/.preserved_db.read";

void zero_count(uint32 *count)
{
    if (count != nullptr) {
        *count = 0;
    }
}

// Entries that belong to this unit until the file has been read with success.
struct private_entries {
    bn_str_value *entries = nullptr;
    uint32 count = 0;

    private_entries() = default;
    private_entries(const private_entries &) = delete;
    private_entries &operator=(const private_entries &) = delete;
    ~private_entries() { ovmd::free_entries(entries, count); }

    // An array without entries is never handed out.
    void hand_over(bn_str_value **ret_entries, uint32 *ret_count)
    {
        if (ret_count != nullptr) {
            *ret_count = count;
        }
        if (ret_entries != nullptr && count != 0) {
            *ret_entries = entries;
            entries = nullptr;
            count = 0;
        }
    }
};

} // namespace

int db_default_get_all(bn_str_value **ret_values, uint32 *ret_num_values,
                       bn_str_value **ret_deletes, uint32 *ret_num_deletes)
{
    zero_count(ret_num_values);
    zero_count(ret_num_deletes);
    BAIL_ERROR(db_default_get_file_default(debug_path, ret_values, ret_num_values, ret_deletes,
                                           ret_num_deletes));
    return 0;
}

int db_model_def_get_all(bn_str_value **ret_values, uint32 *ret_num_values,
                         bn_str_value **ret_deletes, uint32 *ret_num_deletes)
{
    zero_count(ret_num_values);
    zero_count(ret_num_deletes);
    const char *const config_name = get_config_name();
    if (config_name == nullptr) {
        return 0;
    }
    char path[128];
    (void)snprintf(path, sizeof path, model_path_format, config_name);
    if (!conf_file_okay(path)) {
        return 0;
    }

    private_entries values;
    private_entries removals;
    BAIL_ERROR(db_default_get_file_default(path, &values.entries, &values.count, &removals.entries,
                                           &removals.count));
    values.hand_over(ret_values, ret_num_values);
    removals.hand_over(ret_deletes, ret_num_deletes);
    return 0;
}

int db_preserved_get_all(bn_str_value **ret_values, uint32 *ret_num_values,
                         bn_str_value **ret_deletes, uint32 *ret_num_deletes, tbool renameWhenDone)
{
    zero_count(ret_num_values);
    zero_count(ret_num_deletes);
    BAIL_ERROR(db_default_get_file_default(preserved_path, ret_values, ret_num_values, ret_deletes,
                                           ret_num_deletes));
    if (renameWhenDone) {
        (void)rename(preserved_path, preserved_read_path); // there may be no file to move
    }
    return 0;
}

int db_default_set_all(bn_str_value *, uint32 *)
{
    return 0;
}

int bn_str_value_free(bn_str_value **array, uint32 count)
{
    if (array == nullptr || *array == nullptr || count == 0) {
        return 0;
    }
    ovmd::free_entries(*array, count);
    *array = nullptr;
    return 0;
}

// The table from tunnel aliases to tunnel IDs.
#include "libovmd/md_tunbin_ht/text_table.h"

okv_assoc_entry_type tunalias_assoc[OKV_ASSOC_SIZE];

namespace md_tunbin_ht_tunalias
{

hash64_state ht_state;
uint64 h128_seed;

} // namespace md_tunbin_ht_tunalias

namespace
{

struct tunalias_table {
    static okv_assoc_entry_type *assoc() { return tunalias_assoc; }
    static hash64_state &state() { return md_tunbin_ht_tunalias::ht_state; }
    static uint64 &seed() { return md_tunbin_ht_tunalias::h128_seed; }

    static constexpr char init_name[] = "tunbin_tunalias_ht_init";
    static constexpr char add_name[] = "tunbin_tunalias_ht_add";
    static constexpr char del_name[] = "tunbin_tunalias_ht_del";
    static constexpr char dump_name[] = "tunbin_tunalias_ht_dump";

    static constexpr char conflict_format[] =
        "%s: CONFLICT tunalias %s key=" OKV_KEY_FORMAT ", tid:%d";
    static constexpr char collision_failed_format[] =
        "%s: FAILED to add collision value for tunalias";
    static constexpr char added_format[] = "%s: ADDED tunalias %s key=" OKV_KEY_FORMAT ", tid:%d";
    static constexpr char failed_format[] =
        "%s: FAILED to add tunalias %s key=" OKV_KEY_FORMAT ", tid:%d";
};

using table = ovmd::text_table<tunalias_table>;

} // namespace

int tunbin_tunalias_ht_init(void)
{
    return table::init();
}

void tunbin_tunalias_ht_add(char *alias, uint32 id)
{
    table::add(alias, id);
}

void tunbin_tunalias_ht_del(char *alias)
{
    table::del(alias);
}

int tunbin_tunalias_ht_find(const char *alias, uint32 *tid)
{
    return table::find(alias, tid);
}

uint32 tunbin_tunalias_ht_dump(void)
{
    return table::dump();
}

// The table from tunnel names to tunnel IDs.
#include "libovmd/md_tunbin_ht/text_table.h"

okv_assoc_entry_type tunname_assoc[OKV_ASSOC_SIZE];

namespace md_tunbin_ht_tunname
{

hash64_state ht_state;
uint64 h128_seed;

} // namespace md_tunbin_ht_tunname

namespace
{

struct tunname_table {
    static okv_assoc_entry_type *assoc() { return tunname_assoc; }
    static hash64_state &state() { return md_tunbin_ht_tunname::ht_state; }
    static uint64 &seed() { return md_tunbin_ht_tunname::h128_seed; }

    static constexpr char init_name[] = "tunbin_tunname_ht_init";
    static constexpr char add_name[] = "tunbin_tunname_ht_add";
    static constexpr char del_name[] = "tunbin_tunname_ht_del";
    static constexpr char dump_name[] = "tunbin_tunname_ht_dump";

    static constexpr char conflict_format[] =
        "%s: CONFLICT tunname %s key=" OKV_KEY_FORMAT ", tid:%d";
    static constexpr char collision_failed_format[] =
        "%s: FAILED to add collision value for tunname";
    static constexpr char added_format[] = "%s: ADDED tunname %s key=" OKV_KEY_FORMAT ", tid:%d";
    static constexpr char failed_format[] =
        "%s: FAILED to add tunname %s key=" OKV_KEY_FORMAT ", tid:%d";
};

using table = ovmd::text_table<tunname_table>;

} // namespace

int tunbin_tunname_ht_init(void)
{
    return table::init();
}

void tunbin_tunname_ht_add(char *name, uint32 id)
{
    table::add(name, id);
}

void tunbin_tunname_ht_del(char *name)
{
    table::del(name);
}

int tunbin_tunname_ht_find(const char *name, uint32 *tid)
{
    return table::find(name, tid);
}

uint32 tunbin_tunname_ht_dump(void)
{
    return table::dump();
}

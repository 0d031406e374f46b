// The management tunnel cache, indexed by tunnel ID, with the two tables behind it kept in step.
#include "orvale/md_tunbin_ht.h"

#include "framework/bail.h"

#include <cstring>

static const char bail_unit[] = "md_tunbin_ht";

namespace
{

struct ht_tun_info_t {
    uint32 id; // the slot's own index while it is in use, else TUNNEL_ID_NONE
    char name[TUNNEL_NAME_SIZE];
    char alias[TUNNEL_ALIAS_SIZE];
};

ht_tun_info_t ht_tun_infos[MD_TUNBIN_HT_SIZE];

void empty_slot(ht_tun_info_t &slot)
{
    memset(&slot, 0, sizeof slot);
    slot.id = TUNNEL_ID_NONE;
}

// Copies as much as fits and always terminates.
template <size_t size>
void copy_text(char (&target)[size], const char (&source)[size])
{
    const size_t length = strnlen(source, size - 1);
    memcpy(target, source, length);
    target[length] = '\0';
}

// What the cache keeps of a record. A text that fills its field to the last byte is cut, so that
// nobody reads on behind it.
ht_tun_info_t info_of(const tunnel_config_bin_t &tunnel)
{
    ht_tun_info_t info = {};
    info.id = tunnel.tp_tunnel_id;
    copy_text(info.name, tunnel.tp_tunnel_name);
    copy_text(info.alias, tunnel.tp_tunnel_alias);
    return info;
}

// The record that a caller hands over, null when there is none to work on: no record is not an
// error, one whose ID is out of range is. Reports in the exported function's name.
int take_record(const char *function, const void *vtunbin, const tunnel_config_bin_t *&ret_tunnel)
{
    ret_tunnel = nullptr;
    const auto *const tunnel = static_cast<const tunnel_config_bin_t *>(vtunbin);
    if (tunnel != nullptr && tunnel->tp_tunnel_id >= MD_TUNBIN_HT_SIZE) {
        (void)BAIL_LOG_AT(function, bail_unit, __LINE__, "%s: tunbin has invalid tunnel id %d",
                          function, tunnel->tp_tunnel_id);
        bail_debug();
        return lc_err_generic_error;
    }
    ret_tunnel = tunnel;
    return 0;
}

void dump_cache()
{
    // The lines name the step that writes them.
    constexpr char name[] = "md_tunbin_ht_dump_tun_cache";
    for (uint32 i = 0; i < MD_TUNBIN_HT_SIZE; ++i) {
        const ht_tun_info_t &slot = ht_tun_infos[i];
        if (slot.id == TUNNEL_ID_NONE) {
            continue;
        }
        // More urgent than the listing: only damaged memory can have done this.
        if (slot.id != i) {
            OV_LOG(ov_log_notice, "%s: WRONG INDEX - tunnel id %d at index position %d", name,
                   slot.id, i);
            continue;
        }
        OV_LOG(ov_log_info, "%s: tunnel id %d - name=%s, alias=%s", name, i, slot.name, slot.alias);
    }
}

} // namespace

int md_tunbin_ht_init(void)
{
    OV_LOG(ov_log_info, "%s: ENTRY", __func__);
    for (ht_tun_info_t &slot : ht_tun_infos) {
        empty_slot(slot);
    }
    (void)tunbin_tunname_ht_init(); // cannot fail
    (void)tunbin_tunalias_ht_init();
    OV_LOG(ov_log_info, "%s: Done", __func__);
    return 0;
}

int md_tunbin_ht_add(const void *vtunbin)
{
    const tunnel_config_bin_t *tunnel = nullptr;
    const int err = take_record(__func__, vtunbin, tunnel);
    if (tunnel == nullptr) {
        return err;
    }
    const uint32 tid = tunnel->tp_tunnel_id;
    ht_tun_info_t &slot = ht_tun_infos[tid];
    slot = info_of(*tunnel);
    tunbin_tunname_ht_add(slot.name, tid);
    tunbin_tunalias_ht_add(slot.alias, tid);
    // The field labelled alias shows the name: log readers know the line so.
    OV_LOG(ov_log_info, "%s: added name=%s/alias=%s/id=%d to mgmt tun cache", __func__, slot.name,
           slot.name, tid);
    return 0;
}

int md_tunbin_ht_del(const void *vtunbin)
{
    const tunnel_config_bin_t *tunnel = nullptr;
    const int err = take_record(__func__, vtunbin, tunnel);
    if (tunnel == nullptr) {
        return err;
    }
    const uint32 tid = tunnel->tp_tunnel_id;
    ht_tun_info_t info = info_of(*tunnel);
    empty_slot(ht_tun_infos[tid]);
    tunbin_tunname_ht_del(info.name);
    tunbin_tunalias_ht_del(info.alias);
    OV_LOG(ov_log_info, "%s: removed name=%s/alias=%s/id=%d from mgmt cache", __func__, info.name,
           info.name, tid);
    return 0;
}

tbool md_tunbin_ht_id_has_tunnel(uint32 tid)
{
    return tid < MD_TUNBIN_HT_SIZE && ht_tun_infos[tid].id == tid;
}

const char *md_tunbin_ht_get_name_by_id(uint32 tid)
{
    if (tid >= MD_TUNBIN_HT_SIZE) {
        OV_LOG(ov_log_error, "%s: invalid tunnel id %d", __func__, tid);
        return nullptr;
    }
    return md_tunbin_ht_id_has_tunnel(tid) ? ht_tun_infos[tid].name : nullptr;
}

uint32 md_tunbin_ht_get_id_by_name(const char *name)
{
    BAIL_NULL_ANSWER(name, TUNNEL_ID_NONE);
    uint32 tid = TUNNEL_ID_NONE;
    (void)tunbin_tunname_ht_find(name, &tid); // unknown and ambiguous names leave "none" behind
    return tid;
}

uint32 md_tunbin_ht_get_id_by_alias(const char *alias)
{
    BAIL_NULL_ANSWER(alias, TUNNEL_ID_NONE);
    uint32 tid = TUNNEL_ID_NONE;
    (void)tunbin_tunalias_ht_find(alias, &tid);
    return tid;
}

void md_tunbin_ht_dump(void)
{
    OV_LOG(ov_log_info, "%s: dumping tunnel name/alias/id cache", __func__);
    dump_cache();
    OV_LOG(ov_log_info, "%s: dumping tunnel name hash table", __func__);
    (void)tunbin_tunname_ht_dump();
    OV_LOG(ov_log_info, "%s: dumping tunnel alias hash table", __func__);
    (void)tunbin_tunalias_ht_dump();
}

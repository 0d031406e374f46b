// The count of configured interfaces, and whether more of them fit.
#include "orvale/md_utils.h"

#include "framework/appliance.h"
#include "framework/bail.h"
#include "libovmd/frame/absent.h"
#include "libovmd/md_utils/unit.h"

namespace
{

int md_ifmgr_num_interfaces;

// The level of a line is the module's, lowered to the cap of the line's place.
constexpr unsigned change_cap = 7;
constexpr unsigned summary_cap = 5;
constexpr unsigned refusal_cap = 3;
constexpr unsigned count_cap = 6;

// The count may pass the ends of its type.
int sum_of(int count, int more)
{
    return static_cast<int>(static_cast<uint32>(count) + static_cast<uint32>(more));
}

int difference_of(int count, int less)
{
    return static_cast<int>(static_cast<uint32>(count) - static_cast<uint32>(less));
}

// The model's limit; without its information, what stands in the record.
uint32 max_interfaces()
{
    if (ov_system_info.initialized == 0) {
        (void)init_model_info(nullptr);
    }
    return ov_system_info.system_max_interfaces;
}

// The name of the node when it stands for a new interface; else null.
const char *new_interface(const mdb_db_change *change, const char *bpattern)
{
    const char *const name = change != nullptr ? ovmd::text_of(change->mdc_name) : nullptr;
    return name != nullptr && bn_binding_name_pattern_match(name, bpattern) &&
                   change->mdc_change_type == mdct_add
               ? name
               : nullptr;
}

} // namespace

tbool md_ifmgr_can_interface_be_added(mdb_db_change_array *changes, const char *bpattern,
                                      int multiplier)
{
    BAIL_NULL_ANSWER(changes, false);

    const int32 num_changes = mdb_db_change_array_length_quick(changes);
    if (num_changes < 1) {
        return true;
    }
    BAIL_NULL_ANSWER(bpattern, false);
    uint32 count = 0;
    for (int32 i = 0; i < num_changes; ++i) {
        const char *const name =
            new_interface(mdb_db_change_array_get_quick(changes, static_cast<uint32>(i)), bpattern);
        if (name != nullptr) {
            ++count;
            OV_LOG_MODULE(change_cap, "Interfaces %s being added. count=%d", name, count);
        }
    }
    if (count == 0) {
        return true;
    }
    if (g_ovif_skfd < 0) {
        (void)ovif_network_init_sockets(); // the count says then what it says without the socket
    }
    const int ifidxs = ovif_get_ifcount();
    OV_LOG_MODULE(summary_cap, "%s: Interface %d changes; cur l3:%d ifidx:%d mult:%d max:%d",
                  __func__, count, md_ifmgr_num_interfaces, ifidxs, multiplier, max_interfaces());
    if (static_cast<uint32>(md_ifmgr_num_interfaces) + count > max_interfaces()) {
        OV_LOG_MODULE(refusal_cap, "%s: Adding %d interfaces to current l3 ifs:%d exceeds max",
                      __func__, count, md_ifmgr_num_interfaces);
        return false;
    }
    if (static_cast<uint32>(multiplier) * count + static_cast<uint32>(ifidxs) >=
        MD_IFMGR_IFINDEX_BUDGET) {
        OV_LOG_MODULE(refusal_cap, "%s: Adding %d interfaces to current ifindicies:%d exceeds max",
                      __func__, count, ifidxs);
        return false;
    }
    return true;
}

void md_ifmgr_ifcount_inc(int count)
{
    const int sum = sum_of(md_ifmgr_num_interfaces, count);
    OV_LOG_MODULE(count_cap, "%s: Incrementing interface count from %d to %d", __func__,
                  md_ifmgr_num_interfaces, sum);
    md_ifmgr_num_interfaces = sum;
}

void md_ifmgr_ifcount_dec(int count)
{
    const int difference = difference_of(md_ifmgr_num_interfaces, count);
    OV_LOG_MODULE(count_cap, "%s: Decrementing interface count from %d to %d", __func__,
                  md_ifmgr_num_interfaces, difference);
    md_ifmgr_num_interfaces = difference;
}

int md_ifmgr_get_ifcount(void)
{
    return md_ifmgr_num_interfaces;
}

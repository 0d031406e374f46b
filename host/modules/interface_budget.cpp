#include "host/modules/interface_budget.h"

#include "framework/appliance.h"
#include "host/modules/commit_access.h"
#include "host/modules/interface_nodes.h"
#include "host/modules/node_access.h"
#include "orvale/md_utils.h"

#include <algorithm>

namespace ovhost
{
namespace
{

/// The last number of kernel interfaces that is not too many.
constexpr uint32 most_in_kernel = MD_IFMGR_IFINDEX_BUDGET - 1;

/// VLAN and tunnel interfaces alike.
const std::string counted_pattern = tunneld_interfaces_node("*") + "/*";

struct Tally {
    int added = 0;
    int removed = 0;
};

Tally count_interfaces(const mdb_db_change_array *changes)
{
    Tally tally;
    for (const mdb_db_change *const change : changes_in(changes)) {
        if (matches(change, counted_pattern)) {
            tally.added += change->mdc_change_type == mdct_add;
            tally.removed += is_deleted(change);
        }
    }
    return tally;
}

int count_configured(const mdb_db *db)
{
    // One without a value could not be seen to go.
    const auto has_value = [db](const std::string &node) {
        return node_text(db, node).has_value();
    };
    return static_cast<int>(std::ranges::count_if(matching_nodes(db, counted_pattern), has_value));
}

uint32 not_negative(int number)
{
    return static_cast<uint32>(std::max(number, 0));
}

uint32 difference(uint32 most, uint32 taken)
{
    return most > taken ? most - taken : 0;
}

std::string refusal(const Tally &tally)
{
    const InterfaceBudget budget = measure_interface_budget();
    const std::string begin = "cannot add " + std::to_string(tally.added) +
                              (tally.added == 1 ? " interface: " : " interfaces: ");
    if (not_negative(tally.added) > difference(budget.allowed, budget.configured)) {
        return begin + std::to_string(budget.configured) +
               " are configured, and the model allows " + std::to_string(budget.allowed) +
               (tally.removed == 0 ? ": remove others before"
                                   : ": those that are removed make room after the commit only, "
                                     "so remove them before");
    }
    return begin + "each takes " + std::to_string(kernel_interfaces_each) +
           " of the kernel's, which has " + std::to_string(budget.in_kernel) + " of " +
           std::to_string(most_in_kernel);
}

} // namespace

InterfaceBudget measure_interface_budget()
{
    InterfaceBudget budget;
    budget.configured = not_negative(md_ifmgr_get_ifcount());
    budget.allowed = ov_system_info.system_max_interfaces;
    budget.in_kernel = not_negative(ovif_get_ifcount());
    budget.left =
        std::min(difference(budget.allowed, budget.configured),
                 difference(most_in_kernel, budget.in_kernel) / uint32{kernel_interfaces_each});
    return budget;
}

std::vector<std::string> InterfaceBudgetModule::patterns() const
{
    return {counted_pattern};
}

void InterfaceBudgetModule::start(const mdb_db *running)
{
    const int configured = count_configured(running);
    if (const int before = md_ifmgr_get_ifcount(); before != 0) {
        md_ifmgr_ifcount_dec(before);
    }
    if (configured != 0) {
        md_ifmgr_ifcount_inc(configured);
    }
}

int InterfaceBudgetModule::check_commit(md_dbinfo *dbinfo, const mdb_db_change_array *changes)
{
    // The library takes the list without const, and only reads it.
    auto *const list = const_cast<mdb_db_change_array *>(changes);
    return md_ifmgr_can_interface_be_added(list, counted_pattern.c_str(), kernel_interfaces_each)
               ? 0
               : refuse(dbinfo, refusal(count_interfaces(changes)));
}

int InterfaceBudgetModule::apply(const md_dbinfo *, const mdb_db_change_array *changes)
{
    const Tally tally = count_interfaces(changes);
    if (tally.added != 0) {
        md_ifmgr_ifcount_inc(tally.added);
    }
    if (tally.removed != 0) {
        md_ifmgr_ifcount_dec(tally.removed);
    }
    return 0;
}

} // namespace ovhost

/*
 * The interface budget, and the removal of all children of a node.
 */
#ifndef ORVALE_MD_UTILS_H
#define ORVALE_MD_UTILS_H

#include "framework/mdb_db.h"
#include "orvale/ov_api.h"

OV_C_BEGIN

/*
 * The interface count: how many layer-3 interfaces the host says it has configured. It begins at 0,
 * lives in memory only, and is what the host makes of it: nothing keeps it from passing below 0 or
 * above a limit.
 */

/* Adds to the count, or takes away from it. */
OV_API void md_ifmgr_ifcount_inc(int count);
OV_API void md_ifmgr_ifcount_dec(int count);

/* The count. */
OV_API int md_ifmgr_get_ifcount(void);

/* Interfaces the kernel has indices for, and one more: so many are too many. */
#define MD_IFMGR_IFINDEX_BUDGET 128u

/*
 * Whether the interfaces that a commit adds fit: the count with them must not exceed the model's
 * number of layer-3 interfaces, and the kernel's interfaces with theirs must stay below
 * MD_IFMGR_IFINDEX_BUDGET. Both sums are unsigned 32-bit numbers. The count itself is not changed.
 *
 * changes     the commit's changes; null entries and entries without a name are passed over
 * bpattern    matches the names of the nodes of which each stands for one interface
 * multiplier  how many of the kernel's interfaces each new one takes
 * Returns true when they fit, or when there are none; false also when changes is null, and when
 * bpattern is while there are changes. Where the model's information cannot be had, its number of
 * interfaces is what ov_system_info holds.
 */
OV_API tbool md_ifmgr_can_interface_be_added(mdb_db_change_array *changes, const char *bpattern,
                                             int multiplier);

/*
 * Removes all children of a node, each with everything below it.
 *
 * commit  may be null
 * db      written, const or not
 * parent  full name
 * num     may be null; receives the number of children removed, on failure too
 * Returns 0; 14001 when db, parent or a child's name is null; the code of the query or of the write
 * that failed. What was removed before a failure stays so.
 */
OV_NODISCARD OV_API int md_delete_children(md_commit *commit, const mdb_db *db, const char *parent,
                                           int *num);

OV_C_END

#endif

/*
 * Policy maps and ACLs: limits, references from maps to ACLs, guards, match strings and their
 * upgrade from older configurations.
 *
 * A map is a list of entries, each at a priority; an entry says which traffic it is about by an ACL
 * or by a match string, and sets parameters for it. The entry of priority "65535" is the default
 * one of its map: it is neither counted nor does it refer to an ACL. ov_xmap.h has the kinds of
 * maps. A check that is asked about an unknown kind logs that and answers 0.
 *
 * The functions with a `dbinfo` are for checks of a commit: they see the database as it was, the
 * database as it is meant to be and, one at a time, the changed nodes. Where they refuse, they set
 * the message for the user on the commit, with code 1; that this may fail is told once, here: the
 * code of md_commit_set_return_status_msg is then the answer.
 *
 * Where a path or name has a size, what is longer is cut there.
 */
#ifndef ORVALE_MD_XMAP_COMMON_H
#define ORVALE_MD_XMAP_COMMON_H

#include "framework/md_commit.h"
#include "framework/mdb_db.h"
#include "orvale/ov_api.h"
#include "orvale/ov_xmap.h"

OV_C_BEGIN

/*
 * Whether a protocol that a user gives may stand: a number from 1 to 255, or a name of
 * opkt_proto_map. The number is read as strtol does, in base 10, and its low 32 bits count; "0" is
 * looked up as a name. Refuses with "Invalid protocol number %d.\n" or "Unknown protocol %s.\n".
 *
 * dbinfo  its commit takes the refusal
 * found   receives true, also when `proto` is null, or false after a refusal
 * Returns 0, refused or not; 14001 when an argument or the commit is null; lc_string_to_enum's
 * code.
 */
OV_NODISCARD OV_API int md_validate_proto(md_dbinfo *dbinfo, const char *proto, tbool *found);

/*
 * Keeps the references from an ACL to the map entries that name it, in the new database: for each
 * such entry a node "/ov/tunneld/acl/config/ACL/KEY/MAP/prio/PRIORITY" with the priority as its
 * value, KEY being that of the map's kind. To be called once for each change, while the new
 * database can be written.
 *
 * An entry's ACL that is set or changed gets its reference first, and the reference of the ACL that
 * it had in the old database is removed then; an ACL that is set to what it was is therefore left
 * without. The removal of a whole entry removes its reference; the removal of the ACL's node alone
 * does not.
 *
 * Returns 0, also for a change that does not matter here and for an unknown kind of map; 14001 when
 * an argument or the new database is null, the changed node has too short a name or memory has run
 * out; the code of a query or write. What was written before a failure stays.
 */
OV_NODISCARD OV_API int md_acl_ref_processing(mdb_db_change *change, md_dbinfo *dbinfo, int mtype);

/*
 * Refuses the removal of an ACL while an entry of a map of the kind names it in the new database.
 * The entries are found by the references of the old database. Of the ACL's name 255 characters
 * count.
 *
 * Returns 0, refused or not; 14001 when an argument is null, the changed node or a reference has
 * too short a name or memory has run out; the code of a query.
 */
OV_NODISCARD OV_API int md_acl_not_used_in_map(mdb_db_change *change, md_dbinfo *dbinfo, int mtype);

/* What tells a caller within a commit that the change is refused and the message set. */
#define MD_XMAP_REFUSED 80000

/*
 * Refuses a new set parameter of an entry that matches nothing in the new database.
 *
 * Returns 0; MD_XMAP_REFUSED; 14001 when an argument is null, the changed node has too short a name
 * or memory has run out; the code of a query.
 */
OV_NODISCARD OV_API int md_xmap_check_match_exists_for_set(mdb_db_change *change, md_dbinfo *dbinfo,
                                                           int mtype);

/*
 * What is checked for every change of a map: the limits of maps and entries, and then that an entry
 * matches before it sets.
 *
 * A new map is refused when the old database has ten of its kind; there is no limit of security
 * maps, and no room for any DNS-proxy map of the VRF "0". A new entry is refused when the old
 * database has twice the model's number of entries in all maps of the kind together, the security
 * map's under "map1" alone. The entries of NAT and DNS-proxy maps are not counted: they are refused
 * only where the model's number is 0. An unknown kind is logged and has no limits.
 *
 * to_bail  receives whether the change is refused and is to be checked no further
 * Returns 0, refused or not; 14001 when an argument is null, the changed node has too short a name
 * or memory has run out; the code of a query.
 */
OV_NODISCARD OV_API int md_xmap_common_change_check(mdb_db_change *change, md_dbinfo *dbinfo,
                                                    int mtype, tbool *to_bail);

/*
 * Match strings: "any", or pairs of key and value such as "src_ip:10.1.0.0/16,dst_port:443". Keys
 * are compared without regard to case. What a value may be is the host's to say
 * (ov_acl_validate_matchstr); of VLANs the library asks more, below.
 */

/* Size of a match string, with the terminating NUL. */
#define MD_XMAP_MATCHSTR_SIZE 1024

/*
 * Checks a match string. Refuses one that ov_acl_validate_matchstr does not take, with "Invalid
 * match string %s - %s\n".
 *
 * ret_valid  receives true, or false after such a refusal
 * Returns 0; -1 when a "vlan" is neither a label nor a name that a VLAN may have, which leaves
 * ret_valid true and sets no message; 14001 when an argument is null.
 */
OV_NODISCARD OV_API int md_xmap_validate_match_str(md_dbinfo *dbinfo, const char *mstr,
                                                   tbool *ret_valid);

/* Whether a text may be the value of "vlan": 0 for an interface label (md_xmap_iflabel_check) and
 * for the name that a VLAN may have (ovlan_valid_name_check), else -1. */
OV_NODISCARD OV_API int md_xmap_vlan_check(const mdb_db *db, const char *vlan);

/* Whether a text is a configured interface label: the name of a node "/ov/iflabels/config/X/NAME",
 * whatever X is. The path has 255 characters at most. */
OV_API tbool md_xmap_iflabel_check(const char *iflabel, const mdb_db *db);

/*
 * Appends a pair to a match string. A pair is cut at 1023 characters before it is looked at whether
 * there is room for it.
 *
 * buf     NUL-terminated; empty for the first pair
 * buflen  its size in bytes, with the NUL
 * Returns 0, with `buf` as it was when an argument is null; 14002 when the pair does not fit, which
 * also leaves `buf` as it was.
 */
OV_NODISCARD OV_API int md_xmap_concat_key_value(char *buf, size_t buflen, const char *key,
                                                 const char *value);

/*
 * Gives every entry of every map under a root the node "match/0/ipver": "any" for the default
 * entry, "ipv4" for all others.
 *
 * pattern  the root, such as "/ov/tunneld/route_map/config/map"
 * Returns 0; 14001 when an argument is null or memory has run out; the code of a query or write,
 * which ends the walk: what was written stays.
 */
OV_NODISCARD OV_API int md_xmap_add_ipver(mdb_db *inout_new_db, const char *pattern);

/* Removes a node; an absent one is no error. Returns 0; 14001 when an argument is null; the code of
 * the query or write. */
OV_NODISCARD OV_API int md_xmap_delete_match_binding(mdb_db *db, const char *bname);

/*
 * Removes the node "application" of the older form below an entry's match node; no other. It does
 * so thirteen times over.
 *
 * mtype  not used
 * Returns 0, also when an argument is null; the code of md_xmap_delete_match_binding.
 */
OV_NODISCARD OV_API int md_xmap_delete_match_entries(mdb_db *db, int mtype, const char *match_root);

/*
 * Rewrites all entries of a kind of map from the older form, one node for each field, to a match
 * string: the fields are read in `db` and removed from `new_db`, where the node "matchstr" is
 * written. An entry with an ACL gets none, and only its "application" is removed.
 *
 * mtype  one of the five kinds that have an older form: MAP_TYPE_R to MAP_TYPE_N
 * Returns 0; 14002 for another kind, of which nothing is touched; 14001 when a database is null or
 * the conversion of a mask hands out nothing; the code of a query, a mask's conversion or the
 * write. Such a failure ends the upgrade: what was converted stays. The code of a failing removal
 * is logged only, but for that of an entry with an ACL when no further list or entry is read after
 * it, which is returned.
 */
OV_NODISCARD OV_API int md_xmap_upgrade_to_pattern_match(mdb_db *new_db, const mdb_db *db,
                                                         int mtype);

/*
 * Whether an entry of a route map chooses its interface by itself: "auto_mod" is "preferred-if".
 * The entries are those of the new database, their values those of the old one.
 *
 * change     not used
 * ret_found  receives the answer; null: nothing is asked
 * Returns 0; 14001 when dbinfo is null or memory has run out; the code of a query.
 */
OV_NODISCARD OV_API int md_preferred_if_is_used_in_rmap(mdb_db_change *change, md_dbinfo *dbinfo,
                                                        tbool *ret_found);

/*
 * Refuses the removal of a VLAN that an entry of a route map has for its preferred interface. The
 * entries are those of the new database, their values those of the old one.
 *
 * change  the removed node; component 7 of its name (counted from 0) is the VLAN's name, cut at 255
 *         characters
 * Returns 0, refused or not; 14001 when an argument is null, the name has no such component or
 * memory has run out; the code of a query.
 */
OV_NODISCARD OV_API int md_vlan_is_used_in_rmap(mdb_db_change *change, md_dbinfo *dbinfo);

OV_C_END

#endif

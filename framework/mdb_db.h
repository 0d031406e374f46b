/*
 * The configuration database: queries, writes, and the list of changes of a commit.
 *
 * Nodes are bindings (bnode.h); md_commit.h has the commit that a query or write belongs to. Every
 * query and write takes the commit or null, then the database. A node is absent when it holds no
 * value, also when other nodes stand below it; child lists and pattern matches name every node that
 * exists, with a value or as a parent.
 */
#ifndef FRAMEWORK_MDB_DB_H
#define FRAMEWORK_MDB_DB_H

#include "framework/bnode.h"

OV_C_BEGIN

typedef struct mdb_db mdb_db;
typedef struct md_commit md_commit;

/* Query options. */
enum {
    mdqf_sel_class_no_state = 512,  /* leave out state nodes */
    mdqf_sel_iterate_subtree = 4096 /* walk the subtree that the pattern spans */
};

/* Operations of a write. */
enum {
    bsso_create = 1, /* write the node, with the parents it lacks */
    bsso_delete = 2, /* remove the node and everything below it; an absent node is no error */
    bsso_modify = 4  /* write the node's value, creating the node when it is absent */
};

/* Kinds of a change. */
enum { mdct_add = 1, mdct_modify = 2, mdct_delete = 3 };

/* One changed node of a commit. The commit owns the record and everything in it. */
typedef struct mdb_db_change {
    tstring *mdc_name;                /* full name */
    tstr_array *mdc_name_parts;       /* its components, counted from 0 without the leading slash */
    int mdc_change_type;              /* mdct_add, mdct_modify or mdct_delete */
    tbool mdc_no_notify;              /* the change is not announced to other daemons */
    bn_attrib_array *mdc_old_attribs; /* null for an added node */
    bn_attrib_array *mdc_new_attribs; /* null for a deleted node */
} mdb_db_change;

/* The changes of a commit in order; opaque, owned by the commit. */
typedef struct mdb_db_change_array mdb_db_change_array;

/*
 * The value of a node as text. `options` is 0, `further` null. `ret` receives a new string, which
 * the caller frees with ts_free, or null when the node is absent (not an error).
 * Returns 0; 14001 on a null argument; 14009 when `name` is not a node name; 14000 when out of
 * memory.
 */
OV_NODISCARD int mdb_get_node_value_tstr(md_commit *commit, const mdb_db *db, const char *name,
                                         uint32 options, void *further, tstring **ret);

/* A node as a binding, which the caller frees with bn_binding_free; null when the node is absent
 * (not an error). `options` is 0. Returns as mdb_get_node_value_tstr. */
OV_NODISCARD int mdb_get_node_binding(md_commit *commit, const mdb_db *db, const char *name,
                                      uint32 options, bn_binding **ret);

/*
 * The names of a node's direct children: the last component of each, escapes resolved, in the
 * database's order. A node without children, or an absent one, gives an empty array. The three
 * option words are 0. Caller frees with tstr_array_free.
 * Returns as mdb_get_node_value_tstr.
 */
OV_NODISCARD int mdb_get_tstr_array(md_commit *commit, const mdb_db *db, const char *parent,
                                    uint32 options1, uint32 options2, uint32 options3,
                                    tstr_array **ret);

/*
 * The full names of all nodes that match a pattern, in the database's order; an empty array when
 * there are none. `options` is a set of mdqf_ flags. Caller frees with tstr_array_free.
 * Returns as mdb_get_node_value_tstr.
 */
OV_NODISCARD int mdb_get_matching_tstr_array(md_commit *commit, const mdb_db *db,
                                             const char *pattern, uint32 options, tstr_array **ret);

/*
 * Writes one node from text; its name is built printf-style. `op` is one of bsso_, `flags` 0; for
 * bsso_delete type and value are ignored and the value may be null.
 * Returns 0; 14001 on a null argument; 14002 when the host does not let this database be
 * written at this moment, or `op` is unknown; 14009 when the name is not a node name; 14020
 * when the text does not fit the type; 14000 when out of memory. On failure nothing is written.
 */
OV_NODISCARD int mdb_set_node_str(md_commit *commit, mdb_db *db, int op, uint32 flags, bn_type type,
                                  const char *value, const char *name_format, ...) OV_PRINTF(7, 8);

/* Writes one node from a binding; one without a value makes a node of type none. Returns as
 * mdb_set_node_str. */
OV_NODISCARD int mdb_set_node_binding(md_commit *commit, mdb_db *db, int op, uint32 flags,
                                      const bn_binding *binding);

/* Number of changes; the array is not null. */
int32 mdb_db_change_array_length_quick(const mdb_db_change_array *changes);

/* The change at an index in range, borrowed; null entries occur. The array is not null. */
mdb_db_change *mdb_db_change_array_get_quick(const mdb_db_change_array *changes, uint32 index);

OV_C_END

#endif

/*
 * Default, model and preserved configuration values, read from text files.
 *
 * The host applies what these functions deliver when it builds its configuration database. The
 * text format, one entry a line:
 *
 *     /ov/tunneld/system/config/mode,string,router     a value: name, type, value
 *     /ov/tunneld/system/config/comment,string         an empty value
 *     -/ov/some/node                                   a removal
 *     # a comment; blank lines are ignored too
 *
 * Blanks (spaces, tabs) before an entry are skipped; all others belong to the fields. Fields end at
 * the next comma, without quoting: a value cannot hold a comma, and what follows a third comma is
 * ignored. A "#" further on, and a carriage return at the end, are part of their field, as is a
 * blank behind the "-" of a removal. Type names are those of bn_type_map (framework/bnode.h). A
 * removal's type and value are optional; without a type the value is dropped.
 *
 * A bad line is logged and left out, and reading goes on. The status is that of the last entry
 * line: an error in an earlier line is logged only.
 */
#ifndef ORVALE_MD_DB_DEFAULT_H
#define ORVALE_MD_DB_DEFAULT_H

#include "framework/bnode.h"
#include "orvale/ov_api.h"

OV_C_BEGIN

/* One entry. Both texts are allocated with malloc and owned by the entry. */
typedef struct bn_str_value {
    char *bv_name;   /* full node name, never null */
    bn_type bv_type; /* type code; 0 when a removal gives none */
    char *bv_value;  /* never null in a value ("" when none is given); null in a removal unless type
                        and value are given */
} bn_str_value;

/*
 * The debugging defaults of "/var/opt/tms/.debug_default_db"; a missing file has none.
 *
 * ret_values, ret_num_values      receive the values to set and their count
 * ret_deletes, ret_num_deletes    receive the bindings to remove and their count
 * Any of the four may be null; what is not handed out is released. The counts are set to 0 first.
 * When the file has entry lines the arrays are handed out even when the status is not 0, and even
 * with a count of 0 when no line was good. The caller releases an array with bn_str_value_free (or,
 * at a count of 0, with free()). An array pointer is left alone when the file is missing, empty or
 * cannot be read, and is set to null when it has no line of that kind.
 * Returns 0; 14012 when the last entry line lacks its name, or its type if it is a value;
 * lc_string_to_enum's code when its type is unknown; 14001 when memory for its texts ran out; the
 * code of lf_test_exists or lf_read_file_lines. When there is no memory for the arrays: 0, and
 * nothing is handed out, because defaults are optional.
 */
OV_NODISCARD OV_API int db_default_get_all(bn_str_value **ret_values, uint32 *ret_num_values,
                                           bn_str_value **ret_deletes, uint32 *ret_num_deletes);

/*
 * The defaults of the appliance's model: "/opt/orvale/defdb.conf.NAME", NAME being
 * get_config_name(); the path is cut at 127 characters. Without a name, or when conf_file_okay
 * rejects the file, there are none.
 *
 * Arguments as in db_default_get_all, but nothing is handed out unless the status is 0, and an
 * array only when its count is not 0: the pointer is left alone otherwise.
 * Returns as db_default_get_all.
 */
OV_NODISCARD OV_API int db_model_def_get_all(bn_str_value **ret_values, uint32 *ret_num_values,
                                             bn_str_value **ret_deletes, uint32 *ret_num_deletes);

/*
 * The values preserved across a reinstall: "/var/opt/tms/.preserved_db".
 *
 * renameWhenDone  when the status is 0, move the file to "/var/opt/tms/.preserved_db.read"; that
 *                 the move fails, or that there is no file, is no error
 * Otherwise as db_default_get_all.
 */
OV_NODISCARD OV_API int db_preserved_get_all(bn_str_value **ret_values, uint32 *ret_num_values,
                                             bn_str_value **ret_deletes, uint32 *ret_num_deletes,
                                             tbool renameWhenDone);

/* Does nothing and returns 0: defaults are read from files only. */
OV_API int db_default_set_all(bn_str_value *values, uint32 *count);

/*
 * Releases an array of entries with its texts and nulls the caller's pointer. Does nothing when the
 * address, the array or the count is null or 0: an array of no good entries is not released here.
 * Returns 0.
 */
OV_API int bn_str_value_free(bn_str_value **array, uint32 count);

OV_C_END

#endif

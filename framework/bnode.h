/*
 * Bindings: a node's name with a typed value. Also event messages, which are lists of bindings.
 *
 * mdb_db.h reads and writes bindings in a database; tstr_array.h holds the parts of a name.
 *
 * A node name is a path such as "/ov/tunneld/system/config/mode". A slash inside a component is
 * written "\/", a backslash "\\"; "\*" is a literal star where a name is taken as a pattern. Any
 * other backslash makes a name invalid. In a pattern the component "*" matches exactly one
 * component.
 */
#ifndef FRAMEWORK_BNODE_H
#define FRAMEWORK_BNODE_H

#include "framework/errors.h"
#include "framework/tstr_array.h"

OV_C_BEGIN

/* Type code of a value. */
typedef uint32 bn_type;

enum {
    bt_uint8 = 1,
    bt_int8 = 2,
    bt_uint16 = 3,
    bt_int16 = 4,
    bt_uint32 = 5,
    bt_int32 = 6,
    bt_uint64 = 7,
    bt_int64 = 8,
    bt_bool = 9,
    bt_float32 = 20,
    bt_float64 = 21,
    bt_char = 40,
    bt_ipaddr = 50,
    bt_ipprefix = 51,
    bt_ipv4addr = 60,
    bt_ipv4prefix = 61,
    bt_ipv6addr = 63,
    bt_ipv6prefix = 64,
    bt_macaddr802 = 62,
    bt_date = 70,
    bt_time_sec = 71,
    bt_time_ms = 72,
    bt_time_us = 73,
    bt_datetime_sec = 74,
    bt_datetime_ms = 75,
    bt_datetime_us = 76,
    bt_duration_sec = 77,
    bt_duration_ms = 78,
    bt_duration_us = 79,
    bt_none = 90,
    bt_any = 91,
    bt_btype = 92,
    bt_attribute = 93,
    bt_string = 101,
    bt_utf8_string = 102,
    bt_binary = 103,
    bt_oid = 105,
    bt_link = 120,
    bt_name = 121,
    bt_hostname = 130,
    bt_uri = 131,
    bt_charlist = 132,
    bt_regex = 133,
    bt_globpattern = 134
};

/* Type names as text files write them. The rows are not in the order of the codes: look up by name
 * or by code, never by position. */
OV_UNIT_TABLE lc_enum_string_map bn_type_map[] = {
    {bt_uint8, "uint8"},
    {bt_int8, "int8"},
    {bt_uint16, "uint16"},
    {bt_int16, "int16"},
    {bt_uint32, "uint32"},
    {bt_int32, "int32"},
    {bt_uint64, "uint64"},
    {bt_int64, "int64"},
    {bt_bool, "bool"},
    {bt_float32, "float32"},
    {bt_float64, "float64"},
    {bt_char, "char"},
    {bt_ipaddr, "ipaddr"},
    {bt_ipprefix, "ipprefix"},
    {bt_ipv4addr, "ipv4addr"},
    {bt_ipv4prefix, "ipv4prefix"},
    {bt_ipv6addr, "ipv6addr"},
    {bt_ipv6prefix, "ipv6prefix"},
    {bt_macaddr802, "macaddr802"},
    {bt_date, "date"},
    {bt_time_sec, "time_sec"},
    {bt_time_ms, "time_ms"},
    {bt_time_us, "time_us"},
    {bt_datetime_sec, "datetime_sec"},
    {bt_datetime_ms, "datetime_ms"},
    {bt_datetime_us, "datetime_us"},
    {bt_duration_sec, "duration_sec"},
    {bt_duration_ms, "duration_ms"},
    {bt_duration_us, "duration_us"},
    {bt_none, "none"},
    {bt_any, "any"},
    {bt_btype, "btype"},
    {bt_attribute, "attribute"},
    {bt_string, "string"},
    {bt_utf8_string, "utf8_string"},
    {bt_binary, "binary"},
    {bt_oid, "oid"},
    {bt_link, "link"},
    {bt_name, "name"},
    {bt_hostname, "hostname"},
    {bt_uri, "uri"},
    {bt_charlist, "charlist"},
    {bt_regex, "regex"},
    {bt_globpattern, "globpattern"},
    {0, NULL},
};

/* The attribute that holds a node's value. */
enum { ba_value = 1 };

typedef struct bn_binding bn_binding;
typedef struct bn_attrib_array bn_attrib_array;
typedef struct bn_request bn_request;
typedef struct gcl_session gcl_session;

/*
 * A new binding whose attribute `attrib_id` holds `value` as text of type `type`. `flags` is 0.
 * Caller frees with bn_binding_free.
 * Returns 0; 14001 on a null argument; 14009 when `name` is not a node name; 14020 when the text
 * does not fit the type; 14000 when out of memory.
 */
OV_NODISCARD int bn_binding_new_str(bn_binding **ret, const char *name, uint32 attrib_id,
                                    bn_type type, uint32 flags, const char *value);

/* A new binding without any attribute. Caller frees with bn_binding_free. Returns as
 * bn_binding_new_str. */
OV_NODISCARD int bn_binding_new_named(bn_binding **ret, const char *name);

/* Releases the binding and nulls the caller's pointer. Safe on null, at both levels. */
void bn_binding_free(bn_binding **binding);

/*
 * An attribute as text. `ret` receives a new copy, which the caller releases with free(), or null
 * when the binding does not have the attribute (not an error). `type` is the type the caller
 * expects, bt_any for every one; `flags` is 0.
 * Returns 0; 14001 on a null argument; 14020 when the attribute is of another type; 14000 when out
 * of memory.
 */
OV_NODISCARD int bn_binding_get_str(const bn_binding *binding, uint32 attrib_id, bn_type type,
                                    uint32 flags, char **ret);

/*
 * An attribute of type uint32. `flags` is 0.
 * Returns 0; 14001 on a null argument; 14004 when the binding does not have the attribute; 14020
 * when it is of another type. `ret` is left alone on failure.
 */
OV_NODISCARD int bn_binding_get_uint32(const bn_binding *binding, uint32 attrib_id, uint32 flags,
                                       uint32 *ret);

/* An attribute of type bool; otherwise as bn_binding_get_uint32. */
OV_NODISCARD int bn_binding_get_tbool(const bn_binding *binding, uint32 attrib_id, uint32 flags,
                                      tbool *ret);

/*
 * The components of a node name in order, without the leading slash and with escapes resolved.
 * Caller frees with tstr_array_free. `flag` is false.
 * Returns 0; 14001 on a null argument; 14009 when `name` is not a node name; 14000 when out of
 * memory.
 */
OV_NODISCARD int bn_binding_name_to_parts(const char *name, tstr_array **ret, tbool flag);

/* Whether a name matches a pattern. False for null or malformed arguments. */
tbool bn_binding_name_pattern_match(const char *name, const char *pattern);

/* The same for a name already taken apart. `flag` is true. False for null arguments. */
tbool bn_binding_name_parts_pattern_match(const tstr_array *parts, tbool flag, const char *pattern);

/*
 * The text of an attribute from the attributes of a change. `ret` receives a new string, which the
 * caller frees with ts_free, or null when the attribute is not there (not an error); a null array
 * has no attributes. Returns 0; 14001 when `ret` is null; 14000 when out of memory.
 */
OV_NODISCARD int bn_attrib_array_get_attrib_tstr(const bn_attrib_array *attribs, uint32 attrib_id,
                                                 tstring **ret);

/*
 * A new, empty event message. Caller frees with bn_request_msg_free, sent or not.
 * Returns 0; 14001 on a null argument; 14000 when out of memory.
 */
OV_NODISCARD int bn_event_request_msg_create(bn_request **ret, const char *event_name);

/*
 * Appends one binding, its value given as text. `flags` is 0; `ret_index` may be null, otherwise it
 * receives the binding's position, counted from 0.
 * Returns 0; 14001 on a null argument; 14009 when `name` is not a node name; 14020 when the text
 * does not fit the type; 14000 when out of memory. On failure the message is unchanged.
 */
OV_NODISCARD int bn_event_request_msg_append_new_binding(bn_request *request, uint32 flags,
                                                         const char *name, bn_type type,
                                                         const char *value, uint32 *ret_index);

/*
 * Sends a message to a peer without waiting for it. The caller keeps the message.
 * Returns 0; 14001 on a null argument; 14016 when the session is closed.
 */
OV_NODISCARD int bn_request_msg_send(gcl_session *session, bn_request *request);

/* Releases the message and nulls the caller's pointer. Safe on null, at both levels. */
void bn_request_msg_free(bn_request **request);

OV_C_END

#endif

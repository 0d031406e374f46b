/*
 * One line of the default-database text format taken apart: what kind of line it is, and its
 * fields.
 *
 * The format is told in orvale/md_db_default.h. The host's modules that read the same format from
 * elsewhere share this header, so that a line means the same to all. Nothing here allocates or
 * fails; a line is NUL-terminated and borrowed, and a field points into it.
 */
#ifndef ORVALE_OV_DEFDB_LINE_H
#define ORVALE_OV_DEFDB_LINE_H

#include "framework/types.h"

#include <string.h>

OV_C_BEGIN

enum ov_defdb_line_kind {
    ov_defdb_comment, /* a comment or a blank line */
    ov_defdb_value,
    ov_defdb_removal
};

/* A stretch of a line; one of length 0 stands for a field that is not there. */
typedef struct ov_defdb_field {
    const char *text;
    size_t length;
} ov_defdb_field;

typedef struct ov_defdb_fields {
    ov_defdb_field name;
    ov_defdb_field type;
    ov_defdb_field value;
} ov_defdb_fields;

/* The first character that counts: spaces and tabs before an entry do not. */
static inline const char *ov_defdb_line_start(const char *line)
{
    while (*line == ' ' || *line == '\t') {
        ++line;
    }
    return line;
}

/* The kind of the line that begins at ov_defdb_line_start(). */
static inline enum ov_defdb_line_kind ov_defdb_kind(const char *start)
{
    if (*start == '\0' || *start == '#') {
        return ov_defdb_comment;
    }
    return *start == '-' ? ov_defdb_removal : ov_defdb_value;
}

/* Takes the field at the cursor and moves the cursor to the next one. */
static inline ov_defdb_field ov_defdb_take_field(const char **cursor)
{
    ov_defdb_field field;

    field.text = *cursor;
    field.length = strcspn(*cursor, ",");
    *cursor += field.length;
    if (**cursor == ',') {
        ++*cursor;
    }
    return field;
}

/*
 * The fields of an entry: `start` is ov_defdb_line_start() of a value line, and the character
 * behind the "-" of a removal line. There is no quoting: a value ends at the next comma, and what
 * follows is ignored.
 */
static inline ov_defdb_fields ov_defdb_split(const char *start)
{
    ov_defdb_fields fields;

    fields.name = ov_defdb_take_field(&start);
    fields.type = ov_defdb_take_field(&start);
    fields.value = ov_defdb_take_field(&start);
    return fields;
}

OV_C_END

#endif

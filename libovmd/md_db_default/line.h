// One line of a default-database file taken apart: what kind of line it is, and its fields.
//
// file_parser.cpp turns the fields into entries. Nothing here allocates or fails.
#pragma once

#include <cstddef>
#include <cstring>

namespace ovmd
{

enum class line_kind { comment, value, removal };

// A stretch of a line; an empty one stands for a field that is not there.
struct field {
    const char *text = nullptr;
    size_t length = 0;

    bool empty() const { return length == 0; }
};

struct line_fields {
    field name;
    field type;
    field value;
};

// The first character that counts: blanks before an entry do not.
inline const char *line_start(const char *line)
{
    return line + strspn(line, " \t");
}

inline line_kind kind_of_line(const char *start)
{
    switch (*start) {
    case '\0':
    case '#':
        return line_kind::comment;
    case '-':
        return line_kind::removal;
    default:
        return line_kind::value;
    }
}

// Takes the field at `cursor` and moves on to the next one.
inline field next_field(const char *&cursor)
{
    const char *const comma = strchrnul(cursor, ',');
    const field taken{cursor, static_cast<size_t>(comma - cursor)};
    cursor = *comma == ',' ? comma + 1 : comma;
    return taken;
}

// There is no quoting: a value ends at the next comma, and what follows is ignored.
inline line_fields split_line(const char *cursor)
{
    line_fields fields;
    fields.name = next_field(cursor);
    fields.type = next_field(cursor);
    fields.value = next_field(cursor);
    return fields;
}

} // namespace ovmd

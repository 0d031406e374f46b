// Lists and strings of the host that may be absent: no operation is asked about one that is.
#pragma once

#include "framework/tstr_array.h"
#include "framework/tstring.h"

namespace ovmd
{

// A list that was not handed out counts as empty.
inline uint32 length_of(const tstr_array *names)
{
    return names != nullptr ? static_cast<uint32>(tstr_array_length_quick(names)) : 0;
}

// Null past the end.
inline const char *part_of(const tstr_array *parts, uint32 index)
{
    return index < length_of(parts) ? tstr_array_get_str_quick(parts, index) : nullptr;
}

// Null without a string.
inline const char *text_of(const tstring *string)
{
    return string != nullptr ? ts_str(string) : nullptr;
}

} // namespace ovmd

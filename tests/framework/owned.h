#pragma once
// The host's owners, so that a failing test leaks nothing and the leaks the sanitizer reports are
// the host's; and what is in an array of strings.

#include "host/framework/owners.h"

#include <string>
#include <vector>

namespace ovhost::test
{

inline std::vector<std::string> texts_of(const OwnedStrings &array)
{
    std::vector<std::string> texts;
    const int32 length = tstr_array_length_quick(array.get());
    for (int32 index = 0; index < length; ++index) {
        texts.emplace_back(tstr_array_get_str_quick(array.get(), static_cast<uint32>(index)));
    }
    return texts;
}

} // namespace ovhost::test

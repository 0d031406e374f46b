#include "framework/errors.h"

#include <cstring>

const char *lc_enum_to_string_quiet_null(const lc_enum_string_map *map, uint32 code)
{
    if (map == nullptr) {
        return nullptr;
    }
    // The end row has code 0, which may be a row of its own: the text tells them apart.
    for (; map->lesm_string != nullptr; ++map) {
        if (map->lesm_enum == code) {
            return map->lesm_string;
        }
    }
    return nullptr;
}

int lc_string_to_enum(const lc_enum_string_map *map, const char *text, uint32 *ret)
{
    if (map == nullptr || text == nullptr || ret == nullptr) {
        return lc_err_unexpected_null;
    }
    for (; map->lesm_string != nullptr; ++map) {
        if (std::strcmp(map->lesm_string, text) == 0) {
            *ret = map->lesm_enum;
            return lc_err_no_error;
        }
    }
    return lc_err_bad_type;
}

// Reads one default-database file into entries; readers.cpp says which files there are.
#pragma once

#include "orvale/md_db_default.h"

// Parses the file at `path`. A file that does not exist, or has no lines, leaves the four
// out-pointers alone and is no error; otherwise both counts and arrays are handed over where asked
// for, also when the result is not 0. The result is that of the last entry line.
[[nodiscard]] int db_default_get_file_default(const char *path, bn_str_value **ret_values,
                                              uint32 *ret_num_values, bn_str_value **ret_deletes,
                                              uint32 *ret_num_deletes);

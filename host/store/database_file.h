#pragma once
// The store's database as a file: making a new one, and opening an existing one only when it is
// whole and the store's own. A file that is refused is left as it is, byte by byte. Neighbours:
// schema.h has the tables, store.h works on the connection.

#include "host/store/sqlite.h"

#include <filesystem>

namespace ovhost
{

/// Opens DIR/config.db of a state directory that this process holds, or makes it when it is
/// missing. Throws StoreError.
[[nodiscard]] SqliteConnection open_database(const std::filesystem::path &file);

} // namespace ovhost

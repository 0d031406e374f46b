#pragma once
// The tables of the store's database and their versions. A database is brought from one version
// to the next by the steps of schema.cpp; a new database begins at version 0. Neighbours:
// database_file.h makes and judges the file, store.h works on its tables.

#include <cstdint>
#include <string>
#include <vector>

namespace ovhost
{

class SqliteConnection;

/// "ovmd": tells the store's databases from those of other programs.
inline constexpr std::int32_t kApplicationId = 0x6f766d64;

/// The first version with a history.
inline constexpr std::int64_t kHistoryVersion = 2;

/// The version this program writes.
[[nodiscard]] std::int64_t schema_version() noexcept;

/// Brings a database of an older version to schema_version(), in one transaction.
void upgrade_schema(const SqliteConnection &db);

/// What the database's tables, indexes and triggers look like, in the order of their names.
[[nodiscard]] std::vector<std::string> schema_of(const SqliteConnection &db);

/// What schema_of() answers for a sound database of this version.
[[nodiscard]] std::vector<std::string> expected_schema(std::int64_t version);

} // namespace ovhost

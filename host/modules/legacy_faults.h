#pragma once
// What keeps the entries of a legacy configuration (legacy_entries.h) from being upgraded: before
// the library converts them, and after. legacy_upgrade.h asks.

#include "host/modules/legacy_entries.h"

#include <optional>
#include <string>

namespace ovhost
{

/// Why an entry must not be handed to the library, which would make less of it and say nothing.
[[nodiscard]] std::optional<std::string> fault_before_conversion(const mdb_db &legacy,
                                                                 const LegacyEntry &entry);

/// Whether the library has come to the entry.
[[nodiscard]] bool is_converted(const mdb_db &converted, const LegacyEntry &entry);

/// What the library has dropped of an entry that it has converted: an entry that says less matches
/// more.
[[nodiscard]] std::optional<std::string> loss_fault(const mdb_db &legacy, const mdb_db &converted,
                                                    const LegacyEntry &entry);

/// Of an entry that has not been converted; `err` ended the conversion.
[[nodiscard]] std::string failure_message(const mdb_db &legacy, const LegacyEntry &entry, int err);

/// The same when there is no entry to name.
[[nodiscard]] std::string failure_message(int err);

} // namespace ovhost

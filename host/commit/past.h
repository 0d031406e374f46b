#pragma once
// Configurations of the past, made from the present one and the history in the store. patch.h makes
// the changes.

#include "host/tree/tree.h"

#include <cstdint>

namespace ovhost
{

class Store;

/// The oldest commit after which the configuration can be told; the last commit when the store has
/// no history.
[[nodiscard]] std::uint64_t oldest_known_commit(const Store &store);

/// The configuration as it was after a commit from oldest_known_commit() to the last one. `running`
/// is what is in force. Throws StoreError.
[[nodiscard]] Tree configuration_after(const Store &store, const Tree &running,
                                       std::uint64_t number);

} // namespace ovhost

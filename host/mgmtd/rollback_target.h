#pragma once
// What to ask for in order to get back to a configuration of the past (commit/past.h).

#include "host/tree/tree.h"

namespace ovhost
{

/// `past` with those nodes as they are in `running` that modules keep by themselves while they
/// check a commit: the references of the ACLs. Modules work out what becomes of them from the
/// changes of what they depend on, and find them changed already otherwise.
[[nodiscard]] Tree rollback_target(Tree past, const Tree &running);

} // namespace ovhost

#pragma once
// A list of changes made to a configuration: the way back from tree/diff.h.

#include "host/tree/diff.h"
#include "host/tree/tree.h"

#include <span>

namespace ovhost
{

/// A configuration with changes made to it, each node as the change has it afterwards. What the
/// changes do not name stays.
[[nodiscard]] Tree with_changes(Tree configuration, std::span<const Change> changes);

} // namespace ovhost

#pragma once
// A binding from its parts, checked: what bn_binding_new_str and the appending of a binding to an
// event message have in common.

#include "host/framework/objects.h"

namespace ovhost
{

/// Fills the binding. Returns 0; 14009 when `name` is not a node name; 14020 when the text does not
/// fit the type. May throw std::bad_alloc; on failure the binding is not to be used.
[[nodiscard]] int build_binding(const char *name, uint32 attrib_id, bn_type type, const char *text,
                                bn_binding &binding);

} // namespace ovhost

#pragma once
// Nodes of a bench's own database, and what must hold before its figures mean anything.

#include "framework/bnode.h"
#include "host/framework/objects.h"

#include <string>

namespace ovbench
{

void require(bool holds, const char *what);

/// Sets a node.
void set(mdb_db &db, const std::string &node, bn_type type, const std::string &value);

} // namespace ovbench

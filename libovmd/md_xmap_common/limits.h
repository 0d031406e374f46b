// How many maps, and how many entries in all maps of a kind.
#pragma once

#include "framework/md_commit.h"
#include "framework/mdb_db.h"

namespace ovmd
{

// Refuses a new map or entry past the limit of its kind. Returns 0, MD_XMAP_REFUSED or a code.
int md_xmap_check_limit(mdb_db_change *change, md_dbinfo *dbinfo, int mtype);

} // namespace ovmd

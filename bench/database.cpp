#include "bench/database.h"

#include "host/tree/name.h"

#include <stdexcept>

namespace ovbench
{

void require(bool holds, const char *what)
{
    if (!holds) {
        throw std::runtime_error(what);
    }
}

void set(mdb_db &db, const std::string &node, bn_type type, const std::string &value)
{
    db.tree.set(ovhost::split_name(node).value(), {type, value});
}

} // namespace ovbench

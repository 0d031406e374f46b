#include "bench/owned.h"

#include "host/tree/name.h"

#include <cstdlib>
#include <stdexcept>

namespace ovbench
{

void free_text(char **text)
{
    std::free(*text);
}

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

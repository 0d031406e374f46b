#include "host/modules/limits.h"

#include "orvale/md_dyna_limits.h"

namespace ovhost
{

std::vector<std::string> LimitsModule::patterns() const
{
    return {"/ov/tunneld/system/config/limits/*"};
}

int LimitsModule::apply(const md_dbinfo *dbinfo, const mdb_db_change_array *)
{
    return write_dyna_limits_conf(dbinfo->newdb);
}

} // namespace ovhost

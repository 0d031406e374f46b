#include "framework/bail.h"
#include "framework/mdb_db.h"
#include "orvale/md_db_default.h"
#include "orvale/md_dyna_limits.h"
#include "orvale/md_event_common.h"
#include "orvale/md_tunneld_tunnel_common.h"
#include "orvale/md_xmap_common.h"

int consume_in_c(const mdb_db *db);
int consume_in_c(const mdb_db *db)
{
    md_send_dbc_event("/ov/a", "2", "1");
    return write_dyna_limits_conf(db) + md_is_10g_enabled(db) + md_xmap_vlan_check(db, "vlan5");
}

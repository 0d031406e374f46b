#include "framework/bail.h"
#include "framework/mdb_db.h"
#include "orvale/md_db_default.h"
#include "orvale/md_dyna_limits.h"
#include "orvale/md_event_common.h"
#include "orvale/md_tunneld_tunnel_common.h"
#include "orvale/md_xmap_common.h"

int consume_in_cpp(const mdb_db *db)
{
    char *mode = nullptr;
    return md_get_db_system_mode(db, &mode) + db_default_set_all(nullptr, nullptr) +
           md_xmap_iflabel_check("label", db);
}

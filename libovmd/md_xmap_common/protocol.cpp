// Protocols that users give by number or name.
#include "orvale/md_xmap_common.h"

#include "framework/bail.h"
#include "libovmd/md_xmap_common/unit.h"
#include "orvale/opkt_proto.h"

#include <cstdlib>

namespace
{

constexpr uint32 last_protocol = 255;

} // namespace

int md_validate_proto(md_dbinfo *dbinfo, const char *proto, tbool *found)
{
    BAIL_NULL(dbinfo);
    BAIL_NULL(dbinfo->commit);
    BAIL_NULL(found);
    *found = true;
    BAIL_NULL(proto);

    const auto number = static_cast<int32>(strtol(proto, nullptr, 10));
    if (number != 0) {
        if (static_cast<uint32>(number) > last_protocol) {
            BAIL_ERROR(md_commit_set_return_status_msg_fmt(
                dbinfo->commit, 1, "Invalid protocol number %d.\n", number));
            *found = false;
        }
        return 0;
    }
    uint32 known = 0;
    const int err = lc_string_to_enum(opkt_proto_map, proto, &known);
    if (err != lc_err_bad_type) {
        BAIL_ERROR(err);
        return 0;
    }
    BAIL_ERROR(
        md_commit_set_return_status_msg_fmt(dbinfo->commit, 1, "Unknown protocol %s.\n", proto));
    *found = false;
    return 0;
}

// The file of the alarms of software upgrades.
#include "orvale/md_tunneld_tunnel_common.h"

#include "framework/bail.h"
#include "libovmd/md_tunneld_tunnel_common/unit.h"

#include <cstdio>

namespace
{

constexpr char alarm_path[] = "/var/opt/tms/output/upgrade_alarms.txt";

} // namespace

int md_tunneld_write_sw_upgrade_alarm(const char *alarm_str)
{
    BAIL_NULL(alarm_str);
    FILE *const file = fopen(alarm_path, "a");
    OV_LOG(ov_log_info, "%s: writing alarm %s", __func__, alarm_str);
    if (file == nullptr) {
        OV_LOG(ov_log_error, "Write error opening %s", alarm_path);
        return lc_err_bad_file;
    }
    (void)fprintf(file, "%s\n", alarm_str);
    (void)fclose(file);
    return 0;
}

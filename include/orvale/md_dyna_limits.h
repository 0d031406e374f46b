/*
 * The limits file for processes that cannot ask the configuration database.
 */
#ifndef ORVALE_MD_DYNA_LIMITS_H
#define ORVALE_MD_DYNA_LIMITS_H

#include "framework/mdb_db.h"
#include "orvale/ov_api.h"

OV_C_BEGIN

/*
 * Writes "/var/opt/tms/dynalimits.conf" anew: six lines "KEY VALUE", in this order, from the nodes
 * below "/ov/tunneld/system/config/limits":
 *
 *     expected_mem    mem_size         expected memory size
 *     max_def_bw      system_bw        default system bandwidth limit
 *     max_loc_flows   total_flows      locally handled flows
 *     max_cifs_conns  cifs_flows       CIFS connections
 *     max_ssl_flows   ssl_flows        SSL flows
 *     nm_ram_size     nm_ram_size      memory for network monitoring
 *
 * A value is an unsigned 32-bit number written as a signed one; an absent node writes 0. When
 * writing fails the file is removed: no file with fewer than six lines stays behind.
 *
 * new_db  the database to read; during a commit, the one that will be in force after it
 * Returns 0; 14001 when new_db is null or the file cannot be created; 14014 when it cannot be
 * written to its end; the code of init_model_info, or of reading a node or its value. The file of
 * an earlier call stays only when init_model_info failed, before the file was touched.
 */
OV_NODISCARD OV_API int write_dyna_limits_conf(const mdb_db *new_db);

OV_C_END

#endif

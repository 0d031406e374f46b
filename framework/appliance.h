/*
 * What the host knows of the appliance: model, limits, interfaces, and two parsers.
 */
#ifndef FRAMEWORK_APPLIANCE_H
#define FRAMEWORK_APPLIANCE_H

#include "framework/mdb_db.h"

OV_C_BEGIN

/* Model information; the host may add fields behind these. */
typedef struct ov_system_info_t {
    uint8 initialized;            /* not 0 once init_model_info has filled the record */
    uint32 system_max_interfaces; /* layer-3 interfaces the model allows */
} ov_system_info_t;

extern ov_system_info_t ov_system_info;

/*
 * Fills ov_system_info from a database; null means the database in force.
 * Returns 0, or the code of the query that failed; the record is then unchanged.
 */
int init_model_info(const mdb_db *db);

/* Name of the model's configuration, borrowed; null when there is none. */
const char *get_config_name(void);

/* Number of tunnels the model allows; IDs run from 0 to one less. Constant for the life of the
 * process. */
uint32 get_max_tunnel_number(void);

/* Entries the model allows in the maps of each kind. */
uint32 get_max_rmap_entries(void);
uint32 get_max_omap_entries(void);
uint32 get_max_qmap_entries(void);
uint32 get_max_smap_entries(void);
uint32 get_max_nmap_entries(void);
uint32 get_max_dns_proxy_map_entries(void);

/* Number of network interfaces the kernel has at this moment. */
int ovif_get_ifcount(void);

/* Opens the interface-control socket g_ovif_skfd. Returns 0, or 14014 when it cannot be opened. */
int ovif_network_init_sockets(void);

/* The interface-control socket; negative while closed. */
extern int g_ovif_skfd;

/*
 * Takes a match string apart into its keys and values: two arrays of equal length, in the order of
 * the string, which the caller frees with tstr_array_free. When the string is not valid the result
 * is not 0 and `reason` may receive a text, which the caller releases with free().
 */
OV_NODISCARD int ov_acl_validate_matchstr(const char *matchstr, tstr_array **keys,
                                          tstr_array **values, char **reason);

/* Whether a text may name a VLAN interface: 0 when it may. */
OV_NODISCARD int ovlan_valid_name_check(const char *name);

OV_C_END

#endif

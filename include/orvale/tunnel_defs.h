/*
 * Tunnel records and their limits, as the daemons share them.
 */
#ifndef ORVALE_TUNNEL_DEFS_H
#define ORVALE_TUNNEL_DEFS_H

#include "framework/types.h"

OV_C_BEGIN

/* Sizes of a tunnel's name and alias, with the terminating NUL. */
#define TUNNEL_NAME_SIZE 65
#define TUNNEL_ALIAS_SIZE 256

/* What stands for "no tunnel ID". */
#define TUNNEL_ID_NONE 65535u

/* A tunnel's configuration; the host may add fields behind these. */
typedef struct tunnel_config_bin_t {
    char tp_tunnel_name[TUNNEL_NAME_SIZE];
    char tp_tunnel_alias[TUNNEL_ALIAS_SIZE];
    uint32 tp_tunnel_id;
} tunnel_config_bin_t;

OV_C_END

#endif

/*
 * What the tunnel ID allocator goes by.
 */
#ifndef ORVALE_MD_TUNNELD_DEFS_H
#define ORVALE_MD_TUNNELD_DEFS_H

#include "framework/types.h"
#include "orvale/tunnel_defs.h"

OV_C_BEGIN

/* How many IDs must stay unused when some are offered: a margin while the space is nearly full. */
#define TUNNEL_ID_RESERVE 20u

/* How long a freed ID is held back, in milliseconds. */
#define TUNNEL_ID_QUARANTINE_MS 60000u

/* The reserved tunnel name: it never holds an ID. */
#define TUNNEL_NAME_DEFAULT "default"

OV_C_END

#endif

/*
 * The kinds of policy maps.
 *
 * md_xmap_common.h has what the library does with them.
 */
#ifndef ORVALE_OV_XMAP_H
#define ORVALE_OV_XMAP_H

/* Passed as `int mtype`. */
enum {
    MAP_TYPE_R = 0,        /* route map */
    MAP_TYPE_O = 1,        /* optimisation map */
    MAP_TYPE_Q = 2,        /* QoS map */
    MAP_TYPE_S = 3,        /* statistics map */
    MAP_TYPE_N = 4,        /* NAT map */
    MAP_TYPE_SEC = 5,      /* security map */
    MAP_TYPE_RTMAP = 6,    /* declared only: every function takes it for an unknown kind */
    MAP_TYPE_DNS_PROXY = 7 /* DNS-proxy map: only its limits are known */
};

#endif

/*
 * Address helpers of the host.
 */
#ifndef FRAMEWORK_ADDRESSES_H
#define FRAMEWORK_ADDRESSES_H

#include "framework/types.h"

OV_C_BEGIN

/*
 * The mask length of a netmask ("255.255.0.0") or mask length ("16") as decimal text, which the
 * caller releases with free().
 * Returns 0; 14001 on a null argument; 14020 when the text is neither; 14000 when out of memory.
 */
OV_NODISCARD int lc_mask_or_masklen_to_masklen_str(const char *mask_or_length, char **ret);

/*
 * Whether two addresses of the same family, each with its mask length in bits, name the same
 * subnet. A mask length of 0 covers every address; one beyond the family's width counts as the
 * full width; two different lengths name different subnets. False for null or malformed addresses.
 */
tbool mgmt_is_same_subnet_using_masklen(const char *addr1, const char *addr2, uint8 masklen1,
                                        uint8 masklen2);

OV_C_END

#endif

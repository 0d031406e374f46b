// The unit's name in the log, whichever of its files a line comes from.
#pragma once

static const char bail_unit[] = "md_utils";

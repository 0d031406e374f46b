#pragma once
// The former name of map_interfaces.h.

#include "host/modules/map_interfaces.h"

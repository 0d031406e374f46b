#include "host/support/version.h"

namespace ovhost
{

const char *program_version()
{
    return OVMD_VERSION;
}

} // namespace ovhost

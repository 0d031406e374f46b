#include "host/jsond/backoff.h"

#include <algorithm>
#include <utility>

namespace ovhost
{

Backoff::Milliseconds Backoff::next()
{
    return std::exchange(next_, std::min(longest_, next_ * 2));
}

} // namespace ovhost

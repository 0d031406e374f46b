#include "host/support/commit_range.h"

namespace ovhost
{

std::string commit_range(std::uint64_t back_to, std::uint64_t last)
{
    const std::string end = std::to_string(last);
    return back_to + 1 == last ? "commit " + end
                               : "commits " + std::to_string(back_to + 1) + " to " + end;
}

std::string commit_range(std::uint64_t back_to, std::uint64_t last, const char *one,
                         const char *several)
{
    return commit_range(back_to, last) + " " + (back_to + 1 == last ? one : several);
}

} // namespace ovhost

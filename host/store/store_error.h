#pragma once
// The one error of the store: its text names the file, says what is wrong and what to do.

#include <cerrno>
#include <stdexcept>
#include <string>
#include <system_error>

namespace ovhost
{

class StoreError : public std::runtime_error
{
  public:
    using std::runtime_error::runtime_error;
};

/// The system's words for an errno, as they stand in the messages.
[[nodiscard]] inline std::string system_message(int error)
{
    return std::generic_category().message(error);
}

inline constexpr const char *space_advice = "; free space on its file system and start again";

/// What to do about a failed system call: room is needed when there is none, whatever else helps.
[[nodiscard]] inline const char *advice_for(int error, const char *otherwise)
{
    return error == ENOSPC || error == EDQUOT ? space_advice : otherwise;
}

} // namespace ovhost

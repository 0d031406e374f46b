// The one error of the store: its text names the file, says what is wrong and what to do.
#pragma once

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

// The system's words for an errno, as they stand in the messages.
[[nodiscard]] inline std::string system_message(int error)
{
    return std::generic_category().message(error);
}

} // namespace ovhost

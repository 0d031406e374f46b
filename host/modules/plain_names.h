#pragma once
// What things that users name may be called. Their names stand in paths and patterns that the
// library builds, where these characters mean something, and in its buffers.

#include <cstddef>
#include <optional>
#include <string>

namespace ovhost
{

inline constexpr std::size_t longest_plain_name = 255;

/// What is wrong with the name of something; `thing` begins the sentence, such as "an ACL's name".
[[nodiscard]] std::optional<std::string> plain_name_fault(const char *thing,
                                                          const std::string &name,
                                                          std::size_t longest = longest_plain_name);

/// What is wrong with a number that an entry has for its name: it must be written as 1 to 65535
/// are.
[[nodiscard]] std::optional<std::string> entry_number_fault(const char *thing,
                                                            const std::string &number);

} // namespace ovhost

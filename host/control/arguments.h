#pragma once
// Reads the arguments of a request, for those who handle one (RequestHandler in request_handler.h).
// A missing or wrongly typed argument is a RequestError "bad-request" that names command and
// argument.

#include <nlohmann/json_fwd.hpp>

#include <cstdint>
#include <optional>
#include <string>

namespace ovhost
{

/// Seconds that a commit can wait for its confirmation: a day.
inline constexpr std::uint32_t longest_confirmation = 86400;

[[nodiscard]] std::string required_text(const nlohmann::json &request, const char *name);
/// One that is null counts as not given; so it does below.
[[nodiscard]] std::string optional_text(const nlohmann::json &request, const char *name,
                                        const std::string &otherwise = {});
/// Nothing when it is not given.
[[nodiscard]] std::optional<std::uint32_t> optional_number(const nlohmann::json &request,
                                                           const char *name);
[[nodiscard]] bool optional_flag(const nlohmann::json &request, const char *name,
                                 bool otherwise = false);

} // namespace ovhost

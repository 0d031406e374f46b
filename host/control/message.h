#pragma once
// The lines of the control protocol: requests, answers, events and goodbyes, as JSON and as text.
// docs/control-protocol.md is the description for people. Used by server.h and client.h.

#include "host/control/request_error.h"

#include <nlohmann/json_fwd.hpp>

#include <cstdint>
#include <string>
#include <string_view>

namespace ovhost
{

inline constexpr int control_protocol_version = 1;

/// Why the daemon ends a connection by itself.
namespace goodbye_code
{
inline constexpr const char *replaced = "replaced";
inline constexpr const char *stopping = "stopping";
} // namespace goodbye_code

/// One line, newline included. Bytes that are not UTF-8 become U+FFFD.
[[nodiscard]] std::string to_line(const nlohmann::json &message);

/// Reads a line. Throws RequestError "bad-json" that names the fault and where it is; values nested
/// deeper than 64 are a fault too, because reading them back would exhaust the stack, and so is a
/// NUL byte: the parser takes one for the end of the text.
[[nodiscard]] nlohmann::json parse_line(std::string_view line);

/// Reads a request line and stores its id as soon as that is known, so that the answer to a faulty
/// request carries it. Throws RequestError "bad-json" or "bad-request".
[[nodiscard]] nlohmann::json parse_request(std::string_view line, nlohmann::json &id);

/// Answers, an event for peers or watchers, and the last line before the daemon ends a connection:
/// each a line, newline included. `id` is the request's, null when it has none.
[[nodiscard]] std::string result_line(const nlohmann::json &id, const nlohmann::json &result);
[[nodiscard]] std::string error_line(const nlohmann::json &id, const RequestError &error);
[[nodiscard]] std::string event_line(const nlohmann::json &event);
/// Tells a watcher that events were left out, because it did not read them.
[[nodiscard]] std::string gap_line(std::uint64_t left_out);
[[nodiscard]] std::string goodbye_line(const std::string &code, const std::string &message);

/// The "error" object of an answer, and back. What would make it unreadable is cut short: texts
/// have at most 4096 bytes, and details at most 200, of which the last one then tells how
/// many more there are. from_json throws nlohmann::json::exception when the
/// object is not one.
[[nodiscard]] nlohmann::json error_to_json(const RequestError &error);
[[nodiscard]] RequestError error_from_json(const nlohmann::json &error);

} // namespace ovhost

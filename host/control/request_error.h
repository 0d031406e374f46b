#pragma once
// The one way a request fails: a code for programs, a message for people, and, when several things
// are wrong, one detail for each. message.h turns it into an answer line and back.

#include <stdexcept>
#include <string>
#include <vector>

namespace ovhost
{

/// One thing that is wrong with a request. Fields that do not apply stay empty, or 0.
struct ErrorDetail {
    std::string node;
    std::string message;
    std::string module;
    long line = 0;

    bool operator==(const ErrorDetail &) const = default;
};

/// The codes an error answer can carry; docs/control-protocol.md tells when each is used.
namespace error_code
{
inline constexpr const char *bad_json = "bad-json";
inline constexpr const char *bad_request = "bad-request";
inline constexpr const char *too_long = "too-long";
inline constexpr const char *unknown_command = "unknown-command";
inline constexpr const char *not_found = "not-found";
inline constexpr const char *bad_value = "bad-value";
inline constexpr const char *bad_lines = "bad-lines";
inline constexpr const char *refused = "refused";
inline constexpr const char *busy = "busy";
inline constexpr const char *not_allowed = "not-allowed";
inline constexpr const char *internal = "internal";
} // namespace error_code

class RequestError : public std::runtime_error
{
  public:
    /// `message` becomes one line (printable.h): it may quote what a client has sent.
    RequestError(std::string code, const std::string &message,
                 std::vector<ErrorDetail> details = {});

    [[nodiscard]] const std::string &code() const { return code_; }
    [[nodiscard]] const std::vector<ErrorDetail> &details() const { return details_; }

  private:
    std::string code_;
    std::vector<ErrorDetail> details_;
};

} // namespace ovhost

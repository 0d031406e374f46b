#pragma once
// What stands behind the control socket: server.h hands each request to a RequestHandler. Throwing
// RequestError (request_error.h) is how a handler refuses; arguments.h reads a request's arguments.

#include "host/control/request_error.h"

#include <nlohmann/json_fwd.hpp>
#include <sys/types.h>

#include <cstdint>
#include <string>

namespace ovhost
{

/// Who asks. `pid`, `uid` and `gid` are those the client had when it connected; `user` is the name
/// of `uid`, or its digits when the machine knows no name for it; `peer` is the name it registered
/// under, or empty.
struct ClientInfo {
    std::uint64_t number = 0;
    pid_t pid = 0;
    uid_t uid = 0;
    gid_t gid = 0;
    std::string user;
    std::string peer;
};

class RequestHandler
{
  public:
    virtual ~RequestHandler() = default;

    /// Answers one request, an object with a string "command" ("hello" never comes here). Throws
    /// RequestError to refuse; any other exception becomes an error answer "internal".
    [[nodiscard]] virtual nlohmann::json handle(const nlohmann::json &request,
                                                const ClientInfo &client) = 0;
};

} // namespace ovhost

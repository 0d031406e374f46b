#pragma once
// What clients can ask of the daemon: one handler for each command of docs/control-protocol.md.
// control/server.h brings the requests; configuration.h is what they are about. history_requests.h,
// library_requests.h, upgrade_requests.h and show.h have the answers of their own fields.

#include "host/control/request_handler.h"
#include "host/mgmtd/configuration.h"

#include <nlohmann/json_fwd.hpp>

#include <chrono>
#include <functional>
#include <vector>

namespace ovhost
{

struct PeerStatus; // control/server.h

/// What the handlers need to know of the daemon around them.
struct DaemonView {
    std::function<std::vector<PeerStatus>()> peers;
    /// Called before anything that may send events.
    std::function<void()> before_events;
    /// Called when a commit has been stored, or one need not wait for its confirmation any
    /// more: the time of undoing may be another, and those who watch have to be told.
    std::function<void()> after_commit = [] {};
};

class Requests : public RequestHandler
{
  public:
    Requests(Configuration &configuration, DaemonView daemon);

    [[nodiscard]] nlohmann::json handle(const nlohmann::json &request,
                                        const ClientInfo &client) override;

  private:
    struct Command;
    static const Command commands[];

    /// Carries out what may store a commit, and throws when nothing was stored.
    using Storing = nlohmann::json (*)(Configuration &configuration, const nlohmann::json &request,
                                       const ClientInfo &client);
    nlohmann::json store(Storing carry_out, const nlohmann::json &request,
                         const ClientInfo &client);

    nlohmann::json get(const nlohmann::json &request, const ClientInfo &client);
    nlohmann::json set(const nlohmann::json &request, const ClientInfo &client);
    nlohmann::json erase(const nlohmann::json &request, const ClientInfo &client);
    nlohmann::json load(const nlohmann::json &request, const ClientInfo &client);
    nlohmann::json discard(const nlohmann::json &request, const ClientInfo &client);
    nlohmann::json diff(const nlohmann::json &request, const ClientInfo &client);
    nlohmann::json check(const nlohmann::json &request, const ClientInfo &client);
    nlohmann::json commit(const nlohmann::json &request, const ClientInfo &client);
    nlohmann::json status(const nlohmann::json &request, const ClientInfo &client);
    nlohmann::json show(const nlohmann::json &request, const ClientInfo &client);
    nlohmann::json upgrade(const nlohmann::json &request, const ClientInfo &client);
    nlohmann::json history(const nlohmann::json &request, const ClientInfo &client);
    nlohmann::json rollback(const nlohmann::json &request, const ClientInfo &client);
    nlohmann::json confirm(const nlohmann::json &request, const ClientInfo &client);
    nlohmann::json enable(const nlohmann::json &request, const ClientInfo &client);
    nlohmann::json clear(const nlohmann::json &request, const ClientInfo &client);
    nlohmann::json alarm(const nlohmann::json &request, const ClientInfo &client);

    Configuration &configuration_;
    DaemonView daemon_;
    std::chrono::steady_clock::time_point started_ = std::chrono::steady_clock::now();
};

} // namespace ovhost

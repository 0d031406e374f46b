#pragma once
// What clients ask of the history of commits, and how they go back in it. requests.h has all other
// commands; docs/control-protocol.md tells them all.

#include "host/commit/report.h"
#include "host/store/commit_record.h"

#include <nlohmann/json_fwd.hpp>

#include <optional>

namespace ovhost
{

class Configuration;
class Store;
struct ClientInfo;

/// These throw RequestError for a request that makes no sense, for a commit that is not known, and
/// for one that is refused.
[[nodiscard]] nlohmann::json answer_history(const Configuration &configuration,
                                            const nlohmann::json &request);
[[nodiscard]] nlohmann::json answer_show_commit(Configuration &configuration,
                                                const nlohmann::json &request);
[[nodiscard]] nlohmann::json answer_past_diff(const Configuration &configuration,
                                              const nlohmann::json &request);
[[nodiscard]] nlohmann::json answer_commit(Configuration &configuration,
                                           const nlohmann::json &request, const ClientInfo &client);
[[nodiscard]] nlohmann::json answer_rollback(Configuration &configuration,
                                             const nlohmann::json &request,
                                             const ClientInfo &client);
[[nodiscard]] nlohmann::json answer_confirm(Configuration &configuration);

/// The note for a commit that a client asks for, with the arguments "comment" and "confirm".
[[nodiscard]] CommitNote client_note(const nlohmann::json &request, const ClientInfo &client);

/// The answer to a commit that was accepted. `waited` is what waited for its confirmation before.
[[nodiscard]] nlohmann::json commit_answer(const Configuration &configuration,
                                           const CommitReport &report,
                                           const std::optional<Wait> &waited);

/// What watchers are told of a stored commit; none when it is not in the history. The changes are
/// null when there are more than watchers could be made to wait for. Throws StoreError.
[[nodiscard]] std::optional<nlohmann::json> commit_event(const Store &store, std::uint64_t number);

/// What waits for its confirmation, or null.
[[nodiscard]] nlohmann::json wait_json(const Configuration &configuration);

} // namespace ovhost

#pragma once
// Reports each stored commit to those who watch (control/server.h), whoever made it: it looks at
// the history, not at the requests. history_requests.h answers for the past.

#include <nlohmann/json_fwd.hpp>

#include <cstdint>
#include <functional>

namespace ovhost
{

class Configuration;

class CommitWatch
{
  public:
    struct Watchers {
        std::function<bool()> any;
        std::function<void(const nlohmann::json &event)> report;
    };

    CommitWatch(const Configuration &configuration, Watchers watchers);

    /// Reports the commits since the last call, in their order. Commits that were stored while
    /// nobody watched are passed over. To be called after whatever may have stored one.
    void update();

  private:
    void report(std::uint64_t number);

    const Configuration &configuration_;
    Watchers watchers_;
    std::uint64_t told_ = 0;
};

} // namespace ovhost

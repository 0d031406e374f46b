#include "host/mgmtd/commit_watch.h"

#include "framework/logging.h"
#include "host/mgmtd/configuration.h"
#include "host/mgmtd/daemon_log.h"
#include "host/mgmtd/history_requests.h"
#include "host/store/store_error.h"

#include <nlohmann/json.hpp>

#include <string>

namespace ovhost
{

CommitWatch::CommitWatch(const Configuration &configuration, Watchers watchers)
    : configuration_(configuration), watchers_(std::move(watchers)),
      told_(configuration.commit_number())
{
}

void CommitWatch::update()
{
    const std::uint64_t last = configuration_.commit_number();
    while (told_ < last) {
        ++told_;
        if (watchers_.any()) {
            report(told_);
        }
    }
}

/// The commit stands whether it can be told or not.
void CommitWatch::report(std::uint64_t number)
{
    try {
        if (const auto event = commit_event(configuration_.store(), number)) {
            watchers_.report(*event);
        }
    } catch (const StoreError &error) {
        log_line(ov_log_warning,
                 "commit " + std::to_string(number) +
                     " is stored, but cannot be told to those who watch: " + error.what());
    }
}

} // namespace ovhost

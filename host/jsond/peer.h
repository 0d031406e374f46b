#pragma once
// The work of jsond: register with mgmtd as the peer "jsond" and write every event that comes.
// event_writer.h is where they go, backoff.h the pace of coming back.

#include "host/jsond/backoff.h"
#include "host/jsond/event_writer.h"

#include <functional>
#include <string>

namespace ovhost
{

struct JsondOptions {
    std::string socket;
    std::string output;
    bool retry = false;
};

class JsondPeer
{
  public:
    using Report = std::function<void(const std::string &message)>;

    /// `report` gets one line at a time about what happens to the connection. `stop_fd` becomes
    /// readable when it is time to end.
    JsondPeer(JsondOptions options, int stop_fd, EventWriter &writer, Backoff backoff,
              Report report);

    /// Works until told to stop (returns 0), or until there is nothing more to do (returns 1, the
    /// reason reported). Throws std::runtime_error when events cannot be written.
    [[nodiscard]] int run();

  private:
    enum class End { stopped, lost, replaced };

    [[nodiscard]] End serve_one_connection();
    void report_once(const std::string &message);
    [[nodiscard]] bool pause();
    [[nodiscard]] bool stop_wanted(int milliseconds) const;

    JsondOptions options_;
    int stop_fd_;
    EventWriter &writer_;
    Backoff backoff_;
    Report report_;
    std::string reported_;
};

} // namespace ovhost

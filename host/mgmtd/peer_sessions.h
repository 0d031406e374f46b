#pragma once
// The peers of the control socket as the library sees them: one session for each that is connected.

#include "host/framework/objects.h"

#include <map>
#include <memory>
#include <string>

namespace ovhost
{

class ControlServer;

class PeerSessions
{
  public:
    explicit PeerSessions(ControlServer &server);
    ~PeerSessions();
    PeerSessions(const PeerSessions &) = delete;
    PeerSessions &operator=(const PeerSessions &) = delete;

    /// Makes md_gcl_find_session find the peers that are connected now, and no others.
    void update();

  private:
    class Session;

    ControlServer &server_;
    std::map<std::string, std::unique_ptr<Session>> sessions_;
};

} // namespace ovhost

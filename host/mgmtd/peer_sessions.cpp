#include "host/mgmtd/peer_sessions.h"

#include "host/control/server.h"
#include "host/framework/sessions.h"
#include "host/modules/node_access.h"

#include <nlohmann/json.hpp>

#include <algorithm>

namespace ovhost
{
namespace
{

nlohmann::json to_json(const bn_request &request)
{
    auto bindings = nlohmann::json::array();
    for (const bn_binding &binding : request.bindings) {
        for (const auto &[id, value] : binding.attribs.attribs) {
            bindings.push_back(
                {{"name", binding.name}, {"type", type_name(value.type)}, {"value", value.text}});
        }
    }
    return {{"name", request.event_name}, {"bindings", std::move(bindings)}};
}

} // namespace

class PeerSessions::Session : public gcl_session
{
  public:
    Session(ControlServer &server, std::string peer) : server_(server), peer_(std::move(peer)) {}
    ~Session() override { close(); }
    Session(const Session &) = delete;
    Session &operator=(const Session &) = delete;

    void open() { register_session(peer_, *this); }
    void close() { unregister_session(peer_, *this); }

    bool send(const bn_request &request) override
    {
        const bool sent = server_.send_to_peer(peer_, to_json(request));
        // The rest of a commit finds no peer, instead of failing once for each change.
        if (!sent) {
            close();
        }
        return sent;
    }

  private:
    ControlServer &server_;
    std::string peer_;
};

PeerSessions::PeerSessions(ControlServer &server) : server_(server) {}

PeerSessions::~PeerSessions() = default;

void PeerSessions::update()
{
    std::erase_if(sessions_, [this](const auto &entry) { return !server_.has_peer(entry.first); });
    for (const PeerStatus &peer : server_.peers()) {
        auto &session = sessions_[peer.name];
        if (!session) {
            session = std::make_unique<Session>(server_, peer.name);
        }
        session->open();
    }
}

} // namespace ovhost

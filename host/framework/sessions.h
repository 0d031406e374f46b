#pragma once
// The peers that are connected at this moment: where md_gcl_find_session looks. The control
// socket's side puts a session in when a peer has said its name and takes it out when it goes.

#include "framework/bnode.h"

#include <string_view>

namespace ovhost
{

/// Makes the session the one of that peer. A peer that has come back before its old session was
/// seen to end takes the name over. The session stays the caller's.
void register_session(std::string_view peer_name, gcl_session &session);

/// Takes the session out, unless another one has taken the name over. To be called before the
/// session ends.
void unregister_session(std::string_view peer_name, const gcl_session &session);

/// Null when the peer is not connected.
[[nodiscard]] gcl_session *find_session(std::string_view peer_name);

} // namespace ovhost

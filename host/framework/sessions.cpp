#include "host/framework/sessions.h"

#include <functional>
#include <map>
#include <string>

namespace ovhost
{

namespace
{

using Sessions = std::map<std::string, gcl_session *, std::less<>>;

Sessions &sessions()
{
    static Sessions by_name;
    return by_name;
}

} // namespace

void register_session(std::string_view peer_name, gcl_session &session)
{
    sessions().insert_or_assign(std::string(peer_name), &session);
}

void unregister_session(std::string_view peer_name, const gcl_session &session)
{
    const auto entry = sessions().find(peer_name);
    if (entry != sessions().end() && entry->second == &session) {
        sessions().erase(entry);
    }
}

gcl_session *find_session(std::string_view peer_name)
{
    const auto entry = sessions().find(peer_name);
    return entry == sessions().end() ? nullptr : entry->second;
}

} // namespace ovhost

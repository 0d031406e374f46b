#pragma once
// What a daemon is to hold after a stream of random commits, worked out apart from it.
// kill_test.cpp makes the commits and kills the daemon in between.

#include <cstdint>
#include <map>
#include <random>
#include <set>
#include <string>
#include <utility>

namespace e2e
{

/// Full names with types and values.
using Nodes = std::map<std::string, std::pair<std::string, std::string>>;

inline constexpr const char *tunnels_root = "/ov/tunneld/tunnel/config/";
inline constexpr const char *acls_root = "/ov/tunneld/acl/config/";
inline constexpr const char *entries_root = "/ov/tunneld/route_map/config/map/";

class KillModel
{
  public:
    /// The lines of a `load` for a random change: tunnels, ACLs and map entries come and go, and a
    /// stamp of many nodes is set anew, which shows a commit that is there in part.
    [[nodiscard]] std::string edit(std::mt19937 &random);

    /// Everything that clients set, and the records of the ACLs that entries name; without the IDs
    /// of the tunnels.
    [[nodiscard]] Nodes nodes() const;

    [[nodiscard]] const std::set<std::string> &tunnels() const { return tunnels_; }
    [[nodiscard]] std::size_t references() const { return entries_.size(); }

  private:
    std::string turn_tunnel(std::mt19937 &random);
    std::string turn_entry(std::mt19937 &random);
    std::string turn_acl(std::mt19937 &random);
    std::string stamp();

    std::uint64_t stamp_ = 0;
    std::set<std::string> tunnels_;
    std::set<std::string> acls_;
    /// Map and priority to the ACL that the entry names.
    std::map<std::pair<std::string, std::string>, std::string> entries_;
};

} // namespace e2e

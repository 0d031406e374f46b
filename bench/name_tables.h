#pragma once
// The tables that are compared with walking_table.h's, each under the same operations: the
// library's and two hash maps.

#include "orvale/md_tunbin_ht.h"

#include <absl/container/flat_hash_map.h>
#include <absl/strings/string_view.h>

#include <string>
#include <unordered_map>

namespace ovbench
{

struct LibraryTable {
    static constexpr const char *name = "library";

    LibraryTable() { (void)tunbin_tunname_ht_init(); }

    void add(char *text, uint32 id) { tunbin_tunname_ht_add(text, id); }
    void del(char *text) { tunbin_tunname_ht_del(text); }
    [[nodiscard]] uint32 find(const char *text) const
    {
        uint32 id = TUNNEL_ID_NONE;
        (void)tunbin_tunname_ht_find(text, &id);
        return id;
    }
};

struct AbslTable {
    static constexpr const char *name = "absl";

    void add(const char *text, uint32 id) { map.emplace(absl::string_view(text), id); }
    void del(const char *text) { map.erase(absl::string_view(text)); }
    [[nodiscard]] uint32 find(const char *text) const
    {
        const auto found = map.find(absl::string_view(text));
        return found != map.end() ? found->second : TUNNEL_ID_NONE;
    }

    absl::flat_hash_map<std::string, uint32> map;
};

struct StdTable {
    static constexpr const char *name = "std";

    void add(const char *text, uint32 id) { map.emplace(text, id); }
    void del(const char *text) { map.erase(text); }
    [[nodiscard]] uint32 find(const char *text) const
    {
        const auto found = map.find(text);
        return found != map.end() ? found->second : TUNNEL_ID_NONE;
    }

    std::unordered_map<std::string, uint32> map;
};

} // namespace ovbench

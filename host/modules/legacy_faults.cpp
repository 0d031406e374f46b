#include "host/modules/legacy_faults.h"

#include "framework/errors.h"
#include "host/modules/node_access.h"
#include "orvale/md_xmap_common.h"

#include <algorithm>
#include <string_view>
#include <vector>

namespace ovhost
{
namespace
{

/// The library cuts the name of a field of an entry with an ACL behind 255 characters, and would
/// then remove another node.
constexpr std::size_t longest_match_root = 255 - std::string_view("/application").size();

/// The values in a legacy configuration hold no commas.
std::vector<std::string> split_pairs(const std::string &match_string)
{
    std::vector<std::string> pairs;
    for (std::size_t begin = 0; begin <= match_string.size();) {
        const std::size_t end = std::min(match_string.find(',', begin), match_string.size());
        pairs.push_back(match_string.substr(begin, end - begin));
        begin = end + 1;
    }
    return pairs;
}

std::size_t joined_size(const std::vector<LegacyPair> &pairs)
{
    std::size_t size = pairs.empty() ? 0 : pairs.size() - 1;
    for (const LegacyPair &pair : pairs) {
        size += pair.text.size();
    }
    return size;
}

std::string with_code(const std::string &fault, int err)
{
    const char *const text =
        lc_enum_to_string_quiet_null(lc_error_code_map, static_cast<uint32>(err));
    return fault + " (error code " + std::to_string(err) +
           (text != nullptr ? std::string(", ") + text : "") + ")";
}

} // namespace

std::optional<std::string> fault_before_conversion(const mdb_db &legacy, const LegacyEntry &entry)
{
    if (node_text(&legacy, entry.match_root + "/matchstr")) {
        return "it has a match string already; give a file whose entries are all of the older form";
    }
    if (entry.match_root.size() > longest_match_root) {
        return "its names are too long: an upgrade takes " + std::to_string(longest_match_root) +
               " characters up to here";
    }
    if (const auto unknown = unknown_legacy_field(legacy, entry)) {
        return "an upgrade knows no field \"" + *unknown +
               "\", and without it the entry would match more; mend its name, or remove it";
    }
    return std::nullopt;
}

bool is_converted(const mdb_db &converted, const LegacyEntry &entry)
{
    return matches_by_acl(converted, entry)
               ? !node_text(&converted, entry.match_root + "/application").has_value()
               : node_text(&converted, entry.match_root + "/matchstr").has_value();
}

std::optional<std::string> loss_fault(const mdb_db &legacy, const mdb_db &converted,
                                      const LegacyEntry &entry)
{
    if (matches_by_acl(legacy, entry)) {
        return std::nullopt;
    }
    const std::vector<LegacyPair> wanted = legacy_pairs(legacy, entry);
    const std::vector<std::string> present = split_pairs(legacy_text(converted, entry, "matchstr"));
    std::string lost;
    for (const LegacyPair &pair : wanted) {
        if (std::ranges::find(present, pair.text) == present.end()) {
            lost += (lost.empty() ? "" : ", ") + pair.key;
        }
    }
    return lost.empty() ? std::nullopt
                        : std::optional("its match string would lack " + lost +
                                        ", and the entry would match more: it needs " +
                                        std::to_string(joined_size(wanted)) +
                                        " characters, and there is room for " +
                                        std::to_string(MD_XMAP_MATCHSTR_SIZE - 1));
}

std::string failure_message(const mdb_db &legacy, const LegacyEntry &entry, int err)
{
    if (err == 0) {
        return "it was not converted: an upgrade takes no map whose name holds a slash or a "
               "backslash";
    }
    const auto fault = mask_fault(legacy, entry);
    return fault ? with_code(*fault, err) : failure_message(err);
}

std::string failure_message(int err)
{
    return with_code("it cannot be converted", err);
}

} // namespace ovhost

#include "host/framework/match_string.h"

#include "framework/appliance.h"
#include "host/framework/c_boundary.h"
#include "host/framework/objects.h"
#include "host/tree/value_type.h"
#include "orvale/md_xmap_common.h"
#include "orvale/opkt_proto.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <memory>
#include <utility>

namespace ovhost
{

namespace
{

std::optional<unsigned> parse_number(std::string_view text, unsigned largest)
{
    unsigned number = 0;
    const auto [end, fault] = std::from_chars(text.data(), text.data() + text.size(), number);
    const bool is_number = fault == std::errc() && end == text.data() + text.size();
    return is_number && number <= largest ? std::optional(number) : std::nullopt;
}

bool is_text(std::string_view value)
{
    return !value.empty();
}

bool is_prefix(std::string_view value)
{
    return !value_fault(bt_ipprefix, value);
}

bool is_port_or_range(std::string_view value)
{
    constexpr unsigned largest_port = 65535;
    const std::size_t dash = value.find('-');
    const auto first = parse_number(value.substr(0, dash), largest_port);
    if (dash == std::string_view::npos) {
        return first.has_value();
    }
    const auto last = parse_number(value.substr(dash + 1), largest_port);
    return first && last && *first <= *last;
}

/// One component of a pattern that stands for itself alone. Neither labels nor VLANs have slashes
/// or backslashes in their names, so that there is nothing to escape.
bool is_label(std::string_view value)
{
    return !value.empty() && value.size() <= longest_label && value != "*" &&
           value.find_first_of("/\\") == std::string_view::npos;
}

bool is_protocol(std::string_view value)
{
    const auto has_name = [value](const lc_enum_string_map &row) {
        return row.lesm_string != nullptr && value == row.lesm_string;
    };
    return parse_number(value, 255) || std::ranges::any_of(opkt_proto_map, has_name);
}

bool is_dscp(std::string_view value)
{
    constexpr std::array<std::string_view, 22> names = {
        "any",  "ef",   "cs0",  "cs1",  "cs2",  "cs3",  "cs4",  "cs5",  "cs6",  "cs7",  "af11",
        "af12", "af13", "af21", "af22", "af23", "af31", "af32", "af33", "af41", "af42", "af43",
    };
    return parse_number(value, 63) || std::ranges::find(names, value) != names.end();
}

struct MatchKey {
    std::string_view name;
    bool (*accepts)(std::string_view value);
    std::string_view expected;
};

constexpr std::size_t longest_match_string = MD_XMAP_MATCHSTR_SIZE - 1;

constexpr std::string_view any_text = "a text that is not empty";
constexpr std::string_view a_prefix = "an address and a mask length, such as 10.1.0.0/16";
static_assert(longest_label == 233);
constexpr std::string_view a_label =
    "a label or a VLAN's name: 1 to 233 bytes without slash and backslash, and not * alone";
constexpr std::string_view a_port = "a port from 0 to 65535 or a range such as 8000-8080";

constexpr std::array<MatchKey, 10> match_keys = {{
    {"application", is_text, any_text},
    {"app_group", is_text, any_text},
    {"tbehavior", is_text, any_text},
    {"src_ip", is_prefix, a_prefix},
    {"dst_ip", is_prefix, a_prefix},
    {"src_port", is_port_or_range, a_port},
    {"dst_port", is_port_or_range, a_port},
    {"vlan", is_label, a_label},
    {"protocol", is_protocol, "a number from 0 to 255 or a protocol's name such as tcp"},
    {"dscp", is_dscp, "a number from 0 to 63, cs0 to cs7, af11 to af43, ef or any"},
}};

bool equal_ignoring_case(std::string_view left, std::string_view right)
{
    const auto lower = [](char character) {
        return character >= 'A' && character <= 'Z' ? static_cast<char>(character - 'A' + 'a')
                                                    : character;
    };
    return std::ranges::equal(left, right, {}, lower, lower);
}

const MatchKey *find_key(std::string_view name)
{
    const auto row = std::ranges::find_if(
        match_keys, [name](const MatchKey &key) { return equal_ignoring_case(key.name, name); });
    return row == match_keys.end() ? nullptr : &*row;
}

std::string known_keys()
{
    std::string names;
    for (const MatchKey &key : match_keys) {
        names += names.empty() ? "" : ", ";
        names += key.name;
    }
    return names;
}

/// Adds one pair; what is wrong with it if it cannot be added.
std::optional<std::string> add_pair(std::string_view pair, MatchString &match)
{
    const std::size_t colon = pair.find(':');
    if (colon == std::string_view::npos) {
        return "it has no colon; write key:value";
    }
    const std::string_view name = pair.substr(0, colon);
    const std::string_view value = pair.substr(colon + 1);
    const MatchKey *key = find_key(name);
    if (key == nullptr) {
        return std::string("the key is not one of ").append(known_keys());
    }
    const auto is_present = [name](const std::string &present) {
        return equal_ignoring_case(present, name);
    };
    if (std::ranges::any_of(match.keys, is_present)) {
        return "the key stands in an earlier pair already";
    }
    if (!key->accepts(value)) {
        return std::string("the value must be ").append(key->expected);
    }
    match.keys.emplace_back(name);
    match.values.emplace_back(value);
    return std::nullopt;
}

} // namespace

std::optional<std::string> parse_match_string(std::string_view text, MatchString &match)
{
    if (text.empty()) {
        return "it is empty; write key:value pairs joined by commas, or any";
    }
    if (text.size() > longest_match_string) {
        return std::string("it is longer than ")
            .append(std::to_string(longest_match_string))
            .append(" characters");
    }
    MatchString parsed;
    if (text != "any") {
        for (std::size_t begin = 0; begin <= text.size();) {
            const std::size_t end = std::min(text.find(',', begin), text.size());
            const std::string_view pair = text.substr(begin, end - begin);
            if (const auto fault = add_pair(pair, parsed)) {
                return std::string("pair \"").append(pair).append("\": ").append(*fault);
            }
            begin = end + 1;
        }
    }
    match = std::move(parsed);
    return std::nullopt;
}

} // namespace ovhost

int ov_acl_validate_matchstr(const char *matchstr, tstr_array **keys, tstr_array **values,
                             char **reason)
{
    for (tstr_array **list : {keys, values}) {
        if (list != nullptr) {
            *list = nullptr;
        }
    }
    if (reason != nullptr) {
        *reason = nullptr;
    }
    if (matchstr == nullptr || keys == nullptr || values == nullptr) {
        return lc_err_unexpected_null;
    }
    return ovhost::at_c_boundary([&]() -> int {
        ovhost::MatchString match;
        if (const auto fault = ovhost::parse_match_string(matchstr, match)) {
            // Without memory for the reason the answer still is that the string is not valid.
            if (reason != nullptr) {
                (void)ovhost::hand_out_text(reason, *fault);
            }
            return lc_err_parse_error;
        }
        auto key_list = std::make_unique<tstr_array>(match.keys);
        auto value_list = std::make_unique<tstr_array>(match.values);
        *keys = key_list.release();
        *values = value_list.release();
        return lc_err_no_error;
    });
}

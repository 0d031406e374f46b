// The conversion of maps of the older form; fault_rows_xmap_match.cpp has its lesser edits.
#include "orvale/md_xmap_common.h"
#include "tests/library/fault_rows.h"
#include "tests/library/map_changes.h"

#include <span>

namespace ovtest
{

namespace
{

const UnitLines unit("md_xmap_common");

constexpr char upgrade_function[] = "md_xmap_upgrade_to_pattern_match";

const std::string match_node = "/ov/tunneld/route_map/config/map/m/prio/10/match/0/";

// A field of an entry in the older form, in the order in which the upgrade visits them; those
// without a value are absent.
struct Field {
    const char *node;
    const char *value;
};

using Fields = std::vector<Field>;

constexpr std::size_t num_fields = 13;

const Fields &ipv4_fields()
{
    static const Fields fields = {
        {"application", "web"},
        {"ipver", "ipv4"},
        {"source/addr/ipv6/static/ipv6prefix", nullptr},
        {"dest/addr/ipv6/static/ipv6prefix", nullptr},
        {"source/addr/ipv4/static/ipaddr", "10.0.0.0"},
        {"source/addr/ipv4/static/mask_len", "255.0.0.0"},
        {"dest/addr/ipv4/static/ipaddr", "10.1.0.0"},
        {"dest/addr/ipv4/static/mask_len", "16"},
        {"src/port", "1"},
        {"dest/port", "2"},
        {"vlan", "wan0"},
        {"protocol", "tcp"},
        {"dscp", "ef"},
    };
    return fields;
}

const Fields &ipv6_fields()
{
    static const Fields fields = {
        {"application", nullptr},
        {"ipver", "ipv6"},
        {"source/addr/ipv6/static/ipv6prefix", "2001:db8::/32"},
        {"dest/addr/ipv6/static/ipv6prefix", "::1/128"},
        {"source/addr/ipv4/static/ipaddr", nullptr},
        {"source/addr/ipv4/static/mask_len", nullptr},
        {"dest/addr/ipv4/static/ipaddr", nullptr},
        {"dest/addr/ipv4/static/mask_len", nullptr},
        {"src/port", nullptr},
        {"dest/port", nullptr},
        {"vlan", nullptr},
        {"protocol", nullptr},
        {"dscp", nullptr},
    };
    return fields;
}

template <const Fields &(*fields)()>
void with_fields(HostFixture &host)
{
    for (const Field &field : fields()) {
        if (field.value != nullptr) {
            host.set(match_node + field.node, bt_string, field.value);
        }
    }
}

// Status, the old nodes that the entry still has, and its match string.
std::string upgraded(HostFixture &host)
{
    mdb_db db = *host.db();
    db.writable = true;
    const int status = in_library(md_xmap_upgrade_to_pattern_match, &db, host.db(), MAP_TYPE_R);
    std::string kept;
    std::string match_string;
    const std::string new_node = match_node + "matchstr string ";
    kept += nodes(db, match_node + "acl").empty() ? "" : " acl";
    for (const Field &field : ipv4_fields()) {
        kept += nodes(db, match_node + field.node).empty() ? "" : std::string(" ") + field.node;
    }
    for (const std::string &node : nodes(db, match_node + "matchstr")) {
        match_string = ", match string " + node.substr(new_node.size());
    }
    return std::to_string(status) + ", kept:" + kept + match_string;
}

ExpectedLine converted(const std::string &match_string)
{
    return gated(6, "Converted match string " + match_string);
}

// The present fields from `begin` to before `end`, as they stand in the answer.
std::string kept(const Fields &fields, std::size_t begin, std::size_t end = num_fields)
{
    std::string text = ", kept:";
    for (std::size_t i = begin; i < end && i < num_fields; ++i) {
        if (fields[i].value != nullptr) {
            text += std::string(" ") + fields[i].node;
        }
    }
    return text;
}

Outcome finished(const std::string &match_string)
{
    return {"0, kept:, match string " + match_string, {converted(match_string)}};
}

Outcome failed(const Fields &fields, std::size_t first_kept)
{
    return {"{code}" + kept(fields, first_kept), {unit.bail(upgrade_function)}};
}

// What comes of lists and writes that fail is the same for all entries that are converted.
std::vector<FailureRow> common_failures(const Fields &fields, const std::string &match_string)
{
    const Lines at_end = {converted(match_string), unit.bail(upgrade_function)};
    return {{fails(Operation::mdb_get_tstr_array), failed(fields, 0)},
            {hands_out_nothing(Operation::mdb_get_tstr_array), {"0" + kept(fields, 0)}},
            {fails(Operation::bn_binding_new_str), {"{code}, kept:", at_end}},
            {hands_out_nothing(Operation::bn_binding_new_str),
             {"14001, kept:", {converted(match_string), unit.unexpected_null(upgrade_function)}}}};
}

// Each failing removal is told, and the field stays.
std::vector<FailureRow> removal_failures(const Fields &fields, const std::string &match_string)
{
    const Lines told = {unit.bail("md_xmap_delete_match_binding"),
                        unit.passed_over(upgrade_function)};
    const std::string end = ", match string " + match_string;
    const auto once = [](Operation operation, std::size_t call, FaultWay way = FaultWay::fails) {
        return When{operation, static_cast<unsigned>(call), When::Lasting::once, way};
    };
    const auto from = [](Operation operation, std::size_t call, FaultWay way = FaultWay::fails) {
        return When{operation, static_cast<unsigned>(call), When::Lasting::and_later, way};
    };
    std::vector<FailureRow> failures;
    std::size_t num_present = 0;
    for (std::size_t i = 0; i < num_fields; ++i) {
        Lines told_from_here;
        Lines told_of_present;
        for (std::size_t j = i; j < num_fields; ++j) {
            told_from_here = told_from_here + told;
            told_of_present = told_of_present + (fields[j].value != nullptr ? told : Lines{});
        }
        const Lines ends = {converted(match_string)};
        const std::string one_kept = "0" + kept(fields, i, i + 1) + end;
        const std::string all_kept = "0" + kept(fields, i) + end;
        const auto get = Operation::mdb_get_node_binding;
        const auto set = Operation::mdb_set_node_binding;
        failures.insert(failures.end(),
                        {{once(get, i + 1), {one_kept, told + ends}},
                         {from(get, i + 1), {all_kept, told_from_here + ends}},
                         {once(get, i + 1, FaultWay::without_object), {one_kept, ends}},
                         {from(get, i + 1, FaultWay::without_object), {all_kept, ends}}});
        if (fields[i].value != nullptr) {
            ++num_present;
            failures.push_back({once(set, num_present), {one_kept, told + ends}});
            // The match string cannot be written either.
            failures.push_back({from(set, num_present),
                                {"{code}" + kept(fields, i),
                                 told_of_present + ends + Lines{unit.bail(upgrade_function)}}});
        }
    }
    failures.push_back(
        {fails(Operation::mdb_set_node_binding, static_cast<unsigned>(num_present) + 1),
         {"{code}, kept:", {converted(match_string), unit.bail(upgrade_function)}}});
    return failures;
}

// A read that hands out nothing: the match string when it is one read, and when all later ones do
// the same.
struct AbsentRead {
    unsigned call;
    const char *once;
    const char *from;
};

std::vector<FailureRow> absent_reads(std::span<const AbsentRead> reads)
{
    std::vector<FailureRow> failures;
    for (const AbsentRead &read : reads) {
        const auto operation = Operation::mdb_get_node_value_tstr;
        failures.push_back({{operation, read.call, When::Lasting::once, FaultWay::without_object},
                            finished(read.once)});
        failures.push_back(
            {{operation, read.call, When::Lasting::and_later, FaultWay::without_object},
             finished(read.from)});
    }
    return failures;
}

void append(std::vector<FailureRow> &failures, const std::vector<FailureRow> &further)
{
    failures.insert(failures.end(), further.begin(), further.end());
}

constexpr char ipv4_string[] = "application:web,src_ip:10.0.0.0/8,dst_ip:10.1.0.0/16,"
                               "src_port:1,dst_port:2,vlan:wan0,protocol:tcp,dscp:ef";

constexpr AbsentRead ipv4_absent_reads[] = {
    {1, ipv4_string, "any"},
    {2,
     "src_ip:10.0.0.0/8,dst_ip:10.1.0.0/16,src_port:1,dst_port:2,vlan:wan0,protocol:tcp,"
     "dscp:ef",
     "any"},
    {3, "application:web,src_port:1,dst_port:2,vlan:wan0,protocol:tcp,dscp:ef", "application:web"},
    {4,
     "application:web,src_ip:0.0.0.0/0,dst_ip:10.1.0.0/16,src_port:1,dst_port:2,vlan:wan0,"
     "protocol:tcp,dscp:ef",
     "application:web,src_ip:0.0.0.0/0,dst_ip:0.0.0.0/0"},
    {6,
     "application:web,src_ip:10.0.0.0/8,dst_ip:0.0.0.0/0,src_port:1,dst_port:2,vlan:wan0,"
     "protocol:tcp,dscp:ef",
     "application:web,src_ip:10.0.0.0/8,dst_ip:0.0.0.0/0"},
    {8,
     "application:web,src_ip:10.0.0.0/8,dst_ip:10.1.0.0/16,dst_port:2,vlan:wan0,"
     "protocol:tcp,dscp:ef",
     "application:web,src_ip:10.0.0.0/8,dst_ip:10.1.0.0/16"},
    {9,
     "application:web,src_ip:10.0.0.0/8,dst_ip:10.1.0.0/16,src_port:1,vlan:wan0,"
     "protocol:tcp,dscp:ef",
     "application:web,src_ip:10.0.0.0/8,dst_ip:10.1.0.0/16,src_port:1"},
    {10,
     "application:web,src_ip:10.0.0.0/8,dst_ip:10.1.0.0/16,src_port:1,dst_port:2,"
     "protocol:tcp,dscp:ef",
     "application:web,src_ip:10.0.0.0/8,dst_ip:10.1.0.0/16,src_port:1,dst_port:2"},
    {11,
     "application:web,src_ip:10.0.0.0/8,dst_ip:10.1.0.0/16,src_port:1,dst_port:2,vlan:wan0,"
     "dscp:ef",
     "application:web,src_ip:10.0.0.0/8,dst_ip:10.1.0.0/16,src_port:1,dst_port:2,"
     "vlan:wan0"},
    {12,
     "application:web,src_ip:10.0.0.0/8,dst_ip:10.1.0.0/16,src_port:1,dst_port:2,vlan:wan0,"
     "protocol:tcp",
     "application:web,src_ip:10.0.0.0/8,dst_ip:10.1.0.0/16,src_port:1,dst_port:2,vlan:wan0,"
     "protocol:tcp"},
};

FaultRow ipv4_row()
{
    const std::string whole = ipv4_string;
    const Fields &fields = ipv4_fields();
    std::vector<FailureRow> failures = common_failures(fields, whole);
    append(failures, removal_failures(fields, whole));
    // The first read is of the ACL, the others of the fields but for the two IPv6 prefixes.
    const std::size_t first_kept[] = {0, 0, 1, 4, 5, 6, 7, 8, 9, 10, 11, 12};
    for (unsigned i = 0; i < std::size(first_kept); ++i) {
        failures.push_back(
            {fails(Operation::mdb_get_node_value_tstr, i + 1), failed(fields, first_kept[i])});
    }
    failures.push_back({fails(Operation::lc_mask_or_masklen_to_masklen_str, 1), failed(fields, 6)});
    failures.push_back({fails(Operation::lc_mask_or_masklen_to_masklen_str, 2), failed(fields, 8)});
    const Lines null = {unit.unexpected_null(upgrade_function)};
    failures.push_back({hands_out_nothing(Operation::lc_mask_or_masklen_to_masklen_str, 1),
                        {"14001" + kept(fields, 6), null}});
    failures.push_back({hands_out_nothing(Operation::lc_mask_or_masklen_to_masklen_str, 2),
                        {"14001" + kept(fields, 8), null}});
    // Without a mask there is none to convert.
    failures.push_back({hands_out_nothing(Operation::mdb_get_node_value_tstr, 5),
                        {"14001" + kept(fields, 6), {unit.bail(upgrade_function, 14001)}}});
    failures.push_back({hands_out_nothing(Operation::mdb_get_node_value_tstr, 7),
                        {"14001" + kept(fields, 8), {unit.bail(upgrade_function, 14001)}}});
    append(failures, absent_reads(ipv4_absent_reads));
    return {upgrade_function, "of_ipv4",       with_fields<ipv4_fields>,
            upgraded,         finished(whole), failures};
}

constexpr char ipv6_string[] = "src_ip:2001:db8::/32,dst_ip:::1/128";

// Those behind the addresses are absent anyway.
constexpr AbsentRead ipv6_absent_reads[] = {
    {1, ipv6_string, "any"},
    {2, ipv6_string, "any"},
    {3, "any", "any"},
    {4, "src_ip:::/0,dst_ip:::1/128", "src_ip:::/0,dst_ip:::/0"},
    {5, "src_ip:2001:db8::/32,dst_ip:::/0", "src_ip:2001:db8::/32,dst_ip:::/0"},
};

FaultRow ipv6_row()
{
    const std::string whole = ipv6_string;
    const Fields &fields = ipv6_fields();
    std::vector<FailureRow> failures = common_failures(fields, whole);
    append(failures, removal_failures(fields, whole));
    // The ACL, the application, the version, the two prefixes, and what stands behind addresses.
    const std::size_t first_kept[] = {0, 0, 1, 2, 3, 8, 9, 10, 11, 12};
    for (unsigned i = 0; i < std::size(first_kept); ++i) {
        failures.push_back(
            {fails(Operation::mdb_get_node_value_tstr, i + 1), failed(fields, first_kept[i])});
    }
    append(failures, absent_reads(ipv6_absent_reads));
    failures.push_back({hands_out_nothing(Operation::mdb_get_node_value_tstr), finished(whole)});
    return {upgrade_function, "of_ipv6",       with_fields<ipv6_fields>,
            upgraded,         finished(whole), failures};
}

FaultRow acl_row()
{
    // That the application stays is told whatever the code, and is no end of the upgrade.
    const Lines told = {unit.bail("md_xmap_delete_match_binding"),
                        unit.bail("md_xmap_delete_match_entries"), unit.told(upgrade_function)};
    const Lines bail = {unit.bail(upgrade_function)};
    const auto get = Operation::mdb_get_node_binding;
    const auto read = Operation::mdb_get_node_value_tstr;
    return {upgrade_function,
            "of_an_entry_with_an_acl",
            [](HostFixture &host) {
                host.set(match_node + "acl", bt_string, "office");
                host.set(match_node + "application", bt_string, "web");
            },
            upgraded,
            {"0, kept: acl"},
            {{fails(Operation::mdb_get_tstr_array), {"{code}, kept: acl application", bail}},
             {hands_out_nothing(Operation::mdb_get_tstr_array), {"0, kept: acl application"}},
             {fails(read), {"{code}, kept: acl application", bail}},
             {{read, 1, When::Lasting::once, FaultWay::without_object},
              {"0, kept: acl, match string application:web", {converted("application:web")}}},
             {{read, 1, When::Lasting::and_later, FaultWay::without_object},
              {"0, kept: acl, match string any", {converted("any")}}},
             {fails(get, 1), {"{code}, kept: acl application", told}},
             {fails(get), {"{code}, kept: acl", told}},
             {{get, 1, When::Lasting::and_later, FaultWay::without_object},
              {"0, kept: acl application"}},
             {hands_out_nothing(get), {"0, kept: acl"}},
             {fails(Operation::mdb_set_node_binding), {"{code}, kept: acl application", told}}}};
}

} // namespace

std::vector<FaultRow> xmap_upgrade_rows()
{
    return {ipv4_row(), ipv6_row(), acl_row()};
}

} // namespace ovtest

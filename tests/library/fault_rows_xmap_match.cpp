// Match strings, the older form of a match, and the guards of interfaces and VLANs.
#include "orvale/md_xmap_common.h"
#include "tests/library/fault_rows.h"
#include "tests/library/map_changes.h"

namespace ovtest
{

namespace
{

const UnitLines unit("md_xmap_common");

const std::string route_root = "/ov/tunneld/route_map/config/map";
const std::string match_node = route_root + "/m/prio/10/match/0/";

using Lines = std::vector<ExpectedLine>;

Lines operator+(Lines lines, const Lines &further)
{
    lines.insert(lines.end(), further.begin(), further.end());
    return lines;
}

// A proposed database that is still what the old one was.
mdb_db writable_copy(HostFixture &host)
{
    mdb_db copy = *host.db();
    copy.writable = true;
    return copy;
}

md_dbinfo dbinfo_of(HostFixture &host)
{
    return {.commit = &host.commit(), .olddb = host.db(), .newdb = host.db()};
}

void nothing(HostFixture &) {}

std::string validated(HostFixture &host, const char *match_string)
{
    md_dbinfo dbinfo = dbinfo_of(host);
    tbool valid = false;
    const int status = in_library(md_xmap_validate_match_str, &dbinfo, match_string, &valid);
    return std::to_string(status) + (valid ? " valid, " : " not valid, ") +
           std::to_string(host.commit().refusals.size()) + " refused";
}

std::vector<FaultRow> validation_rows()
{
    const char *const function = "md_xmap_validate_match_str";
    const Lines label_failed = {unit.bail("md_xmap_iflabel_check")};
    return {
        {function,
         "of_a_vlan",
         nothing,
         [](HostFixture &host) { return validated(host, "vlan:vlan7"); },
         {"0 valid, 0 refused"},
         {{fails(Operation::ov_acl_validate_matchstr), {"0 not valid, 1 refused"}},
          {fails(Operation::mdb_get_matching_tstr_array), {"0 valid, 0 refused", label_failed}},
          {hands_out_nothing(Operation::mdb_get_matching_tstr_array), {"0 valid, 0 refused"}},
          {fails(Operation::ovlan_valid_name_check),
           {"-1 valid, 0 refused", {unit.bail(function, -1)}}}}},
        {function,
         "of_a_bad_pair",
         nothing,
         [](HostFixture &host) { return validated(host, "colour:red"); },
         {"0 not valid, 1 refused"},
         {{fails(Operation::ov_acl_validate_matchstr), {"0 not valid, 1 refused"}},
          {fails(Operation::md_commit_set_return_status_msg_fmt),
           {"{code} valid, 0 refused", {unit.bail(function)}}}}},
        {"md_xmap_vlan_check",
         "of_a_vlan",
         nothing,
         [](HostFixture &host) {
             return std::to_string(in_library(md_xmap_vlan_check, host.db(), "vlan7"));
         },
         {"0"},
         {{fails(Operation::mdb_get_matching_tstr_array), {"0", label_failed}},
          {hands_out_nothing(Operation::mdb_get_matching_tstr_array), {"0"}},
          {fails(Operation::ovlan_valid_name_check), {"-1"}}}},
        {"md_xmap_iflabel_check",
         "of_a_label",
         [](HostFixture &host) { host.set("/ov/iflabels/config/wan/mpls", bt_string, "x"); },
         [](HostFixture &host) -> std::string {
             return in_library(md_xmap_iflabel_check, "mpls", host.db()) ? "yes" : "no";
         },
         {"yes"},
         {{fails(Operation::mdb_get_matching_tstr_array), {"no", label_failed}},
          {hands_out_nothing(Operation::mdb_get_matching_tstr_array), {"no"}}}},
        {"md_xmap_concat_key_value",
         "of_a_second_pair",
         nothing,
         [](HostFixture &) {
             char buffer[32] = "dscp:ef";
             const int status =
                 in_library(md_xmap_concat_key_value, buffer, sizeof buffer, "vlan", "wan0");
             return std::to_string(status) + ' ' + buffer;
         },
         {"0 dscp:ef,vlan:wan0"}},
    };
}

FaultRow ipver_row()
{
    const char *const function = "md_xmap_add_ipver";
    const ExpectedLine one_map = gated(6, "md_xmap_add_ipver: num maps: 1");
    const ExpectedLine two_entries = gated(6, "md_xmap_add_ipver: num prios for m: 2");
    const ExpectedLine prio = unit.debug(function, "smprintf=" + route_root + "/m/prio");
    const ExpectedLine first =
        unit.debug(function, "smprintf=" + route_root + "/m/prio/10/match/0/ipver");
    const ExpectedLine second =
        unit.debug(function, "smprintf=" + route_root + "/m/prio/65535/match/0/ipver");
    const ExpectedLine bail = unit.bail(function);
    const ExpectedLine null = unit.unexpected_null(function);
    const Lines at_first = {one_map, prio, two_entries, first};
    const Lines at_second = at_first + Lines{second};
    return {function,
            "of_two_entries",
            [](HostFixture &host) {
                host.set(route_root + "/m/prio/10/seq", bt_string, "x");
                host.set(route_root + "/m/prio/65535/seq", bt_string, "x");
            },
            [](HostFixture &host) {
                mdb_db db = writable_copy(host);
                std::string answer =
                    std::to_string(in_library(md_xmap_add_ipver, &db, route_root.c_str()));
                for (const char *priority : {"10", "65535"}) {
                    const std::string entry = route_root + "/m/prio/" + priority + "/match/0/ipver";
                    for (const std::string &node : nodes(db, entry)) {
                        answer += std::string(", ") + priority + node.substr(entry.size());
                    }
                }
                return answer;
            },
            {"0, 10 string ipv4, 65535 string any", at_second},
            {{fails(Operation::mdb_get_tstr_array, 1), {"{code}", {bail}}},
             {fails(Operation::mdb_get_tstr_array, 2), {"{code}", {one_map, prio, bail}}},
             {hands_out_nothing(Operation::mdb_get_tstr_array, 1),
              {"0", {gated(6, "md_xmap_add_ipver: num maps: 0")}}},
             {hands_out_nothing(Operation::mdb_get_tstr_array, 2),
              {"0", {one_map, prio, gated(6, "md_xmap_add_ipver: num prios for m: 0")}}},
             {fails(Operation::smprintf, 1), {"14001", {one_map, null}}},
             {fails(Operation::smprintf, 2), {"14001", {one_map, prio, two_entries, null}}},
             {fails(Operation::smprintf, 3), {"14001, 10 string ipv4", at_first + Lines{null}}},
             {fails_once(Operation::lc_log_check_level, 1),
              {"0, 10 string ipv4, 65535 string any", {one_map, two_entries, first, second}}},
             {fails_once(Operation::lc_log_check_level, 2),
              {"0, 10 string ipv4, 65535 string any", {one_map, prio, two_entries, second}}},
             {fails_from(Operation::lc_log_check_level, 1),
              {"0, 10 string ipv4, 65535 string any", {one_map, two_entries}}},
             {fails_from(Operation::lc_log_check_level, 2),
              {"0, 10 string ipv4, 65535 string any", {one_map, prio, two_entries}}},
             {fails(Operation::lc_log_check_level, 3),
              {"0, 10 string ipv4, 65535 string any", at_first}},
             {fails(Operation::bn_binding_new_str, 1), {"{code}", at_first + Lines{bail}}},
             {fails(Operation::bn_binding_new_str, 2),
              {"{code}, 10 string ipv4", at_second + Lines{bail}}},
             {fails(Operation::mdb_set_node_binding, 1), {"{code}", at_first + Lines{bail}}},
             {fails(Operation::mdb_set_node_binding, 2),
              {"{code}, 10 string ipv4", at_second + Lines{bail}}}}};
}

void with_application(HostFixture &host)
{
    host.set(match_node + "application", bt_string, "web");
}

std::string left_in(const mdb_db &db)
{
    return nodes(db, match_node + "application").empty() ? " gone" : " there";
}

std::vector<FaultRow> removal_rows()
{
    const char *const function = "md_xmap_delete_match_binding";
    const Lines logged = {unit.bail(function)};
    const Lines logged_twice = {unit.bail(function), unit.bail("md_xmap_delete_match_entries")};
    return {
        {function,
         "of_a_node",
         with_application,
         [](HostFixture &host) {
             mdb_db db = writable_copy(host);
             const int status = in_library(md_xmap_delete_match_binding, &db,
                                           (match_node + "application").c_str());
             return std::to_string(status) + left_in(db);
         },
         {"0 gone"},
         {{fails(Operation::mdb_get_node_binding), {"{code} there", logged}},
          {hands_out_nothing(Operation::mdb_get_node_binding), {"0 there"}},
          {fails(Operation::mdb_set_node_binding), {"{code} there", logged}}}},
        {"md_xmap_delete_match_entries",
         "of_an_entry",
         with_application,
         [](HostFixture &host) {
             mdb_db db = writable_copy(host);
             const std::string match_root = match_node.substr(0, match_node.size() - 1);
             const int status =
                 in_library(md_xmap_delete_match_entries, &db, MAP_TYPE_R, match_root.c_str());
             return std::to_string(status) + left_in(db);
         },
         {"0 gone"},
         {{fails(Operation::mdb_get_node_binding, 1), {"{code} there", logged_twice}},
          {fails(Operation::mdb_get_node_binding), {"{code} gone", logged_twice}},
          {{Operation::mdb_get_node_binding, 1, When::Lasting::and_later, FaultWay::without_object},
           {"0 there"}},
          {hands_out_nothing(Operation::mdb_get_node_binding), {"0 gone"}},
          {fails(Operation::mdb_set_node_binding), {"{code} there", logged_twice}}}}};
}

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
    mdb_db db = writable_copy(host);
    const int status = in_library(md_xmap_upgrade_to_pattern_match, &db, host.db(), MAP_TYPE_R);
    std::string kept;
    std::string match_string;
    const std::string new_node = match_node + "matchstr string ";
    for (const char *node : {"acl"}) {
        kept += nodes(db, match_node + node).empty() ? "" : std::string(" ") + node;
    }
    for (const Field &field : ipv4_fields()) {
        kept += nodes(db, match_node + field.node).empty() ? "" : std::string(" ") + field.node;
    }
    for (const std::string &node : nodes(db, match_node + "matchstr")) {
        match_string = ", match string " + node.substr(new_node.size());
    }
    return std::to_string(status) + ", kept:" + kept + match_string;
}

const char upgrade_function[] = "md_xmap_upgrade_to_pattern_match";

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
            {fails(Operation::bn_binding_new_str), {"{code}, kept:", at_end}}};
}

// Each failing removal is told, and the field stays.
std::vector<FailureRow> removal_failures(const Fields &fields, const std::string &match_string)
{
    const Lines told = {unit.bail("md_xmap_delete_match_binding"), unit.bail(upgrade_function)};
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

std::vector<FailureRow> absent_reads(std::initializer_list<AbsentRead> reads)
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

FaultRow ipv4_row()
{
    const std::string whole = "application:web,src_ip:10.0.0.0/8,dst_ip:10.1.0.0/16,"
                              "src_port:1,dst_port:2,vlan:wan0,protocol:tcp,dscp:ef";
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
    // Without a mask there is none to convert.
    failures.push_back({hands_out_nothing(Operation::mdb_get_node_value_tstr, 5),
                        {"14001" + kept(fields, 6), {unit.bail(upgrade_function, 14001)}}});
    failures.push_back({hands_out_nothing(Operation::mdb_get_node_value_tstr, 7),
                        {"14001" + kept(fields, 8), {unit.bail(upgrade_function, 14001)}}});
    append(
        failures,
        absent_reads({
            {1, whole.c_str(), "any"},
            {2,
             "src_ip:10.0.0.0/8,dst_ip:10.1.0.0/16,src_port:1,dst_port:2,vlan:wan0,protocol:tcp,"
             "dscp:ef",
             "any"},
            {3, "application:web,src_port:1,dst_port:2,vlan:wan0,protocol:tcp,dscp:ef",
             "application:web"},
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
        }));
    return {upgrade_function, "of_ipv4",       with_fields<ipv4_fields>,
            upgraded,         finished(whole), failures};
}

FaultRow ipv6_row()
{
    const std::string whole = "src_ip:2001:db8::/32,dst_ip:::1/128";
    const Fields &fields = ipv6_fields();
    std::vector<FailureRow> failures = common_failures(fields, whole);
    append(failures, removal_failures(fields, whole));
    // The ACL, the application, the version, the two prefixes, and what stands behind addresses.
    const std::size_t first_kept[] = {0, 0, 1, 2, 3, 8, 9, 10, 11, 12};
    for (unsigned i = 0; i < std::size(first_kept); ++i) {
        failures.push_back(
            {fails(Operation::mdb_get_node_value_tstr, i + 1), failed(fields, first_kept[i])});
    }
    append(failures, absent_reads({{1, whole.c_str(), "any"},
                                   {2, whole.c_str(), "any"},
                                   {3, "any", "any"},
                                   {4, "src_ip:::/0,dst_ip:::1/128", "src_ip:::/0,dst_ip:::/0"},
                                   {5, "src_ip:2001:db8::/32,dst_ip:::/0",
                                    "src_ip:2001:db8::/32,dst_ip:::/0"}}));
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
                with_application(host);
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

// Two entries of a route map, of which the second one is found.
struct Guard {
    const char *function;
    const char *parameter;
    std::string found; // how an answer ends, found or not
    std::string not_found;
    Lines before; // any entry is looked at
    ExpectedLine finds;
};

std::vector<FailureRow> guard_failures(const Guard &guard)
{
    const auto path = [&guard](const std::string &entry) {
        return unit.debug(guard.function,
                          "smprintf=" + route_root + entry + "/set/0/" + guard.parameter);
    };
    const ExpectedLine first = path("/a/prio/10");
    const ExpectedLine second = path("/a/prio/20");
    const ExpectedLine bail = unit.bail(guard.function);
    const ExpectedLine null = unit.unexpected_null(guard.function);
    const std::string failed = "{code}" + guard.not_found;
    const std::string found = "0" + guard.found;
    const auto read = Operation::mdb_get_node_value_tstr;
    const auto check = Operation::lc_log_check_level;
    const auto lines = [&guard](const Lines &further) { return guard.before + further; };
    return {
        {fails(Operation::mdb_get_matching_tstr_array), {failed, {bail}}},
        {fails(Operation::bn_binding_name_to_parts, 1), {failed, lines({bail})}},
        {fails(Operation::bn_binding_name_to_parts, 2), {failed, lines({first, bail})}},
        {fails(Operation::smprintf, 1), {"14001" + guard.not_found, lines({null})}},
        {fails(Operation::smprintf, 2), {"14001" + guard.not_found, lines({first, null})}},
        {fails_once(check, 1), {found, lines({second, guard.finds})}},
        {fails_from(check, 1), {found, lines({guard.finds})}},
        {fails(check, 2), {found, lines({first, guard.finds})}},
        {fails(read, 1), {failed, lines({first, bail})}},
        {fails(read, 2), {failed, lines({first, second, bail})}},
        {{read, 1, When::Lasting::once, FaultWay::without_object},
         {found, lines({first, second, guard.finds})}},
        {hands_out_nothing(read), {"0" + guard.not_found, lines({first, second})}},
    };
}

Lines guard_lines(const Guard &guard)
{
    const std::string path = "smprintf=" + route_root + "/a/prio/";
    const std::string end = std::string("/set/0/") + guard.parameter;
    return guard.before + Lines{unit.debug(guard.function, path + "10" + end),
                                unit.debug(guard.function, path + "20" + end), guard.finds};
}

FaultRow preferred_interface_row()
{
    const Guard guard = {"md_preferred_if_is_used_in_rmap",      "auto_mod", " yes", " no", {},
                         gated(5, "Found preferred_if in a:20.")};
    std::vector<FailureRow> failures = guard_failures(guard);
    failures.push_back({hands_out_nothing(Operation::mdb_get_matching_tstr_array), {"0 no"}});
    return {guard.function,
            "with_two_entries",
            [](HostFixture &host) {
                host.set(route_root + "/a/prio/10/set/0/auto_mod", bt_string, "other");
                host.set(route_root + "/a/prio/20/set/0/auto_mod", bt_string, "preferred-if");
            },
            [](HostFixture &host) {
                md_dbinfo dbinfo = dbinfo_of(host);
                tbool found = true;
                const int status =
                    in_library(md_preferred_if_is_used_in_rmap, nullptr, &dbinfo, &found);
                return std::to_string(status) + (found ? " yes" : " no");
            },
            {"0 yes", guard_lines(guard)},
            failures};
}

FaultRow vlan_row()
{
    const Guard guard = {"md_vlan_is_used_in_rmap",
                         "auto_prefif",
                         ", refused: 1 Cannot delete a vlan when used by a route-map preferred "
                         "interface.\n  Please remove vlan vlan7 from associated route-map first.",
                         "",
                         {gated(5, "Checking 2 rmaps entries for VLAN vlan7.")},
                         gated(5, "Found VLAN vlan7 in a:20.")};
    std::vector<FailureRow> failures = guard_failures(guard);
    failures.push_back({hands_out_nothing(Operation::mdb_get_matching_tstr_array),
                        {"0", {gated(5, "Checking 0 rmaps entries for VLAN vlan7.")}}});
    failures.push_back({fails(Operation::md_commit_set_return_status_msg),
                        {"{code}", guard_lines(guard) + Lines{unit.bail(guard.function)}}});
    return {guard.function,
            "with_two_entries",
            [](HostFixture &host) {
                host.set(route_root + "/a/prio/10/set/0/auto_prefif", bt_string, "vlan8");
                host.set(route_root + "/a/prio/20/set/0/auto_prefif", bt_string, "vlan7");
            },
            [](HostFixture &host) {
                md_dbinfo dbinfo = dbinfo_of(host);
                MapChange removal(mdct_delete, "/a/b/c/d/e/f/g/vlan7");
                std::string answer =
                    std::to_string(in_library(md_vlan_is_used_in_rmap, removal.record(), &dbinfo));
                for (const std::string &refusal : host.commit().refusals) {
                    answer += ", refused: " + refusal;
                }
                return answer;
            },
            {"0" + guard.found, guard_lines(guard)},
            failures};
}

} // namespace

std::vector<FaultRow> xmap_match_rows()
{
    std::vector<FaultRow> rows = validation_rows();
    for (FaultRow &row : removal_rows()) {
        rows.push_back(std::move(row));
    }
    for (FaultRow &row : std::vector<FaultRow>{ipver_row(), ipv4_row(), ipv6_row(), acl_row(),
                                               preferred_interface_row(), vlan_row()}) {
        rows.push_back(std::move(row));
    }
    return rows;
}

} // namespace ovtest

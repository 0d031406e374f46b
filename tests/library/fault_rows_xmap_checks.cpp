// Protocols, the limits of maps, references from ACLs, and what is checked of maps and ACLs.
#include "orvale/md_xmap_common.h"
#include "tests/library/fault_rows.h"
#include "tests/library/map_changes.h"
#include "tests/library/map_kinds.h"

#include <cstddef>
#include <string>
#include <vector>

namespace ovtest
{

namespace
{

const UnitLines unit("md_xmap_common");

constexpr char references_function[] = "md_acl_ref_processing";
constexpr char guard_function[] = "md_acl_not_used_in_map";
constexpr char set_function[] = "md_xmap_check_match_exists_for_set";
constexpr char common_function[] = "md_xmap_common_change_check";
constexpr char limit_function[] = "md_xmap_check_limit";
constexpr char count_function[] = "get_nbr_map_entries";

// Each call makes the commit that it needs.
void as_it_is(HostFixture &) {}

ExpectedLine path_line(const std::string &function, const std::string &path)
{
    return unit.debug(function, "smprintf=" + path);
}

// The first lines, and what is written then.
Lines up_to(const Lines &lines, std::size_t count, const Lines &then = {})
{
    Lines some(lines.begin(), lines.begin() + static_cast<std::ptrdiff_t>(count));
    some.insert(some.end(), then.begin(), then.end());
    return some;
}

// The lines without the traces of which `left_out` says so, by their place among traces.
template <typename Predicate>
Lines without_traces(const Lines &lines, Predicate left_out)
{
    Lines rest;
    unsigned trace = 0;
    for (const ExpectedLine &line : lines) {
        if (line.kind != ExpectedLine::Kind::debug || !left_out(++trace)) {
            rest.push_back(line);
        }
    }
    return rest;
}

// Adds what becomes of an outcome when traces are not asked for: nothing but the trace is missing.
std::vector<FailureRow> with_trace_failures(const Outcome &outcome, std::vector<FailureRow> rows)
{
    for (unsigned call = 1; call <= outcome.log.size(); ++call) {
        const auto is_it = [&](unsigned trace) { return trace == call; };
        const auto is_it_or_later = [&](unsigned trace) { return trace >= call; };
        rows.push_back({fails_once(Operation::lc_log_check_level, call),
                        {outcome.answer, without_traces(outcome.log, is_it)}});
        rows.push_back({fails_from(Operation::lc_log_check_level, call),
                        {outcome.answer, without_traces(outcome.log, is_it_or_later)}});
    }
    return rows;
}

std::string joined(const std::vector<std::string> &texts)
{
    std::string all;
    for (const std::string &text : texts) {
        all += "; " + text;
    }
    return all;
}

// Status of a call that is given a commit; told when the database before it is another then.
template <typename Call>
std::string status_of(const MapCommit &commit, Call call)
{
    const std::vector<std::string> before = nodes(commit.olddb, "/");
    const int status = call();
    const bool is_as_before =
        nodes(commit.olddb, "/") == before && commit.olddb.refused_writes == 0;
    return std::to_string(status) + (is_as_before ? "" : " with the old database written");
}

// --- Protocols

// "0 yes; REFUSAL".
template <const char *proto>
std::string protocol_answer(HostFixture &)
{
    MapCommit commit;
    tbool found = false;
    const std::string status = status_of(
        commit, [&] { return in_library(md_validate_proto, &commit.dbinfo, proto, &found); });
    return status + (found ? " yes" : " no") + joined(commit.commit.refusals);
}

constexpr char wrong_number[] = "256";
constexpr char unknown_name[] = "nothing";
constexpr char known_name[] = "tcp";

std::vector<FaultRow> protocol_rows()
{
    const Outcome passed_up = {"{code} yes", {unit.bail("md_validate_proto")}};
    const FailureRow unreported = {fails(Operation::md_commit_set_return_status_msg_fmt),
                                   passed_up};
    const FailureRow not_looked_up = {fails(Operation::lc_string_to_enum), passed_up};
    return {
        {"md_validate_proto",
         "of_a_wrong_number",
         as_it_is,
         protocol_answer<wrong_number>,
         {"0 no; 1 Invalid protocol number 256.\n"},
         {unreported}},
        {"md_validate_proto",
         "of_an_unknown_name",
         as_it_is,
         protocol_answer<unknown_name>,
         {"0 no; 1 Unknown protocol nothing.\n"},
         {not_looked_up, unreported}},
        {"md_validate_proto",
         "of_a_known_name",
         as_it_is,
         protocol_answer<known_name>,
         {"0 yes"},
         {not_looked_up}},
    };
}

// --- References

// A reference of entries of map m1 as an answer has it.
std::string reference(const MapKind &kind, const std::string &acl, const std::string &priority)
{
    return "; " + kind.reference(acl, "m1", priority) + " uint32 " + priority;
}

constexpr char reference_1[] = "; /ov/tunneld/acl/config/a1/rmap/m1/prio/10 uint32 10";
constexpr char reference_1_of_20[] = "; /ov/tunneld/acl/config/a1/rmap/m1/prio/20 uint32 20";
constexpr char reference_2[] = "; /ov/tunneld/acl/config/a2/rmap/m1/prio/10 uint32 10";

// An entry of map m1 names a1 before the commit.
void give_acl(MapCommit &commit, const MapKind &kind = route_map,
              const std::string &priority = "10")
{
    commit.set_old(kind.acl_node("m1", priority), "a1");
    set_node(commit.newdb, kind.reference("a1", "m1", priority), priority, bt_uint32);
}

// Status, and the references of the proposed database.
std::string processed(const MapKind &kind, MapCommit &commit, MapChange &change)
{
    const std::string status = status_of(commit, [&] {
        return in_library(md_acl_ref_processing, change.record(), &commit.dbinfo, kind.mtype);
    });
    return status + joined(nodes(commit.newdb, "/ov/tunneld/acl/config"));
}

std::string acl_set(const MapKind &kind, MapCommit &commit, const std::string &acl,
                    const std::string &priority = "10")
{
    MapChange change(mdct_modify, kind.acl_node("m1", priority), acl);
    return processed(kind, commit, change);
}

const ExpectedLine modify_line = gated(6, "In map Apply ACL modify");
const ExpectedLine acl_path_line =
    path_line(references_function, "/ov/tunneld/route_map/config/map/m1/prio/10/match/0/acl");

FaultRow row_of_first_acl()
{
    const Lines lines = {
        modify_line,
        acl_path_line,
        gated(6, "refcheck: acl=a2, m1-10, old=(null)"),
        path_line(references_function, "/ov/tunneld/acl/config/a2/rmap/m1/prio/10"),
        gated(6, "Creating ACL map entry /ov/tunneld/acl/config/a2/rmap/m1/prio/10"),
    };
    const ExpectedLine bail = unit.bail(references_function);
    const ExpectedLine null = unit.unexpected_null(references_function);
    const Outcome success = {std::string("0") + reference_2, lines};
    const Outcome no_acl = {
        "0", {modify_line, acl_path_line, gated(6, "refcheck: acl=(null), m1-10, old=(null)")}};
    return {
        references_function,
        "of_a_first_acl",
        as_it_is,
        [](HostFixture &) {
            MapCommit commit;
            return acl_set(route_map, commit, "a2");
        },
        success,
        with_trace_failures(
            success,
            {{fails(Operation::bn_binding_name_parts_pattern_match), {"0"}},
             {fails(Operation::bn_attrib_array_get_attrib_tstr),
              {"{code}", up_to(lines, 1, {bail})}},
             {hands_out_nothing(Operation::bn_attrib_array_get_attrib_tstr), no_acl},
             {fails(Operation::smprintf, 1), {"14001", up_to(lines, 1, {null})}},
             {fails(Operation::mdb_get_node_binding), {"{code}", up_to(lines, 2, {bail})}},
             {hands_out_nothing(Operation::mdb_get_node_binding), success},
             {fails(Operation::smprintf, 2), {"14001", up_to(lines, 3, {null})}},
             {fails(Operation::bn_binding_new_str), {"{code}", up_to(lines, 5, {bail})}},
             {hands_out_nothing(Operation::bn_binding_new_str), {"14001", up_to(lines, 5, {null})}},
             {fails(Operation::mdb_set_node_binding), {"{code}", up_to(lines, 5, {bail})}}})};
}

// What becomes of another ACL of an entry: `all` has both references of the entry.
std::vector<FailureRow> another_acl_failures(const Lines &lines, const std::string &as_before,
                                             const std::string &all, const Outcome &no_new_acl,
                                             const Outcome &no_old_acl, const Outcome &no_list)
{
    const ExpectedLine bail = unit.bail(references_function);
    const ExpectedLine null = unit.unexpected_null(references_function);
    return {
        {fails(Operation::bn_binding_name_parts_pattern_match), {"0" + as_before}},
        {fails(Operation::bn_attrib_array_get_attrib_tstr),
         {"{code}" + as_before, up_to(lines, 1, {bail})}},
        {hands_out_nothing(Operation::bn_attrib_array_get_attrib_tstr), no_new_acl},
        {fails(Operation::smprintf, 1), {"14001" + as_before, up_to(lines, 1, {null})}},
        {fails(Operation::mdb_get_node_binding), {"{code}" + as_before, up_to(lines, 2, {bail})}},
        {hands_out_nothing(Operation::mdb_get_node_binding), no_old_acl},
        {fails(Operation::bn_binding_get_str), {"{code}" + as_before, up_to(lines, 2, {bail})}},
        {hands_out_nothing(Operation::bn_binding_get_str), no_old_acl},
        {fails(Operation::smprintf, 2), {"14001" + as_before, up_to(lines, 3, {null})}},
        {fails(Operation::bn_binding_new_str), {"{code}" + as_before, up_to(lines, 5, {bail})}},
        {hands_out_nothing(Operation::bn_binding_new_str),
         {"14001" + as_before, up_to(lines, 5, {null})}},
        {fails(Operation::mdb_set_node_binding, 1),
         {"{code}" + as_before, up_to(lines, 5, {bail})}},
        {fails(Operation::smprintf, 3), {"14001" + all, up_to(lines, 5, {null})}},
        {fails(Operation::mdb_get_tstr_array), {"{code}" + all, up_to(lines, 6, {bail})}},
        {hands_out_nothing(Operation::mdb_get_tstr_array), no_list},
        {fails(Operation::smprintf, 4), {"14001" + all, up_to(lines, 6, {null})}},
        {fails(Operation::bn_binding_new_named), {"{code}" + all, up_to(lines, 8, {bail})}},
        {hands_out_nothing(Operation::bn_binding_new_named),
         {"14001" + all, up_to(lines, 8, {null})}},
        {fails(Operation::mdb_set_node_binding, 2), {"{code}" + all, up_to(lines, 8, {bail})}}};
}

// The new reference stays whatever becomes of the old one.
template <const MapKind &kind>
FaultRow row_of_another_acl(const std::string &situation)
{
    const std::string key = kind.key;
    const ExpectedLine acl_path = path_line(references_function, kind.acl_node("m1", "10"));
    const Lines lines = {
        modify_line,
        acl_path,
        gated(6, "refcheck: acl=a2, m1-10, old=a1"),
        path_line(references_function, kind.reference("a2", "m1", "10")),
        gated(6, "Creating ACL map entry " + kind.reference("a2", "m1", "10")),
        path_line(references_function, "/ov/tunneld/acl/config/a1/" + key + "/m1/prio"),
        path_line(references_function, "/ov/tunneld/acl/config/a1/" + key + "/m1"),
        gated(6, "Removing /ov/tunneld/acl/config/a1/" + key + "/m1"),
    };
    const Outcome success = {"0" + reference(kind, "a2", "10"), lines};
    const std::string as_before = reference(kind, "a1", "10");
    const std::string both = as_before + reference(kind, "a2", "10");
    const Outcome no_new_acl = {"0",
                                {modify_line, acl_path,
                                 gated(6, "refcheck: acl=(null), m1-10, old=a1"), lines[5],
                                 lines[6], lines[7]}};
    const Outcome no_old_acl = {"0" + both,
                                {modify_line, acl_path,
                                 gated(6, "refcheck: acl=a2, m1-10, old=(null)"), lines[3],
                                 lines[4]}};
    return {references_function,
            situation,
            as_it_is,
            [](HostFixture &) {
                MapCommit commit;
                give_acl(commit, kind);
                return acl_set(kind, commit, "a2");
            },
            success,
            with_trace_failures(success, another_acl_failures(lines, as_before, both, no_new_acl,
                                                              no_old_acl, success))};
}

// A removed entry, or one that has lost its ACL: the lines differ in how they begin. Entry 20 names
// the ACL, too.
std::vector<FailureRow> removal_failures(const Outcome &success, const Lines &no_old_acl_lines)
{
    const Lines &lines = success.log;
    const std::size_t begin = lines.size() - 3; // of the removal
    const std::string as_before = std::string(reference_1) + reference_1_of_20;
    const ExpectedLine bail = unit.bail(references_function);
    const ExpectedLine null = unit.unexpected_null(references_function);
    const Outcome no_old_acl = {"0" + as_before, no_old_acl_lines};
    const Lines whole_map =
        up_to(lines, begin + 1,
              {path_line(references_function, "/ov/tunneld/acl/config/a1/rmap/m1"),
               gated(6, "Removing /ov/tunneld/acl/config/a1/rmap/m1")});
    const Lines unread =
        begin == 1 ? Lines{acl_path_line, bail} : Lines{modify_line, acl_path_line, bail};
    const Lines no_path = begin == 1 ? Lines{null} : Lines{modify_line, null};
    return with_trace_failures(
        success,
        {{fails(Operation::bn_binding_name_parts_pattern_match), {"0" + as_before}},
         {fails(Operation::bn_attrib_array_get_attrib_tstr),
          {"{code}" + as_before, {modify_line, bail}}},
         {fails(Operation::smprintf, 1), {"14001" + as_before, no_path}},
         {fails(Operation::mdb_get_node_binding), {"{code}" + as_before, unread}},
         {hands_out_nothing(Operation::mdb_get_node_binding), no_old_acl},
         {fails(Operation::bn_binding_get_str), {"{code}" + as_before, unread}},
         {hands_out_nothing(Operation::bn_binding_get_str), no_old_acl},
         {fails(Operation::smprintf, 2), {"14001" + as_before, up_to(lines, begin, {null})}},
         {fails(Operation::mdb_get_tstr_array),
          {"{code}" + as_before, up_to(lines, begin + 1, {bail})}},
         {hands_out_nothing(Operation::mdb_get_tstr_array), {"0", whole_map}},
         {fails(Operation::smprintf, 3), {"14001" + as_before, up_to(lines, begin + 1, {null})}},
         {fails(Operation::bn_binding_new_named),
          {"{code}" + as_before, up_to(lines, begin + 3, {bail})}},
         {hands_out_nothing(Operation::bn_binding_new_named),
          {"14001" + as_before, up_to(lines, begin + 3, {null})}},
         {fails(Operation::mdb_set_node_binding),
          {"{code}" + as_before, up_to(lines, begin + 3, {bail})}}});
}

// What is written at the end of a removal.
const Lines removal_lines = {
    path_line(references_function, "/ov/tunneld/acl/config/a1/rmap/m1/prio"),
    path_line(references_function, "/ov/tunneld/acl/config/a1/rmap/m1/prio/10"),
    gated(6, "Removing /ov/tunneld/acl/config/a1/rmap/m1/prio/10"),
};

void give_acl_twice(MapCommit &commit)
{
    give_acl(commit);
    set_node(commit.newdb, "/ov/tunneld/acl/config/a1/rmap/m1/prio/20", "20", bt_uint32);
}

FaultRow row_of_no_acl()
{
    const Lines begin = {modify_line, acl_path_line, gated(6, "refcheck: acl=, m1-10, old=a1")};
    const Outcome success = {std::string("0") + reference_1_of_20, up_to(begin, 3, removal_lines)};
    std::vector<FailureRow> failures = removal_failures(
        success, {modify_line, acl_path_line, gated(6, "refcheck: acl=, m1-10, old=(null)")});
    Lines null_lines = success.log;
    null_lines[2] = gated(6, "refcheck: acl=(null), m1-10, old=a1");
    failures.push_back({hands_out_nothing(Operation::bn_attrib_array_get_attrib_tstr),
                        {success.answer, null_lines}});
    return {references_function,
            "of_no_acl",
            as_it_is,
            [](HostFixture &) {
                MapCommit commit;
                give_acl_twice(commit);
                return acl_set(route_map, commit, "");
            },
            success,
            failures};
}

FaultRow row_of_removed_entry()
{
    const Outcome success = {std::string("0") + reference_1_of_20,
                             up_to({acl_path_line}, 1, removal_lines)};
    return {references_function,
            "of_a_removed_entry",
            as_it_is,
            [](HostFixture &) {
                MapCommit commit;
                give_acl_twice(commit);
                MapChange change(mdct_delete, "/ov/tunneld/route_map/config/map/m1/prio/10");
                return processed(route_map, commit, change);
            },
            success,
            removal_failures(success, {acl_path_line})};
}

// Entry 20 keeps its reference, and the map's level with it.
FaultRow row_of_another_acl_of_one_entry()
{
    const Lines begin = {
        modify_line,
        acl_path_line,
        gated(6, "refcheck: acl=a2, m1-10, old=a1"),
        path_line(references_function, "/ov/tunneld/acl/config/a2/rmap/m1/prio/10"),
        gated(6, "Creating ACL map entry /ov/tunneld/acl/config/a2/rmap/m1/prio/10"),
    };
    const Lines lines = begin + removal_lines;
    const std::string as_before = std::string(reference_1) + reference_1_of_20;
    const std::string all = as_before + reference_2;
    const Outcome success = {std::string("0") + reference_1_of_20 + reference_2, lines};
    const Outcome no_new_acl = {
        std::string("0") + reference_1_of_20,
        Lines{modify_line, acl_path_line, gated(6, "refcheck: acl=(null), m1-10, old=a1")} +
            removal_lines};
    const Outcome no_old_acl = {"0" + all,
                                {modify_line, acl_path_line,
                                 gated(6, "refcheck: acl=a2, m1-10, old=(null)"), lines[3],
                                 lines[4]}};
    // Without the list the entry is taken for the last one.
    const Outcome no_list = {
        std::string("0") + reference_2,
        up_to(lines, 6,
              {path_line(references_function, "/ov/tunneld/acl/config/a1/rmap/m1"),
               gated(6, "Removing /ov/tunneld/acl/config/a1/rmap/m1")})};
    return {references_function,
            "of_another_acl_of_one_of_two_entries",
            as_it_is,
            [](HostFixture &) {
                MapCommit commit;
                give_acl_twice(commit);
                return acl_set(route_map, commit, "a2");
            },
            success,
            with_trace_failures(success, another_acl_failures(lines, as_before, all, no_new_acl,
                                                              no_old_acl, no_list))};
}

// Whatever refers to the default entry stays.
std::vector<FaultRow> default_entry_rows()
{
    const std::string as_before = reference(route_map, "a1", "65535");
    const Outcome set = {"0" + as_before, {modify_line}};
    const Outcome untouched = {"0" + as_before};
    const FailureRow no_match = {fails(Operation::bn_binding_name_parts_pattern_match), untouched};
    return {{references_function,
             "of_another_acl_of_the_default_entry",
             as_it_is,
             [](HostFixture &) {
                 MapCommit commit;
                 give_acl(commit, route_map, "65535");
                 return acl_set(route_map, commit, "a2", "65535");
             },
             set,
             {no_match,
              {fails(Operation::bn_attrib_array_get_attrib_tstr),
               {"{code}" + as_before, {modify_line, unit.bail(references_function)}}},
              {hands_out_nothing(Operation::bn_attrib_array_get_attrib_tstr), set}}},
            {references_function,
             "of_the_removed_default_entry",
             as_it_is,
             [](HostFixture &) {
                 MapCommit commit;
                 give_acl(commit, route_map, "65535");
                 MapChange change(mdct_delete, route_map.entry("m1", "65535"));
                 return processed(route_map, commit, change);
             },
             untouched,
             {no_match}}};
}

// --- The guard of ACLs

// Two entries are referred to: the first has got another ACL.
void give_references(MapCommit &commit, const MapKind &kind)
{
    for (const char *priority : {"10", "20"}) {
        set_node(commit.olddb, kind.reference("a1", "m1", priority), priority, bt_uint32);
    }
    commit.set_new(kind.acl_node("m1", "10"), "a2");
}

std::string guard_answer(const MapKind &kind, MapCommit &commit)
{
    MapChange change(mdct_delete, "/ov/tunneld/acl/config/a1");
    const std::string status = status_of(commit, [&] {
        return in_library(md_acl_not_used_in_map, change.record(), &commit.dbinfo, kind.mtype);
    });
    return status + joined(commit.commit.refusals);
}

// What becomes of the guard up to the entries' ACLs.
std::vector<FailureRow> guard_failures(const MapKind &kind, const Lines &lines)
{
    const ExpectedLine bail = unit.bail(guard_function);
    const ExpectedLine null = unit.unexpected_null(guard_function);
    const std::string unused = std::string("ACL a1 used by 0 ") + kind.user_name;
    return {
        {fails(Operation::bn_binding_name_parts_pattern_match), {"0"}},
        {fails(Operation::smprintf, 1), {"14001", {null}}},
        {fails(Operation::mdb_get_matching_tstr_array), {"{code}", up_to(lines, 1, {bail})}},
        {hands_out_nothing(Operation::mdb_get_matching_tstr_array),
         {"0", up_to(lines, 1, {gated(5, unused)})}},
        {fails(Operation::bn_binding_name_to_parts, 1), {"{code}", up_to(lines, 2, {bail})}},
        {fails(Operation::bn_binding_name_to_parts, 2), {"{code}", up_to(lines, 4, {bail})}},
        {hands_out_nothing(Operation::bn_binding_name_to_parts, 1),
         {"14001", up_to(lines, 2, {null})}},
        {hands_out_nothing(Operation::bn_binding_name_to_parts, 2),
         {"14001", up_to(lines, 4, {null})}},
        {fails(Operation::smprintf, 2), {"14001", up_to(lines, 2, {null})}},
        {fails(Operation::smprintf, 3), {"14001", up_to(lines, 4, {null})}},
        {fails(Operation::mdb_get_node_value_tstr, 1), {"{code}", up_to(lines, 3, {bail})}},
        {fails(Operation::mdb_get_node_value_tstr, 2), {"{code}", up_to(lines, 5, {bail})}},
    };
}

// Up to the second entry's ACL.
Lines guard_lines(const MapKind &kind)
{
    return {
        path_line(guard_function,
                  "/ov/tunneld/acl/config/a1/" + std::string(kind.key) + "/*/prio/*"),
        gated(5, std::string("ACL a1 used by 2 ") + kind.user_name),
        path_line(guard_function, kind.acl_node("m1", "10")),
        gated(6, "Ref <m1/10>, <a2/a1>"),
        path_line(guard_function, kind.acl_node("m1", "20")),
    };
}

constexpr When no_value = {Operation::mdb_get_node_value_tstr, 1, When::Lasting::once,
                           FaultWay::without_object};
constexpr When no_values = {Operation::mdb_get_node_value_tstr, 1, When::Lasting::and_later,
                            FaultWay::without_object};

// The second entry still names the ACL.
template <const MapKind &kind>
FaultRow row_of_acl_in_use(const std::string &situation)
{
    const std::string name = kind.user_name;
    const Lines lines = guard_lines(kind) + Lines{gated(6, "Ref <m1/20>, <a1/a1>")};
    const Outcome success = {"0; 1 Cannot delete an ACL when used by a " + name +
                                 ".\n  Please remove ACL from associated " + name + " first.",
                             lines};
    std::vector<FailureRow> failures = guard_failures(kind, lines);
    failures.push_back({no_value, {success.answer, up_to(lines, 3, {lines[4], lines[5]})}});
    failures.push_back({no_values, {"0", up_to(lines, 3, {lines[4]})}});
    failures.push_back(
        {hands_out_nothing(Operation::mdb_get_node_value_tstr, 2), {"0", up_to(lines, 5)}});
    failures.push_back({fails(Operation::md_commit_set_return_status_msg),
                        {"{code}", up_to(lines, 6, {unit.bail(guard_function)})}});
    return {guard_function,
            situation,
            as_it_is,
            [](HostFixture &) {
                MapCommit commit;
                give_references(commit, kind);
                commit.set_new(kind.acl_node("m1", "20"), "a1");
                return guard_answer(kind, commit);
            },
            success,
            with_trace_failures(success, failures)};
}

// The second entry is gone.
FaultRow row_of_acl_that_may_go()
{
    const Lines lines = guard_lines(route_map);
    const Outcome success = {"0", lines};
    std::vector<FailureRow> failures = guard_failures(route_map, lines);
    const Outcome no_values_at_all = {"0", up_to(lines, 3, {lines[4]})};
    failures.push_back({no_value, no_values_at_all});
    failures.push_back({no_values, no_values_at_all});
    failures.push_back({hands_out_nothing(Operation::mdb_get_node_value_tstr, 2), success});
    return {guard_function,
            "of_an_acl_with_references_that_may_go",
            as_it_is,
            [](HostFixture &) {
                MapCommit commit;
                give_references(commit, route_map);
                return guard_answer(route_map, commit);
            },
            success,
            with_trace_failures(success, failures)};
}

// --- What is checked for every change

constexpr char set_node_name[] = "/ov/tunneld/route_map/config/map/m1/prio/10/set/nexthop";
constexpr char match_path[] = "/ov/tunneld/route_map/config/map/m1/prio/10/match";
constexpr char set_refused[] =
    "; 1 The match parameters have to be configured before configuring the set parameters.";

std::string set_answer(const MapKind &kind, MapCommit &commit)
{
    MapChange change(mdct_add, kind.set_node("m1", "10"), "x");
    const std::string status = status_of(commit, [&] {
        return in_library(md_xmap_check_match_exists_for_set, change.record(), &commit.dbinfo,
                          kind.mtype);
    });
    return status + joined(commit.commit.refusals);
}

template <const MapKind &kind>
std::vector<FaultRow> set_rows(const std::string &of_kind = "")
{
    const ExpectedLine bail = unit.bail(set_function);
    const ExpectedLine path = path_line(set_function, kind.match_node("m1", "10"));
    const Outcome refused = {std::string("80000") + set_refused, {path}};
    const Outcome accepted = {"0", {path}};
    const Outcome failed = {"{code}", {path, bail}};
    const std::vector<FailureRow> failures = {
        {fails(Operation::bn_binding_name_parts_pattern_match), {"0"}},
        {fails(Operation::smprintf), {"14001", {unit.unexpected_null(set_function)}}},
        {fails(Operation::mdb_get_tstr_array), failed},
        {hands_out_nothing(Operation::mdb_get_tstr_array), refused},
        {fails(Operation::md_commit_set_return_status_msg), failed}};
    return {
        {set_function, "of_an_entry_without_a_match" + of_kind, as_it_is,
         [](HostFixture &) {
             MapCommit commit;
             return set_answer(kind, commit);
         },
         refused, with_trace_failures(refused, failures)},
        {set_function, "of_an_entry_with_a_match" + of_kind, as_it_is,
         [](HostFixture &) {
             MapCommit commit;
             commit.set_new(kind.acl_node("m1", "10"), "a1");
             return set_answer(kind, commit);
         },
         accepted, with_trace_failures(accepted, failures)},
    };
}

// "0 refused; REFUSAL", "0 goes on".
std::string common_answer(MapCommit &commit, int mtype, const std::string &name)
{
    MapChange change(mdct_add, name, "x");
    tbool to_bail = true;
    const std::string status = status_of(commit, [&] {
        return in_library(md_xmap_common_change_check, change.record(), &commit.dbinfo, mtype,
                          &to_bail);
    });
    return status + (to_bail ? " refused" : " goes on") + joined(commit.commit.refusals);
}

const Outcome goes_on = {"0 goes on"};

FaultRow row_of_eleventh_map()
{
    const Outcome failed = {"{code} goes on",
                            {unit.bail(limit_function), unit.bail(common_function)}};
    return {common_function,
            "of_an_eleventh_map",
            as_it_is,
            [](HostFixture &) {
                MapCommit commit;
                for (int i = 0; i < 10; ++i) {
                    commit.set_old("/ov/tunneld/nat_map/config/map/m" + std::to_string(i), "x");
                }
                return common_answer(commit, MAP_TYPE_N, "/ov/tunneld/nat_map/config/map/new");
            },
            {"0 refused; 1 Cannot add map because maximum reached."},
            {{fails(Operation::bn_binding_name_parts_pattern_match), goes_on},
             {fails(Operation::mdb_get_tstr_array), failed},
             {hands_out_nothing(Operation::mdb_get_tstr_array), goes_on},
             {fails(Operation::md_commit_set_return_status_msg), failed}}};
}

// Two entries in the first map, none in the second, where two are the most.
std::string entry_answer(HostFixture &)
{
    planted().max_entries[Operation::get_max_rmap_entries] = 1;
    MapCommit commit;
    for (const char *entry : {"m1/prio/10", "m1/prio/20", "m1/prio/65535", "m2/prio/65535"}) {
        commit.set_old(std::string("/ov/tunneld/route_map/config/map/") + entry, "x");
    }
    return common_answer(commit, MAP_TYPE_R, "/ov/tunneld/route_map/config/map/m2/prio/10");
}

// What cannot be counted is not in the way of the entry.
FaultRow row_of_entry_beyond()
{
    const ExpectedLine uncounted = unit.bail(count_function);
    const ExpectedLine reached = gated(5, "Can't add map entry because max (2) reached");
    const std::string refused = "0 refused; 1 Cannot add map entry because maximum reached.";
    const Outcome success = {refused, {gated(6, "Total map entries before add: 2"), reached}};
    return {common_function,
            "of_an_entry_beyond_the_limit",
            as_it_is,
            entry_answer,
            success,
            {// The first pattern is that of maps, which an entry does not match.
             {fails_once(Operation::bn_binding_name_parts_pattern_match, 1), success},
             {fails(Operation::bn_binding_name_parts_pattern_match), goes_on},
             {fails(Operation::mdb_get_tstr_array, 1), {"0 goes on", {uncounted}}},
             {hands_out_nothing(Operation::mdb_get_tstr_array, 1),
              {"0 goes on", {unit.unexpected_null(count_function)}}},
             {fails(Operation::mdb_get_tstr_array, 2), {"0 goes on", {uncounted}}},
             {hands_out_nothing(Operation::mdb_get_tstr_array, 2),
              {"0 goes on", {gated(6, "Total map entries before add: 0")}}},
             {fails(Operation::mdb_get_tstr_array, 3), {refused, {uncounted, reached}}},
             {hands_out_nothing(Operation::mdb_get_tstr_array, 3), success},
             {fails(Operation::md_commit_set_return_status_msg),
              {"{code} goes on",
               up_to(success.log, 2, {unit.bail(limit_function), unit.bail(common_function)})}}}};
}

FaultRow row_of_dns_proxy_map()
{
    const ExpectedLine unknown = gated(3, "UNKNOWN type in md_xmap_common_change_check");
    const Outcome unlimited = {"0 goes on", {unknown, gated(3, "UNKNOWN map type")}};
    const Outcome failed = {"{code} goes on",
                            {unknown, unit.bail(limit_function), unit.bail(common_function)}};
    return {common_function,
            "of_a_dns_proxy_map",
            as_it_is,
            [](HostFixture &) {
                MapCommit commit;
                return common_answer(commit, MAP_TYPE_DNS_PROXY, "/ov/dnsproxy/config/0/map/m1");
            },
            {"0 refused; 1 Cannot add map because maximum reached.", {unknown}},
            {{fails(Operation::smprintf),
              {"14001 goes on",
               {unknown, unit.unexpected_null(limit_function), unit.bail(common_function, 14001)}}},
             {fails(Operation::bn_binding_name_parts_pattern_match), unlimited},
             {fails(Operation::mdb_get_tstr_array), failed},
             {hands_out_nothing(Operation::mdb_get_tstr_array), unlimited},
             {fails(Operation::md_commit_set_return_status_msg), failed}}};
}

FaultRow row_of_match_string()
{
    return {common_function,
            "of_a_match_string",
            as_it_is,
            [](HostFixture &) {
                MapCommit commit;
                return common_answer(commit, MAP_TYPE_R, std::string(match_path) + "/0/matchstr");
            },
            goes_on,
            {{fails(Operation::bn_binding_name_parts_pattern_match), goes_on},
             {fails(Operation::bn_attrib_array_get_attrib_tstr),
              {"{code} goes on", {unit.bail(common_function)}}},
             {hands_out_nothing(Operation::bn_attrib_array_get_attrib_tstr), goes_on}}};
}

FaultRow row_of_set_parameter()
{
    const ExpectedLine path = path_line(set_function, match_path);
    const Outcome success = {std::string("0 refused") + set_refused, {path}};
    const Outcome failed = {"{code} goes on",
                            {path, unit.bail(set_function), unit.bail(common_function)}};
    const Operation match = Operation::bn_binding_name_parts_pattern_match;
    return {common_function,
            "of_a_set_parameter_without_a_match",
            as_it_is,
            [](HostFixture &) {
                MapCommit commit;
                return common_answer(commit, MAP_TYPE_R, set_node_name);
            },
            success,
            with_trace_failures(
                success,
                {// Maps, entries and match strings have patterns that it does not match.
                 {fails_once(match, 1), success},
                 {fails_once(match, 2), success},
                 {fails_once(match, 3), success},
                 {fails(match), goes_on},
                 {fails(Operation::smprintf),
                  {"14001 goes on",
                   {unit.unexpected_null(set_function), unit.bail(common_function, 14001)}}},
                 {fails(Operation::mdb_get_tstr_array), failed},
                 {hands_out_nothing(Operation::mdb_get_tstr_array), success},
                 {fails(Operation::md_commit_set_return_status_msg), failed}})};
}

// A set parameter of an entry that matches something. New security maps are not counted, so that
// one pattern less is asked about.
template <const MapKind &kind>
FaultRow row_of_set_parameter_that_passes(const std::string &situation)
{
    const ExpectedLine path = path_line(set_function, kind.match_node("m1", "10"));
    const Outcome success = {"0 goes on", {path}};
    const Outcome failed = {"{code} goes on",
                            {path, unit.bail(set_function), unit.bail(common_function)}};
    const Operation match = Operation::bn_binding_name_parts_pattern_match;
    std::vector<FailureRow> failures = {
        {fails(Operation::smprintf),
         {"14001 goes on",
          {unit.unexpected_null(set_function), unit.bail(common_function, 14001)}}},
        {fails(Operation::mdb_get_tstr_array), failed},
        {hands_out_nothing(Operation::mdb_get_tstr_array),
         {std::string("0 refused") + set_refused, {path}}}};
    const unsigned others = kind.mtype == MAP_TYPE_SEC ? 2 : 3;
    for (unsigned call = 1; call <= others; ++call) {
        failures.push_back({fails_once(match, call), success});
    }
    failures.push_back({fails(match), goes_on});
    return {common_function,
            situation,
            as_it_is,
            [](HostFixture &) {
                MapCommit commit;
                commit.set_new(kind.acl_node("m1", "10"), "a1");
                return common_answer(commit, kind.mtype, kind.set_node("m1", "10"));
            },
            success,
            with_trace_failures(success, failures)};
}

} // namespace

std::vector<FaultRow> xmap_checks_rows()
{
    std::vector<FaultRow> rows = protocol_rows();
    for (const std::vector<FaultRow> &some : {default_entry_rows(), set_rows<route_map>(),
                                              set_rows<security_map>("_of_a_security_map")}) {
        rows.insert(rows.end(), some.begin(), some.end());
    }
    rows.push_back(row_of_another_acl<route_map>("of_another_acl"));
    rows.push_back(row_of_another_acl<security_map>("of_another_acl_of_a_security_map"));
    rows.push_back(row_of_acl_in_use<route_map>("of_an_acl_in_use"));
    rows.push_back(row_of_acl_in_use<security_map>("of_an_acl_in_use_by_a_security_map"));
    rows.push_back(row_of_set_parameter_that_passes<route_map>("of_a_set_parameter_that_passes"));
    rows.push_back(row_of_set_parameter_that_passes<security_map>(
        "of_a_set_parameter_of_a_security_map_that_passes"));
    for (const auto row :
         {row_of_first_acl, row_of_another_acl_of_one_entry, row_of_no_acl, row_of_removed_entry,
          row_of_acl_that_may_go, row_of_eleventh_map, row_of_entry_beyond, row_of_dns_proxy_map,
          row_of_match_string, row_of_set_parameter}) {
        rows.push_back(row());
    }
    return rows;
}

} // namespace ovtest

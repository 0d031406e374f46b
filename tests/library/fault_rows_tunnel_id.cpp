#include "tests/library/fault_rows.h"
#include "tests/library/tunnel_ids.h"

namespace ovtest
{

namespace
{

const UnitLines unit("md_tunneld_tunnel_common");

constexpr uint32 bound = 30;
constexpr uint64 set_up_time = 70000;

// 0 is "alpha", 2 is "beta"; the others are free and never used.
void with_two_tunnels(HostFixture &host)
{
    host.set_time(set_up_time);
    begin_tunnel_ids(bound);
    (void)set_id(0, "alpha");
    (void)set_id(2, "beta");
}

void before_the_beginning(HostFixture &)
{
    end_tunnel_ids();
    planted().tunnel_bounds = {bound};
}

// What others see: the names in order with the IDs they lead to, and the first free IDs. Asked
// outside of the library's run, so that it neither fails nor counts.
std::string state()
{
    std::string text;
    for (const char *name : {"alpha", "beta", "gamma"}) {
        const TestString string = string_of(name);
        uint32 id = 0;
        if (md_get_tunnel_id(string.get(), &id) == 0) {
            text += std::string(", ") + name + ' ' + std::to_string(id);
        }
    }
    text += ", in order:";
    for (const std::string &name : names_in_order()) {
        text += ' ' + name;
    }
    text += ", free:";
    const TestIds ids = new_ids();
    (void)md_get_next_n_available_tunnel_ids(3, ids.get());
    for (const uint32 id : elements(ids.get())) {
        text += ' ' + std::to_string(id);
    }
    return text;
}

template <uint32 id>
std::string set_gamma(HostFixture &)
{
    const int status = set_id(id, "gamma");
    return std::to_string(status) + state();
}

std::string set_line(uint32 id)
{
    return "TUN_IDS: SET tunnel index " + std::to_string(id) + " content to gamma";
}

std::vector<FaultRow> init_rows()
{
    const char *const function = "md_init_tunnel_id";
    const ExpectedLine initialized = gated(6, "TUN_IDS: Initialized");
    // Without the sequence no name stands in order, and every ID is free all the same.
    const Outcome without_sequence = {"0, in order:, free: 0 1 2",
                                      {unit.bail("init_tunnel_sorted_seq"), initialized}};
    return {{function,
             "the_first_time",
             before_the_beginning,
             [](HostFixture &) {
                 const int status = in_library(md_init_tunnel_id);
                 return std::to_string(status) + (status == 0 ? state() : "");
             },
             {"0, in order:, free: 0 1 2", {initialized}},
             {{fails(Operation::array_options_get_defaults), without_sequence},
              {fails(Operation::uint32_array_new_full), without_sequence},
              {fails(Operation::allocation), {"14001", {unit.unexpected_null(function)}}}},
             end_tunnel_ids}};
}

std::vector<FaultRow> set_rows()
{
    const char *const function = "md_set_tunnel_id";
    const std::vector<ExpectedLine> logged = {unit.bail(function)};
    return {
        // An ID that is not bound in the end has left the free ones, until it is set again.
        {function,
         "of_a_free_id",
         with_two_tunnels,
         set_gamma<1>,
         {"0, alpha 0, beta 2, gamma 1, in order: alpha beta gamma, free: 3 4 5",
          {gated(6, set_line(1))}},
         {{fails(Operation::ts_dup),
           {"{code}, alpha 0, beta 2, in order: alpha beta, free: 3 4 5", logged}},
          {hands_out_nothing(Operation::ts_dup),
           {"0, alpha 0, beta 2, in order: null alpha beta, free: 3 4 5", {gated(6, set_line(1))}}},
          {fails(Operation::uint32_array_insert_sorted),
           {"{code}, alpha 0, beta 2, gamma 1, in order: alpha beta, free: 3 4 5", logged}}},
         end_tunnel_ids},
        {function,
         "of_an_id_in_use",
         with_two_tunnels,
         set_gamma<0>,
         {"0, beta 2, gamma 0, in order: beta gamma, free: 1 3 4", {gated(6, set_line(0))}},
         {{fails(Operation::uint32_array_delete_by_value),
           {"{code}, beta 2, in order: null beta, free: 1 3 4", logged}},
          {fails(Operation::ts_dup), {"{code}, beta 2, in order: beta, free: 1 3 4", logged}},
          {hands_out_nothing(Operation::ts_dup),
           {"0, beta 2, in order: null beta, free: 1 3 4", {gated(6, set_line(0))}}},
          {fails(Operation::uint32_array_insert_sorted),
           {"{code}, beta 2, gamma 0, in order: beta, free: 1 3 4", logged}}},
         end_tunnel_ids},
    };
}

std::vector<FaultRow> free_rows()
{
    const char *const function = "md_free_tunnel_id";
    const ExpectedLine freed = gated(6, "TUN_IDS: Freed tunnel at index 0 (alpha)");
    return {
        {function,
         "of_a_name_in_use",
         with_two_tunnels,
         [](HostFixture &) {
             const int status = free_id("alpha");
             return std::to_string(status) + state();
         },
         {"0, beta 2, in order: beta, free: 1 3 4", {freed}},
         // The ID is freed all the same.
         {{fails(Operation::uint32_array_delete_by_value),
           {"{code}, beta 2, in order: null beta, free: 1 3 4", {unit.bail(function), freed}}}},
         end_tunnel_ids},
    };
}

std::vector<FaultRow> offer_rows()
{
    const char *const function = "md_get_next_n_available_tunnel_ids";
    const ExpectedLine asked = gated(6, "Received request for 2 available tunnel IDs");
    const ExpectedLine first = gated(6, "TUN_IDS: next available tunnel index 1");
    const ExpectedLine second = gated(6, "TUN_IDS: next available tunnel index 3");
    return {
        {function,
         "of_two",
         with_two_tunnels,
         [](HostFixture &) { return offer(2); },
         {"0 1 3", {asked, first, second}},
         {{fails(Operation::uint32_array_append, 1), {"1", {asked, first, unit.bail(function)}}},
          {fails(Operation::uint32_array_append, 2),
           {"1 1", {asked, first, second, unit.bail(function)}}}},
         end_tunnel_ids},
    };
}

// These call nothing that can fail.
std::vector<FaultRow> question_rows()
{
    return {
        {"md_get_tunnel_id",
         "of_a_name_in_use",
         with_two_tunnels,
         [](HostFixture &) { return id_of("beta"); },
         {"0 2"},
         {},
         end_tunnel_ids},
        {"md_get_tunnel_id_sorted",
         "of_a_name_in_use",
         with_two_tunnels,
         [](HostFixture &) { return sorted_id_of("beta"); },
         {"0 2"},
         {},
         end_tunnel_ids},
        {"md_get_tunnel_name_str_sorted",
         "of_the_second",
         with_two_tunnels,
         [](HostFixture &) { return name_at(1); },
         {"0 beta"},
         {},
         end_tunnel_ids},
        {"md_get_total_tunnels",
         "of_two",
         with_two_tunnels,
         [](HostFixture &) { return std::to_string(in_library(md_get_total_tunnels)); },
         {"2"},
         {},
         end_tunnel_ids},
        {"tunnel_sorted_seq_compare",
         "of_two_names",
         with_two_tunnels,
         [](HostFixture &) {
             const uint32 first = 0;
             const uint32 second = 2;
             const int order = in_library(tunnel_sorted_seq_compare, &first, &second);
             return std::string(order < 0 ? "before" : "not before");
         },
         {"before"},
         {},
         end_tunnel_ids},
    };
}

} // namespace

std::vector<FaultRow> tunnel_id_rows()
{
    std::vector<FaultRow> rows;
    for (const auto part : {init_rows, set_rows, free_rows, offer_rows, question_rows}) {
        for (FaultRow &row : part()) {
            rows.push_back(std::move(row));
        }
    }
    return rows;
}

} // namespace ovtest

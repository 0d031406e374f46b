#include "tests/library/tunnel_ids.h"

#include <cstdlib>

namespace ovtest
{

namespace
{

constexpr uint32 no_answer = 77;

} // namespace

TestString string_of(const std::string &text)
{
    tstring *string = nullptr;
    if (ts_new_str(&string, text.c_str()) != 0) {
        abort();
    }
    return TestString(string);
}

TestIds new_ids()
{
    uint32_array *ids = nullptr;
    if (uint32_array_new_full(&ids, nullptr) != 0) {
        abort();
    }
    return TestIds(ids);
}

std::vector<uint32> elements(const uint32_array *ids)
{
    std::vector<uint32> all;
    for (int32 i = 0; i < uint32_array_length_quick(ids); ++i) {
        all.push_back(uint32_array_get_quick(ids, static_cast<uint32>(i)));
    }
    return all;
}

void begin_tunnel_ids(uint32 bound)
{
    end_tunnel_ids();
    // Without tunnels the lookup goes back to the first position.
    (void)sorted_id_of("none");
    planted().tunnel_bounds = {bound};
    if (in_library(md_init_tunnel_id) != 0) {
        abort();
    }
    forget_calls();
}

void end_tunnel_ids()
{
    planted().tunnel_bounds = {0};
    arm({.operation =
             has_allocation_layer ? Operation::allocation : Operation::array_options_get_defaults});
    (void)in_library(md_init_tunnel_id);
    disarm();
}

int set_id(uint32 id, const std::string &name)
{
    const TestString string = string_of(name);
    return in_library(md_set_tunnel_id, id, string.get());
}

int free_id(const std::string &name)
{
    const TestString string = string_of(name);
    return in_library(md_free_tunnel_id, string.get());
}

std::string id_of(const std::string &name)
{
    const TestString string = string_of(name);
    uint32 id = no_answer;
    const int status = in_library(md_get_tunnel_id, string.get(), &id);
    return std::to_string(status) + ' ' + std::to_string(id);
}

std::string sorted_id_of(const std::string &name)
{
    const TestString string = string_of(name);
    uint32 id = no_answer;
    const int status = in_library(md_get_tunnel_id_sorted, string.get(), &id);
    return std::to_string(status) + ' ' + std::to_string(id);
}

std::string offer(uint32 num_tunnels)
{
    const TestIds ids = new_ids();
    std::string answer =
        std::to_string(in_library(md_get_next_n_available_tunnel_ids, num_tunnels, ids.get()));
    for (const uint32 id : elements(ids.get())) {
        answer += ' ' + std::to_string(id);
    }
    return answer;
}

std::string name_at(uint32 position)
{
    const char *name = "old";
    const int status = in_library(md_get_tunnel_name_str_sorted, position, &name);
    return std::to_string(status) + ' ' + (name != nullptr ? name : "null");
}

std::vector<std::string> names_in_order()
{
    std::vector<std::string> names;
    for (int i = 0; i < md_get_total_tunnels(); ++i) {
        const char *name = nullptr;
        if (md_get_tunnel_name_str_sorted(static_cast<uint32>(i), &name) != 0) {
            abort();
        }
        names.emplace_back(name != nullptr ? name : "null");
    }
    return names;
}

} // namespace ovtest

// What the tests of the tunnel ID allocator share. Its state lives as long as the process: each
// test begins it anew and ends with nothing of it left.
#pragma once

#include "orvale/md_tunneld_defs.h"
#include "orvale/md_tunneld_tunnel_common.h"
#include "tests/support/allocation_layer.h"
#include "tests/support/fault_layer.h"

#include <memory>
#include <string>
#include <vector>

namespace ovtest
{

// An object that a test makes for itself.
template <auto release>
struct Releaser {
    template <typename T>
    void operator()(T *object) const
    {
        release(&object);
    }
};
using TestString = std::unique_ptr<tstring, Releaser<ts_free>>;
using TestIds = std::unique_ptr<uint32_array, Releaser<uint32_array_free>>;

TestString string_of(const std::string &text);
TestIds new_ids();
std::vector<uint32> elements(const uint32_array *ids);

// All IDs below the bound free and never used. The lookup by the order of names starts at its
// beginning.
void begin_tunnel_ids(uint32 bound);

// A beginning that fails releases what an earlier one has made. Without the allocation layer the
// records stay, and the leak checker knows where they are.
void end_tunnel_ids();

// The library's answers. An ID is that of the out-parameter, which holds 77 before the call.
int set_id(uint32 id, const std::string &name);
int free_id(const std::string &name);

// Status and ID: "0 5".
std::string id_of(const std::string &name);
std::string sorted_id_of(const std::string &name);

// Status and IDs: "0 5 6 7".
std::string offer(uint32 num_tunnels);

// Status and name: "0 alpha"; the name was "old".
std::string name_at(uint32 position);

// The names in their order.
std::vector<std::string> names_in_order();

} // namespace ovtest

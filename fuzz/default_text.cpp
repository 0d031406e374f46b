// Default databases as text: whatever is read, written out again, reads as the same entries.
#include "framework/errors.h"
#include "fuzz/host.h"
#include "orvale/md_db_default.h"

#include <cstdlib>
#include <fstream>
#include <optional>
#include <string>
#include <string_view>
#include <tuple>
#include <vector>

namespace
{

using namespace ovfuzz;

constexpr char default_file[] = "/var/opt/tms/.debug_default_db";

struct Entry {
    std::string name;
    bn_type type = 0;
    std::optional<std::string> value;

    bool operator==(const Entry &) const = default;
};

struct Entries {
    int status = 0;
    std::vector<Entry> values;
    std::vector<Entry> removals;
};

std::vector<Entry> take(bn_str_value *entries, uint32 number)
{
    std::vector<Entry> taken;
    for (uint32 i = 0; i < number; ++i) {
        const bn_str_value &entry = entries[i];
        require(entry.bv_name != nullptr && *entry.bv_name != '\0', "every entry has a name");
        taken.push_back({entry.bv_name, entry.bv_type,
                         entry.bv_value != nullptr ? std::optional<std::string>(entry.bv_value)
                                                   : std::nullopt});
    }
    if (number == 0) {
        std::free(entries); // an array of no good entries is the caller's all the same
    }
    (void)bn_str_value_free(&entries, number);
    return taken;
}

Entries read(std::string_view text)
{
    std::ofstream(default_file, std::ios::binary) << text;
    bn_str_value *values = nullptr;
    bn_str_value *removals = nullptr;
    uint32 num_values = 0;
    uint32 num_removals = 0;
    Entries read;
    read.status = db_default_get_all(&values, &num_values, &removals, &num_removals);
    read.values = take(values, num_values);
    read.removals = take(removals, num_removals);
    return read;
}

std::string to_line(const Entry &entry)
{
    std::string line = entry.name;
    if (entry.type != 0) {
        const char *const type = lc_enum_to_string_quiet_null(bn_type_map, entry.type);
        require(type != nullptr, "every type has a name");
        line.append(",").append(type).append(",").append(entry.value.value_or(""));
    }
    return line + '\n';
}

} // namespace

int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size)
{
    static const ScratchRoot files;
    const Entries first = read({reinterpret_cast<const char *>(data), size});
    std::string text;
    for (const Entry &entry : first.values) {
        require(entry.value.has_value(), "every value entry has a value");
        text += to_line(entry);
    }
    for (const Entry &entry : first.removals) {
        require(entry.type != 0 || !entry.value, "a removal without a type has no value");
        text += '-' + to_line(entry);
    }
    const Entries second = read(text);
    require(second.status == 0, "what was read is good");
    require(second.values == first.values, "the same values are read again");
    require(second.removals == first.removals, "the same removals are read again");
    return 0;
}

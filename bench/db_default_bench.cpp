// Reading a default file of 1,000,000 lines, beside the least that any reader must do: copy each
// name and each value once.

#include "bench/goals.h"
#include "bench/scratch.h"
#include "host/mgmtd/private_root.h"
#include "orvale/md_db_default.h"

#include <cstdlib>
#include <cstring>
#include <fstream>
#include <memory>
#include <string>

namespace
{

constexpr std::size_t num_lines = 1'000'000;
constexpr char debug_defaults[] = "/var/opt/tms/.debug_default_db";

struct TypedValue {
    const char *type;
    const char *value;
};

// The types and lengths of an ordinary default file.
constexpr TypedValue typed_values[] = {
    {"uint32", "64000"},      {"bool", "true"},         {"string", "branch office, floor 2"},
    {"ipv4addr", "10.1.2.3"}, {"duration_ms", "60000"}, {"hostname", "branch-7.example.net"},
};

std::string line_name(std::size_t i)
{
    return "/ov/tunneld/tunnel/config/tunnel" + std::to_string(i) + "/setting";
}

const TypedValue &line_value(std::size_t i)
{
    return typed_values[i % std::size(typed_values)];
}

void write_default_file()
{
    std::ofstream file(debug_defaults);
    for (std::size_t i = 0; i < num_lines; ++i) {
        file << line_name(i) << ',' << line_value(i).type << ',' << line_value(i).value << '\n';
    }
    if (!file.flush()) {
        throw std::runtime_error(std::string("cannot write ") + debug_defaults);
    }
}

void read_default_file(benchmark::State &state)
{
    for (auto _ : state) {
        bn_str_value *values = nullptr;
        bn_str_value *removals = nullptr;
        uint32 num_values = 0;
        uint32 num_removals = 0;
        if (db_default_get_all(&values, &num_values, &removals, &num_removals) != 0 ||
            num_values != num_lines) {
            state.SkipWithError("the file was not read whole");
        }
        state.PauseTiming();
        (void)bn_str_value_free(&values, num_values);
        state.ResumeTiming();
    }
}

char *copy_text(const std::string &text)
{
    auto *const copy = static_cast<char *>(std::malloc(text.size() + 1));
    std::memcpy(copy, text.c_str(), text.size() + 1);
    return copy;
}

// The texts stand ready in one block each, as after reading a file.
void copy_texts_once(benchmark::State &state)
{
    std::vector<std::string> names;
    std::vector<std::string> values;
    for (std::size_t i = 0; i < num_lines; ++i) {
        names.push_back(line_name(i));
        values.emplace_back(line_value(i).value);
    }
    for (auto _ : state) {
        auto *entries = static_cast<bn_str_value *>(std::calloc(num_lines, sizeof(bn_str_value)));
        for (std::size_t i = 0; i < num_lines; ++i) {
            entries[i].bv_name = copy_text(names[i]);
            entries[i].bv_value = copy_text(values[i]);
        }
        benchmark::DoNotOptimize(entries);
        state.PauseTiming();
        (void)bn_str_value_free(&entries, num_lines);
        state.ResumeTiming();
    }
}

BENCHMARK(copy_texts_once)->Unit(benchmark::kMillisecond)->Repetitions(9)->ReportAggregatesOnly();
BENCHMARK(read_default_file)->Unit(benchmark::kMillisecond)->Repetitions(9)->ReportAggregatesOnly();

} // namespace

int main(int argc, char **argv)
{
    const ovbench::ScratchDir root;
    ovhost::enter_private_root(root.path());
    write_default_file();
    const ovbench::GoalTable table{
        "Reading a default file of 1,000,000 lines, beside copying each name and each value once. "
        "At most twice that.",
        "lines",
        "read_default_file",
        {"copy_texts_once"},
        {{"1,000,000", "read_default_file", {{"copy_texts_once", 2.0}}}}};
    return ovbench::run_with_goals(argc, argv, {"Default files", {table}});
}

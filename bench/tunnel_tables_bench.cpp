// Finding, adding and deleting tunnel names: the library's table beside two hash maps, beside the
// table that walks its slots, and beside the least that any table with these contents must write.

#include "bench/goals.h"
#include "bench/name_tables.h"
#include "bench/tunnel_names.h"
#include "bench/walking_table.h"
#include "framework/logging.h"

#include <memory>
#include <string>

namespace
{

using namespace ovbench;

constexpr std::size_t sizes[] = {100, 1'000, 5'000, 10'000};
constexpr std::size_t first_unknown = 500'000;

template <typename Table>
void fill(Table &table, NameList &names)
{
    for (std::size_t i = 0; i < names.size(); ++i) {
        table.add(names[i], static_cast<uint32>(i));
    }
}

/// Goes through the list from end to end, over and over.
class Turn
{
  public:
    explicit Turn(std::size_t size) : size_(size) {}
    std::size_t next()
    {
        const std::size_t current = position_;
        position_ = position_ + 1 == size_ ? 0 : position_ + 1;
        return current;
    }

  private:
    std::size_t size_;
    std::size_t position_ = 0;
};

template <typename Table>
void find_hit(benchmark::State &state, const NameShape &shape, std::size_t size)
{
    NameList names(shape, size, 0);
    Table table;
    fill(table, names);
    for (std::size_t i = 0; i < size; ++i) {
        if (table.find(names[i]) != i) {
            state.SkipWithError("a name leads to another ID than its own");
        }
    }
    Turn turn(size);
    for (auto _ : state) {
        benchmark::DoNotOptimize(table.find(names[turn.next()]));
    }
}

template <typename Table>
void find_miss(benchmark::State &state, const NameShape &shape, std::size_t size)
{
    NameList names(shape, size, 0);
    const NameList unknown(shape, size, first_unknown);
    Table table;
    fill(table, names);
    for (std::size_t i = 0; i < size; ++i) {
        if (table.find(unknown[i]) != TUNNEL_ID_NONE) {
            state.SkipWithError("an unknown name leads to an ID");
        }
    }
    Turn turn(size);
    for (auto _ : state) {
        benchmark::DoNotOptimize(table.find(unknown[turn.next()]));
    }
}

template <typename Table>
void add_delete(benchmark::State &state, const NameShape &shape, std::size_t size)
{
    NameList names(shape, size, 0);
    Table table;
    fill(table, names);
    Turn turn(size);
    for (auto _ : state) {
        const std::size_t i = turn.next();
        table.del(names[i]);
        table.add(names[i], static_cast<uint32>(i));
    }
    for (std::size_t i = 0; i < size; ++i) {
        if (table.find(names[i]) != i) {
            state.SkipWithError("a name that was added again is lost");
        }
    }
}

/// Slots from a key's home to its own, on average over the library's table.
std::size_t mean_path()
{
    std::size_t num_keys = 0;
    std::size_t num_slots = 0;
    for (uint32 slot = 0; slot < OKV_ASSOC_SIZE; ++slot) {
        const okv_assoc_entry &entry = tunname_assoc[slot];
        if (entry.value != OKV_INVALID_VALUE) {
            num_keys += 1;
            num_slots += ((slot - okv_home(entry.key)) & (OKV_ASSOC_SIZE - 1)) + 1;
        }
    }
    return num_slots / num_keys;
}

/// The least that a delete and an add can cost whose names share homes: each hashes the name and
/// changes every count on the path. No other bench writes this table.
void add_delete_floor(benchmark::State &state, const NameShape &shape, std::size_t size)
{
    NameList names(shape, size, 0);
    LibraryTable table;
    fill(table, names);
    const std::size_t path = mean_path();
    const auto array = std::make_unique<SlotArray>();
    okv_assoc_entry *const slots = array->slots;
    hash64_state hash_state;
    Turn turn(size);
    for (auto _ : state) {
        const char *const name = names[turn.next()];
        for (const uint32 amount : {static_cast<uint32>(-1), uint32{1}}) {
            benchmark::DoNotOptimize(hash64_key(name, 1, &hash_state));
            for (std::size_t slot = 0; slot < path; ++slot) {
                slots[slot].count += amount;
            }
            benchmark::ClobberMemory();
        }
    }
    state.counters["mean path"] = static_cast<double>(path);
}

std::string bench_name(const char *operation, const char *table, const NameShape &shape,
                       std::size_t size)
{
    return std::string(operation) + "/" + table + "/" + shape.name + "/" + std::to_string(size);
}

template <typename Measure>
void add_bench(const char *operation, const char *table, const NameShape &shape, std::size_t size,
               Measure measure)
{
    benchmark::RegisterBenchmark(
        bench_name(operation, table, shape, size).c_str(),
        [&shape, size, measure](benchmark::State &state) { measure(state, shape, size); })
        ->MinTime(0.01)
        ->Repetitions(15)
        ->ReportAggregatesOnly();
}

template <typename Table>
void add_table_benches(const NameShape &shape, std::size_t size)
{
    add_bench("find_hit", Table::name, shape, size, find_hit<Table>);
    add_bench("find_miss", Table::name, shape, size, find_miss<Table>);
    add_bench("add_delete", Table::name, shape, size, add_delete<Table>);
}

void add_benches()
{
    for (const NameShape &shape : name_shapes) {
        for (const std::size_t size : sizes) {
            add_table_benches<LibraryTable>(shape, size);
            add_table_benches<AbslTable>(shape, size);
            add_table_benches<StdTable>(shape, size);
            add_table_benches<WalkingTable>(shape, size);
            if (shape.shares_homes) {
                add_bench("add_delete", "floor", shape, size, add_delete_floor);
            }
        }
    }
}

/// A size of a shape: all tables and operations.
std::vector<std::string> groups()
{
    std::vector<std::string> patterns;
    for (const NameShape &shape : name_shapes) {
        for (const std::size_t size : sizes) {
            patterns.push_back(bench_name("", "", shape, size).substr(1) + "/");
        }
    }
    return patterns;
}

std::string row_label(const NameShape &shape, std::size_t size)
{
    return std::string(shape.label) + ": " + std::to_string(size);
}

struct FindGoal {
    const char *operation;
    const char *word;
    double absl_limit;
    double std_limit;
};

constexpr FindGoal find_hit_goal = {"find_hit", "hit", 2.0, 0.8};
constexpr FindGoal find_miss_goal = {"find_miss", "miss", 3.5, 0.75};

GoalTable find_table(const FindGoal &goal, const char *text)
{
    GoalTable table{
        text, std::string("find, ") + goal.word, "library", {"absl", "std", "walk"}, {}};
    for (const NameShape &shape : name_shapes) {
        for (const std::size_t size : sizes) {
            table.rows.push_back(
                {row_label(shape, size),
                 bench_name(goal.operation, LibraryTable::name, shape, size),
                 {{bench_name(goal.operation, AbslTable::name, shape, size), goal.absl_limit},
                  {bench_name(goal.operation, StdTable::name, shape, size), goal.std_limit},
                  {bench_name(goal.operation, WalkingTable::name, shape, size)}}});
        }
    }
    return table;
}

GoalTable growth_table()
{
    constexpr double limit = 3.0;
    GoalTable table{"From 100 names to 10,000 a find may grow to 3 times its time.",
                    "growth of find",
                    "10,000 names",
                    {"100 names"},
                    {}};
    for (const FindGoal &goal : {find_hit_goal, find_miss_goal}) {
        for (const NameShape &shape : name_shapes) {
            table.rows.push_back(
                {std::string(goal.word) + ", " + shape.label,
                 bench_name(goal.operation, LibraryTable::name, shape, 10'000),
                 {{bench_name(goal.operation, LibraryTable::name, shape, 100), limit}}});
        }
    }
    return table;
}

GoalTable shared_homes_table()
{
    constexpr double floor_limit = 1.25;
    constexpr double walk_limit = 0.2;
    /// What an add or a delete may take beside the hash and the counts; a pair has two of them.
    constexpr double extra_ns = 2 * 30;
    GoalTable table{
        "Deleting a name and adding it again, names that share home slots: every slot between home "
        "and the name's own must change. The floor is a plain loop over as many slots as the mean "
        "path of the library's table, with the hash and 30 ns, each twice. At most 1.25 times the "
        "floor, and from 1,000 names on at most a fifth of the walk.",
        "delete and add, shared homes",
        "library",
        {"floor", "walk", "absl"},
        {}};
    for (const NameShape &shape : name_shapes) {
        for (const std::size_t size : sizes) {
            if (shape.shares_homes) {
                table.rows.push_back(
                    {row_label(shape, size),
                     bench_name("add_delete", LibraryTable::name, shape, size),
                     {{bench_name("add_delete", "floor", shape, size), floor_limit, extra_ns},
                      {bench_name("add_delete", WalkingTable::name, shape, size),
                       size >= 1'000 ? walk_limit : 0},
                      {bench_name("add_delete", AbslTable::name, shape, size)}}});
            }
        }
    }
    return table;
}

GoalTable spread_table()
{
    GoalTable table{
        "The same with names that are spread over the slots: never slower than absl, and "
        "never slower than the walk.",
        "delete and add, spread",
        "library",
        {"absl", "walk", "std"},
        {}};
    for (const NameShape &shape : name_shapes) {
        for (const std::size_t size : sizes) {
            if (!shape.shares_homes) {
                table.rows.push_back(
                    {row_label(shape, size),
                     bench_name("add_delete", LibraryTable::name, shape, size),
                     {{bench_name("add_delete", AbslTable::name, shape, size), 1.0},
                      {bench_name("add_delete", WalkingTable::name, shape, size), 1.0},
                      {bench_name("add_delete", StdTable::name, shape, size)}}});
            }
        }
    }
    return table;
}

} // namespace

int main(int argc, char **argv)
{
    G_daemon_log_level = ov_log_error;
    add_benches();
    return run_with_goals(
        argc, argv,
        {"Tunnel name tables",
         {find_table(find_hit_goal,
                     "Finding the ID of a tunnel by its name. `absl` is "
                     "`absl::flat_hash_map<std::string, uint32_t>` asked with a `string_view`, "
                     "`std` is `std::unordered_map<std::string, uint32_t>`, and `walk` is the same "
                     "table as the library's, with the same hash, searched slot by slot. All are "
                     "asked with the same C strings. A known name: at most 2.0 times `absl` and "
                     "0.8 times `std`."),
          find_table(find_miss_goal,
                     "An unknown name: at most 3.5 times `absl` and 0.75 times `std`."),
          growth_table(), shared_homes_table(), spread_table()},
         groups()});
}

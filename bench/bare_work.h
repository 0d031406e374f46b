#pragma once
// Benches of work that the library does, beside the host operations that the same work cannot do
// without, called one after the other with all names at hand. goals.h prints what comes of it.
//
// A kind of work has a class of its data, made once for each size. Work that changes a database
// has `newdb`, which begin() makes as it was.

#include "bench/database.h"
#include "bench/goals.h"
#include "host/tree/diff.h"

#include <benchmark/benchmark.h>

#include <cstdint>
#include <map>
#include <memory>
#include <span>
#include <string>

namespace ovbench
{

/// The same data for all repetitions of a size.
template <typename Data>
Data &of_size(const benchmark::State &state)
{
    static std::map<std::int64_t, std::unique_ptr<Data>> made;
    std::unique_ptr<Data> &data = made[state.range(0)];
    if (data == nullptr) {
        data = std::make_unique<Data>(static_cast<int>(state.range(0)));
    }
    return *data;
}

/// Work that leaves everything as it was.
template <typename Data, int (Data::*work)()>
void repeat(benchmark::State &state)
{
    Data &data = of_size<Data>(state);
    for (auto _ : state) {
        if ((data.*work)() != 0) {
            state.SkipWithError("the work failed");
        }
    }
}

/// Work that begins on another database each time.
template <typename Data, int (Data::*work)()>
void repeat_anew(benchmark::State &state)
{
    Data &data = of_size<Data>(state);
    for (auto _ : state) {
        state.PauseTiming();
        data.begin();
        state.ResumeTiming();
        if ((data.*work)() != 0) {
            state.SkipWithError("the work failed");
        }
    }
    data.begin();
}

/// Both roads lead to the same database.
template <typename Data, int (Data::*work)(), int (Data::*queries)()>
void require_same_end(int size)
{
    Data data(size);
    const ovhost::Tree start = data.newdb.tree;
    require((data.*work)() == 0, "the work failed");
    const ovhost::Tree end = data.newdb.tree;
    data.begin();
    require((data.*queries)() == 0, "the queries failed");
    require(!ovhost::diff(start, end).empty(), "nothing was done");
    require(ovhost::diff(end, data.newdb.tree).empty(), "the queries do not do the same");
}

/// One kind of work: its benches are named by `name`, and "NAME_bare" is of the queries alone.
struct Work {
    const char *name;
    const char *label;
    void (*library)(benchmark::State &);
    void (*bare)(benchmark::State &);
};

/// What stands above the tables.
struct Subject {
    const char *title;
    const char *data;  ///< what the work is done on
    const char *sizes; ///< what there are 10, 1,000 and 10,000 of
};

/// Runs all works in three sizes and prints how they compare and how they grow. Answers the
/// process's exit status: 1 when a goal was missed.
int run_beside_bare(int argc, char **argv, const Subject &subject, std::span<const Work> works);

} // namespace ovbench

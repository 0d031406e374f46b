// Commits of 1, 100 and 10,000 changes on a store of 100,000 nodes: the daemon's whole road, beside
// what the durable store alone takes for the same changes, and how both grow.

#include "bench/goals.h"
#include "bench/scratch.h"
#include "framework/logging.h"
#include "host/framework/log_config.h"
#include "host/mgmtd/configuration.h"
#include "host/mgmtd/private_root.h"
#include "host/store/store.h"

#include <string>
#include <vector>

namespace
{

constexpr int num_nodes = 100'000;

/// Nodes of no module: the road that every commit takes is measured, not what a module adds to it.
std::string node_name(int i)
{
    return "/ov/bench/config/group" + std::to_string(i / 10) + "/field" + std::to_string(i % 10);
}

/// Each commit writes other values than the one before, spread over the whole tree.
template <typename Write>
void edit(int num_changes, unsigned round, Write write)
{
    const int stride = num_nodes / num_changes;
    for (int i = 0; i < num_changes; ++i) {
        write(node_name(i * stride), std::to_string(round));
    }
}

ovhost::Configuration &configuration()
{
    static const ovbench::ScratchDir state_dir;
    static ovhost::Configuration *const configuration = [] {
        auto *made = new ovhost::Configuration(state_dir.path() / "state");
        made->start();
        for (int i = 0; i < num_nodes; ++i) {
            if (made->candidate().set(node_name(i), bt_uint32, "0")) {
                std::abort();
            }
        }
        if (!made->commit(ovhost::daemon_note("")).accepted()) {
            std::abort();
        }
        return made;
    }();
    return *configuration;
}

void commit(benchmark::State &state)
{
    static unsigned round = 0;
    ovhost::Configuration &daemon = configuration();
    const auto num_changes = static_cast<int>(state.range(0));
    for (auto _ : state) {
        state.PauseTiming();
        edit(num_changes, ++round, [&daemon](const std::string &name, const std::string &text) {
            if (daemon.candidate().set(name, bt_uint32, text)) {
                std::abort();
            }
        });
        state.ResumeTiming();
        if (daemon.commit(ovhost::daemon_note("")).outcome != ovhost::CommitOutcome::committed) {
            state.SkipWithError("the commit was not accepted");
        }
    }
    state.counters["commits/s"] =
        benchmark::Counter(static_cast<double>(state.iterations()), benchmark::Counter::kIsRate);
}

ovhost::Store &bare_store()
{
    static const ovbench::ScratchDir state_dir;
    static ovhost::Store store = [] {
        auto made = ovhost::Store::open(state_dir.path() / "state");
        std::vector<ovhost::StoredChange> changes;
        for (int i = 0; i < num_nodes; ++i) {
            changes.push_back({node_name(i), ovhost::StoredValue{bt_uint32, "0"}});
        }
        (void)made.commit(changes);
        return made;
    }();
    return store;
}

void store_alone(benchmark::State &state)
{
    static unsigned round = 0;
    ovhost::Store &store = bare_store();
    const auto num_changes = static_cast<int>(state.range(0));
    for (auto _ : state) {
        state.PauseTiming();
        std::vector<ovhost::StoredChange> changes;
        edit(num_changes, ++round, [&changes](const std::string &name, const std::string &text) {
            changes.push_back({name, ovhost::StoredValue{bt_uint32, text}});
        });
        state.ResumeTiming();
        (void)store.commit(changes);
    }
}

void sizes(benchmark::internal::Benchmark *bench)
{
    bench->Arg(1)->Arg(100)->Arg(10'000);
    bench->Unit(benchmark::kMicrosecond)->UseRealTime()->Repetitions(5)->ReportAggregatesOnly();
}

BENCHMARK(store_alone)->Apply(sizes);
BENCHMARK(commit)->Apply(sizes);

} // namespace

int main(int argc, char **argv)
{
    const ovbench::ScratchDir root;
    ovhost::enter_private_root(root.path());
    G_daemon_log_level = ov_log_error;
    const ovbench::GoalTable beside_store{"Commits on a store of 100,000 nodes: the daemon's whole "
                                          "road, beside what the durable store "
                                          "alone takes for the same changes. There is no goal.",
                                          "changes",
                                          "commit",
                                          {"store alone"},
                                          {{"1", "commit/1", {{"store_alone/1"}}},
                                           {"100", "commit/100", {{"store_alone/100"}}},
                                           {"10,000", "commit/10000", {{"store_alone/10000"}}}}};
    const ovbench::GoalTable growth{
        "How a commit grows with its changes.",
        "changes",
        "commit",
        {"a hundredth of the changes"},
        {{"100", "commit/100", {{"commit/1"}}}, {"10,000", "commit/10000", {{"commit/100"}}}}};
    return ovbench::run_with_goals(argc, argv, {"Commits", {beside_store, growth}});
}

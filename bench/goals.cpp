#include "bench/goals.h"

#include <unistd.h>

#include <cstdio>
#include <map>
#include <optional>
#include <string_view>

namespace ovbench
{
namespace
{

struct Median {
    double time;
    const char *unit;
};

/// Shows the figures as usual and keeps the medians.
class MedianKeeper : public benchmark::ConsoleReporter
{
  public:
    MedianKeeper() : ConsoleReporter(::isatty(STDOUT_FILENO) != 0 ? OO_ColorTabular : OO_Tabular) {}

    // The machine is told once, not for each group.
    bool ReportContext(const Context &context) override
    {
        const bool first = medians_.empty();
        return first ? ConsoleReporter::ReportContext(context) : true;
    }

    void ReportRuns(const std::vector<Run> &runs) override
    {
        for (const Run &run : runs) {
            if (run.run_type == Run::RT_Aggregate && run.aggregate_name == "median") {
                medians_[name_of(run)] = {run.GetAdjustedRealTime(),
                                          benchmark::GetTimeUnitString(run.time_unit)};
            }
        }
        ConsoleReporter::ReportRuns(runs);
    }

    [[nodiscard]] std::optional<Median> median(const std::string &bench) const
    {
        const auto found = medians_.find(bench);
        return found != medians_.end() ? std::optional(found->second) : std::nullopt;
    }

  private:
    static std::string name_of(const Run &run)
    {
        const std::string &args = run.run_name.args;
        return run.run_name.function_name + (args.empty() ? "" : "/" + args);
    }

    std::map<std::string, Median> medians_;
};

struct Score {
    int goals = 0;
    int reached = 0;
};

std::string printed(const char *format, auto... values)
{
    char text[64];
    (void)std::snprintf(text, sizeof text, format, values...);
    return text;
}

std::string printed(const Median &median)
{
    return printed(median.time < 100 ? "%.1f %s" : "%.0f %s", median.time, median.unit);
}

/// A peer's time and the ratio to it, beside the goal if there is one.
std::string peer_cell(const MedianKeeper &medians, const Median &bench, const Peer &peer,
                      Score &score)
{
    auto median = medians.median(peer.bench);
    if (!median) {
        return "";
    }
    median->time += peer.extra;
    const double ratio = bench.time / median->time;
    const std::string time = printed(*median);
    if (peer.limit == 0) {
        return time + printed(": %.2f x", ratio);
    }
    const bool reached = ratio <= peer.limit;
    score.goals += 1;
    score.reached += reached ? 1 : 0;
    return time + printed(reached ? ": %.2f x of %.2f" : ": **%.2f x of %.2f**", ratio, peer.limit);
}

/// Benches that were not selected have no row.
Score print_row(const MedianKeeper &medians, const GoalRow &row)
{
    Score score;
    const auto bench = medians.median(row.bench);
    if (!bench) {
        return score;
    }
    std::printf("| %s | %s |", row.label.c_str(), printed(*bench).c_str());
    for (const Peer &peer : row.peers) {
        std::printf(" %s |", peer_cell(medians, *bench, peer, score).c_str());
    }
    std::printf(" %s |\n", score.goals == 0               ? ""
                           : score.goals == score.reached ? "reached"
                                                          : "**MISSED**");
    return score;
}

Score print_table(const MedianKeeper &medians, const GoalTable &table)
{
    std::printf("\n%s\n\n| %s | %s |", table.text.c_str(), table.heading.c_str(),
                table.bench_column.c_str());
    for (const std::string &column : table.peer_columns) {
        std::printf(" %s |", column.c_str());
    }
    std::printf(" goal |\n|---|---|");
    for (std::size_t i = 0; i < table.peer_columns.size(); ++i) {
        std::printf("---|");
    }
    std::printf("---|\n");
    Score score;
    for (const GoalRow &row : table.rows) {
        const Score of_row = print_row(medians, row);
        score.goals += of_row.goals;
        score.reached += of_row.reached;
    }
    return score;
}

Score print_report(const MedianKeeper &medians, const GoalReport &report)
{
    std::printf("\n## %s\n", report.title.c_str());
    Score score;
    for (const GoalTable &table : report.tables) {
        const Score of_table = print_table(medians, table);
        score.goals += of_table.goals;
        score.reached += of_table.reached;
    }
    if (score.goals > 0) {
        std::printf("\nGoals reached: %d of %d.\n", score.reached, score.goals);
    }
    return score;
}

} // namespace

int run_with_goals(int argc, char **argv, const GoalReport &report)
{
    // Whatever else the machine does for a while falls on a bench and its peers alike.
    std::string interleaving = "--benchmark_enable_random_interleaving=true";
    std::vector<char *> arguments = {argv[0], interleaving.data()};
    arguments.insert(arguments.end(), argv + 1, argv + argc);
    int num_arguments = static_cast<int>(arguments.size());
    arguments.push_back(nullptr);
    benchmark::Initialize(&num_arguments, arguments.data());
    if (benchmark::ReportUnrecognizedArguments(num_arguments, arguments.data())) {
        return 2;
    }
    MedianKeeper medians;
    const std::string selected = benchmark::GetBenchmarkFilter();
    if (!selected.empty() || report.groups.empty()) {
        benchmark::RunSpecifiedBenchmarks(&medians);
    } else {
        for (const std::string &group : report.groups) {
            benchmark::RunSpecifiedBenchmarks(&medians, group);
        }
    }
    const Score score = print_report(medians, report);
    benchmark::Shutdown();
    return score.reached == score.goals ? 0 : 1;
}

} // namespace ovbench

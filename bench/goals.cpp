#include "bench/goals.h"

#include <unistd.h>

#include <cstdio>
#include <map>
#include <optional>

namespace ovbench
{
namespace
{

/// Shows the figures as usual and keeps the medians.
class MedianKeeper : public benchmark::ConsoleReporter
{
  public:
    MedianKeeper() : ConsoleReporter(::isatty(STDOUT_FILENO) != 0 ? OO_ColorTabular : OO_Tabular) {}

    void ReportRuns(const std::vector<Run> &runs) override
    {
        for (const Run &run : runs) {
            if (run.run_type == Run::RT_Aggregate && run.aggregate_name == "median") {
                medians_[run.run_name.str()] = run.GetAdjustedRealTime();
            }
        }
        ConsoleReporter::ReportRuns(runs);
    }

    [[nodiscard]] std::optional<double> median(const std::string &bench) const
    {
        const auto found = medians_.find(bench);
        return found != medians_.end() ? std::optional(found->second) : std::nullopt;
    }

  private:
    std::map<std::string, double> medians_;
};

/// One row of the table; false when the goal was missed. Benches that were not selected have none.
bool print_goal(const MedianKeeper &medians, const Goal &goal)
{
    const auto bench = medians.median(goal.bench);
    const auto peer = medians.median(goal.peer);
    if (!bench || !peer) {
        return true;
    }
    const double ratio = *bench / *peer;
    const bool reached = goal.limit == 0 || ratio <= goal.limit;
    if (goal.limit == 0) {
        std::printf("%-52s %-52s %8.2f\n", goal.bench.c_str(), goal.peer.c_str(), ratio);
    } else {
        std::printf("%-52s %-52s %8.2f %8.2f  %s\n", goal.bench.c_str(), goal.peer.c_str(), ratio,
                    goal.limit, reached ? "reached" : "MISSED");
    }
    return reached;
}

} // namespace

int run_with_goals(int argc, char **argv, const std::vector<Goal> &goals)
{
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv)) {
        return 2;
    }
    MedianKeeper medians;
    benchmark::RunSpecifiedBenchmarks(&medians);
    std::printf("\n%-52s %-52s %8s %8s\n", "median of", "divided by the median of", "ratio",
                "goal");
    bool all_reached = true;
    for (const Goal &goal : goals) {
        all_reached = print_goal(medians, goal) && all_reached;
    }
    benchmark::Shutdown();
    return all_reached ? 0 : 1;
}

} // namespace ovbench

#pragma once
// Goals between benches of one run: a bench's time as a multiple of a named peer's. The table is
// printed behind the figures it is made of.

#include <benchmark/benchmark.h>

#include <string>
#include <vector>

namespace ovbench
{

struct Goal {
    std::string bench; ///< full name as the console shows it
    std::string peer;
    double limit; ///< largest ratio that reaches the goal; 0: the ratio is told, no goal is set
};

/// Runs the benches that the command line selects and prints the goals' table from the medians.
/// Answers the process's exit status: 1 when a goal was missed.
int run_with_goals(int argc, char **argv, const std::vector<Goal> &goals);

} // namespace ovbench

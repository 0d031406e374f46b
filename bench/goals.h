#pragma once
// Goals between benches of one run: a bench's time as a multiple of its peers'. The report is
// printed behind the figures it is made of, as Markdown, so that scripts/bench can put it into
// docs/performance.md as it is.

#include <benchmark/benchmark.h>

#include <string>
#include <vector>

namespace ovbench
{

/// What a bench is measured against. Benches are named as they were registered, with their
/// arguments: "commit/100".
struct Peer {
    std::string bench;
    double limit = 0; ///< largest ratio that reaches the goal; 0: told only, no goal is set
    double extra = 0; ///< added to the peer's time, in the bench's unit
};

struct GoalRow {
    std::string label;
    std::string bench;
    std::vector<Peer> peers; ///< one for each of the table's peer columns; unnamed: an empty cell
};

struct GoalTable {
    std::string text;         ///< what is measured, and what the goal is
    std::string heading;      ///< of the labels' column
    std::string bench_column; ///< what is measured
    std::vector<std::string> peer_columns;
    std::vector<GoalRow> rows;
};

struct GoalReport {
    std::string title;
    std::vector<GoalTable> tables;
    /// Patterns of the benches that run together: a bench and its peers. None: all together.
    std::vector<std::string> groups = {};
};

/// Runs the benches that the command line selects, or else the groups one by one, the repetitions
/// of a group in random order, and prints the report from the medians. Answers the process's exit
/// status: 1 when a goal was missed.
int run_with_goals(int argc, char **argv, const GoalReport &report);

} // namespace ovbench

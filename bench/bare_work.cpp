#include "bench/bare_work.h"

namespace ovbench
{
namespace
{

struct Size {
    int number;
    const char *label;
};

constexpr Size sizes[] = {{10, "10"}, {1'000, "1,000"}, {10'000, "10,000"}};

std::string bench_name(const Work &work, const Size &size)
{
    return std::string(work.name) + '/' + std::to_string(size.number);
}

std::string bare_name(const Work &work, const Size &size)
{
    return std::string(work.name) + "_bare/" + std::to_string(size.number);
}

void add_bench(const std::string &name, void (*run)(benchmark::State &))
{
    auto *const bench = benchmark::RegisterBenchmark(name.c_str(), run);
    for (const Size &size : sizes) {
        bench->Arg(size.number);
    }
    bench->Unit(benchmark::kMicrosecond)->MinTime(0.02)->Repetitions(9)->ReportAggregatesOnly();
}

/// The library's own share of the time is a quarter at most.
GoalTable beside_queries(const Subject &subject, std::span<const Work> works)
{
    constexpr double limit = 1 / 0.75;
    GoalTable table{std::string(subject.data) +
                        ": the library's operations, beside the host operations that the same work "
                        "cannot do without, called one after the other with all names at hand. The "
                        "library's own share of the time is to be a quarter at most.",
                    std::string("work, ") + subject.sizes,
                    "library",
                    {"bare host queries"},
                    {}};
    for (const Work &work : works) {
        for (const Size &size : sizes) {
            table.rows.push_back({std::string(work.label) + ", " + size.label,
                                  bench_name(work, size),
                                  {{bare_name(work, size), limit}}});
        }
    }
    return table;
}

/// Linear: ten times as many take ten times as long, and half as much again for memory that is
/// farther away.
GoalTable growth(const Subject &subject, std::span<const Work> works)
{
    constexpr double limit = 10 * 1.5;
    const Size &less = sizes[1];
    const Size &more = sizes[2];
    const std::string of_sizes = std::string(" ") + subject.sizes;
    GoalTable table{"How the same grows from " + (less.label + of_sizes) +
                        " to ten times as many. At most 15 times as long: linear, with half as "
                        "much again for memory that is farther away.",
                    "work",
                    more.label + of_sizes,
                    {less.label + of_sizes},
                    {}};
    for (const Work &work : works) {
        table.rows.push_back(
            {work.label, bench_name(work, more), {{bench_name(work, less), limit}}});
    }
    return table;
}

} // namespace

int run_beside_bare(int argc, char **argv, const Subject &subject, std::span<const Work> works)
{
    GoalReport report{subject.title, {beside_queries(subject, works), growth(subject, works)}};
    for (const Work &work : works) {
        add_bench(work.name, work.library);
        add_bench(std::string(work.name) + "_bare", work.bare);
        report.groups.push_back('^' + std::string(work.name));
    }
    return run_with_goals(argc, argv, report);
}

} // namespace ovbench

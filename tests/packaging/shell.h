#pragma once
// What the tests of this folder run: programs, and what they print.

#include "tests/control/process.h"

#include <ostream>
#include <string>
#include <vector>

namespace packaging_test
{

struct Outcome {
    int exit_code = -1;
    std::string out;
    std::string err;

    bool operator==(const Outcome &) const = default;
};

inline void PrintTo(const Outcome &outcome, std::ostream *stream)
{
    *stream << "exit " << outcome.exit_code << "\nout: " << outcome.out << "\nerr: " << outcome.err;
}

/// The program is looked for on the PATH.
[[nodiscard]] inline Outcome run(const std::vector<std::string> &words)
{
    std::vector<std::string> argv{"/usr/bin/env"};
    argv.insert(argv.end(), words.begin(), words.end());
    ovhost::test::Process process(argv);
    const int exit_code = process.wait();
    return {exit_code, process.out(), process.err()};
}

} // namespace packaging_test

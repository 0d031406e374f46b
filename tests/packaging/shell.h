#pragma once
// What the tests of this folder run: programs, and what they print.

#include "tests/support/process.h"

#include <string>
#include <vector>

namespace packaging_test
{

using ovtest::Outcome;

/// The program is looked for on the PATH.
[[nodiscard]] inline Outcome run(const std::vector<std::string> &words)
{
    std::vector<std::string> argv{"/usr/bin/env"};
    argv.insert(argv.end(), words.begin(), words.end());
    return ovtest::run(argv);
}

} // namespace packaging_test

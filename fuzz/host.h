#pragma once
// What the fuzzers share: the reference host's operations, silent and on a database of each run's
// own, and a way to fail that the fuzzing engine takes for a finding.

#include "host/framework/objects.h"

#include <cstdint>
#include <string>

namespace ovfuzz
{

/// Ends the process: the engine then keeps the input.
[[noreturn]] void report_broken(const char *promise);

inline void require(bool holds, const char *promise)
{
    if (!holds) {
        report_broken(promise);
    }
}

/// From the first of its objects on, the process has fixed directories of its own, under the
/// directory for temporary files, where they stay when it ends.
struct ScratchRoot {
    ScratchRoot();
};

/// A commit that counts refusals.
struct Commit : md_commit {
    int refuse(int code, std::string message) override;

    int num_refusals = 0;
};

/// Sets a node whose name has no escaped components.
void set(mdb_db &db, const std::string &node, const std::string &value);

/// A node's text; null when it has none.
const std::string *text_of(const mdb_db &db, const std::string &node);

} // namespace ovfuzz

/// The engine's entry points, which it declares nowhere. The first is the same for all fuzzers:
/// every line of the log is printed and then dropped, so that formats are tried too.
extern "C" int LLVMFuzzerInitialize(int *argc, char ***argv);
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size);

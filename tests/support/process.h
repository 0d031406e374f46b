// Child processes of a test, with what they print kept in files.
#pragma once

#include "tests/support/files.h"
#include "tests/support/scratch_dir.h"

#include <sys/types.h>

#include <ostream>
#include <string>
#include <vector>

namespace ovtest
{

class Process
{
  public:
    // Starts argv[0]. `input` is what it finds on its standard input; `environment` holds
    // NAME=VALUE texts that are added.
    explicit Process(const std::vector<std::string> &argv, const std::string &input = {},
                     const std::vector<std::string> &environment = {});

    // Kills it when it still runs.
    ~Process();
    Process(const Process &) = delete;
    Process &operator=(const Process &) = delete;

    void signal(int number) const;

    // Waits for its end: the exit code, or 128 and the number of the signal that ended it.
    [[nodiscard]] int wait();

    [[nodiscard]] std::string out() const { return read_file(dir_ / "out").value_or(""); }
    [[nodiscard]] std::string err() const { return read_file(dir_ / "err").value_or(""); }

  private:
    ScratchDir dir_;
    pid_t pid_ = -1;
};

// How a process ended, and what it said.
struct Outcome {
    int exit_code = -1;
    std::string out;
    std::string err;

    bool operator==(const Outcome &) const = default;
};

void PrintTo(const Outcome &outcome, std::ostream *stream);

// Runs a process to its end.
[[nodiscard]] Outcome run(const std::vector<std::string> &argv, const std::string &input = {},
                          const std::vector<std::string> &environment = {});

} // namespace ovtest

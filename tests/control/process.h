#pragma once
// Child processes of a test, with what they print kept in files.

#include "tests/control/temp_dir.h"

#include <sys/types.h>

#include <string>
#include <vector>

namespace ovhost::test
{

class Process
{
  public:
    /// Starts argv[0]. `input` is what it finds on its standard input; `environment` holds
    /// NAME=VALUE texts that are added.
    explicit Process(const std::vector<std::string> &argv, const std::string &input = {},
                     const std::vector<std::string> &environment = {});

    /// Kills it when it still runs.
    ~Process();
    Process(const Process &) = delete;
    Process &operator=(const Process &) = delete;

    void signal(int number) const;

    /// Waits for its end: the exit code, or 128 and the number of the signal that ended it.
    [[nodiscard]] int wait();

    [[nodiscard]] std::string out() const { return read_file(dir_.path("out")); }
    [[nodiscard]] std::string err() const { return read_file(dir_.path("err")); }

  private:
    TempDir dir_;
    pid_t pid_ = -1;
};

} // namespace ovhost::test

#pragma once
// A child process at a terminal of its own, for what programs do only there.

#include <sys/types.h>

#include <string>
#include <vector>

namespace ovtest
{

class PtyProcess
{
  public:
    /// Starts argv[0] with all three standard descriptors at a terminal of so many columns.
    /// `environment` holds NAME=VALUE texts; of the test's own environment only PATH and HOME are
    /// there.
    PtyProcess(const std::vector<std::string> &argv, unsigned short columns,
               const std::vector<std::string> &environment = {"TERM=xterm"});

    /// Kills it when it still runs.
    ~PtyProcess();
    PtyProcess(const PtyProcess &) = delete;
    PtyProcess &operator=(const PtyProcess &) = delete;

    void type(const std::string &text) const;
    void signal(int number) const;

    /// Reads until `text` has been printed; false when it is not within ten seconds.
    [[nodiscard]] bool read_until(const std::string &text);

    /// Reads to the end, and waits for it: the exit code, or 128 and the number of the signal.
    [[nodiscard]] int read_to_end();

    /// Waits without reading until no more is printed, since the terminal holds no more; false when
    /// nothing is printed at all.
    [[nodiscard]] bool fill_up() const;

    /// Waits for the end without reading; false when it does not come within ten seconds.
    [[nodiscard]] bool wait_unread(int &exit_code);

    /// All that was read, with the terminal's "\r\n" as "\n".
    [[nodiscard]] std::string shown() const;

  private:
    bool read_piece(int milliseconds);

    int master_ = -1;
    pid_t pid_ = -1;
    std::string bytes_;
};

} // namespace ovtest

#pragma once
// The real processes at work: a daemon, its client and its peer in a directory of the test's own.

#include "tests/support/eventually.h"
#include "tests/support/process.h"
#include "tests/support/scratch_dir.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

namespace e2e
{

using ovtest::eventually;
using ovtest::Outcome;
using ovtest::Process;
using ovtest::read_file;
using ovtest::run;
using ovtest::write_file;
using Words = std::vector<std::string>;

[[nodiscard]] inline Outcome done(const std::string &out = {})
{
    return {0, out, {}};
}

/// What a client says of an error of mgmtd.
[[nodiscard]] inline Outcome refused(const std::string &err)
{
    return {1, {}, err};
}

/// Each line of a text.
[[nodiscard]] std::vector<std::string> lines_of(const std::string &text);

/// A log's lines without the time: "LEVEL UNIT FUNCTION: TEXT".
[[nodiscard]] std::vector<std::string> log_lines(const std::string &log);

[[nodiscard]] bool exists(const std::string &path);

/// The line that jsond writes for a change; an old or new value of null is not in it.
[[nodiscard]] std::string event_line(const std::string &kind, const std::string &node,
                                     const char *new_value, const char *old_value);

class E2eTest : public testing::Test
{
  protected:
    E2eTest();

    /// Puts the sample files of the model branch-100 in place.
    void install_samples() const;

    /// The command line of a daemon with this test's root, store and socket.
    [[nodiscard]] Words daemon_words(const Words &more = {}) const;

    /// Starts the daemon and waits until it is ready.
    void start(const Words &more = {});

    /// The same for a daemon whose log does not say that it is ready.
    void start_quietly(const std::string &log_level, const Words &more = {});

    /// Runs a daemon that is to end by itself.
    [[nodiscard]] Outcome run_daemon(const Words &more = {}) const
    {
        return run(daemon_words(more));
    }

    /// Ends the daemon with a signal; its exit code.
    [[nodiscard]] int stop(int signal);

    [[nodiscard]] std::string log() const { return daemon_->err(); }

    [[nodiscard]] Outcome ovctl(const Words &words, const std::string &input = {}) const;

    /// Sets a node and commits it.
    void commit(const std::string &node, const std::string &type, const std::string &value) const;

    /// Starts a jsond and waits until it is registered.
    [[nodiscard]] std::unique_ptr<Process> start_jsond(const Words &more = {}) const;

    /// Lines of the events file.
    [[nodiscard]] std::vector<std::string> events() const
    {
        return lines_of(read_file(events_).value_or(""));
    }

    /// Waits until jsond has written so many events; all there are then.
    [[nodiscard]] std::vector<std::string> await_events(std::size_t count) const;

    [[nodiscard]] std::string limits_file() const { return root_ + "/var/opt/tms/dynalimits.conf"; }

    ovtest::ScratchDir dir_;
    std::string root_ = (dir_ / "root").string();
    std::string state_ = (dir_ / "state").string();
    std::string socket_ = (dir_ / "control.sock").string();
    std::string events_ = (dir_ / "events").string();
    std::unique_ptr<Process> daemon_;
};

} // namespace e2e

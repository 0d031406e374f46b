#pragma once
// What the daemon's tests begin with: empty fixed directories, which are private to the program
// (tests/support/test_main.cpp), a state directory, a log that is collected, and no model.

#include "host/mgmtd/configuration.h"
#include "tests/framework/log_capture.h"
#include "tests/support/files.h"
#include "tests/support/scratch_dir.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace mgmtd_test
{

inline constexpr const char *model_file = "/opt/orvale/defdb.conf.m1";
inline constexpr const char *debug_file = "/var/opt/tms/.debug_default_db";
inline constexpr const char *preserved_file = "/var/opt/tms/.preserved_db";
inline constexpr const char *limits_file = "/var/opt/tms/dynalimits.conf";

using ovtest::read_file;
using ovtest::write_file;

class DaemonTest : public testing::Test
{
  protected:
    DaemonTest();

    /// Lines of the daemon itself, "LEVEL TEXT".
    [[nodiscard]] std::vector<std::string> daemon_log() const;

    ovtest::ScratchDir state_;
    ovhost::test::LogCapture log_;
};

/// "NAME TYPE VALUE" for every node with a value.
[[nodiscard]] std::vector<std::string> nodes_of(const ovhost::Tree &tree);

/// "TYPE VALUE"; "none" when the node holds no value.
[[nodiscard]] std::string value_in(const ovhost::Tree &tree, const std::string &name);

/// "NODE: MESSAGE (MODULE)" for each refusal.
[[nodiscard]] std::vector<std::string> refusals_of(const std::vector<ovhost::Refusal> &refusals);

} // namespace mgmtd_test

// The systemd units, checked by systemd itself: packaging/*.service.in.

#include "tests/packaging/shell.h"
#include "tests/support/files.h"
#include "tests/support/scratch_dir.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>

namespace
{

using ovtest::read_file;
using ovtest::ScratchDir;
using ovtest::write_file;
using packaging_test::Outcome;
using packaging_test::run;
using testing::HasSubstr;

/// The units with the programs of the build in place of the installed ones, which are not there.
class Units : public testing::Test
{
  protected:
    Units()
    {
        write_unit("mgmtd", OVMD_MGMTD);
        write_unit("jsond", OVMD_JSOND);
    }

    void write_unit(const std::string &name, const std::string &program) const
    {
        const std::string place = "@" + name + "_program@";
        std::string text = read_file(OVMD_PACKAGING "/" + name + ".service.in").value();
        const std::size_t at = text.find(place);
        ASSERT_NE(at, std::string::npos);
        text.replace(at, place.size(), program);
        write_file(file_of(name), text);
    }

    std::string file_of(const std::string &name) const { return dir_.path(name + ".service"); }

    ScratchDir dir_;
};

Outcome verify(const std::string &one, const std::string &other)
{
    return run({"systemd-analyze", "verify", "--man=no", one, other});
}

TEST_F(Units, SystemdFindsNothingWrong)
{
    EXPECT_EQ(verify(file_of("mgmtd"), file_of("jsond")), (Outcome{0, "", ""}));
}

TEST_F(Units, SystemdWouldFindAMistake)
{
    write_file(file_of("mgmtd"),
               read_file(file_of("mgmtd")).value() + "[Service]\nRestrat=always\n");
    EXPECT_THAT(verify(file_of("mgmtd"), file_of("jsond")).err, HasSubstr("Restrat"));
}

TEST_F(Units, AreExposedToLittle)
{
    // In tenths, from 0 to 100: 20 and less is "OK" or better.
    for (const char *name : {"mgmtd", "jsond"}) {
        const Outcome outcome = run({"systemd-analyze", "security", "--offline=true",
                                     "--threshold=20", "--no-pager", file_of(name)});
        EXPECT_EQ(outcome.exit_code, 0) << outcome.out << outcome.err;
    }
}

TEST(SystemUsers, AreWhatSystemdUnderstands)
{
    const Outcome outcome =
        run({"systemd-sysusers", "--dry-run", OVMD_PACKAGING "/mgmtd.sysusers"});
    EXPECT_EQ(outcome.exit_code, 0) << outcome.err;
}

TEST(DataPlaneFolders, AreMadeWithTheirOwner)
{
    // Below a root of its own, in which the owner is known by number.
    const ScratchDir root;
    std::string text = read_file(OVMD_PACKAGING "/mgmtd.tmpfiles").value();
    for (std::size_t at = text.find("mgmtd mgmtd"); at != std::string::npos;
         at = text.find("mgmtd mgmtd"))
        text.replace(at, 11, "- -");
    write_file(root.path("test.conf"), text);
    const Outcome outcome =
        run({"systemd-tmpfiles", "--create", "--root=" + root.path(""), root.path("test.conf")});
    EXPECT_EQ(outcome.exit_code, 0) << outcome.err;
    EXPECT_EQ(run({"stat", "-c", "%F %a", root.path("var/opt/tms/output")}),
              (Outcome{0, "directory 755\n", ""}));
}

} // namespace

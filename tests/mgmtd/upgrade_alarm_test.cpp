// The alarms of software upgrades: host/modules/upgrade_alarm.h.

#include "host/modules/upgrade_alarm.h"

#include "tests/mgmtd/fixture.h"

#include <filesystem>

namespace
{

namespace fs = std::filesystem;
using namespace ovhost;
using namespace mgmtd_test;

class UpgradeAlarm : public DaemonTest
{
};

TEST_F(UpgradeAlarm, IsALineAtTheEndOfTheFile)
{
    fs::create_directory("/var/opt/tms/output");
    EXPECT_EQ(write_alarm("first"), std::nullopt);
    EXPECT_EQ(write_alarm("second % \xc3\xa9"), std::nullopt);
    EXPECT_EQ(read_file(upgrade_alarms_file), "first\nsecond % \xc3\xa9\n");
}

TEST_F(UpgradeAlarm, TellsWhyItCouldNotBeWritten)
{
    EXPECT_EQ(
        write_alarm("x").value_or(""),
        "/var/opt/tms/output/upgrade_alarms.txt cannot be opened (error code 14010): see that "
        "its folder is there, and the rights of both");
}

TEST_F(UpgradeAlarm, TellsThatItIsNotAllThere)
{
    fs::create_directory("/var/opt/tms/output");
    // Takes no byte, as a full disk does.
    fs::create_symlink("/dev/full", upgrade_alarms_file);
    EXPECT_EQ(write_alarm("x").value_or(""),
              "/var/opt/tms/output/upgrade_alarms.txt could not take the whole alarm: see whether "
              "there is space left");
}

TEST_F(UpgradeAlarm, IsOneLine)
{
    EXPECT_EQ(alarm_fault("restart"), std::nullopt);
    EXPECT_EQ(alarm_fault(""), "an alarm needs a text");
    for (const std::string &text :
         {std::string("a\nb"), std::string("a\0b", 3), std::string("\x7f")}) {
        EXPECT_EQ(alarm_fault(text), "an alarm is one line, without control characters");
    }
}

} // namespace

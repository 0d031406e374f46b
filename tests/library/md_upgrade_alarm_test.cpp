// The file of the alarms of software upgrades: the part of md_tunneld_tunnel_common about it.
#include "orvale/md_tunneld_tunnel_common.h"

#include "tests/library/library_test.h"

#include <sys/mount.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <iterator>
#include <sstream>
#include <string>

using namespace ovtest;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{

namespace fs = std::filesystem;

constexpr char function[] = "md_tunneld_write_sw_upgrade_alarm";
constexpr char alarm_dir[] = "/var/opt/tms/output";
constexpr char alarm_file[] = "/var/opt/tms/output/upgrade_alarms.txt";

std::string writing_line(const std::string &alarm)
{
    return gated_line(6, std::string(function) + ": writing alarm " + alarm);
}

std::string failure_line()
{
    return gated_line(3, "Write error opening /var/opt/tms/output/upgrade_alarms.txt");
}

class AlarmFile : public LibraryTest
{
  protected:
    void SetUp() override { fs::create_directory(alarm_dir); }

    static int write(const std::string &alarm)
    {
        return in_library(md_tunneld_write_sw_upgrade_alarm, alarm.c_str());
    }

    // The two lines of an alarm that could not be written; it is no error exit.
    static void expect_told(const std::string &alarm)
    {
        EXPECT_THAT(log_lines(), ElementsAre(writing_line(alarm), failure_line()));
        EXPECT_EQ(num_calls(Operation::bail_debug), 0U);
        EXPECT_EQ(num_calls(Operation::bail_quiet_debug), 0U);
    }
};

TEST_F(AlarmFile, ComesWithTheFirstAlarm)
{
    EXPECT_EQ(write("no room for the image"), 0);
    EXPECT_EQ(read_file(alarm_file), "no room for the image\n");
    EXPECT_THAT(log_lines(), ElementsAre(writing_line("no room for the image")));
}

TEST_F(AlarmFile, KeepsWhatWasThere)
{
    write_file(alarm_file, "before\nwithout end");
    EXPECT_EQ(write("first"), 0);
    EXPECT_EQ(write("second"), 0);
    EXPECT_EQ(read_file(alarm_file), "before\nwithout endfirst\nsecond\n");
    EXPECT_THAT(log_lines(), ElementsAre(writing_line("first"), writing_line("second")));
}

TEST_F(AlarmFile, TakesTheTextAsItIs)
{
    const std::string long_text(10'000, 'x');
    for (const std::string &text : {std::string(), std::string("%s %n"), std::string("two\nlines"),
                                    std::string("tail\n"), long_text}) {
        fs::remove(alarm_file);
        forget_calls();
        EXPECT_EQ(write(text), 0);
        EXPECT_EQ(read_file(alarm_file), text + '\n');
        EXPECT_THAT(log_lines(), ElementsAre(writing_line(text)));
    }
}

TEST_F(AlarmFile, IsClosedAfterEachAlarm)
{
    const auto before = num_open_descriptors();
    EXPECT_EQ(write("first"), 0);
    EXPECT_EQ(write("second"), 0);
    EXPECT_EQ(num_open_descriptors(), before);
}

TEST_F(AlarmFile, IsWrittenWhetherOrNotItIsTold)
{
    host_.set_log_level(5);
    EXPECT_EQ(write("silent"), 0);
    EXPECT_EQ(read_file(alarm_file), "silent\n");
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(AlarmFile, IsToldByTheDaemonsThresholdBeforeTheGeneralOne)
{
    G_log_level = 7;
    G_daemon_log_level = 5;
    EXPECT_EQ(write("silent"), 0);
    EXPECT_THAT(log_lines(), IsEmpty());
    G_log_level = 0;
    G_daemon_log_level = 6;
    EXPECT_EQ(write("told"), 0);
    EXPECT_THAT(log_lines(), ElementsAre(writing_line("told")));
}

// Alarms of one process, each long enough that half a line would be seen.
std::string alarm_of(char writer, int place)
{
    return std::string(300, writer) + ' ' + std::to_string(place);
}

void write_alarms(char writer, int count)
{
    for (int place = 0; place < count; ++place) {
        if (md_tunneld_write_sw_upgrade_alarm(alarm_of(writer, place).c_str()) != 0) {
            std::_Exit(1);
        }
    }
    std::_Exit(0);
}

std::vector<std::string> lines_of_file()
{
    std::istringstream text(read_file(alarm_file).value_or(""));
    std::vector<std::string> lines;
    for (std::string line; std::getline(text, line);) {
        lines.push_back(line);
    }
    return lines;
}

TEST_F(AlarmFile, TakesWholeLinesOfTwoProcesses)
{
    constexpr int count = 2000;
    host_.set_log_level(0);
    std::vector<pid_t> writers;
    for (const char writer : {'a', 'b'}) {
        const pid_t pid = ::fork();
        ASSERT_GE(pid, 0);
        if (pid == 0) {
            write_alarms(writer, count);
        }
        writers.push_back(pid);
    }
    for (const pid_t pid : writers) {
        int status = -1;
        ASSERT_EQ(::waitpid(pid, &status, 0), pid);
        EXPECT_EQ(status, 0);
    }
    const std::vector<std::string> lines = lines_of_file();
    EXPECT_EQ(lines.size(), std::size_t{2} * count);
    for (const char writer : {'a', 'b'}) {
        std::vector<std::string> expected;
        for (int place = 0; place < count; ++place) {
            expected.push_back(alarm_of(writer, place));
        }
        std::vector<std::string> own;
        std::ranges::copy_if(lines, std::back_inserter(own),
                             [&](const std::string &line) { return line[0] == writer; });
        EXPECT_TRUE(own == expected) << writer;
    }
}

TEST_F(AlarmFile, NeedsItsDirectory)
{
    fs::remove(alarm_dir);
    EXPECT_EQ(write("lost"), 14010);
    EXPECT_FALSE(fs::exists(alarm_dir));
    expect_told("lost");
}

TEST_F(AlarmFile, InADirectoryThatCannotBeWrittenIsAnError)
{
    ASSERT_EQ(::mount("tmpfs", alarm_dir, "tmpfs", 0, nullptr), 0) << "this test needs mounts";
    write_file(alarm_file, "before\n");
    ASSERT_EQ(::mount(nullptr, alarm_dir, nullptr, MS_REMOUNT | MS_RDONLY, nullptr), 0);
    EXPECT_EQ(write("lost"), 14010);
    EXPECT_EQ(read_file(alarm_file), "before\n");
    ASSERT_EQ(::umount(alarm_dir), 0);
    expect_told("lost");
}

TEST_F(AlarmFile, WithADirectoryInItsPlaceIsAnError)
{
    fs::create_directories(std::string(alarm_file) + "/inside");
    EXPECT_EQ(write("lost"), 14010);
    EXPECT_TRUE(fs::is_directory(std::string(alarm_file) + "/inside"));
    expect_told("lost");
}

TEST_F(AlarmFile, FailsWithoutATraceBelowTheThreshold)
{
    fs::remove(alarm_dir);
    host_.set_log_level(5);
    EXPECT_EQ(write("lost"), 14010);
    EXPECT_THAT(log_lines(), ElementsAre(failure_line()));
    forget_calls();
    host_.set_log_level(2);
    EXPECT_EQ(write("lost"), 14010);
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(AlarmFile, LosesAnAlarmOnAFullDisk)
{
    ASSERT_EQ(::mount("tmpfs", alarm_dir, "tmpfs", 0, "size=4096"), 0) << "this test needs mounts";
    write_file(alarm_file, std::string(4096, 'x'));
    EXPECT_EQ(write("lost"), 0);
    EXPECT_EQ(read_file(alarm_file), std::string(4096, 'x'));
    ASSERT_EQ(::umount(alarm_dir), 0);
    EXPECT_THAT(log_lines(), ElementsAre(writing_line("lost")));
}

TEST_F(AlarmFile, TakesNoNull)
{
    EXPECT_EQ(in_library(md_tunneld_write_sw_upgrade_alarm, nullptr), 14001);
    EXPECT_EQ(read_file(alarm_file), std::nullopt);
    EXPECT_THAT(log_lines(),
                ElementsAre(error_line("md_tunneld_tunnel_common", function, "Unexpected NULL")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
}

} // namespace

#include "orvale/md_dyna_limits.h"

#include "framework/appliance.h"
#include "tests/library/library_test.h"

#include <sys/mount.h>
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <string>

using namespace ovtest;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{

namespace fs = std::filesystem;

constexpr char limits_dir[] = "/var/opt/tms";
constexpr char limits_file[] = "/var/opt/tms/dynalimits.conf";
constexpr char limits_node[] = "/ov/tunneld/system/config/limits/";

constexpr char all_zero[] = "expected_mem 0\n"
                            "max_def_bw 0\n"
                            "max_loc_flows 0\n"
                            "max_cifs_conns 0\n"
                            "max_ssl_flows 0\n"
                            "nm_ram_size 0\n";

std::string line_of(const std::string &text)
{
    return error_line("md_dyna_limits", "write_dyna_limits_conf", text);
}

class LimitsFile : public LibraryTest
{
  protected:
    int write() { return in_library(write_dyna_limits_conf, host_.db()); }
    void set(const std::string &limit, const std::string &value)
    {
        host_.set(limits_node + limit, bt_uint32, value);
    }

    // There is no file, and the line is the only one logged.
    static void expect_no_file(const std::string &logged)
    {
        EXPECT_EQ(read_file(limits_file), std::nullopt);
        EXPECT_THAT(log_lines(), ElementsAre(logged));
        EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
    }
};

TEST_F(LimitsFile, AnEmptyDatabaseWritesSixZeros)
{
    EXPECT_EQ(write(), 0);
    EXPECT_EQ(read_file(limits_file), all_zero);
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(LimitsFile, EachLimitHasItsLine)
{
    set("mem_size", "1");
    set("system_bw", "2");
    set("total_flows", "3");
    set("cifs_flows", "4");
    set("ssl_flows", "5");
    set("nm_ram_size", "6");
    EXPECT_EQ(write(), 0);
    EXPECT_EQ(read_file(limits_file), "expected_mem 1\n"
                                      "max_def_bw 2\n"
                                      "max_loc_flows 3\n"
                                      "max_cifs_conns 4\n"
                                      "max_ssl_flows 5\n"
                                      "nm_ram_size 6\n");
}

TEST_F(LimitsFile, TheNodesAreReadInOrderAsTheHostExpectsIt)
{
    set("ssl_flows", "5");
    EXPECT_EQ(write(), 0);
    std::vector<std::string> reads;
    for (const char *limit :
         {"mem_size", "system_bw", "total_flows", "cifs_flows", "ssl_flows", "nm_ram_size"}) {
        reads.push_back("mdb_get_node_binding(null, *, \"" + (limits_node + std::string(limit)) +
                        "\", 0, *)");
    }
    EXPECT_EQ(calls_of(Operation::mdb_get_node_binding), reads);
    EXPECT_THAT(calls_of(Operation::bn_binding_get_uint32),
                ElementsAre("bn_binding_get_uint32(*, 1, 0, *)"));
    EXPECT_EQ(num_calls(Operation::bn_binding_free), 1U);
}

TEST_F(LimitsFile, ValuesBeyondTheSignedRangeAreNegative)
{
    set("mem_size", "4294967295");
    set("system_bw", "2147483648");
    set("total_flows", "2147483647");
    EXPECT_EQ(write(), 0);
    EXPECT_EQ(read_file(limits_file), "expected_mem -1\n"
                                      "max_def_bw -2147483648\n"
                                      "max_loc_flows 2147483647\n"
                                      "max_cifs_conns 0\n"
                                      "max_ssl_flows 0\n"
                                      "nm_ram_size 0\n");
}

TEST_F(LimitsFile, AnOldFileIsReplaced)
{
    write_file(limits_file, std::string(1000, 'x'));
    EXPECT_EQ(write(), 0);
    EXPECT_EQ(read_file(limits_file), all_zero);
}

// A reader that has the old file open keeps what it had.
TEST_F(LimitsFile, AnOldFileIsRemovedAndNotWrittenOver)
{
    write_file(limits_file, "old");
    const std::string second_name = std::string(limits_dir) + "/reader";
    fs::create_hard_link(limits_file, second_name);
    EXPECT_EQ(write(), 0);
    EXPECT_EQ(read_file(second_name), "old");
    EXPECT_EQ(read_file(limits_file), all_zero);
}

TEST_F(LimitsFile, ALinkInItsPlaceIsNotFollowed)
{
    const std::string target = std::string(limits_dir) + "/target";
    write_file(target, "kept");
    fs::create_symlink(target, limits_file);
    EXPECT_EQ(write(), 0);
    EXPECT_EQ(read_file(target), "kept");
    EXPECT_FALSE(fs::is_symlink(limits_file));
    EXPECT_EQ(read_file(limits_file), all_zero);
}

TEST_F(LimitsFile, ModelInformationIsFilledFirst)
{
    ov_system_info.initialized = 0;
    EXPECT_EQ(write(), 0);
    EXPECT_THAT(calls_of(Operation::init_model_info), ElementsAre("init_model_info(*)"));
    EXPECT_NE(ov_system_info.initialized, 0);
}

TEST_F(LimitsFile, ModelInformationIsFilledOnce)
{
    ov_system_info.initialized = 1;
    EXPECT_EQ(write(), 0);
    EXPECT_EQ(num_calls(Operation::init_model_info), 0U);
    // Any value but 0 means that it is filled.
    ov_system_info.initialized = 200;
    EXPECT_EQ(write(), 0);
    EXPECT_EQ(num_calls(Operation::init_model_info), 0U);
}

TEST_F(LimitsFile, WithoutModelInformationAnOldFileStays)
{
    write_file(limits_file, "old");
    arm({.operation = Operation::init_model_info, .code = 14004});
    EXPECT_EQ(write(), 14004);
    EXPECT_EQ(read_file(limits_file), "old");
    EXPECT_THAT(log_lines(), ElementsAre(line_of("Error code 14004 (item not found) returned")));
}

TEST_F(LimitsFile, AFailingReadOfTheFourthNodeLeavesNoFile)
{
    write_file(limits_file, "old");
    arm({.operation = Operation::mdb_get_node_binding, .call = 4, .code = 14004});
    EXPECT_EQ(write(), 14004);
    expect_no_file(line_of("Error code 14004 (item not found) returned"));
    EXPECT_EQ(num_calls(Operation::mdb_get_node_binding), 4U);
}

TEST_F(LimitsFile, ACancelledReadLeavesNoFileSilently)
{
    arm({.operation = Operation::mdb_get_node_binding, .call = 6, .code = 14120});
    EXPECT_EQ(write(), 14120);
    EXPECT_EQ(read_file(limits_file), std::nullopt);
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_EQ(num_calls(Operation::bail_quiet_debug), 1U);
}

TEST_F(LimitsFile, ALimitOfAnotherTypeLeavesNoFile)
{
    host_.set(std::string(limits_node) + "nm_ram_size", bt_string, "12");
    EXPECT_EQ(write(), 14020);
    expect_no_file(line_of("Error code 14020 (type conversion failed) returned"));
}

TEST_F(LimitsFile, WhatWasReadIsReleasedBehindTheErrorExit)
{
    host_.set(std::string(limits_node) + "nm_ram_size", bt_string, "12");
    EXPECT_EQ(write(), 14020);
    const std::vector<std::string> called = operations_called();
    ASSERT_GE(called.size(), 5U);
    EXPECT_THAT(std::vector<std::string>(called.end() - 5, called.end()),
                ElementsAre("bn_binding_get_uint32", "lc_enum_to_string_quiet_null",
                            "lc_log_internal", "bail_debug", "bn_binding_free"));
}

TEST_F(LimitsFile, AFailureLeavesNoFileOpen)
{
    const auto before = num_open_descriptors();
    for (const Operation operation :
         {Operation::mdb_get_node_binding, Operation::bn_binding_get_uint32}) {
        set("mem_size", "1");
        for (const int code : {14004, 14120}) {
            arm({.operation = operation, .code = code});
            EXPECT_EQ(write(), code);
            EXPECT_EQ(num_open_descriptors(), before);
        }
    }
    disarm();
    fs::create_directory(limits_file);
    EXPECT_EQ(write(), 14001);
    EXPECT_EQ(num_open_descriptors(), before);
    fs::remove(limits_file);
    EXPECT_EQ(write(), 0);
    EXPECT_EQ(num_open_descriptors(), before);
}

TEST_F(LimitsFile, ANullDatabaseLeavesTheOldFileAlone)
{
    ov_system_info.initialized = 1;
    ASSERT_EQ(write(), 0);
    EXPECT_EQ(in_library(write_dyna_limits_conf, nullptr), 14001);
    EXPECT_EQ(read_file(limits_file), all_zero);
    EXPECT_THAT(log_lines(), ElementsAre(line_of("Unexpected NULL")));
}

TEST_F(LimitsFile, AMissingDirectoryIsAnError)
{
    ASSERT_EQ(::mount("tmpfs", "/var/opt", "tmpfs", 0, nullptr), 0) << "this test needs mounts";
    EXPECT_FALSE(fs::exists(limits_dir));
    EXPECT_EQ(write(), 14001);
    EXPECT_FALSE(fs::exists(limits_dir));
    ASSERT_EQ(::umount("/var/opt"), 0);
    expect_no_file(line_of("Unexpected NULL"));
    EXPECT_EQ(num_calls(Operation::mdb_get_node_binding), 0U);
}

TEST_F(LimitsFile, ADirectoryThatCannotBeWrittenIsAnError)
{
    ASSERT_EQ(::mount("tmpfs", limits_dir, "tmpfs", 0, nullptr), 0) << "this test needs mounts";
    ASSERT_EQ(::mount(nullptr, limits_dir, nullptr, MS_REMOUNT | MS_RDONLY, nullptr), 0);
    EXPECT_EQ(write(), 14001);
    ASSERT_EQ(::umount(limits_dir), 0);
    expect_no_file(line_of("Unexpected NULL"));
}

TEST_F(LimitsFile, ADirectoryInItsPlaceIsAnError)
{
    fs::create_directories(std::string(limits_file) + "/inside");
    EXPECT_EQ(write(), 14001);
    EXPECT_TRUE(fs::is_directory(std::string(limits_file) + "/inside"));
    EXPECT_THAT(log_lines(), ElementsAre(line_of("Unexpected NULL")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
}

// A file system that has room for an empty file alone.
class FullDisk : public LimitsFile
{
  protected:
    void SetUp() override
    {
        ASSERT_EQ(::mount("tmpfs", limits_dir, "tmpfs", 0, "size=4096"), 0)
            << "this test needs mounts";
        mounted_ = true;
        write_file(std::string(limits_dir) + "/filler", std::string(4096, 'x'));
    }

    void TearDown() override
    {
        if (mounted_) {
            EXPECT_EQ(::umount(limits_dir), 0);
        }
        LimitsFile::TearDown();
    }

  private:
    bool mounted_ = false;
};

TEST_F(FullDisk, LeavesNoFile)
{
    const auto num_open = num_open_descriptors();
    EXPECT_EQ(write(), 14014);
    EXPECT_EQ(num_open_descriptors(), num_open);
    expect_no_file(line_of("Error code 14014 (generic IO error) returned"));
}

#if OVTEST_ALLOCATION_LAYER
// Without memory for a buffer the lines fail one by one, and closing the file succeeds.
TEST_F(FullDisk, LeavesNoFileWithoutBufferEither)
{
    arm({.operation = Operation::allocation, .call = 2});
    EXPECT_EQ(write(), 14014);
    EXPECT_TRUE(fault_struck());
    expect_no_file(line_of("Error code 14014 (generic IO error) returned"));
}
#endif

TEST_F(FullDisk, IsRelievedOfTheOldFileFirst)
{
    fs::remove(std::string(limits_dir) + "/filler");
    write_file(limits_file, "old");
    EXPECT_EQ(write(), 0);
    EXPECT_EQ(read_file(limits_file), all_zero);
}

} // namespace

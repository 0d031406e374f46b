#include "host/modules/default_values.h"

#include "host/framework/appliance_config.h"
#include "tests/mgmtd/fixture.h"

#include <sys/stat.h>

#include <algorithm>
#include <filesystem>

namespace
{

namespace fs = std::filesystem;
using namespace ovhost;
using namespace mgmtd_test;
using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;

constexpr const char *mode_node = "/ov/tunneld/system/config/mode";
constexpr const char *flows_node = "/ov/tunneld/system/config/limits/total_flows";

class DefaultValues : public DaemonTest
{
  protected:
    void apply()
    {
        apply_default_values(candidate_,
                             {[this](const DefaultsSummary &summary) {
                                  summaries_.push_back(summary.source + " " +
                                                       std::to_string(summary.set) + "/" +
                                                       std::to_string(summary.removed));
                              },
                              [this](const std::string &text) { warnings_.push_back(text); }});
    }

    /// What apply() throws.
    std::string fault()
    {
        try {
            apply();
        } catch (const DefaultsError &error) {
            return error.what();
        }
        return "none";
    }

    /// The named model's file stops the start, which says why whatever the log level is.
    void expect_unusable_model_file(const std::string &reason)
    {
        EXPECT_EQ(fault(), "the model's default file /opt/orvale/defdb.conf.m1 cannot be used: " +
                               reason + "; mend it or name another --model");
    }

    std::string value(const std::string &name) const { return value_in(candidate_.tree(), name); }

    Candidate candidate_;
    std::vector<std::string> summaries_;
    std::vector<std::string> warnings_;
};

TEST_F(DefaultValues, AreTheCompiledInOnesWithoutAnyFile)
{
    apply();
    EXPECT_THAT(
        nodes_of(candidate_.tree()),
        testing::UnorderedElementsAre("/ov/tunneld/system/config/mode string bridge",
                                      "/ov/tunneld/system/config/submode string normal",
                                      "/ov/tunneld/system/config/routing_inline bool false",
                                      "/ov/tunneld/system/config/10g bool false",
                                      "/ov/tunneld/system/config/bonding bool false",
                                      "/ov/tunneld/system/config/limits/mem_size uint32 2048",
                                      "/ov/tunneld/system/config/limits/system_bw uint32 10000",
                                      "/ov/tunneld/system/config/limits/total_flows uint32 10000",
                                      "/ov/tunneld/system/config/limits/cifs_flows uint32 500",
                                      "/ov/tunneld/system/config/limits/ssl_flows uint32 500",
                                      "/ov/tunneld/system/config/limits/nm_ram_size uint32 128"));
    EXPECT_THAT(summaries_, ElementsAre("compiled-in defaults 11/0", "model defaults 0/0",
                                        "debugging defaults 0/0", "preserved values 0/0"));
    EXPECT_THAT(warnings_, IsEmpty());
}

TEST_F(DefaultValues, ComeFromEachFileAndTheLaterOneWins)
{
    set_config_name("m1");
    write_file(model_file, "/x/model,string,m\n/x/debug,string,m\n/x/preserved,string,m\n"
                           "/ov/tunneld/system/config/mode,string,router\n");
    write_file(debug_file, "/x/debug,string,d\n/x/preserved,string,d\n");
    write_file(preserved_file, "/x/preserved,string,p\n");
    apply();
    EXPECT_EQ(value(mode_node), "string router");
    EXPECT_EQ(value("/x/model"), "string m");
    EXPECT_EQ(value("/x/debug"), "string d");
    EXPECT_EQ(value("/x/preserved"), "string p");
    EXPECT_THAT(summaries_, ElementsAre("compiled-in defaults 11/0", "model defaults 4/0",
                                        "debugging defaults 2/0", "preserved values 1/0"));
}

TEST_F(DefaultValues, AreTakenAwayByLaterRemovals)
{
    set_config_name("m1");
    write_file(model_file, "-/ov/tunneld/system/config/submode\n/x/a/b,string,m\n/x/a,string,m\n");
    write_file(debug_file, "-/x/a\n-/x/not/there\n");
    write_file(preserved_file, "/x/a/c,string,p\n");
    apply();
    EXPECT_EQ(value("/ov/tunneld/system/config/submode"), "none");
    EXPECT_EQ(value("/x/a"), "none");
    EXPECT_EQ(value("/x/a/b"), "none");
    EXPECT_EQ(value("/x/a/c"), "string p");
    // What is not there is not removed.
    EXPECT_THAT(summaries_, ElementsAre("compiled-in defaults 11/0", "model defaults 2/1",
                                        "debugging defaults 0/1", "preserved values 1/0"));
}

TEST_F(DefaultValues, AreRemovedByAFileWhateverElseItSays)
{
    write_file(debug_file, "-/x/a\n/x/a,string,d\n");
    apply();
    EXPECT_EQ(value("/x/a"), "none");
}

TEST_F(DefaultValues, NeedNoModel)
{
    set_config_name("");
    apply();
    EXPECT_THAT(summaries_, Contains("model defaults 0/0"));
}

TEST_F(DefaultValues, NeedTheFileOfAModelThatIsNamed)
{
    set_config_name("m1");
    expect_unusable_model_file("it cannot be opened: No such file or directory");
}

TEST_F(DefaultValues, DoNotComeFromAModelFileThatEverybodyMayWrite)
{
    set_config_name("m1");
    write_file(model_file, "/x/model,string,m\n");
    ASSERT_EQ(::chmod(model_file, 0666), 0);
    expect_unusable_model_file("everybody may write to it; take that right away with chmod o-w");
}

TEST_F(DefaultValues, DoNotComeFromADirectoryInTheModelFilesPlace)
{
    set_config_name("m1");
    fs::create_directory(model_file);
    expect_unusable_model_file("it is not a regular file");
}

TEST_F(DefaultValues, FailOnEveryBadLineOfTheModelFile)
{
    set_config_name("m1");
    // The last line is good: the library's own status knows of no fault.
    write_file(model_file, "# model\n/x/a\n/x/b,nosuchtype,1\n/x/c,uint8,300\nx,string,y\n-\n"
                           "/x/good,string,1\n");
    EXPECT_EQ(
        fault(),
        "/opt/orvale/defdb.conf.m1 has faults; mend it and start again\n"
        "  line 2: /x/a: a value line needs a name and a type: NAME,TYPE,VALUE\n"
        "  line 3: /x/b: unknown type \"nosuchtype\"\n"
        "  line 4: /x/c: \"300\" is not a uint8: must be a decimal number from 0 to 255\n"
        "  line 5: x: \"x\" is not the name of a node: a name is /PART/PART, with \"\\/\" for "
        "a slash inside a part\n"
        "  line 6: a removal line needs a name: -NAME");
}

TEST_F(DefaultValues, FailOnABadLastLineOfTheModelFile)
{
    set_config_name("m1");
    write_file(model_file, "/x/good,string,1\n/x/a,nosuchtype,1\n");
    EXPECT_EQ(fault(), "/opt/orvale/defdb.conf.m1 has faults; mend it and start again\n"
                       "  line 2: /x/a: unknown type \"nosuchtype\"");
}

TEST_F(DefaultValues, LeaveOutBadLinesOfTheOtherFiles)
{
    write_file(debug_file,
               "/x/d1,string,1\n/x/bad,uint8,300\n/x/bad,nosuchtype,1\n/x/d2,string,2\n");
    write_file(preserved_file, "/x/p1,string,1\n/x/bad\n");
    apply();
    EXPECT_EQ(value("/x/d1"), "string 1");
    EXPECT_EQ(value("/x/d2"), "string 2");
    EXPECT_EQ(value("/x/p1"), "string 1");
    EXPECT_EQ(value("/x/bad"), "none");
    EXPECT_THAT(
        warnings_,
        ElementsAre("/var/opt/tms/.debug_default_db, line 2: /x/bad: \"300\" is not a uint8: must "
                    "be a decimal number from 0 to 255; left out",
                    "/var/opt/tms/.debug_default_db, line 3: /x/bad: unknown type \"nosuchtype\"; "
                    "left out",
                    "/var/opt/tms/.preserved_db, line 2: /x/bad: a value line needs a name and a "
                    "type: NAME,TYPE,VALUE; left out"));
    EXPECT_THAT(summaries_, ElementsAre("compiled-in defaults 11/0", "model defaults 0/0",
                                        "debugging defaults 2/0", "preserved values 1/0"));
}

TEST_F(DefaultValues, NeedEveryFileThatIsThereToBeReadable)
{
    for (const char *file : {debug_file, preserved_file}) {
        fs::create_directory(file);
        EXPECT_EQ(fault(), std::string(file) +
                               " cannot be read: it is not a regular file; mend that, or move it "
                               "away, and start again");
        fs::remove(file);
        // Nobody ever writes to it: waiting for that would last for ever.
        ASSERT_EQ(::mkfifo(file, 0600), 0);
        EXPECT_THAT(fault(), HasSubstr("it is not a regular file"));
        fs::remove(file);
        fs::create_symlink(fs::path(file).filename(), file);
        EXPECT_EQ(fault(), std::string(file) +
                               " cannot be read: Too many levels of symbolic links; mend that, or "
                               "move it away, and start again");
        fs::remove(file);
    }
    EXPECT_EQ(fault(), "none");
}

TEST_F(DefaultValues, LeaveOutLinesWithNulBytesAndNamesThatAreNotUtf8)
{
    using namespace std::string_literals;
    // To the library nearly all of them are good entries.
    write_file(debug_file, "/x/a,string,1\n/x/a,string,2\0two\n/x/b,string\0,1\n/x/\xff,string,1\n"
                           "-/x/c\0\n/x/c,string,3\n-/x/\xff\n/x/caf\xc3\xa9,string,\xe9\n"s);
    apply();
    EXPECT_EQ(value("/x/a"), "string 1");
    EXPECT_EQ(value("/x/b"), "none");
    EXPECT_EQ(value("/x/\xff"), "none");
    EXPECT_EQ(value("/x/c"), "string 3");
    EXPECT_EQ(value("/x/caf\xc3\xa9"), "string \xe9");
    const std::string at = "/var/opt/tms/.debug_default_db, line ";
    EXPECT_THAT(
        warnings_,
        ElementsAre(at + "2: the line holds a NUL byte; left out",
                    at + "3: the line holds a NUL byte; left out",
                    at + "4: /x/\\xff: the node's name is not UTF-8: convert the file first; left "
                         "out",
                    at + "5: the line holds a NUL byte; left out",
                    at + "7: /x/\\xff: the node's name is not UTF-8: convert the file first; left "
                         "out"));
    EXPECT_THAT(summaries_, Contains("debugging defaults 3/0"));
}

TEST_F(DefaultValues, LeaveOutLinesThatEndWithACarriageReturn)
{
    write_file(preserved_file, "/x/a,string,1\r\n/x/b,string,2\n");
    apply();
    EXPECT_EQ(value("/x/a"), "none");
    EXPECT_EQ(value("/x/b"), "string 2");
    EXPECT_THAT(warnings_, ElementsAre("/var/opt/tms/.preserved_db, line 1: the line ends with a "
                                       "carriage return: save the file with plain line ends; left "
                                       "out"));
}

TEST_F(DefaultValues, LeaveOutWhatNoModuleTakes)
{
    // Without the last line about the mode, the one before it counts.
    write_file(debug_file, "/ov/tunneld/system/config/mode,string,server\n"
                           "/x/a,string,1\n"
                           "/ov/tunneld/system/config/mode,string,brigde\n"
                           "/ov/tunneld/system/config/limits/mem_size,string,much\n"
                           "/ov/tunneld/system/config/mode,string,ruoter\n");
    apply();
    EXPECT_EQ(value(mode_node), "string server");
    EXPECT_EQ(value("/x/a"), "string 1");
    EXPECT_EQ(value("/ov/tunneld/system/config/limits/mem_size"), "uint32 2048");
    const std::string at = "/var/opt/tms/.debug_default_db, line ";
    EXPECT_THAT(
        warnings_,
        ElementsAre(at + "3: /ov/tunneld/system/config/mode: must be bridge, router or server, not "
                         "\"brigde\"; left out",
                    at + "4: /ov/tunneld/system/config/limits/mem_size: must be of type uint32; "
                         "left out",
                    at + "5: /ov/tunneld/system/config/mode: must be bridge, router or server, not "
                         "\"ruoter\"; left out"));
}

TEST_F(DefaultValues, FailOnAValueOfTheModelFileThatNoModuleTakes)
{
    set_config_name("m1");
    write_file(model_file, "/x/a,string,1\n/ov/tunneld/system/config/mode,string,brigde\n");
    EXPECT_EQ(fault(), "/opt/orvale/defdb.conf.m1 has faults; mend it and start again\n"
                       "  line 2: /ov/tunneld/system/config/mode: must be bridge, router or "
                       "server, not \"brigde\"");
}

TEST_F(DefaultValues, ShowNoControlCharacters)
{
    set_config_name("m1");
    write_file(model_file, "/x/\x1b[31m,nosuchtype,1\n");
    EXPECT_EQ(fault(), "/opt/orvale/defdb.conf.m1 has faults; mend it and start again\n"
                       "  line 1: /x/\\x1b[31m: unknown type \"nosuchtype\"");
}

// The first start of the daemon, where the values become durable.

using FirstStart = DefaultValues;

TEST_F(FirstStart, StoresTheDefaultsAndMovesThePreservedValues)
{
    write_file(preserved_file, "/x/preserved,string,p\n");
    {
        Configuration configuration(state_.path());
        EXPECT_TRUE(read_file(preserved_file));
        configuration.start();
        EXPECT_EQ(configuration.commit_number(), 1U);
        EXPECT_EQ(value_in(configuration.running(), "/x/preserved"), "string p");
        EXPECT_THAT(configuration.candidate().pending(configuration.running()), IsEmpty());
    }
    EXPECT_FALSE(read_file(preserved_file));
    EXPECT_EQ(read_file("/var/opt/tms/.preserved_db.read"), "/x/preserved,string,p\n");
    EXPECT_THAT(daemon_log(), ElementsAre("notice compiled-in defaults: 11 set, 0 removed",
                                          "notice model defaults: 0 set, 0 removed",
                                          "notice debugging defaults: 0 set, 0 removed",
                                          "notice preserved values: 1 set, 0 removed",
                                          "notice first configuration stored: 12 nodes"));
    Configuration again(state_.path());
    EXPECT_EQ(value_in(again.running(), "/x/preserved"), "string p");
}

TEST_F(FirstStart, HappensOnce)
{
    {
        Configuration configuration(state_.path());
        configuration.start();
    }
    write_file(debug_file, "/x/late,string,1\n");
    write_file(preserved_file, "/x/late,string,2\n");
    Configuration again(state_.path());
    again.start();
    EXPECT_EQ(value_in(again.running(), "/x/late"), "none");
    EXPECT_TRUE(read_file(preserved_file));
    EXPECT_EQ(again.commit_number(), 1U);
}

TEST_F(FirstStart, StoresNothingWhenTheModelFileHasAFault)
{
    set_config_name("m1");
    write_file(model_file, "/x/a,nosuchtype,1\n/x/good,string,1\n");
    write_file(preserved_file, "/x/preserved,string,p\n");
    {
        Configuration configuration(state_.path());
        EXPECT_THROW(configuration.start(), DefaultsError);
        EXPECT_EQ(configuration.commit_number(), 0U);
        EXPECT_EQ(configuration.running().size(), 0U);
    }
    EXPECT_EQ(read_file(preserved_file), "/x/preserved,string,p\n");
    EXPECT_FALSE(read_file(limits_file));

    // Mended, it is a first start again.
    write_file(model_file, "/x/good,string,1\n");
    Configuration again(state_.path());
    again.start();
    EXPECT_EQ(again.commit_number(), 1U);
    EXPECT_EQ(value_in(again.running(), "/x/good"), "string 1");
    EXPECT_EQ(value_in(again.running(), "/x/preserved"), "string p");
}

TEST_F(FirstStart, StoresNothingWhenAModuleRefuses)
{
    // Each line is fit for its node; together they are not.
    write_file(preserved_file, "/ov/tunneld/tunnel/config/a,string,a\n"
                               "/ov/tunneld/tunnel/config/a/id,uint16,7\n"
                               "/ov/tunneld/tunnel/config/b,string,b\n"
                               "/ov/tunneld/tunnel/config/b/id,uint16,7\n");
    Configuration configuration(state_.path());
    std::string message;
    try {
        configuration.start();
    } catch (const std::runtime_error &error) {
        message = error.what();
    }
    EXPECT_EQ(message, "the first configuration is refused\n  tunnels \"a\" and \"b\" ask for one "
                       "ID, 7 (tunnels)");
    EXPECT_EQ(configuration.commit_number(), 0U);
    EXPECT_TRUE(read_file(preserved_file));
}

TEST_F(DefaultValues, WarnOfAValueThatEndsAtAComma)
{
    set_config_name("m1");
    write_file(model_file, "/x/m,string,a,b\n");
    write_file(debug_file, "/x/d,string,c\n/x/e,string,,f\n");
    apply();
    EXPECT_EQ(value("/x/m"), "string a");
    EXPECT_EQ(value("/x/d"), "string c");
    EXPECT_EQ(value("/x/e"), "string ");
    const std::string words =
        ": a value in a file cannot hold a comma; use ovctl set; it ends before the comma";
    EXPECT_THAT(warnings_, ElementsAre("/opt/orvale/defdb.conf.m1, line 1: /x/m" + words,
                                       "/var/opt/tms/.debug_default_db, line 2: /x/e" + words));
}

TEST_F(FirstStart, KeepsPreservedValuesOfWhichSomeWereLeftOut)
{
    const std::string text = "/x/good,string,1\n/ov/tunneld/system/config/mode,string,brigde\n";
    write_file(preserved_file, text);
    Configuration configuration(state_.path());
    configuration.start();
    EXPECT_EQ(value_in(configuration.running(), "/x/good"), "string 1");
    EXPECT_EQ(read_file(preserved_file), text);
    EXPECT_FALSE(read_file("/var/opt/tms/.preserved_db.read"));
    const std::string warning =
        "warning /var/opt/tms/.preserved_db stays where it is, for lines of "
        "it were left out: set what they were to say with ovctl, then "
        "remove it";
    const auto lines = daemon_log();
    EXPECT_EQ(std::ranges::count(lines, warning), 1);
    EXPECT_THAT(lines, Contains("warning /var/opt/tms/.preserved_db, line 2: /ov/tunneld/system/"
                                "config/mode: must be bridge, router or server, not \"brigde\"; "
                                "left out"));
}

TEST_F(FirstStart, TellsBadLinesInTheLog)
{
    write_file(debug_file, "/x/bad\n/x/good,string,1\n");
    Configuration configuration(state_.path());
    configuration.start();
    EXPECT_EQ(value_in(configuration.running(), "/x/good"), "string 1");
    EXPECT_THAT(daemon_log(),
                Contains("warning /var/opt/tms/.debug_default_db, line 1: /x/bad: a value line "
                         "needs a name and a type: NAME,TYPE,VALUE; left out"));
}

TEST_F(FirstStart, TakesNodesThatNoModuleKnows)
{
    // Nodes of other daemons are theirs to judge.
    write_file(debug_file, "/other/daemon/node,uint64,18446744073709551615\n");
    Configuration configuration(state_.path());
    configuration.start();
    EXPECT_EQ(value_in(configuration.running(), "/other/daemon/node"),
              "uint64 18446744073709551615");
    EXPECT_EQ(value_in(configuration.running(), flows_node), "uint32 10000");
}

} // namespace

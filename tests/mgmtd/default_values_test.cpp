#include "host/modules/default_values.h"

#include "host/framework/appliance_config.h"
#include "tests/mgmtd/fixture.h"

#include <sys/stat.h>

#include <filesystem>

namespace
{

namespace fs = std::filesystem;
using namespace ovhost;
using namespace mgmtd_test;
using testing::Contains;
using testing::ElementsAre;
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

    /// The named model's file stops the start, and the log says why.
    void expect_unusable_model_file(const std::string &reason)
    {
        EXPECT_EQ(fault(), "the model's default file /opt/orvale/defdb.conf.m1 cannot be used (the "
                           "log says why); mend it or name another --model");
        ASSERT_EQ(log_.lines.size(), 1U);
        EXPECT_EQ(log_.lines[0].text,
                  "configuration file /opt/orvale/defdb.conf.m1 is not used: " + reason);
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

TEST_F(DefaultValues, WarnOfAFileThatCannotBeRead)
{
    fs::create_directory(debug_file);
    apply();
    EXPECT_THAT(warnings_, ElementsAre("/var/opt/tms/.debug_default_db, the file cannot be read "
                                       "(error code 14014); left out"));
    EXPECT_EQ(value(mode_node), "string bridge");
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
    write_file(preserved_file, "/ov/tunneld/system/config/mode,string,brigde\n"
                               "/ov/tunneld/system/config/limits/mem_size,string,much\n");
    Configuration configuration(state_.path());
    std::string message;
    try {
        configuration.start();
    } catch (const std::runtime_error &error) {
        message = error.what();
    }
    EXPECT_EQ(message,
              "the first configuration is refused\n"
              "  /ov/tunneld/system/config/limits/mem_size: must be of type uint32 (schema)\n"
              "  /ov/tunneld/system/config/mode: must be bridge, router or server, not \"brigde\" "
              "(schema)");
    EXPECT_EQ(configuration.commit_number(), 0U);
    EXPECT_TRUE(read_file(preserved_file));
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

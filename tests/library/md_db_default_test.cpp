#include "orvale/md_db_default.h"

#include "host/framework/appliance_config.h"
#include "tests/library/default_entries.h"
#include "tests/library/library_test.h"

#include <sys/stat.h>

#include <cstring>
#include <filesystem>
#include <string>

using namespace ovtest;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{

namespace fs = std::filesystem;

std::string line_of(const std::string &function, const std::string &text)
{
    return error_line("md_db_default", function, text);
}

constexpr char converter[] = "convert_line_to_bn_str_value";
constexpr char parser[] = "db_default_get_file_default";
constexpr char parse_error[] = "Error code 14012 (generic parser error) returned";
constexpr char type_error[] = "Error code 14020 (type conversion failed) returned";

// What the readers deliver when there is nothing to read.
constexpr char nothing[] = "0 | 0 untouched | 0 untouched";

// The text format, read through the debugging defaults.
class DefaultFormat : public LibraryTest
{
  protected:
    std::string read(const std::string &text)
    {
        write_file(debug_file, text);
        return read_defaults(db_default_get_all);
    }
};

TEST_F(DefaultFormat, OneEntryALine)
{
    EXPECT_EQ(read("/ov/tunneld/system/config/mode,string,router\n"
                   "/ov/tunneld/system/config/limits/mem_size,uint32,2048\n"),
              "0 | 2 [/ov/tunneld/system/config/mode 101 'router', "
              "/ov/tunneld/system/config/limits/mem_size 5 '2048'] | 0 null");
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(DefaultFormat, TheLastLineNeedsNoLineEnd)
{
    EXPECT_EQ(read("/a,string,x\n/b,string,y"), "0 | 2 [/a 101 'x', /b 101 'y'] | 0 null");
}

TEST_F(DefaultFormat, LeadingSpacesAndTabsAreSkipped)
{
    EXPECT_EQ(read("  \t /a/b,uint32,5\n\t\t/c,string,x\n \t-/d\n"),
              "0 | 2 [/a/b 5 '5', /c 101 'x'] | 1 [/d 0 null]");
}

TEST_F(DefaultFormat, AllOtherBlanksBelongToTheFields)
{
    EXPECT_EQ(read("/a b ,string, x \t\n"), "0 | 1 [/a b  101 ' x \t'] | 0 null");
    EXPECT_EQ(read("/a, string,x\n"), "14020 | 0 [] | 0 null");
    EXPECT_EQ(read("/a,string ,x\n"), "14020 | 0 [] | 0 null");
    EXPECT_THAT(log_lines(),
                ElementsAre(line_of(converter, "Unable to convert  string type"),
                            line_of(parser, type_error), line_of("db_default_get_all", type_error),
                            line_of(converter, "Unable to convert string  type"),
                            line_of(parser, type_error),
                            line_of("db_default_get_all", type_error)));
}

TEST_F(DefaultFormat, OnlySpacesAndTabsAreLeadingBlanks)
{
    EXPECT_EQ(read("\v/a,string,x\n"), "0 | 1 [\v/a 101 'x'] | 0 null");
}

TEST_F(DefaultFormat, ACarriageReturnBelongsToTheLastField)
{
    EXPECT_EQ(read("/a,string,x\r\n-/b\r\n"), "0 | 1 [/a 101 'x\r'] | 1 [/b\r 0 null]");
}

TEST_F(DefaultFormat, CommentsAndBlankLinesAreIgnored)
{
    EXPECT_EQ(read("# a comment\n\n   \n\t\n  # one with blanks before\n#\n/a,string,x\n\n# end\n"),
              "0 | 1 [/a 101 'x'] | 0 null");
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(DefaultFormat, NothingButCommentsIsNothing)
{
    EXPECT_EQ(read("# comment\n\n    \n\t \t\n"), "0 | 0 null | 0 null");
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(DefaultFormat, AHashElsewhereIsAnOrdinaryCharacter)
{
    EXPECT_EQ(read("/a#b,string,x # y\n-#/c\n"), "0 | 1 [/a#b 101 'x # y'] | 1 [#/c 0 null]");
}

TEST_F(DefaultFormat, AMinusElsewhereIsAnOrdinaryCharacter)
{
    EXPECT_EQ(read("/a-b,int32,-5\n"), "0 | 1 [/a-b 6 '-5'] | 0 null");
}

TEST_F(DefaultFormat, AValueEndsAtTheNextComma)
{
    EXPECT_EQ(read("/a/b,string,x,y\n"), "0 | 1 [/a/b 101 'x'] | 0 null");
    EXPECT_EQ(read("/a/b,string,,y\n"), "0 | 1 [/a/b 101 ''] | 0 null");
    EXPECT_EQ(read("-/a/b,string,x,y,z\n"), "0 | 0 null | 1 [/a/b 101 'x']");
}

TEST_F(DefaultFormat, ThereIsNoQuotingAndNoEscaping)
{
    EXPECT_EQ(read("/a,string,\"x,y\"\n/b,string,x\\,y\n"),
              "0 | 2 [/a 101 '\"x', /b 101 'x\\'] | 0 null");
}

TEST_F(DefaultFormat, AMissingValueIsEmptyText)
{
    EXPECT_EQ(read("/a/b,string\n/c,string,\n"), "0 | 2 [/a/b 101 '', /c 101 ''] | 0 null");
}

TEST_F(DefaultFormat, AValueNeedsItsName)
{
    EXPECT_EQ(read(",uint32,5\n"), "14012 | 0 [] | 0 null");
    EXPECT_THAT(log_lines(), ElementsAre(line_of(parser, parse_error),
                                         line_of("db_default_get_all", parse_error)));
    EXPECT_EQ(num_calls(Operation::bail_debug), 2U);
    EXPECT_EQ(num_calls(Operation::lc_string_to_enum), 0U);
}

TEST_F(DefaultFormat, AValueNeedsItsType)
{
    EXPECT_EQ(read("/a/b,,5\n"), "14012 | 0 [] | 0 null");
    EXPECT_EQ(read("/a/b\n"), "14012 | 0 [] | 0 null");
    EXPECT_EQ(read("/a/b,\n"), "14012 | 0 [] | 0 null");
    EXPECT_EQ(read(",\n"), "14012 | 0 [] | 0 null");
}

TEST_F(DefaultFormat, AValuesTypeMustBeKnown)
{
    EXPECT_EQ(read("/a/b,nosuchtype,5\n"), "14020 | 0 [] | 0 null");
    EXPECT_THAT(log_lines(), ElementsAre(line_of(converter, "Unable to convert nosuchtype type"),
                                         line_of(parser, type_error),
                                         line_of("db_default_get_all", type_error)));
    // The first line says more; the error exits are the other two.
    EXPECT_EQ(num_calls(Operation::bail_debug), 2U);
}

TEST_F(DefaultFormat, TypeNamesAreExact)
{
    for (const char *type : {"String", "strin", "strings", "uint3", "5"}) {
        EXPECT_EQ(read("/a," + std::string(type) + ",x\n"), "14020 | 0 [] | 0 null") << type;
    }
}

TEST_F(DefaultFormat, ALineThatIsNoNodeNameIsStillAnEntry)
{
    EXPECT_EQ(read("no slash,bool,maybe\n"), "0 | 1 [no slash 9 'maybe'] | 0 null");
}

TEST_F(DefaultFormat, ARemovalNeedsItsNameAlone)
{
    EXPECT_EQ(read("-/a/b\n"), "0 | 0 null | 1 [/a/b 0 null]");
    EXPECT_EQ(read("-/a/b,\n"), "0 | 0 null | 1 [/a/b 0 null]");
    EXPECT_EQ(read("-/a/b,,\n"), "0 | 0 null | 1 [/a/b 0 null]");
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(DefaultFormat, ARemovalWithoutTypeDropsItsValue)
{
    EXPECT_EQ(read("-/a/b,,7\n"), "0 | 0 null | 1 [/a/b 0 null]");
}

TEST_F(DefaultFormat, ARemovalMayHaveTypeAndValue)
{
    EXPECT_EQ(read("-/ov/some/node,uint32,7\n-/a,bool\n-/b,bool,\n"),
              "0 | 0 null | 3 [/ov/some/node 5 '7', /a 9 null, /b 9 null]");
}

TEST_F(DefaultFormat, ARemovalWithoutNameIsAParseError)
{
    EXPECT_EQ(read("-\n"), "14012 | 0 null | 0 []");
    EXPECT_EQ(read("-,uint32,7\n"), "14012 | 0 null | 0 []");
    EXPECT_THAT(log_lines(), ElementsAre(line_of(parser, parse_error),
                                         line_of("db_default_get_all", parse_error),
                                         line_of(parser, parse_error),
                                         line_of("db_default_get_all", parse_error)));
}

TEST_F(DefaultFormat, ARemovalsUnknownTypeIsLoggedByItsCodeAlone)
{
    EXPECT_EQ(read("-/a/b,nosuchtype\n"), "14020 | 0 null | 0 []");
    EXPECT_THAT(log_lines(), ElementsAre(line_of(parser, type_error),
                                         line_of("db_default_get_all", type_error)));
}

TEST_F(DefaultFormat, ABlankAfterTheMinusBelongsToTheName)
{
    EXPECT_EQ(read("- /a\n"), "0 | 0 null | 1 [ /a 0 null]");
}

TEST_F(DefaultFormat, ASecondMinusBelongsToTheName)
{
    EXPECT_EQ(read("--/a\n"), "0 | 0 null | 1 [-/a 0 null]");
}

TEST_F(DefaultFormat, TheNextGoodLineTakesTheSlotOfABadOne)
{
    EXPECT_EQ(read("/a,nosuchtype,5\n/b,,5\n/c,uint32,5\n-,x\n-/d\n"),
              "0 | 1 [/c 5 '5'] | 1 [/d 0 null]");
    EXPECT_THAT(log_lines(), ElementsAre(line_of(converter, "Unable to convert nosuchtype type"),
                                         line_of(parser, type_error), line_of(parser, parse_error),
                                         line_of(parser, parse_error)));
    EXPECT_EQ(num_calls(Operation::bail_debug), 3U);
}

TEST_F(DefaultFormat, TheResultIsTheLastEntryLines)
{
    EXPECT_EQ(read("/a,string,x\n/b,,y\n"), "14012 | 1 [/a 101 'x'] | 0 null");
    EXPECT_EQ(read("/b,,y\n/a,string,x\n"), "0 | 1 [/a 101 'x'] | 0 null");
    EXPECT_EQ(read("/b,,y\n-/a\n"), "0 | 0 [] | 1 [/a 0 null]");
    EXPECT_EQ(read("-/a\n/c,string,x\n-,x\n"), "14012 | 1 [/c 101 'x'] | 1 [/a 0 null]");
}

TEST_F(DefaultFormat, CommentsBehindTheLastEntryLineDoNotChangeTheResult)
{
    EXPECT_EQ(read("/a,string,x\n/b,,y\n# comment\n\n   \n"), "14012 | 1 [/a 101 'x'] | 0 null");
}

TEST_F(DefaultFormat, EveryTypeOfTheTableIsKnown)
{
    std::string text;
    std::string expected;
    unsigned count = 0;
    for (const lc_enum_string_map *row = bn_type_map; row->lesm_string != nullptr; ++row) {
        text += "/n," + std::string(row->lesm_string) + ",v\n";
        expected += (count == 0 ? "/n " : ", /n ") + std::to_string(row->lesm_enum) + " 'v'";
        ++count;
    }
    EXPECT_EQ(count, 44U);
    EXPECT_EQ(read(text + text), "0 | 88 [" + expected + ", " + expected + "] | 0 null");
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(DefaultFormat, TypesThatAlternateKeepTheirCodes)
{
    std::string text;
    std::string expected;
    for (int i = 0; i < 50; ++i) {
        text += "/a,uint8,1\n/b,int8,1\n/c,ipv4addr,1\n/d,ipv6addr,1\n";
        expected += (i == 0 ? std::string() : ", ") + "/a 1 '1', /b 2 '1', /c 60 '1', /d 63 '1'";
    }
    EXPECT_EQ(read(text), "0 | 200 [" + expected + "] | 0 null");
}

TEST_F(DefaultFormat, AFailingLookupIsThatOfItsLineAlone)
{
    const std::string text = "/a,uint32,1\n/b,string,x\n-/c,bool,true\n/d,string,y\n";
    arm({.operation = Operation::lc_string_to_enum, .call = 2, .code = 14014});
    EXPECT_EQ(read(text), "0 | 2 [/a 5 '1', /d 101 'y'] | 1 [/c 9 'true']");
    EXPECT_THAT(log_lines(),
                ElementsAre(line_of(converter, "Unable to convert string type"),
                            line_of(parser, "Error code 14014 (generic IO error) returned")));
    forget_calls();
    arm({.operation = Operation::lc_string_to_enum, .call = 3, .code = 14014});
    EXPECT_EQ(read(text), "0 | 3 [/a 5 '1', /b 101 'x', /d 101 'y'] | 0 []");
    EXPECT_THAT(log_lines(),
                ElementsAre(line_of(parser, "Error code 14014 (generic IO error) returned")));
}

TEST_F(DefaultFormat, ACancelledLookupOfAnEarlierLineIsSilent)
{
    arm({.operation = Operation::lc_string_to_enum, .call = 2, .code = 14120});
    EXPECT_EQ(read("/a,uint32,1\n/b,string,x\n/c,bool,true\n"),
              "0 | 2 [/a 5 '1', /c 9 'true'] | 0 null");
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_EQ(num_calls(Operation::bail_quiet_debug), 1U);
    EXPECT_EQ(num_calls(Operation::bail_debug), 0U);
}

TEST_F(DefaultFormat, AnUnknownTypeGoesToTheHostEveryTime)
{
    EXPECT_EQ(read("/a,odd,1\n/b,odd,1\n"), "14020 | 0 [] | 0 null");
    EXPECT_THAT(
        calls_of(Operation::lc_string_to_enum),
        ElementsAre("lc_string_to_enum(*, \"odd\", *)", "lc_string_to_enum(*, \"odd\", *)"));
}

TEST_F(DefaultFormat, LongFieldsAreNotCut)
{
    const std::string name(10000, 'n');
    const std::string value(100000, 'v');
    EXPECT_EQ(read('/' + name + ",string," + value + '\n'),
              "0 | 1 [/" + name + " 101 '" + value + "'] | 0 null");
}

TEST_F(DefaultFormat, BytesBeyondAsciiAreKept)
{
    EXPECT_EQ(read("/a,string,\xc3\xa9\xff\n"), "0 | 1 [/a 101 '\xc3\xa9\xff'] | 0 null");
}

class DebugDefaults : public LibraryTest
{
  protected:
    std::string read() { return read_defaults(db_default_get_all); }
};

TEST_F(DebugDefaults, AMissingFileHasNone)
{
    EXPECT_EQ(read(), nothing);
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_THAT(calls_of(Operation::lf_test_exists),
                ElementsAre("lf_test_exists(\"/var/opt/tms/.debug_default_db\", *)"));
    EXPECT_EQ(num_calls(Operation::lf_read_file_lines), 0U);
}

TEST_F(DebugDefaults, AnEmptyFileHasNone)
{
    write_file(debug_file, "");
    EXPECT_EQ(read(), nothing);
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_THAT(calls_of(Operation::lf_read_file_lines),
                ElementsAre("lf_read_file_lines(\"/var/opt/tms/.debug_default_db\", *)"));
}

TEST_F(DebugDefaults, AFileWithoutListOfLinesHasNone)
{
    write_file(debug_file, "/a,string,x\n");
    arm({.operation = Operation::lf_read_file_lines, .way = FaultWay::without_object});
    EXPECT_EQ(read(), nothing);
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(DebugDefaults, AFileThatCannotBeReadPassesUpTheCode)
{
    fs::create_directory(debug_file);
    EXPECT_EQ(read(), "14014 | 0 untouched | 0 untouched");
    constexpr char io_error[] = "Error code 14014 (generic IO error) returned";
    EXPECT_THAT(log_lines(),
                ElementsAre(line_of(parser, io_error), line_of("db_default_get_all", io_error)));
}

TEST_F(DebugDefaults, TheFileStaysAsItWas)
{
    write_file(debug_file, "/a,string,x\n");
    EXPECT_EQ(read(), "0 | 1 [/a 101 'x'] | 0 null");
    EXPECT_EQ(read_file(debug_file), "/a,string,x\n");
}

TEST_F(DebugDefaults, EveryOutPointerMayBeNull)
{
    write_file(debug_file, "/a,string,x\n-/b\n/c,string,y\n");
    EXPECT_EQ(in_library(db_default_get_all, nullptr, nullptr, nullptr, nullptr), 0);

    DeliveredEntries values;
    EXPECT_EQ(in_library(db_default_get_all, values.entries(), values.count(), nullptr, nullptr),
              0);
    EXPECT_EQ(values.text(), "2 [/a 101 'x', /c 101 'y']");

    DeliveredEntries removals;
    EXPECT_EQ(
        in_library(db_default_get_all, nullptr, nullptr, removals.entries(), removals.count()), 0);
    EXPECT_EQ(removals.text(), "1 [/b 0 null]");
}

TEST_F(DebugDefaults, CountsAreStoredWithoutTheirArrays)
{
    write_file(debug_file, "/a,string,x\n-/b\n/c,string,y\n");
    uint32 num_values = 99;
    uint32 num_removals = 99;
    EXPECT_EQ(in_library(db_default_get_all, nullptr, &num_values, nullptr, &num_removals), 0);
    EXPECT_EQ(num_values, 2U);
    EXPECT_EQ(num_removals, 1U);
}

TEST_F(DebugDefaults, CountsAreZeroedBeforeAnythingElse)
{
    arm({.operation = Operation::lf_test_exists, .code = 14014});
    EXPECT_EQ(read(), "14014 | 0 untouched | 0 untouched");
}

TEST_F(DebugDefaults, WhatWasGoodIsDeliveredWithTheError)
{
    write_file(debug_file, "/a,string,x\n-/b\n/c,string\n/d,nosuchtype,1\n");
    EXPECT_EQ(read(), "14020 | 2 [/a 101 'x', /c 101 ''] | 1 [/b 0 null]");
}

TEST_F(DebugDefaults, ACancelledLineIsSilentInTheBailRule)
{
    write_file(debug_file, "-/a,uint32,1\n");
    arm({.operation = Operation::lc_string_to_enum, .code = 14120});
    EXPECT_EQ(read(), "14120 | 0 null | 0 []");
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_EQ(num_calls(Operation::bail_quiet_debug), 2U);
    EXPECT_EQ(num_calls(Operation::bail_debug), 0U);
}

TEST_F(DebugDefaults, ACancelledLookupHasNotFoundTheTypeUnknown)
{
    write_file(debug_file, "/a,uint32,1\n");
    arm({.operation = Operation::lc_string_to_enum, .code = 14120});
    EXPECT_EQ(read(), "14120 | 0 [] | 0 null");
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(DebugDefaults, ACodeWithoutTextIsLoggedInTheShortForm)
{
    write_file(debug_file, "/a,string,x\n");
    arm({.operation = Operation::lf_read_file_lines, .code = 13999});
    EXPECT_EQ(read(), "13999 | 0 untouched | 0 untouched");
    EXPECT_THAT(log_lines(),
                ElementsAre(line_of(parser, "Error code 13999 returned"),
                            line_of("db_default_get_all", "Error code 13999 returned")));
}

class ModelDefaults : public LibraryTest
{
  protected:
    ModelDefaults() { ovhost::set_config_name("m1"); }

    std::string read() { return read_defaults(db_model_def_get_all); }
    void write(const std::string &text) { write_file("/opt/orvale/defdb.conf.m1", text); }
};

TEST_F(ModelDefaults, AreTheFilesOfTheModel)
{
    write("/a,string,x\n-/b\n");
    write_file("/opt/orvale/defdb.conf.m2", "/other,string,x\n");
    EXPECT_EQ(read(), "0 | 1 [/a 101 'x'] | 1 [/b 0 null]");
    EXPECT_THAT(calls_of(Operation::conf_file_okay),
                ElementsAre("conf_file_okay(\"/opt/orvale/defdb.conf.m1\")"));
    EXPECT_THAT(calls_of(Operation::lf_read_file_lines),
                ElementsAre("lf_read_file_lines(\"/opt/orvale/defdb.conf.m1\", *)"));
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(ModelDefaults, WithoutModelNameThereAreNone)
{
    write("/a,string,x\n");
    arm({.operation = Operation::get_config_name});
    EXPECT_EQ(read(), nothing);
    EXPECT_EQ(num_calls(Operation::conf_file_okay), 0U);
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(ModelDefaults, AnEmptyModelNameIsAName)
{
    planted().config_name = "";
    write_file("/opt/orvale/defdb.conf.", "/a,string,x\n");
    EXPECT_EQ(read(), "0 | 1 [/a 101 'x'] | 0 untouched");
    EXPECT_THAT(calls_of(Operation::conf_file_okay),
                ElementsAre("conf_file_okay(\"/opt/orvale/defdb.conf.\")"));
}

TEST_F(ModelDefaults, ARejectedFileHasNone)
{
    write("/a,string,x\n");
    ASSERT_EQ(::chmod("/opt/orvale/defdb.conf.m1", 0666), 0);
    EXPECT_EQ(read(), nothing);
    EXPECT_EQ(num_calls(Operation::lf_test_exists), 0U);
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(ModelDefaults, AMissingFileHasNone)
{
    EXPECT_EQ(read(), nothing);
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(ModelDefaults, AFileThatGoesAfterItWasAcceptedHasNone)
{
    write("/a,string,x\n");
    arm({.operation = Operation::lf_read_file_lines, .way = FaultWay::without_object});
    EXPECT_EQ(read(), nothing);
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(ModelDefaults, OnlyArraysWithEntriesAreHandedOver)
{
    write("/a,string,x\n");
    EXPECT_EQ(read(), "0 | 1 [/a 101 'x'] | 0 untouched");
    write("-/b\n");
    EXPECT_EQ(read(), "0 | 0 untouched | 1 [/b 0 null]");
    write("# nothing\n");
    EXPECT_EQ(read(), nothing);
    // A bad line made room for an entry that never came.
    write("/a,,x\n-/b\n");
    EXPECT_EQ(read(), "0 | 0 untouched | 1 [/b 0 null]");
    write("-,x\n/a,string,x\n");
    EXPECT_EQ(read(), "0 | 1 [/a 101 'x'] | 0 untouched");
}

TEST_F(ModelDefaults, AnErrorKeepsTheGoodEntriesToo)
{
    write("/a,string,x\n-/b\n/c,,y\n");
    EXPECT_EQ(read(), "14012 | 0 untouched | 0 untouched");
    EXPECT_THAT(log_lines(), ElementsAre(line_of(parser, parse_error),
                                         line_of("db_model_def_get_all", parse_error)));
}

TEST_F(ModelDefaults, AnErrorInAnEarlierLineIsLoggedOnly)
{
    write("/c,,y\n/a,string,x\n");
    EXPECT_EQ(read(), "0 | 1 [/a 101 'x'] | 0 untouched");
    EXPECT_THAT(log_lines(), ElementsAre(line_of(parser, parse_error)));
}

TEST_F(ModelDefaults, EveryOutPointerMayBeNull)
{
    write("/a,string,x\n-/b\n-/c\n");
    EXPECT_EQ(in_library(db_model_def_get_all, nullptr, nullptr, nullptr, nullptr), 0);
    uint32 num_values = 99;
    uint32 num_removals = 99;
    EXPECT_EQ(in_library(db_model_def_get_all, nullptr, &num_values, nullptr, &num_removals), 0);
    EXPECT_EQ(num_values, 1U);
    EXPECT_EQ(num_removals, 2U);
}

// "/opt/orvale/defdb.conf." is 23 characters; with the end mark 104 are left of 128.
TEST_F(ModelDefaults, APathOf127CharactersFits)
{
    const std::string name(104, 'n');
    ovhost::set_config_name(name);
    write_file("/opt/orvale/defdb.conf." + name, "/a,string,x\n");
    EXPECT_EQ(read(), "0 | 1 [/a 101 'x'] | 0 untouched");
}

TEST_F(ModelDefaults, ALongerPathIsCut)
{
    ovhost::set_config_name(std::string(300, 'n'));
    EXPECT_EQ(read(), nothing);
    EXPECT_THAT(
        calls_of(Operation::conf_file_okay),
        ElementsAre("conf_file_okay(\"/opt/orvale/defdb.conf." + std::string(104, 'n') + "\")"));
}

class PreservedValues : public LibraryTest
{
};

TEST_F(PreservedValues, AreReadAndStay)
{
    write_file(preserved_file, "/a,string,x\n-/b\n");
    EXPECT_EQ(read_preserved(false), "0 | 1 [/a 101 'x'] | 1 [/b 0 null]");
    EXPECT_EQ(read_file(preserved_file), "/a,string,x\n-/b\n");
    EXPECT_EQ(read_file(preserved_read_file), std::nullopt);
    EXPECT_THAT(calls_of(Operation::lf_test_exists),
                ElementsAre("lf_test_exists(\"/var/opt/tms/.preserved_db\", *)"));
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(PreservedValues, AreMovedAwayOnRequest)
{
    write_file(preserved_file, "/a,string,x\n");
    write_file(preserved_read_file, "from an earlier time");
    EXPECT_EQ(read_preserved(true), "0 | 1 [/a 101 'x'] | 0 null");
    EXPECT_EQ(read_file(preserved_file), std::nullopt);
    EXPECT_EQ(read_file(preserved_read_file), "/a,string,x\n");
}

TEST_F(PreservedValues, AreMovedAwayEvenWhenThereAreNone)
{
    write_file(preserved_file, "");
    EXPECT_EQ(read_preserved(true), nothing);
    EXPECT_EQ(read_file(preserved_file), std::nullopt);
    EXPECT_EQ(read_file(preserved_read_file), "");
}

TEST_F(PreservedValues, StayWhenTheParseFailed)
{
    write_file(preserved_file, "/a,string,x\n/b,,y\n");
    EXPECT_EQ(read_preserved(true), "14012 | 1 [/a 101 'x'] | 0 null");
    EXPECT_EQ(read_file(preserved_file), "/a,string,x\n/b,,y\n");
    EXPECT_EQ(read_file(preserved_read_file), std::nullopt);
    EXPECT_THAT(log_lines(), ElementsAre(line_of(parser, parse_error),
                                         line_of("db_preserved_get_all", parse_error)));
}

TEST_F(PreservedValues, AreMovedAwayWhenOnlyAnEarlierLineFailed)
{
    write_file(preserved_file, "/b,,y\n/a,string,x\n");
    EXPECT_EQ(read_preserved(true), "0 | 1 [/a 101 'x'] | 0 null");
    EXPECT_EQ(read_file(preserved_file), std::nullopt);
}

TEST_F(PreservedValues, AMissingFileIsNoError)
{
    EXPECT_EQ(read_preserved(true), nothing);
    EXPECT_EQ(read_preserved(false), nothing);
    EXPECT_EQ(read_file(preserved_read_file), std::nullopt);
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(PreservedValues, AMoveThatFailsIsNoError)
{
    write_file(preserved_file, "/a,string,x\n");
    fs::create_directories(std::string(preserved_read_file) + "/in the way");
    EXPECT_EQ(read_preserved(true), "0 | 1 [/a 101 'x'] | 0 null");
    EXPECT_EQ(read_file(preserved_file), "/a,string,x\n");
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(PreservedValues, EveryOutPointerMayBeNull)
{
    write_file(preserved_file, "/a,string,x\n-/b\n");
    EXPECT_EQ(in_library(db_preserved_get_all, nullptr, nullptr, nullptr, nullptr, true), 0);
    EXPECT_EQ(read_file(preserved_file), std::nullopt);
}

class DefaultEntries : public LibraryTest
{
};

TEST_F(DefaultEntries, SettingAllDoesNothing)
{
    bn_str_value value = {nullptr, 5, nullptr};
    uint32 count = 7;
    EXPECT_EQ(in_library(db_default_set_all, &value, &count), 0);
    EXPECT_EQ(value.bv_type, 5U);
    EXPECT_EQ(count, 7U);
    EXPECT_EQ(in_library(db_default_set_all, nullptr, nullptr), 0);
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(DefaultEntries, FreeingNullsThePointer)
{
    auto *array = static_cast<bn_str_value *>(calloc(2, sizeof(bn_str_value)));
    array[0] = {strdup("/a"), 101, strdup("x")};
    array[1] = {strdup("/b"), 0, nullptr};
    EXPECT_EQ(in_library(bn_str_value_free, &array, 2), 0);
    EXPECT_EQ(array, nullptr);
}

TEST_F(DefaultEntries, FreeingNothingDoesNothing)
{
    bn_str_value *array = nullptr;
    EXPECT_EQ(in_library(bn_str_value_free, &array, 3), 0);
    EXPECT_EQ(in_library(bn_str_value_free, nullptr, 3), 0);
    EXPECT_EQ(in_library(bn_str_value_free, nullptr, 0), 0);
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(DefaultEntries, AnArrayCountedAsZeroIsLeftAlone)
{
    bn_str_value entry = {nullptr, 9, nullptr};
    bn_str_value *array = &entry;
    EXPECT_EQ(in_library(bn_str_value_free, &array, 0), 0);
    EXPECT_EQ(array, &entry);
    EXPECT_EQ(entry.bv_type, 9U);
}

} // namespace

#include "host/modules/load_text.h"

#include "tests/mgmtd/fixture.h"

namespace
{

using namespace ovhost;
using mgmtd_test::nodes_of;
using mgmtd_test::value_in;
using testing::ElementsAre;
using testing::IsEmpty;

class LoadText : public testing::Test
{
  protected:
    /// "SET/REMOVED" when all is well, else "LINE NODE|MESSAGE" for each fault.
    std::vector<std::string> load(std::string_view text)
    {
        const LoadResult result = load_text(candidate_, text);
        if (result.faults.empty()) {
            return {std::to_string(result.set) + "/" + std::to_string(result.removed)};
        }
        std::vector<std::string> faults;
        for (const LineFault &fault : result.faults) {
            faults.push_back(std::to_string(fault.line) + " " + fault.node + "|" + fault.message);
        }
        return faults;
    }

    std::vector<std::string> nodes() const { return nodes_of(candidate_.tree()); }

    Candidate candidate_;
};

TEST_F(LoadText, TakesNothingForNothing)
{
    EXPECT_THAT(load(""), ElementsAre("0/0"));
    EXPECT_THAT(load("\n\n"), ElementsAre("0/0"));
    EXPECT_THAT(nodes(), IsEmpty());
}

TEST_F(LoadText, IgnoresCommentsAndBlankLines)
{
    EXPECT_THAT(load("# one\n \t # two\n \t \n#/a/b,uint32,5"), ElementsAre("0/0"));
    EXPECT_THAT(nodes(), IsEmpty());
}

TEST_F(LoadText, SkipsLeadingBlanksAndKeepsTheRest)
{
    EXPECT_THAT(load("  \t /a/b,uint32,5\n/a/c,string, x #y "), ElementsAre("2/0"));
    EXPECT_THAT(nodes(), ElementsAre("/a/b uint32 5", "/a/c string  x #y "));
}

TEST_F(LoadText, RefusesAValueWithAComma)
{
    const std::string fault = "|a value in a file cannot hold a comma; use ovctl set";
    EXPECT_THAT(load("/a,string,x,y\n/b,nosuchtype,\n/c,string,,\n/d,string,z,\n/e,string,\n"),
                ElementsAre("1 /a" + fault, "2 /b|unknown type \"nosuchtype\"", "3 /c" + fault,
                            "4 /d" + fault));
    EXPECT_THAT(nodes(), IsEmpty());
}

TEST_F(LoadText, EndsAValueAtTheNextCommaWhenThatIsTheRule)
{
    const LoadResult result =
        load_text(candidate_, "/a,string,x,y\n/b,string,z\n", CommaRule::ends_value);
    EXPECT_THAT(result.faults, IsEmpty());
    EXPECT_THAT(result.cut, ElementsAre(LineFault{
                                1, "/a", "a value in a file cannot hold a comma; use ovctl set"}));
    EXPECT_THAT(nodes(), ElementsAre("/a string x", "/b string z"));
}

TEST_F(LoadText, TakesAMissingValueAsEmpty)
{
    EXPECT_THAT(load("/a/b,string\n/a/c,string,"), ElementsAre("2/0"));
    EXPECT_THAT(nodes(), ElementsAre("/a/b string ", "/a/c string "));
}

TEST_F(LoadText, CountsALastLineWithoutItsEnd)
{
    EXPECT_THAT(load("/a,string,1\n/b,string,2"), ElementsAre("2/0"));
    EXPECT_THAT(nodes(), ElementsAre("/a string 1", "/b string 2"));
}

TEST_F(LoadText, LetsTheLaterLineWin)
{
    EXPECT_THAT(load("/a,string,1\n/a,uint8,2\n/b,string,x\n-/b"), ElementsAre("3/1"));
    EXPECT_THAT(nodes(), ElementsAre("/a uint8 2"));
}

TEST_F(LoadText, RemovesANodeWithAllBelowIt)
{
    ASSERT_EQ(candidate_.set("/a/b", bt_string, "x"), std::nullopt);
    ASSERT_EQ(candidate_.set("/a/b/c", bt_string, "y"), std::nullopt);
    ASSERT_EQ(candidate_.set("/a/d", bt_string, "z"), std::nullopt);
    EXPECT_THAT(load("-/a/b"), ElementsAre("0/1"));
    EXPECT_THAT(nodes(), ElementsAre("/a/d string z"));
}

TEST_F(LoadText, RemovesWhatIsNotThere)
{
    EXPECT_THAT(load("-/a/b\n-/a/b,uint32,7\n-/a/b,,7"), ElementsAre("0/3"));
    EXPECT_THAT(nodes(), IsEmpty());
}

TEST_F(LoadText, TakesABlankBehindTheMinusForPartOfTheName)
{
    EXPECT_THAT(load("- /a"),
                ElementsAre(testing::StartsWith("1  /a|\" /a\" is not the name of ")));
}

TEST_F(LoadText, RefusesACarriageReturnAtTheEndOfALine)
{
    const std::string fault =
        "|the line ends with a carriage return: save the file with plain line ends";
    EXPECT_THAT(load("/a,string,x\r\n/b,string,y\r\n/c,string\r\n-/d\r\n\r\n/e,string,z\r"),
                ElementsAre("1 " + fault, "2 " + fault, "3 " + fault, "4 " + fault, "5 " + fault,
                            "6 " + fault));
    EXPECT_THAT(nodes(), IsEmpty());
    // In a comment it does no harm, nor in the middle of a value.
    EXPECT_THAT(load("# x\r\n/a,string,x\ry\n"), ElementsAre("1/0"));
    EXPECT_THAT(nodes(), ElementsAre("/a string x\ry"));
}

TEST_F(LoadText, RefusesANameThatIsNotUtf8)
{
    EXPECT_THAT(load("/caf\xe9,string,x\n-/\xff\n"),
                ElementsAre("1 /caf\xe9|the node's name is not UTF-8: convert the file first",
                            "2 /\xff|the node's name is not UTF-8: convert the file first"));
    EXPECT_THAT(load("/caf\xc3\xa9,string,x\n"), ElementsAre("1/0"));
}

TEST_F(LoadText, NamesEveryKindOfFaultWithItsLine)
{
    EXPECT_THAT(load("# comment\n"
                     "/a\n"
                     ",uint32,5\n"
                     "/a,,5\n"
                     "/a,nosuchtype,5\n"
                     "/a,uint8,300\n"
                     "a,string,x\n"
                     "-\n"
                     "-,uint32\n"
                     "-/a,nosuchtype\n"),
                ElementsAre("2 /a|a value line needs a name and a type: NAME,TYPE,VALUE",
                            "3 |a value line needs a name and a type: NAME,TYPE,VALUE",
                            "4 /a|a value line needs a name and a type: NAME,TYPE,VALUE",
                            "5 /a|unknown type \"nosuchtype\"",
                            "6 /a|\"300\" is not a uint8: must be a decimal number from 0 to 255",
                            "7 a|\"a\" is not the name of a node: a name is /PART/PART, with "
                            "\"\\/\" for a slash inside a part",
                            "8 |a removal line needs a name: -NAME",
                            "9 |a removal line needs a name: -NAME",
                            "10 /a|unknown type \"nosuchtype\""));
}

TEST_F(LoadText, DoesNotTouchTheRoot)
{
    const char *const fault = "1 /|\"/\" is not the name of a node: a name is /PART/PART, with "
                              "\"\\/\" for a slash inside a part";
    EXPECT_THAT(load("/,string,x"), ElementsAre(fault));
    EXPECT_THAT(load("-/"), ElementsAre(fault));
}

TEST_F(LoadText, RefusesANulByte)
{
    using namespace std::string_view_literals;
    EXPECT_THAT(load("/a,string,x\0y\n/b,string,\0"sv),
                ElementsAre("1 |the line holds a NUL byte", "2 |the line holds a NUL byte"));
    EXPECT_THAT(nodes(), IsEmpty());
}

TEST_F(LoadText, LeavesTheCandidateAloneWhenOneLineIsBad)
{
    ASSERT_EQ(candidate_.set("/a", bt_string, "before"), std::nullopt);
    EXPECT_THAT(load("/a,string,after\n/b,string,new\n/c\n"),
                ElementsAre("3 /c|a value line needs a name and a type: NAME,TYPE,VALUE"));
    EXPECT_THAT(nodes(), ElementsAre("/a string before"));
}

TEST_F(LoadText, ReadsEscapedSlashes)
{
    EXPECT_THAT(load("/route/10.0.0.0\\/8/via,ipv4addr,192.0.2.1"), ElementsAre("1/0"));
    EXPECT_EQ(value_in(candidate_.tree(), "/route/10.0.0.0\\/8/via"), "ipv4addr 192.0.2.1");
}

} // namespace

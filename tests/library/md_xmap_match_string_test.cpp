#include "orvale/md_xmap_common.h"

#include "tests/library/library_test.h"
#include "tests/library/map_changes.h"

#include <string>

using namespace ovtest;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{

constexpr char label_node[] = "/ov/iflabels/config/wan/branch office";

std::string line_of(const std::string &function, const std::string &text)
{
    return error_line("md_xmap_common", function, text);
}

class MatchString : public LibraryTest
{
  protected:
    // Status and whether the string is valid; "old" when that was not said.
    std::string validate(const std::string &match_string)
    {
        return validate(&map_commit_.dbinfo, match_string.c_str());
    }
    std::string validate(md_dbinfo *dbinfo, const char *match_string)
    {
        tbool valid = false;
        const int status = in_library(md_xmap_validate_match_str, dbinfo, match_string, &valid);
        return std::to_string(status) + (valid ? " valid" : " not valid");
    }

    MapCommit map_commit_;
};

TEST_F(MatchString, OfGoodPairsIsValid)
{
    EXPECT_EQ(validate("src_ip:10.1.0.0/16,dst_port:443"), "0 valid");
    EXPECT_THAT(map_commit_.commit.refusals, IsEmpty());
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_THAT(calls_of(Operation::ov_acl_validate_matchstr),
                ElementsAre("ov_acl_validate_matchstr(\"src_ip:10.1.0.0/16,dst_port:443\", *, *, "
                            "*)"));
    EXPECT_EQ(num_calls(Operation::mdb_get_matching_tstr_array), 0U);
}

TEST_F(MatchString, AnyAloneIsValid)
{
    EXPECT_EQ(validate("any"), "0 valid");
    EXPECT_EQ(num_calls(Operation::tstr_array_get_str_quick), 0U);
}

TEST_F(MatchString, ThatTheHostRefusesIsRefusedWithItsReason)
{
    EXPECT_EQ(validate("colour:red"), "0 not valid");
    ASSERT_EQ(map_commit_.commit.refusals.size(), 1U);
    EXPECT_THAT(map_commit_.commit.refusals.front(),
                testing::StartsWith("1 Invalid match string colour:red - pair \"colour:red\": "));
    EXPECT_EQ(map_commit_.commit.refusals.front().back(), '\n');
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_EQ(num_calls(Operation::md_commit_set_return_status_msg_fmt), 1U);
}

TEST_F(MatchString, RefusedWithoutReasonHasNoneInTheMessage)
{
    arm({.operation = Operation::ov_acl_validate_matchstr, .code = 14012});
    EXPECT_EQ(validate("dscp:ef"), "0 not valid");
    EXPECT_THAT(map_commit_.commit.refusals, ElementsAre("1 Invalid match string dscp:ef - \n"));
}

TEST_F(MatchString, RefusedReleasesWhatTheHostHandsOutAllTheSame)
{
    planted().match_string_reason = "no room for it";
    EXPECT_EQ(validate("dscp:ef,vlan:%"), "0 not valid");
    EXPECT_THAT(map_commit_.commit.refusals,
                ElementsAre("1 Invalid match string dscp:ef,vlan:% - no room for it\n"));
    EXPECT_EQ(num_calls(Operation::tstr_array_get_str_quick), 0U);
    EXPECT_EQ(num_calls(Operation::tstr_array_free), 2U);
}

TEST_F(MatchString, AsksForLabelsInTheProposedDatabase)
{
    map_commit_.name_handles();
    EXPECT_EQ(validate("vlan:vlan7"), "0 valid");
    EXPECT_THAT(calls_of(Operation::mdb_get_matching_tstr_array),
                ElementsAre("mdb_get_matching_tstr_array(null, newdb, "
                            "\"/ov/iflabels/config/*/vlan7\", 512, *)"));
}

TEST_F(MatchString, RefusedByWhateverCodeIsRefused)
{
    for (const int code : {1, -1, 14001, 14120, 13999}) {
        map_commit_.commit.refusals.clear();
        arm({.operation = Operation::ov_acl_validate_matchstr, .code = code});
        EXPECT_EQ(validate("any"), "0 not valid") << code;
        EXPECT_THAT(map_commit_.commit.refusals, ElementsAre("1 Invalid match string any - \n"));
    }
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_EQ(num_calls(Operation::bail_debug), 0U);
}

TEST_F(MatchString, RefusedKeepsPercentSignsInTheMessage)
{
    EXPECT_EQ(validate("%s%n"), "0 not valid");
    ASSERT_EQ(map_commit_.commit.refusals.size(), 1U);
    EXPECT_THAT(map_commit_.commit.refusals.front(),
                testing::StartsWith("1 Invalid match string %s%n - "));
}

TEST_F(MatchString, ThatCannotBeRefusedPassesUpTheCode)
{
    arm({.operation = Operation::md_commit_set_return_status_msg_fmt, .code = 14002});
    EXPECT_EQ(validate("colour:red"), "14002 valid");
    EXPECT_THAT(log_lines(), ElementsAre(line_of("md_xmap_validate_match_str",
                                                 "Error code 14002 (assertion failed) returned")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
}

TEST_F(MatchString, ThatCannotBeRefusedForCancellationIsSilent)
{
    arm({.operation = Operation::md_commit_set_return_status_msg_fmt, .code = 14120});
    EXPECT_EQ(validate("colour:red"), "14120 valid");
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_EQ(num_calls(Operation::bail_quiet_debug), 1U);
}

TEST_F(MatchString, OfUncheckedKeysIsValidWhateverTheirValues)
{
    for (const char *key : {"application", "app_group", "tbehavior", "APPLICATION", "App_Group"}) {
        EXPECT_EQ(validate(std::string(key) + ":vlan4095"), "0 valid") << key;
    }
    EXPECT_EQ(num_calls(Operation::mdb_get_matching_tstr_array), 0U);
    EXPECT_EQ(num_calls(Operation::ovlan_valid_name_check), 0U);
}

TEST_F(MatchString, OfAVlanIsCheckedInTheProposedDatabase)
{
    map_commit_.set_new(label_node, "label");
    EXPECT_EQ(validate("dscp:ef,vlan:branch office"), "0 valid");
    EXPECT_THAT(calls_of(Operation::mdb_get_matching_tstr_array),
                ElementsAre("mdb_get_matching_tstr_array(null, *, "
                            "\"/ov/iflabels/config/*/branch office\", 512, *)"));
}

TEST_F(MatchString, OfALabelThatIsGoneIsABareError)
{
    map_commit_.set_old(label_node, "label");
    EXPECT_EQ(validate("vlan:branch office"), "-1 valid");
}

TEST_F(MatchString, OfABadVlanIsABareError)
{
    EXPECT_EQ(validate("src_port:1,vlan:vlan4095,dscp:ef"), "-1 valid");
    EXPECT_THAT(map_commit_.commit.refusals, IsEmpty());
    EXPECT_THAT(log_lines(),
                ElementsAre(line_of("md_xmap_validate_match_str", "Error code -1 returned")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
}

TEST_F(MatchString, OfAVlanKeyInCapitalsIsCheckedAlike)
{
    EXPECT_EQ(validate("VLAN:vlan7"), "0 valid");
    EXPECT_EQ(validate("Vlan:vlan4095"), "-1 valid");
    EXPECT_EQ(validate("VLAN:vlan4095"), "-1 valid");
}

TEST_F(MatchString, WithAFailingLabelQueryIsJudgedByTheVlanNameAlone)
{
    arm({.operation = Operation::mdb_get_matching_tstr_array, .code = 14004});
    EXPECT_EQ(validate("vlan:vlan7"), "0 valid");
    EXPECT_THAT(log_lines(), ElementsAre(line_of("md_xmap_iflabel_check",
                                                 "Error code 14004 (item not found) returned")));
}

TEST_F(MatchString, EndsAtTheFirstBadVlan)
{
    arm({.operation = Operation::ovlan_valid_name_check, .code = 14120});
    EXPECT_EQ(validate("vlan:vlan7,dscp:ef"), "-1 valid");
    EXPECT_EQ(num_calls(Operation::tstr_array_get_str_quick), 2U);
}

// How long a match string may be is the host's to say.
TEST_F(MatchString, OfAnyLengthIsHandedToTheHostWhole)
{
    for (const std::size_t length : {1023U, 1024U, 4000U}) {
        const std::string long_string = "application:" + std::string(length - 12, 'a');
        ASSERT_EQ(long_string.size(), length);
        forget_calls();
        EXPECT_EQ(validate(long_string), length < 1024 ? "0 valid" : "0 not valid") << length;
        EXPECT_THAT(calls_of(Operation::ov_acl_validate_matchstr),
                    ElementsAre("ov_acl_validate_matchstr(\"" + long_string + "\", *, *, *)"));
    }
}

TEST_F(MatchString, RefusedOfAnyLengthStandsWholeInTheMessage)
{
    for (const std::size_t length : {1023U, 1024U}) {
        map_commit_.commit.refusals.clear();
        const std::string long_string(length, 'a');
        arm({.operation = Operation::ov_acl_validate_matchstr});
        EXPECT_EQ(validate(long_string), "0 not valid");
        EXPECT_THAT(map_commit_.commit.refusals,
                    ElementsAre("1 Invalid match string " + long_string + " - \n"));
    }
}

TEST_F(MatchString, WithoutListsOfPairsHasNone)
{
    arm({.operation = Operation::ov_acl_validate_matchstr, .way = FaultWay::without_object});
    EXPECT_EQ(validate("vlan:vlan4095"), "0 valid");
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(MatchString, WithAVlanThatHasNoValueIsABareError)
{
    planted().null_text_at_call = 2;
    EXPECT_EQ(validate("vlan:vlan7"), "-1 valid");
    EXPECT_THAT(log_lines(),
                ElementsAre(line_of("md_xmap_iflabel_check", "Unexpected NULL"),
                            line_of("md_xmap_validate_match_str", "Error code -1 returned")));
}

TEST_F(MatchString, OfUncheckedKeysNeedsNoValues)
{
    planted().null_text_at_call = 2;
    EXPECT_EQ(validate("application:web"), "0 valid");
    EXPECT_EQ(num_calls(Operation::tstr_array_get_str_quick), 1U);
}

TEST_F(MatchString, WithAKeyThatDoesNotComeIsAnError)
{
    planted().null_text_at_call = 1;
    EXPECT_EQ(validate("vlan:vlan7"), "14001 valid");
    EXPECT_THAT(log_lines(), ElementsAre(line_of("md_xmap_validate_match_str", "Unexpected NULL")));
}

TEST_F(MatchString, WithoutPlaceForTheAnswerIsRefused)
{
    EXPECT_EQ(in_library(md_xmap_validate_match_str, &map_commit_.dbinfo, "any", nullptr), 14001);
    EXPECT_THAT(log_lines(), ElementsAre(line_of("md_xmap_validate_match_str", "Unexpected NULL")));
    EXPECT_EQ(num_calls(Operation::ov_acl_validate_matchstr), 0U);
}

TEST_F(MatchString, OfNothingIsAnErrorAndCountsAsValid)
{
    EXPECT_EQ(validate(nullptr, "any"), "14001 valid");
    EXPECT_EQ(validate(&map_commit_.dbinfo, nullptr), "14001 valid");
    EXPECT_THAT(log_lines(), ElementsAre(line_of("md_xmap_validate_match_str", "Unexpected NULL"),
                                         line_of("md_xmap_validate_match_str", "Unexpected NULL")));
    EXPECT_EQ(num_calls(Operation::ov_acl_validate_matchstr), 0U);
}

class InterfaceLabel : public LibraryTest
{
  protected:
    bool is_label(const std::string &label)
    {
        return in_library(md_xmap_iflabel_check, label.c_str(), host_.db());
    }
    int vlan(const std::string &name)
    {
        return in_library(md_xmap_vlan_check, host_.db(), name.c_str());
    }
};

TEST_F(InterfaceLabel, IsAChildOfAnyCategory)
{
    host_.set("/ov/iflabels/config/wan/mpls", bt_string, "x");
    host_.set("/ov/iflabels/config/lan/voice/colour", bt_string, "red");
    EXPECT_TRUE(is_label("mpls"));
    EXPECT_TRUE(is_label("voice"));
    EXPECT_FALSE(is_label("wan"));
    EXPECT_FALSE(is_label("colour"));
    EXPECT_FALSE(is_label("Mpls"));
    EXPECT_FALSE(is_label("mpl"));
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(InterfaceLabel, IsAskedForAsTheHostExpectsIt)
{
    EXPECT_FALSE(is_label("mpls"));
    EXPECT_THAT(calls_of(Operation::mdb_get_matching_tstr_array),
                ElementsAre("mdb_get_matching_tstr_array(null, *, "
                            "\"/ov/iflabels/config/*/mpls\", 512, *)"));
}

TEST_F(InterfaceLabel, IsAPatternToTheHost)
{
    EXPECT_FALSE(is_label("*"));
    host_.set("/ov/iflabels/config/wan/mpls", bt_string, "x");
    EXPECT_TRUE(is_label("*"));
}

// "/ov/iflabels/config/*/" leaves 233 characters of the path's 255.
TEST_F(InterfaceLabel, IsCutWhereThePathEnds)
{
    host_.set("/ov/iflabels/config/wan/" + std::string(233, 'a'), bt_string, "x");
    host_.set("/ov/iflabels/config/wan/" + std::string(234, 'b'), bt_string, "x");
    EXPECT_TRUE(is_label(std::string(233, 'a')));
    EXPECT_TRUE(is_label(std::string(234, 'a')));
    EXPECT_TRUE(is_label(std::string(600, 'a')));
    EXPECT_FALSE(is_label(std::string(232, 'a')));
    EXPECT_FALSE(is_label(std::string(234, 'b')));
}

TEST_F(InterfaceLabel, ThatMakesNoNameIsAnErrorAndNone)
{
    EXPECT_FALSE(is_label(""));
    EXPECT_THAT(log_lines(), ElementsAre(line_of("md_xmap_iflabel_check",
                                                 "Error code 14009 (invalid path name) returned")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
}

TEST_F(InterfaceLabel, IsNoneWhenTheQueryFails)
{
    host_.set("/ov/iflabels/config/wan/mpls", bt_string, "x");
    arm({.operation = Operation::mdb_get_matching_tstr_array, .code = 13999});
    EXPECT_FALSE(is_label("mpls"));
    EXPECT_THAT(log_lines(),
                ElementsAre(line_of("md_xmap_iflabel_check", "Error code 13999 returned")));
    arm({.operation = Operation::mdb_get_matching_tstr_array, .code = 14120});
    forget_calls();
    EXPECT_FALSE(is_label("mpls"));
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_EQ(num_calls(Operation::bail_quiet_debug), 1U);
}

TEST_F(InterfaceLabel, IsNoneWithoutAList)
{
    host_.set("/ov/iflabels/config/wan/mpls", bt_string, "x");
    arm({.operation = Operation::mdb_get_matching_tstr_array, .way = FaultWay::without_object});
    EXPECT_FALSE(is_label("mpls"));
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(InterfaceLabel, OfNothingIsNone)
{
    EXPECT_FALSE(in_library(md_xmap_iflabel_check, nullptr, host_.db()));
    EXPECT_FALSE(in_library(md_xmap_iflabel_check, "mpls", nullptr));
    EXPECT_THAT(log_lines(), ElementsAre(line_of("md_xmap_iflabel_check", "Unexpected NULL"),
                                         line_of("md_xmap_iflabel_check", "Unexpected NULL")));
    EXPECT_EQ(num_calls(Operation::mdb_get_matching_tstr_array), 0U);
}

TEST_F(InterfaceLabel, MayStandForAVlan)
{
    EXPECT_EQ(vlan("a label with blanks"), -1);
    host_.set("/ov/iflabels/config/lan/a label with blanks", bt_string, "x");
    EXPECT_EQ(vlan("a label with blanks"), 0);
    EXPECT_EQ(num_calls(Operation::ovlan_valid_name_check), 1U);
}

TEST_F(InterfaceLabel, OrElseTheVlanNeedsAValidName)
{
    EXPECT_EQ(vlan("vlan4094"), 0);
    EXPECT_EQ(vlan("vlan4095"), -1);
    EXPECT_EQ(vlan("eth0.7"), 0);
    EXPECT_THAT(calls_of(Operation::ovlan_valid_name_check),
                ElementsAre("ovlan_valid_name_check(\"vlan4094\")",
                            "ovlan_valid_name_check(\"vlan4095\")",
                            "ovlan_valid_name_check(\"eth0.7\")"));
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(InterfaceLabel, AndWhateverTheHostsCodeABadVlanIsMinusOne)
{
    for (const int code : {1, -5, 14004, 14120}) {
        arm({.operation = Operation::ovlan_valid_name_check, .code = code});
        EXPECT_EQ(vlan("vlan7"), -1) << code;
    }
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(InterfaceLabel, NorIsNothingAVlan)
{
    EXPECT_EQ(in_library(md_xmap_vlan_check, host_.db(), nullptr), -1);
    EXPECT_EQ(in_library(md_xmap_vlan_check, nullptr, "vlan7"), 0);
    EXPECT_EQ(in_library(md_xmap_vlan_check, nullptr, "vlan4095"), -1);
    EXPECT_EQ(log_lines(),
              std::vector<std::string>(3, line_of("md_xmap_iflabel_check", "Unexpected NULL")));
}

class Pair : public LibraryTest
{
  protected:
    // Status and the match string in a buffer of `size` bytes, with what stands behind them.
    int append(const std::string &key, const std::string &value, std::size_t size = 1024)
    {
        buffer_.resize(4096, '#');
        const int status =
            in_library(md_xmap_concat_key_value, buffer_.data(), size, key.c_str(), value.c_str());
        return status;
    }
    void begin_with(const std::string &text)
    {
        buffer_ = text + '\0';
        buffer_.resize(4096, '#');
    }
    std::string match_string() const { return buffer_.c_str(); }

    std::string buffer_ = std::string(1, '\0');
};

TEST_F(Pair, OfAnEmptyStringHasNoCommaBefore)
{
    EXPECT_EQ(append("application", "web"), 0);
    EXPECT_EQ(match_string(), "application:web");
    EXPECT_EQ(append("src_ip", "10.0.0.0/8"), 0);
    EXPECT_EQ(match_string(), "application:web,src_ip:10.0.0.0/8");
    EXPECT_EQ(append("dst_ip", "::/0"), 0);
    EXPECT_EQ(match_string(), "application:web,src_ip:10.0.0.0/8,dst_ip:::/0");
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(Pair, IsTakenAsItIs)
{
    EXPECT_EQ(append("VLAN", "%s,a:b"), 0);
    EXPECT_EQ(append("", ""), 0);
    EXPECT_EQ(match_string(), "VLAN:%s,a:b,:");
}

TEST_F(Pair, OfNothingChangesNothing)
{
    begin_with("dscp:ef");
    char *const buffer = buffer_.data();
    EXPECT_EQ(in_library(md_xmap_concat_key_value, buffer, 1024, nullptr, "1"), 0);
    EXPECT_EQ(in_library(md_xmap_concat_key_value, buffer, 1024, "src_port", nullptr), 0);
    EXPECT_EQ(in_library(md_xmap_concat_key_value, nullptr, 1024, "src_port", "1"), 0);
    EXPECT_EQ(match_string(), "dscp:ef");
    EXPECT_THAT(log_lines(), IsEmpty());
}

// With its comma and colon, the piece of a key of 2 characters is 4 longer than the value.
TEST_F(Pair, NeedsRoomForItsEndToo)
{
    const std::string thousand(1000, 'x');
    begin_with(thousand);
    EXPECT_EQ(append("ab", std::string(20, 'v')), 14002);
    EXPECT_EQ(match_string(), thousand);
    EXPECT_THAT(log_lines(),
                ElementsAre(line_of("md_xmap_concat_key_value", "Required condition was not met")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 1U);

    EXPECT_EQ(append("ab", std::string(19, 'v')), 0);
    EXPECT_EQ(match_string(), thousand + ",ab:" + std::string(19, 'v'));
    EXPECT_EQ(match_string().size(), 1023U);
    EXPECT_EQ(buffer_[1024], '#');
}

TEST_F(Pair, OfAFullStringHasNoRoom)
{
    const std::string full(1023, 'x');
    begin_with(full);
    EXPECT_EQ(append("", ""), 14002);
    EXPECT_EQ(match_string(), full);
}

TEST_F(Pair, ThatIsRefusedLeavesWhatStandsBehindTheStringAlone)
{
    begin_with("abc");
    const std::string before = buffer_;
    EXPECT_EQ(append("dscp", "63", 11), 14002); // ",dscp:63" are 8, and 11 - 3 is no more
    EXPECT_EQ(buffer_, before);
    EXPECT_EQ(append("dscp", "63", 12), 0);
    EXPECT_EQ(match_string(), "abc,dscp:63");
}

TEST_F(Pair, OfUpTo1023CharactersIsWhole)
{
    EXPECT_EQ(append("k", std::string(1021, 'v')), 0);
    EXPECT_EQ(match_string(), "k:" + std::string(1021, 'v'));
}

TEST_F(Pair, IsCutAt1023CharactersBeforeItsRoomIsLookedAt)
{
    EXPECT_EQ(append("k", std::string(1022, 'v')), 0);
    EXPECT_EQ(match_string(), "k:" + std::string(1021, 'v'));
    EXPECT_EQ(buffer_[1024], '#');
}

TEST_F(Pair, IsCutBeforeALargerStringToo)
{
    begin_with("dscp:ef");
    EXPECT_EQ(append("k", std::string(2000, 'v'), 2048), 0);
    EXPECT_EQ(match_string(), "dscp:ef,k:" + std::string(1020, 'v'));
}

TEST_F(Pair, CutHasNoRoomBehindAnythingIn1024Bytes)
{
    begin_with("x");
    EXPECT_EQ(append("k", std::string(2000, 'v')), 14002);
    EXPECT_EQ(match_string(), "x");
}

TEST_F(Pair, HasNoRoomInABufferThatIsSmallerThanItsString)
{
    begin_with("dscp:ef");
    for (const std::size_t size : {0U, 1U, 7U, 8U}) {
        EXPECT_EQ(append("k", "v", size), 14002) << size;
        EXPECT_EQ(match_string(), "dscp:ef");
    }
    begin_with("");
    EXPECT_EQ(append("k", "v", 0), 14002);
    EXPECT_EQ(append("k", "v", 3), 14002);
    EXPECT_EQ(append("k", "v", 4), 0);
    EXPECT_EQ(match_string(), "k:v");
}

} // namespace

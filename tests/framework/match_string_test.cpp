#include "host/framework/match_string.h"

#include "framework/appliance.h"
#include "orvale/opkt_proto.h"
#include "tests/framework/allocation_failure.h"
#include "tests/framework/owned.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>

namespace ovhost::test
{
namespace
{

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

class MatchStringOperation : public testing::Test
{
  protected:
    int validate(const char *text)
    {
        return ov_acl_validate_matchstr(text, keys.out(), values.out(), reason.out());
    }

    OwnedStrings keys;
    OwnedStrings values;
    OwnedText reason;
};

TEST_F(MatchStringOperation, TakesPairsApartInOrder)
{
    ASSERT_EQ(validate("application:web,src_ip:10.1.0.0/16,dst_port:443"), 0);
    EXPECT_THAT(texts_of(keys), ElementsAre("application", "src_ip", "dst_port"));
    EXPECT_THAT(texts_of(values), ElementsAre("web", "10.1.0.0/16", "443"));
    EXPECT_EQ(reason.get(), nullptr);
}

TEST_F(MatchStringOperation, AnyAloneHasNoPairs)
{
    ASSERT_EQ(validate("any"), 0);
    EXPECT_THAT(texts_of(keys), IsEmpty());
    EXPECT_THAT(texts_of(values), IsEmpty());
}

TEST_F(MatchStringOperation, AKeyEndsAtItsFirstColon)
{
    ASSERT_EQ(validate("src_ip:2001:db8::/32,dst_ip:::/0,application:a:b"), 0);
    EXPECT_THAT(texts_of(keys), ElementsAre("src_ip", "dst_ip", "application"));
    EXPECT_THAT(texts_of(values), ElementsAre("2001:db8::/32", "::/0", "a:b"));
}

TEST_F(MatchStringOperation, KeysMayBeInCapitalsAndStayAsWritten)
{
    ASSERT_EQ(validate("VLAN:wan0,Dscp:ef"), 0);
    EXPECT_THAT(texts_of(keys), ElementsAre("VLAN", "Dscp"));
}

TEST_F(MatchStringOperation, KnowsAllKeys)
{
    EXPECT_EQ(validate("application:a,app_group:g,tbehavior:t,src_ip:0.0.0.0/0,dst_ip:::/0,"
                       "src_port:1,dst_port:2,vlan:v,protocol:tcp,dscp:1"),
              0);
    EXPECT_EQ(tstr_array_length_quick(keys.get()), 10);
}

struct ValueCase {
    const char *text;
    bool is_valid;
};

constexpr ValueCase value_cases[] = {
    {"src_ip:10.1.2.3/32", true},
    {"src_ip:10.1.2.3", false},
    {"src_ip:10.1.2.3/33", false},
    {"src_ip:10.1.2/24", false},
    {"src_ip:any", false},
    {"src_ip:", false},
    {"dst_ip:2001:db8::1/128", true},
    {"dst_ip:2001:db8::1/129", false},
    {"dst_ip: 10.0.0.0/8", false},
    {"src_port:0", true},
    {"src_port:65535", true},
    {"src_port:65536", false},
    {"src_port:80-90", true},
    {"src_port:80-80", true},
    {"src_port:90-80", false},
    {"src_port:80-", false},
    {"src_port:-80", false},
    {"src_port:80-90-100", false},
    {"src_port:80-70000", false},
    {"src_port:+80", false},
    {"src_port:http", false},
    {"dst_port:", false},
    {"dst_port:443", true},
    {"protocol:0", true},
    {"protocol:255", true},
    {"protocol:256", false},
    {"protocol:99999999999999999999", false},
    {"protocol:tcp", true},
    {"protocol:ip", true},
    {"protocol:tp++", true},
    {"protocol:raw", true},
    {"protocol:ipproto-198", true},
    {"protocol:ipproto-199", false},
    {"protocol:ipv6-icmp", false},
    {"protocol:TCP", false},
    {"protocol:", false},
    {"protocol:-5", false},
    {"protocol: 6", false},
    {"protocol:17abc", false},
    {"protocol:4294967302", false},
    {"protocol:tcp_udp", false},
    {"protocol:t cp", false},
    {"dscp:0", true},
    {"dscp:63", true},
    {"dscp:64", false},
    {"dscp:any", true},
    {"dscp:ef", true},
    {"dscp:af11", true},
    {"dscp:af43", true},
    {"dscp:af14", false},
    {"dscp:af51", false},
    {"dscp:cs0", true},
    {"dscp:cs7", true},
    {"dscp:cs8", false},
    {"dscp:EF", false},
    {"dscp:", false},
    {"application:any", true},
    {"application:", false},
    {"app_group:", false},
    {"tbehavior:", false},
    {"vlan:", false},
    {"vlan:a name with blanks", true},
    {"vlan:*", false},
    {"vlan:\\*", false},
    {"vlan:wan*", true},
    {"vlan:a/b", false},
    {"vlan:a\\/b", false},
    {"vlan:*/*", false},
    {"vlan:/", false},
    {"vlan:a\\", false},
    {"application:*", true},
    {"src_ip:010.1.2.3/8", false},
    {"src_ip:10.1.2.3/", false},
    {"src_ip:10.1.2.3/-1", false},
    {"src_ip:10.1.2.3/255.0.0.0", false},
    {"dst_ip:::ffff:10.1.2.3/96", true},
    {"dst_ip:2001:db8/32", false},
};

TEST_F(MatchStringOperation, ValuesByKey)
{
    for (const ValueCase &row : value_cases) {
        EXPECT_EQ(validate(row.text), row.is_valid ? 0 : 14012) << row.text;
        EXPECT_EQ(keys.get() != nullptr, row.is_valid) << row.text;
        EXPECT_EQ(values.get() != nullptr, row.is_valid) << row.text;
        EXPECT_EQ(reason.get() == nullptr, row.is_valid) << row.text;
    }
}

TEST_F(MatchStringOperation, ALabelIsNoLongerThanTheLibraryCanLookUp)
{
    const std::string longest = "vlan:" + std::string(233, 'l');
    EXPECT_EQ(validate(longest.c_str()), 0);
    EXPECT_EQ(validate((longest + "l").c_str()), 14012);
}

TEST_F(MatchStringOperation, ReasonsNameThePairAndSayWhatToWrite)
{
    const std::pair<const char *, const char *> rows[] = {
        {"", "it is empty; write key:value pairs joined by commas, or any"},
        {"vlan:a,web", "pair \"web\": it has no colon; write key:value"},
        {"any,vlan:a", "pair \"any\": it has no colon; write key:value"},
        {"ANY", "pair \"ANY\": it has no colon; write key:value"},
        {"vlan:a,", "pair \"\": it has no colon; write key:value"},
        {",vlan:a", "pair \"\": it has no colon; write key:value"},
        {"vlan:a,,dscp:1", "pair \"\": it has no colon; write key:value"},
        {"app:web", "pair \"app:web\": the key is not one of application, app_group, tbehavior, "
                    "src_ip, dst_ip, src_port, dst_port, vlan, protocol, dscp"},
        {":web", "pair \":web\": the key is not one of application, app_group, tbehavior, "
                 "src_ip, dst_ip, src_port, dst_port, vlan, protocol, dscp"},
        {"dscp:1,vlan:a,DSCP:2", "pair \"DSCP:2\": the key stands in an earlier pair already"},
        {"dst_port:http", "pair \"dst_port:http\": the value must be a port from 0 to 65535 or a "
                          "range such as 8000-8080"},
        {"src_ip:10.1", "pair \"src_ip:10.1\": the value must be an address and a mask length, "
                        "such as 10.1.0.0/16"},
        {"vlan:",
         "pair \"vlan:\": the value must be a label or a VLAN's name: 1 to 233 bytes without "
         "slash and backslash, and not * alone"},
        {"tbehavior:", "pair \"tbehavior:\": the value must be a text that is not empty"},
        {"protocol:a/b", "pair \"protocol:a/b\": the value must be a number from 0 to 255 or a "
                         "protocol's name such as tcp"},
        {"dscp:64", "pair \"dscp:64\": the value must be a number from 0 to 63, cs0 to cs7, af11 "
                    "to af43, ef or any"},
    };
    for (const auto &[text, expected] : rows) {
        EXPECT_EQ(validate(text), 14012) << text;
        EXPECT_STREQ(reason.get(), expected) << text;
    }
}

TEST_F(MatchStringOperation, ABlankAfterACommaIsPartOfTheKey)
{
    EXPECT_EQ(validate("vlan:a, dscp:1"), 14012);
    EXPECT_THAT(reason.get(), HasSubstr("pair \" dscp:1\""));
}

TEST_F(MatchStringOperation, HasAtMost1023Characters)
{
    const std::string key = "application:";
    EXPECT_EQ(validate((key + std::string(1023 - key.size(), 'a')).c_str()), 0);
    EXPECT_EQ(validate((key + std::string(1024 - key.size(), 'a')).c_str()), 14012);
    EXPECT_STREQ(reason.get(), "it is longer than 1023 characters");
    EXPECT_EQ(keys.get(), nullptr);
}

// Every name of the library's table is a protocol here: what an older configuration named is good
// in a match string.
TEST_F(MatchStringOperation, KnowsEveryProtocolOfTheTable)
{
    int names = 0;
    for (const lc_enum_string_map &row : opkt_proto_map) {
        if (row.lesm_string != nullptr) {
            EXPECT_EQ(validate((std::string("protocol:") + row.lesm_string).c_str()), 0)
                << row.lesm_string;
            ++names;
        }
    }
    EXPECT_EQ(names, 256);
}

TEST_F(MatchStringOperation, NullArguments)
{
    EXPECT_EQ(validate(nullptr), 14001);
    EXPECT_EQ(keys.get(), nullptr);
    EXPECT_EQ(reason.get(), nullptr);
    EXPECT_EQ(ov_acl_validate_matchstr("any", nullptr, values.out(), reason.out()), 14001);
    EXPECT_EQ(ov_acl_validate_matchstr("any", keys.out(), nullptr, reason.out()), 14001);
    // Nobody needs to ask for the reason.
    EXPECT_EQ(ov_acl_validate_matchstr("any", keys.out(), values.out(), nullptr), 0);
    EXPECT_EQ(ov_acl_validate_matchstr("no", keys.out(), values.out(), nullptr), 14012);
}

TEST_F(MatchStringOperation, ReportsLackOfMemory)
{
    const std::string text = "application:" + std::string(100, 'a') + ",vlan:b";
    expect_allocation_failures_reported([&] { return validate(text.c_str()); });
    EXPECT_EQ(tstr_array_length_quick(keys.get()), 2);
}

TEST(MatchString, AFaultLeavesTheResultAlone)
{
    MatchString match = {{"k"}, {"v"}};
    EXPECT_TRUE(parse_match_string("vlan:a,nonsense", match).has_value());
    EXPECT_THAT(match.keys, ElementsAre("k"));
    EXPECT_THAT(match.values, ElementsAre("v"));
}

} // namespace
} // namespace ovhost::test

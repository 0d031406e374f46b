#include "host/tree/value_type.h"

#include <gmock/gmock.h>

#include <iterator>
#include <set>

namespace ovhost
{
namespace
{

using testing::Optional;
using testing::StartsWith;
using testing::StrEq;

struct TypeTexts {
    bn_type type;
    std::vector<std::string> fitting;
    std::vector<std::string> refused;
};

const std::string label_63(63, 'a');
const std::string label_64(64, 'a');
// 3 labels of 63, their dots and one of 61: 253.
const std::string host_253 =
    label_63 + "." + label_63 + "." + label_63 + "." + std::string(61, 'b');

std::string repeat(const std::string &text, int times)
{
    std::string all;
    for (; times > 0; --times) {
        all += text;
    }
    return all;
}

// Blanks, signs and empty texts are refused by every number.
const std::vector<TypeTexts> integers = {
    {bt_uint8, {"0", "255", "007"}, {"256", "-1", "-0", "+1", "", " 1", "1 ", "0x1", "1.0", "a"}},
    {bt_int8, {"-128", "127", "0", "-0"}, {"-129", "128", "+1", "", "-", "--1", "- 1"}},
    {bt_uint16, {"0", "65535"}, {"65536", "-1", ""}},
    {bt_int16, {"-32768", "32767"}, {"-32769", "32768", ""}},
    {bt_uint32, {"0", "4294967295"}, {"4294967296", "-1", ""}},
    {bt_int32, {"-2147483648", "2147483647"}, {"-2147483649", "2147483648", ""}},
    {bt_uint64, {"0", "18446744073709551615"}, {"18446744073709551616", "-1", ""}},
    {bt_int64,
     {"-9223372036854775808", "9223372036854775807"},
     {"-9223372036854775809", "9223372036854775808", "18446744073709551615", ""}},
    {bt_duration_sec, {"0", "18446744073709551615"}, {"18446744073709551616", "-1", "1s", ""}},
    {bt_duration_ms, {"0", "18446744073709551615"}, {"18446744073709551616", "-1", "1.5", ""}},
    {bt_duration_us, {"0", "18446744073709551615"}, {"18446744073709551616", "-1", ""}},
    {bt_attribute, {"0", "1", "4294967295"}, {"4294967296", "-1", "value", ""}},
};

const std::vector<TypeTexts> simple_values = {
    {bt_bool, {"true", "false"}, {"True", "FALSE", "1", "0", "yes", "", "true "}},
    {bt_float32,
     {"0", "-0.5", "12", "1.5e-3", "3.4e38", ".5", "5."},
     {"3.5e38", "1e-60", "inf", "-inf", "nan", "+1", "1,5", "0x1p3", "1.0f", "", ".", " 1", "1 "}},
    {bt_float64,
     {"0", "-0.5", "3.5e38", "1.7e308", "1e-60"},
     {"1.8e308", "1e-400", "inf", "nan", "+1", "1e", "", "-"}},
    {bt_char, {"a", " ", "~", "\"", "\\"}, {"", "ab", "\n", "\x7f", "\xc3\xa4", "\xff"}},
    {bt_none, {""}, {" ", "none", "0"}},
    {bt_any, {"", "anything", "\xff\x01", "a\nb"}, {}},
    {bt_string, {"", "text", "\xff not UTF-8", " padded "}, {}},
    {bt_charlist, {"", "abc,", "\x01\xff"}, {}},
    {bt_utf8_string,
     {"", "text", "gr\xc3\xbc\xc3\x9f", "\xf0\x9f\x98\x80"},
     {"\xff", "ab\xc3", "\xc0\x80", "\xed\xa0\x80"}},
    {bt_binary, {"", "00", "dEaDbEeF"}, {"0", "123", "0x00", "zz", "00 11"}},
    {bt_btype,
     {"uint8", "macaddr802", "globpattern", "btype", "none"},
     {"", "UINT8", "uint", "uint128", "uint8 ", "5"}},
};

const std::vector<TypeTexts> addresses = {
    {bt_ipv4addr,
     {"0.0.0.0", "192.0.2.1", "255.255.255.255"},
     {"", "256.0.0.1", "1.2.3", "1.2.3.4.5", "1.2.3.4 ", " 1.2.3.4", "::1", "1.2.3.4/32", "a.b.c.d",
      "1..2.3"}},
    {bt_ipv6addr,
     {"::", "::1", "2001:db8::1", "2001:DB8:0:0:0:0:0:1", "::ffff:192.0.2.1"},
     {"", "2001:db8", "1::2::3", "fe80::1%eth0", "12345::", "192.0.2.1", "::1/128", ":", "[::1]"}},
    {bt_ipaddr, {"192.0.2.1", "2001:db8::1"}, {"", "192.0.2", "2001:db8", "host", "10.0.0.0/8"}},
    {bt_ipv4prefix,
     {"0.0.0.0/0", "10.0.0.0/8", "192.0.2.1/32", "192.0.2.1/24"},
     {"", "10.0.0.0", "10.0.0.0/", "10.0.0.0/33", "10.0.0.0/-1", "10.0.0.0/8/8", "/8", "10/8",
      "10.0.0.0/255.0.0.0", "::/0", "10.0.0.0 /8"}},
    {bt_ipv6prefix,
     {"::/0", "2001:db8::/32", "::1/128"},
     {"", "::", "::/", "::/129", "::/-0", "10.0.0.0/8", "2001:db8/32"}},
    {bt_ipprefix,
     {"10.0.0.0/8", "2001:db8::/128"},
     {"", "10.0.0.0/33", "::/129", "10.0.0.1", "::1", "10.0.0.0/64"}},
    {bt_macaddr802,
     {"00:1b:21:0a:0b:0c", "FF:FF:FF:FF:FF:FF"},
     {"", "00:1b:21:0a:0b", "00:1b:21:0a:0b:0c:0d", "00-1b-21-0a-0b-0c", "0:1b:21:0a:0b:0c",
      "001b210a0b0c", "0g:1b:21:0a:0b:0c"}},
};

const std::vector<TypeTexts> dates_and_times = {
    {bt_date,
     {"2024/02/29", "2000/02/29", "1999/12/31", "0001/01/01", "9999/12/31"},
     {"", "2023/02/29", "1900/02/29", "2024/04/31", "2024/13/01", "2024/00/01", "2024/01/00",
      "2024/01/32", "2024-01-01", "24/01/01", "2024/1/1", "2024/01/01 ", "12024/01/01"}},
    {bt_time_sec,
     {"00:00:00", "23:59:59", "09:08:07"},
     {"", "24:00:00", "23:60:00", "23:59:60", "9:08:07", "23:59", "23:59:59.000", "23.59.59",
      "-1:00:00"}},
    {bt_time_ms,
     {"00:00:00.000", "23:59:59.999"},
     {"", "00:00:00", "00:00:00.00", "00:00:00.0000", "24:00:00.000", "00:00:00,000"}},
    {bt_time_us,
     {"00:00:00.000000", "23:59:59.999999"},
     {"", "00:00:00", "00:00:00.000", "00:00:00.0000000", "00:60:00.000000"}},
    {bt_datetime_sec,
     {"2024/02/29 23:59:59"},
     {"", "2024/02/29", "23:59:59", "2023/02/29 00:00:00", "2024/02/29 24:00:00",
      "2024/02/29T00:00:00", "2024/02/29  00:00:00", "2024/02/29 00:00:00.000", "2024/02/29 "}},
    {bt_datetime_ms,
     {"2024/02/29 23:59:59.123"},
     {"", "2024/02/29 23:59:59", "2024/02/30 23:59:59.123", "2024/02/29 23:59:59.123456"}},
    {bt_datetime_us,
     {"2024/02/29 23:59:59.123456"},
     {"", "2024/02/29 23:59:59.123", "2024/02/30 23:59:59.123456"}},
};

const std::vector<TypeTexts> names_and_patterns = {
    {bt_oid,
     {"1.3", "1.3.6.1.4.1", ".1.3.6", "0.4294967295", "1" + repeat(".1", 127)},
     {"", ".", "1", ".1", "1.", "1..3", "1.a", "1.-1", "1.4294967296", "..1.3",
      "1" + repeat(".1", 128)}},
    {bt_link,
     {"/", "/a/b", R"(/a/10.0.0.0\/8)"},
     {"", "a", "a/b", "/a/", "//", "/a\\", repeat("/x", 257)}},
    {bt_name,
     {"/", "/a/b", R"(/a/10.0.0.0\/8)", repeat("/x", 256)},
     {"", "a", "a/b", "/a/", "//", "/a\\", repeat("/x", 257)}},
    {bt_hostname,
     {"a", "host", "Host-1.example", "3com", "10.0.0.1", label_63 + ".b", host_253},
     {"", ".", "a.", ".a", "a..b", "-a", "a-", "a.-b", "a_b", "a b", label_64, host_253 + "b",
      "h\xc3\xb6st"}},
    {bt_uri,
     {"http://host/path?q=1#part", "mailto:a@b", "urn:x:y", "a:", "ftp://[::1]/%20x",
      "z39.50r+x-y:z"},
     {"", "host/path", ":x", "1http://x", "ht_tp://x", "http://a b", "http://a%2", "http://a%zz",
      "http://a%", "http://h\xc3\xb6st", "http://a#b#c", "http://a<b>", "http://a\"", "a\\:b"}},
    {bt_regex,
     {"", "a", "^(a|b)+[[:digit:]]{1,3}$", "a{2048}", R"(\()", std::string(1024, 'a')},
     {"(", "[", "a{2,1}", "*)", "[[:nope:]]", "a\\", "a{2049}", "((a{255}){255}){255}",
      std::string(1025, 'a'), repeat("(", 20000) + repeat(")", 20000)}},
    {bt_globpattern,
     {"", "*", "a?b*", "[abc]", "[!a-z]x", "[^]]", "[]]", "[]a]", "[!]a]", R"(\[)", R"(\])",
      R"(\\)", R"([a\]b])"},
     {"[", "[abc", "[]", "[!]", "[!", "[!!", "]", "a]", "\\", "a\\", R"([a\])", "[a]]"}},
};

const std::vector<std::vector<TypeTexts>> all_texts = {integers, simple_values, addresses,
                                                       dates_and_times, names_and_patterns};

TEST(ValueFault, IsNothingForTextsThatFit)
{
    for (const auto &group : all_texts) {
        for (const TypeTexts &row : group) {
            for (const std::string &text : row.fitting) {
                EXPECT_EQ(value_fault(row.type, text), std::nullopt)
                    << row.type << " " << testing::PrintToString(text);
            }
        }
    }
}

TEST(ValueFault, RefusesOtherTexts)
{
    for (const auto &group : all_texts) {
        for (const TypeTexts &row : group) {
            for (const std::string &text : row.refused) {
                EXPECT_THAT(value_fault(row.type, text), Optional(StartsWith("must be ")))
                    << row.type << " " << testing::PrintToString(text);
            }
        }
    }
}

TEST(ValueFault, IsTestedForEveryType)
{
    std::set<bn_type> tested;
    for (const auto &group : all_texts) {
        for (const TypeTexts &row : group) {
            EXPECT_TRUE(tested.insert(row.type).second) << row.type;
        }
    }
    std::set<bn_type> types;
    for (const lc_enum_string_map &row : bn_type_map) {
        types.insert(row.lesm_enum);
    }
    types.erase(0);
    EXPECT_EQ(types.size(), 44U);
    EXPECT_EQ(tested, types);
}

TEST(ValueFault, RefusesNulBytesWhateverTheType)
{
    for (const lc_enum_string_map &row : bn_type_map) {
        EXPECT_EQ(value_fault(row.lesm_enum, std::string_view("1\0", 2)),
                  "must not hold a NUL byte")
            << row.lesm_enum;
    }
}

TEST(ValueFault, RefusesUnknownTypes)
{
    EXPECT_EQ(value_fault(0, ""), "no value type has the code 0");
    EXPECT_EQ(value_fault(10, "1"), "no value type has the code 10");
    EXPECT_EQ(value_fault(4294967295U, "1"), "no value type has the code 4294967295");
}

TEST(ValueFault, RefusesExpensiveExpressionsWithoutCompilingThem)
{
    EXPECT_TRUE(value_fault(bt_regex, repeat("(", 100) + "a" + repeat("+)", 100)).has_value());
    EXPECT_TRUE(value_fault(bt_regex, "(((a{1,200}){1,200}){1,200}){1,200}").has_value());
}

TEST(ValueFault, SaysWhatTheValueMustBe)
{
    const struct {
        bn_type type;
        const char *reason;
    } rows[] = {
        {bt_uint8, "must be a decimal number from 0 to 255"},
        {bt_int8, "must be a decimal number from -128 to 127"},
        {bt_uint16, "must be a decimal number from 0 to 65535"},
        {bt_int16, "must be a decimal number from -32768 to 32767"},
        {bt_uint32, "must be a decimal number from 0 to 4294967295"},
        {bt_int32, "must be a decimal number from -2147483648 to 2147483647"},
        {bt_uint64, "must be a decimal number from 0 to 18446744073709551615"},
        {bt_int64, "must be a decimal number from -9223372036854775808 to 9223372036854775807"},
        {bt_bool, "must be true or false"},
        {bt_float32, "must be a finite decimal number in the range of the type"},
        {bt_float64, "must be a finite decimal number in the range of the type"},
        {bt_char, "must be one printable ASCII character"},
        {bt_ipaddr, "must be an IPv4 or IPv6 address"},
        {bt_ipprefix,
         "must be an IPv4 or IPv6 address, a slash and a prefix length up to 32 or 128"},
        {bt_ipv4addr, "must be an IPv4 address such as 192.0.2.1"},
        {bt_ipv4prefix, "must be an IPv4 address, a slash and a length from 0 to 32"},
        {bt_ipv6addr, "must be an IPv6 address such as 2001:db8::1"},
        {bt_ipv6prefix, "must be an IPv6 address, a slash and a length from 0 to 128"},
        {bt_macaddr802, "must be six pairs of hex digits such as 00:1b:21:0a:0b:0c"},
        {bt_date, "must be a calendar day as YYYY/MM/DD"},
        {bt_time_sec, "must be a time of day as HH:MM:SS"},
        {bt_time_ms, "must be a time of day as HH:MM:SS.mmm"},
        {bt_time_us, "must be a time of day as HH:MM:SS.uuuuuu"},
        {bt_datetime_sec, "must be a date and time as YYYY/MM/DD HH:MM:SS"},
        {bt_datetime_ms, "must be a date and time as YYYY/MM/DD HH:MM:SS.mmm"},
        {bt_datetime_us, "must be a date and time as YYYY/MM/DD HH:MM:SS.uuuuuu"},
        {bt_duration_sec, "must be a decimal number from 0 to 18446744073709551615"},
        {bt_duration_ms, "must be a decimal number from 0 to 18446744073709551615"},
        {bt_duration_us, "must be a decimal number from 0 to 18446744073709551615"},
        {bt_none, "must be empty"},
        {bt_btype, "must be the name of a value type such as uint32"},
        {bt_attribute, "must be a decimal number from 0 to 4294967295"},
        {bt_utf8_string, "must be well-formed UTF-8"},
        {bt_binary, "must be pairs of hex digits"},
        {bt_oid, "must be 2 to 128 decimal numbers joined by dots"},
        {bt_link, "must be a node name such as /a/b, at most 256 components, \"\\/\" for a slash "
                  "inside one"},
        {bt_name, "must be a node name such as /a/b, at most 256 components, \"\\/\" for a slash "
                  "inside one"},
        {bt_hostname, "must be labels of letters, digits and inner hyphens joined by dots, up to "
                      "63 characters each and 253 in all"},
        {bt_uri, "must be a URI such as https://host/path"},
        {bt_regex,
         "must be a POSIX extended regular expression of at most 1024 bytes that repeats little"},
        {bt_globpattern, "must be a glob pattern with every bracket closed"},
    };
    // A byte that no format takes, behind a bracket that no pattern closes.
    for (const auto &row : rows) {
        EXPECT_THAT(value_fault(row.type, "[\xff"), Optional(StrEq(row.reason))) << row.type;
    }
    // All but "any", "string" and "charlist", which take every text.
    EXPECT_EQ(std::size(rows), 44U - 3U);
}

std::string describe(bn_type type, std::string_view text)
{
    return describe_fault("/a/b", type, text, "must be so");
}

TEST(DescribeFault, NamesNodeTypeAndValue)
{
    EXPECT_EQ(describe_fault("/a/b", bt_uint8, "300", value_fault(bt_uint8, "300").value()),
              R"(/a/b: "300" is not a uint8: must be a decimal number from 0 to 255)");
    EXPECT_EQ(describe_fault(R"(/r/10.0.0.0\/8)", bt_bool, "", value_fault(bt_bool, "").value()),
              R"(/r/10.0.0.0\/8: "" is not a bool: must be true or false)");
}

TEST(DescribeFault, ChoosesTheArticle)
{
    EXPECT_EQ(describe(bt_int8, "x"), R"(/a/b: "x" is not an int8: must be so)");
    EXPECT_EQ(describe(bt_ipv4addr, "x"), R"(/a/b: "x" is not an ipv4addr: must be so)");
    EXPECT_EQ(describe(bt_oid, "x"), R"(/a/b: "x" is not an oid: must be so)");
    EXPECT_EQ(describe(bt_attribute, "x"), R"(/a/b: "x" is not an attribute: must be so)");
    EXPECT_EQ(describe(bt_uri, "x"), R"(/a/b: "x" is not a uri: must be so)");
    EXPECT_EQ(describe(bt_hostname, "x"), R"(/a/b: "x" is not a hostname: must be so)");
}

TEST(DescribeFault, NamesAnUnknownTypeByItsCode)
{
    EXPECT_EQ(describe_fault("/a", 555, "1", value_fault(555, "1").value()),
              R"(/a: "1" is not of type 555: no value type has the code 555)");
    EXPECT_EQ(describe(0, "1"), R"(/a/b: "1" is not of type 0: must be so)");
}

TEST(DescribeFault, QuotesTheValueSafely)
{
    EXPECT_EQ(describe(bt_uint8, "a\nb\x7f"), R"(/a/b: "a\x0ab\x7f" is not a uint8: must be so)");
    EXPECT_EQ(describe(bt_uint8, R"(say "\")"), R"(/a/b: "say \"\\\"" is not a uint8: must be so)");
    EXPECT_EQ(describe(bt_uint8, "\xff\xc3"), R"(/a/b: "\xff\xc3" is not a uint8: must be so)");
    EXPECT_EQ(describe(bt_uint8, std::string_view("\0", 1)),
              R"(/a/b: "\x00" is not a uint8: must be so)");
    EXPECT_EQ(describe(bt_uint8, "\xc3\xbc"), "/a/b: \"\xc3\xbc\" is not a uint8: must be so");
}

TEST(DescribeFault, CutsALongValueBetweenCharacters)
{
    const std::string full(128, 'x');
    EXPECT_EQ(describe(bt_uint8, full), "/a/b: \"" + full + "\" is not a uint8: must be so");
    EXPECT_EQ(describe(bt_uint8, full + "y"),
              "/a/b: \"" + full + "\"... is not a uint8: must be so");
    const std::string shorter(127, 'x');
    EXPECT_EQ(describe(bt_uint8, shorter + "\xc3\xbc" + "y"),
              "/a/b: \"" + shorter + "\xc3\xbc\"... is not a uint8: must be so");
}

} // namespace
} // namespace ovhost

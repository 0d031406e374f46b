#include "framework/errors.h"

#include "framework/bnode.h"

#include <gtest/gtest.h>

#include <array>
#include <iterator>
#include <string_view>
#include <utility>

namespace ovhost::test
{
namespace
{

using Row = std::pair<uint32, std::string_view>;

constexpr std::array<Row, 39> status_codes = {{
    {0, "no error"},
    {14000, "generic error"},
    {14001, "unexpected NULL"},
    {14002, "assertion failed"},
    {14003, "not yet implemented"},
    {14004, "item not found"},
    {14005, "item unexpectedly already exists"},
    {14006, "expected single item, found multiple"},
    {14007, "unexpected EOF"},
    {14008, "unknown command line argument"},
    {14009, "invalid path name"},
    {14010, "invalid file"},
    {14011, "buffer space exhausted"},
    {14012, "generic parser error"},
    {14013, "file or path not found"},
    {14014, "generic IO error"},
    {14015, "IO source/sink would block"},
    {14016, "IO source/sink is closed"},
    {14017, "IO operation timed out"},
    {14018, "IO operation had unexpected file existence"},
    {14019, "unexpected case in switch statement"},
    {14020, "type conversion failed"},
    {14021, "bad UTF-8 character sequence"},
    {14022, "divide by zero"},
    {14023, "filesystem out of space"},
    {14090, "tree: tried to delete node with children"},
    {14091, "tree: node is not an ancestor"},
    {14092, "tree: no preexisting path to specified node"},
    {14100, "foreach: delete current element"},
    {14101, "foreach: remove current element"},
    {14102, "foreach: halt iteration with error"},
    {14103, "foreach: halt iteration without error"},
    {14110, "CLI shell: reset timer for event callback"},
    {14111, "CLI shell: delete event callback registration"},
    {14115, "CLI shell func called but not available"},
    {14120, "Operation cancelled"},
    {14500, "Invalid user/password for login"},
    {14501, "Invalid string name was passed in."},
    {14502, "Upgrade failed, no continue."},
}};

constexpr std::array<Row, 44> value_types = {{
    {1, "uint8"},        {2, "int8"},         {3, "uint16"},        {4, "int16"},
    {5, "uint32"},       {6, "int32"},        {7, "uint64"},        {8, "int64"},
    {9, "bool"},         {20, "float32"},     {21, "float64"},      {40, "char"},
    {50, "ipaddr"},      {51, "ipprefix"},    {60, "ipv4addr"},     {61, "ipv4prefix"},
    {63, "ipv6addr"},    {64, "ipv6prefix"},  {62, "macaddr802"},   {70, "date"},
    {71, "time_sec"},    {72, "time_ms"},     {73, "time_us"},      {74, "datetime_sec"},
    {75, "datetime_ms"}, {76, "datetime_us"}, {77, "duration_sec"}, {78, "duration_ms"},
    {79, "duration_us"}, {90, "none"},        {91, "any"},          {92, "btype"},
    {93, "attribute"},   {101, "string"},     {102, "utf8_string"}, {103, "binary"},
    {105, "oid"},        {120, "link"},       {121, "name"},        {130, "hostname"},
    {131, "uri"},        {132, "charlist"},   {133, "regex"},       {134, "globpattern"},
}};

/// The table holds these rows in this order, and the row {0, NULL} behind them.
template <std::size_t RowCount>
void expect_rows(const lc_enum_string_map *table, const std::array<Row, RowCount> &expected)
{
    for (const auto &[code, text] : expected) {
        ASSERT_NE(table->lesm_string, nullptr) << "before " << text;
        EXPECT_EQ(table->lesm_enum, code);
        EXPECT_EQ(table->lesm_string, text);
        ++table;
    }
    EXPECT_EQ(table->lesm_enum, 0U);
    EXPECT_EQ(table->lesm_string, nullptr);
}

TEST(ErrorCodeMap, HoldsAllCodesInOrder)
{
    EXPECT_EQ(std::size(lc_error_code_map), 40U);
    expect_rows(lc_error_code_map, status_codes);
}

TEST(TypeMap, HoldsAllTypesInOrder)
{
    EXPECT_EQ(std::size(bn_type_map), 45U);
    expect_rows(bn_type_map, value_types);
}

TEST(EnumToString, FindsEveryCode)
{
    for (const auto &[code, text] : status_codes) {
        EXPECT_EQ(lc_enum_to_string_quiet_null(lc_error_code_map, code), text);
    }
}

TEST(EnumToString, AnswersNullForAnUnknownCode)
{
    EXPECT_EQ(lc_enum_to_string_quiet_null(lc_error_code_map, 13999), nullptr);
    EXPECT_EQ(lc_enum_to_string_quiet_null(lc_error_code_map, 0xFFFFFFFFU), nullptr);
    EXPECT_EQ(lc_enum_to_string_quiet_null(nullptr, 0), nullptr);
}

TEST(EnumToString, DoesNotTakeTheEndForARow)
{
    EXPECT_EQ(lc_enum_to_string_quiet_null(bn_type_map, 0), nullptr);
    constexpr lc_enum_string_map empty[] = {{0, nullptr}};
    EXPECT_EQ(lc_enum_to_string_quiet_null(empty, 0), nullptr);
}

TEST(StringToEnum, FindsEveryType)
{
    for (const auto &[code, text] : value_types) {
        uint32 found = 0;
        EXPECT_EQ(lc_string_to_enum(bn_type_map, text.data(), &found), 0);
        EXPECT_EQ(found, code);
    }
}

TEST(StringToEnum, LeavesTheResultAloneWhenNoRowHasTheText)
{
    for (const char *text : {"", "uint3", "uint322", "UINT32", " uint32"}) {
        uint32 found = 4711;
        EXPECT_EQ(lc_string_to_enum(bn_type_map, text, &found), 14020) << text;
        EXPECT_EQ(found, 4711U);
    }
}

TEST(StringToEnum, TheFirstMatchingRowCounts)
{
    constexpr lc_enum_string_map table[] = {{7, "on"}, {8, "on"}, {0, nullptr}};
    uint32 found = 0;
    EXPECT_EQ(lc_string_to_enum(table, "on", &found), 0);
    EXPECT_EQ(found, 7U);
}

TEST(StringToEnum, RefusesNull)
{
    uint32 found = 0;
    EXPECT_EQ(lc_string_to_enum(nullptr, "x", &found), 14001);
    EXPECT_EQ(lc_string_to_enum(bn_type_map, nullptr, &found), 14001);
    EXPECT_EQ(lc_string_to_enum(bn_type_map, "bool", nullptr), 14001);
}

} // namespace
} // namespace ovhost::test

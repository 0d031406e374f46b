#include "host/modules/plain_names.h"

#include <gtest/gtest.h>

namespace
{

using namespace ovhost;

TEST(PlainNames, AreOneTo255BytesLong)
{
    EXPECT_EQ(plain_name_fault("a thing's name", "a"), std::nullopt);
    EXPECT_EQ(plain_name_fault("a thing's name", std::string(255, 'a')), std::nullopt);
    EXPECT_EQ(plain_name_fault("a thing's name", ""),
              "a thing's name is 1 to 255 bytes long, not 0");
    EXPECT_EQ(plain_name_fault("a thing's name", std::string(256, 'a')),
              "a thing's name is 1 to 255 bytes long, not 256");
    EXPECT_EQ(plain_name_fault("a thing's name", "abc", 3), std::nullopt);
    EXPECT_EQ(plain_name_fault("a thing's name", "abcd", 3),
              "a thing's name is 1 to 3 bytes long, not 4");
}

TEST(PlainNames, HoldNoControlCharacters)
{
    struct Row {
        const char *name;
        const char *shown;
    };
    for (const auto &[name, shown] :
         {Row{"a\nb", "a\\nb"}, Row{"\r", "\\r"}, Row{"\x1b[2J", "\\x1b[2J"},
          Row{"a\x7f", "a\\x7f"}, Row{"\xc2\x9b", "\\u009b"}}) {
        EXPECT_EQ(plain_name_fault("a thing's name", name),
                  "a thing's name must not hold control characters, as \"" + std::string(shown) +
                      "\" does: choose another name");
    }
}

TEST(PlainNames, HoldNothingThatMeansSomethingInPaths)
{
    EXPECT_EQ(plain_name_fault("a thing's name", "a b.c-d_e:f,\xc3\xa9"), std::nullopt);
    EXPECT_EQ(plain_name_fault("a thing's name", "a/"),
              "a thing's name must not hold \"/\": choose another name");
    EXPECT_EQ(plain_name_fault("a thing's name", "\\a/"),
              "a thing's name must not hold \"\\\": choose another name");
    EXPECT_EQ(plain_name_fault("a thing's name", "*"),
              "a thing's name must not hold \"*\": choose another name");
}

TEST(EntryNumbers, AreWrittenInOneWay)
{
    for (const char *number : {"1", "9", "10", "65534", "65535"}) {
        EXPECT_EQ(entry_number_fault("the number", number), std::nullopt) << number;
    }
    for (const char *number :
         {"", "0", "00", "01", "65536", "4294967297", "-1", "+1", " 1", "1 ", "1a", "a", "0x1"}) {
        EXPECT_EQ(entry_number_fault("the number", number),
                  "the number is a decimal number from 1 to 65535, not \"" + std::string(number) +
                      "\"");
    }
}

} // namespace

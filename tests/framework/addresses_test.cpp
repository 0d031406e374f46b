#include "framework/addresses.h"

#include "tests/framework/owned.h"

#include <gtest/gtest.h>

#include <string>

namespace ovhost::test
{
namespace
{

TEST(MaskLength, OfMasksAndLengths)
{
    const std::pair<const char *, const char *> rows[] = {
        {"255.255.0.0", "16"},
        {"255.255.255.255", "32"},
        {"0.0.0.0", "0"},
        {"128.0.0.0", "1"},
        {"255.255.254.0", "23"},
        {"0", "0"},
        {"16", "16"},
        {"32", "32"},
        // A length of its own tells no family: 33 is one of IPv6.
        {"33", "33"},
        {"032", "32"},
        {"128", "128"},
        {"ffff:ffff::", "32"},
        {"ffff:fe00::", "23"},
        {"::", "0"},
        {"ffff:ffff:ffff:ffff:ffff:ffff:ffff:ffff", "128"},
    };
    for (const auto &[text, expected] : rows) {
        OwnedText length;
        EXPECT_EQ(lc_mask_or_masklen_to_masklen_str(text, length.out()), 0) << text;
        EXPECT_STREQ(length.get(), expected) << text;
    }
}

TEST(MaskLength, RefusesWhatIsNeither)
{
    for (const char *text :
         {"", " ", "129", "-1", "+8", "8 ", "0x8", "99999999999", "255.0.255.0", "0.255.0.0",
          "255.255.127.0", "255.255", "255.255.255.256", "10.0.0.1", "ffff::ffff", "/16"}) {
        OwnedText length;
        EXPECT_EQ(lc_mask_or_masklen_to_masklen_str(text, length.out()), 14020) << text;
        EXPECT_EQ(length.get(), nullptr) << text;
    }
}

TEST(MaskLength, RefusesNull)
{
    OwnedText length;
    EXPECT_EQ(lc_mask_or_masklen_to_masklen_str(nullptr, length.out()), 14001);
    EXPECT_EQ(lc_mask_or_masklen_to_masklen_str("16", nullptr), 14001);
}

struct SubnetCase {
    const char *left;
    const char *right;
    uint8 left_length;
    uint8 right_length;
    bool same;
};

constexpr SubnetCase subnet_cases[] = {
    {"10.1.2.3", "10.1.200.3", 16, 16, true},
    {"10.1.2.3", "10.2.2.3", 16, 16, false},
    {"10.1.2.3", "10.1.2.3", 32, 32, true},
    {"10.1.2.3", "10.1.2.2", 32, 32, false},
    {"10.1.2.3", "10.1.2.2", 31, 31, true},
    {"10.1.2.0", "10.1.3.0", 23, 23, true},
    {"10.1.2.0", "10.1.3.0", 24, 24, false},
    {"10.1.2.0", "10.1.4.0", 22, 22, false},
    // Two lengths are two subnets, even where the shorter one holds the other.
    {"10.1.2.3", "10.1.2.3", 16, 24, false},
    {"0.0.0.0", "255.255.255.255", 0, 0, true},
    // Beyond the width the full width counts.
    {"10.1.2.3", "10.1.2.3", 33, 255, true},
    {"10.1.2.3", "10.1.2.2", 128, 128, false},
    {"2001:db8::1", "2001:db8::ffff", 112, 112, true},
    {"2001:db8::1", "2001:db8::1:ffff", 112, 112, false},
    {"2001:db8::1", "2001:db8::1", 128, 200, true},
    {"::1", "0.0.0.1", 0, 0, false},
    {"10.1.2", "10.1.2.3", 8, 8, false},
    {"10.1.2.3", "", 0, 0, false},
    {"10.1.2.3/8", "10.1.2.3/8", 8, 8, false},
    {nullptr, "10.1.2.3", 0, 0, false},
    {"10.1.2.3", nullptr, 0, 0, false},
};

TEST(SameSubnet, Table)
{
    for (const SubnetCase &row : subnet_cases) {
        EXPECT_EQ(mgmt_is_same_subnet_using_masklen(row.left, row.right, row.left_length,
                                                    row.right_length),
                  row.same)
            << (row.left == nullptr ? "null" : row.left) << "/" << int{row.left_length} << " and "
            << (row.right == nullptr ? "null" : row.right) << "/" << int{row.right_length};
    }
}

} // namespace
} // namespace ovhost::test

#include "framework/addresses.h"

#include "framework/errors.h"
#include "host/framework/c_boundary.h"

#include <arpa/inet.h>

#include <algorithm>
#include <array>
#include <bit>
#include <charconv>
#include <cstring>
#include <optional>
#include <string>
#include <string_view>

namespace
{

constexpr unsigned longest_mask = 128;

struct Address {
    std::array<std::uint8_t, 16> bytes = {};
    unsigned bits = 0; ///< 32 or 128, which tells the family
};

std::optional<Address> parse_address(const char *text)
{
    Address address;
    if (::inet_pton(AF_INET, text, address.bytes.data()) == 1) {
        address.bits = 32;
        return address;
    }
    if (::inet_pton(AF_INET6, text, address.bytes.data()) == 1) {
        address.bits = 128;
        return address;
    }
    return std::nullopt;
}

/// The number of leading one bits of a mask whose other bits are all zero.
std::optional<unsigned> length_of_mask(const Address &mask)
{
    unsigned length = 0;
    unsigned bits_before = 0;
    for (const std::uint8_t byte : mask.bytes) {
        const auto ones = static_cast<unsigned>(std::countl_one(byte));
        const bool is_contiguous = static_cast<std::uint8_t>(byte << ones) == 0;
        const bool is_below_a_zero = byte != 0 && length != bits_before;
        if (!is_contiguous || is_below_a_zero) {
            return std::nullopt;
        }
        length += ones;
        bits_before += 8;
    }
    return length;
}

std::optional<unsigned> parse_mask_length(std::string_view text)
{
    unsigned length = 0;
    const auto [end, fault] = std::from_chars(text.data(), text.data() + text.size(), length);
    const bool is_number = fault == std::errc() && end == text.data() + text.size();
    return is_number && length <= longest_mask ? std::optional(length) : std::nullopt;
}

bool share_leading_bits(const Address &left, const Address &right, unsigned bits)
{
    const std::size_t whole_bytes = bits / 8;
    if (std::memcmp(left.bytes.data(), right.bytes.data(), whole_bytes) != 0) {
        return false;
    }
    const unsigned rest = bits % 8;
    if (rest == 0) {
        return true;
    }
    const auto difference =
        static_cast<unsigned>(left.bytes[whole_bytes] ^ right.bytes[whole_bytes]);
    return difference >> (8 - rest) == 0;
}

} // namespace

int lc_mask_or_masklen_to_masklen_str(const char *mask_or_length, char **ret)
{
    if (ret == nullptr) {
        return lc_err_unexpected_null;
    }
    *ret = nullptr;
    if (mask_or_length == nullptr) {
        return lc_err_unexpected_null;
    }
    return ovhost::at_c_boundary([&]() -> int {
        const std::optional<Address> mask = parse_address(mask_or_length);
        const std::optional<unsigned> length =
            mask ? length_of_mask(*mask) : parse_mask_length(mask_or_length);
        return length ? ovhost::hand_out_text(ret, std::to_string(*length)) : lc_err_bad_type;
    });
}

tbool mgmt_is_same_subnet_using_masklen(const char *addr1, const char *addr2, uint8 masklen1,
                                        uint8 masklen2)
{
    if (addr1 == nullptr || addr2 == nullptr) {
        return false;
    }
    const std::optional<Address> left = parse_address(addr1);
    const std::optional<Address> right = parse_address(addr2);
    if (!left || !right || left->bits != right->bits) {
        return false;
    }
    const unsigned length = std::min<unsigned>(masklen1, left->bits);
    return length == std::min<unsigned>(masklen2, left->bits) &&
           share_leading_bits(*left, *right, length);
}

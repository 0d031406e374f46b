// ovlan_valid_name_check of framework/appliance.h.
//
// A VLAN's interface gets its name in the kernel, whose rules are the first half; a name that says
// which VLAN it is ("7", "vlan7", "eth0.7") must say a number that VLANs have.
#include "framework/appliance.h"

#include <algorithm>
#include <charconv>
#include <string_view>

namespace
{

constexpr std::size_t longest_name = 15;
constexpr unsigned first_vlan = 1;
constexpr unsigned last_vlan = 4094;

bool is_digit(char character)
{
    return character >= '0' && character <= '9';
}

bool is_refused_by_kernel(char character)
{
    // The kernel knows one blank beyond ASCII's, and takes "%" for the place of a number.
    constexpr std::string_view refused = "/:% \t\n\v\f\r\xa0";
    return refused.find(character) != std::string_view::npos;
}

bool is_interface_name(std::string_view name)
{
    return !name.empty() && name.size() <= longest_name && name != "." && name != ".." &&
           std::ranges::none_of(name, is_refused_by_kernel);
}

/// The digits that a name gives as its VLAN's number; empty when it gives none.
std::string_view number_in(std::string_view name)
{
    constexpr std::string_view vlan = "vlan";
    std::string_view digits = name;
    if (const std::size_t dot = name.rfind('.'); dot != std::string_view::npos) {
        digits = name.substr(dot + 1);
    } else if (name.starts_with(vlan)) {
        digits = name.substr(vlan.size());
    }
    return std::ranges::all_of(digits, is_digit) ? digits : std::string_view();
}

bool is_vlan_number(std::string_view digits)
{
    unsigned number = 0;
    const auto result = std::from_chars(digits.data(), digits.data() + digits.size(), number);
    return result.ec == std::errc() && number >= first_vlan && number <= last_vlan;
}

} // namespace

int ovlan_valid_name_check(const char *name)
{
    if (name == nullptr) {
        return lc_err_unexpected_null;
    }
    if (!is_interface_name(name)) {
        return lc_err_bad_name;
    }
    const std::string_view digits = number_in(name);
    return digits.empty() || is_vlan_number(digits) ? lc_err_no_error : lc_err_bad_name;
}

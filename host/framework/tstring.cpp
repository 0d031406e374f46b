#include "framework/tstring.h"

#include "host/framework/c_boundary.h"
#include "host/framework/format.h"
#include "host/framework/objects.h"

#include <algorithm>
#include <compare>
#include <cstdarg>
#include <limits>
#include <string_view>

namespace
{

using ovhost::at_c_boundary;
using ovhost::hand_out;

int32 as_length(std::size_t size)
{
    constexpr auto largest = static_cast<std::size_t>(std::numeric_limits<int32>::max());
    return static_cast<int32>(std::min(size, largest));
}

/// Null before everything else, then byte by byte as unsigned characters.
int compare_texts(const char *left, std::size_t left_size, const char *right,
                  std::size_t right_size)
{
    if (left == nullptr || right == nullptr) {
        return static_cast<int>(left != nullptr) - static_cast<int>(right != nullptr);
    }
    return std::string_view(left, left_size).compare(std::string_view(right, right_size));
}

std::size_t size_of(const tstring *str)
{
    return str == nullptr ? 0 : str->text.size();
}

std::size_t size_of(const char *text)
{
    return text == nullptr ? 0 : std::strlen(text);
}

} // namespace

int ts_new_str(tstring **ret, const char *text)
{
    if (ret == nullptr) {
        return lc_err_unexpected_null;
    }
    *ret = nullptr;
    return at_c_boundary([&] { return hand_out(ret, tstring{text == nullptr ? "" : text}); });
}

int ts_new_sprintf(tstring **ret, const char *format, ...)
{
    if (ret == nullptr) {
        return lc_err_unexpected_null;
    }
    *ret = nullptr;
    if (format == nullptr) {
        return lc_err_unexpected_null;
    }
    va_list arguments;
    va_start(arguments, format);
    const ovhost::PrintedText text = ovhost::print_text(format, arguments);
    va_end(arguments);
    return text ? ts_new_str(ret, text.get()) : lc_err_generic_error;
}

void ts_free(tstring **str)
{
    ovhost::release(str);
}

int ts_dup(const tstring *str, tstring **ret)
{
    if (ret == nullptr) {
        return lc_err_unexpected_null;
    }
    *ret = nullptr;
    if (str == nullptr) {
        return lc_err_no_error;
    }
    return at_c_boundary([&] { return hand_out(ret, tstring(*str)); });
}

const char *ts_str_(const tstring *str)
{
    return str == nullptr ? nullptr : str->text.c_str();
}

int32 ts_length_(const tstring *str)
{
    return str == nullptr ? -1 : as_length(str->text.size());
}

int32 ts_num_chars(const tstring *str)
{
    if (str == nullptr) {
        return -1;
    }
    // Every byte starts a character except those that continue one: 10xxxxxx.
    const auto starts = std::ranges::count_if(
        str->text, [](char byte) { return (static_cast<unsigned char>(byte) & 0xC0U) != 0x80U; });
    return as_length(static_cast<std::size_t>(starts));
}

tbool ts_equal(const tstring *a, const tstring *b)
{
    return ts_cmp(a, b) == 0;
}

tbool ts_equal_str(const tstring *str, const char *text, tbool flag)
{
    return ts_cmp_str(str, text, flag) == 0;
}

int ts_cmp(const tstring *a, const tstring *b)
{
    return compare_texts(ts_str_(a), size_of(a), ts_str_(b), size_of(b));
}

int ts_cmp_str(const tstring *str, const char *text, tbool /*flag*/)
{
    return compare_texts(ts_str_(str), size_of(str), text, size_of(text));
}

char *smprintf(const char *format, ...)
{
    if (format == nullptr) {
        return nullptr;
    }
    va_list arguments;
    va_start(arguments, format);
    ovhost::PrintedText text = ovhost::print_text(format, arguments);
    va_end(arguments);
    return text.release();
}

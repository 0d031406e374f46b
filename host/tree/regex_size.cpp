#include "host/tree/regex_size.h"

#include <algorithm>
#include <charconv>
#include <cstdint>
#include <limits>
#include <optional>
#include <vector>

namespace ovhost
{

namespace
{

/// Far beyond any size in use, and small enough to be multiplied by a factor without overflow.
constexpr std::size_t size_cap = std::numeric_limits<std::uint32_t>::max();
constexpr std::size_t factor_cap = 65536;

class RegexSizer
{
  public:
    explicit RegexSizer(std::string_view regex) : rest_(regex) {}

    std::size_t size()
    {
        while (!rest_.empty()) {
            take_item();
        }
        while (groups_.size() > 1) {
            close_group();
        }
        return groups_.back();
    }

  private:
    void take_item()
    {
        switch (rest_.front()) {
        case '\\':
            skip(2);
            add(1);
            break;
        case '[':
            skip(bracket_length());
            add(1);
            break;
        case '(':
            skip(1);
            groups_.push_back(0);
            last_ = 0;
            break;
        case ')':
            skip(1);
            close_group();
            break;
        case '*':
        case '?':
            skip(1);
            break;
        case '+':
            // Unrolled as one match followed by any number of the same.
            skip(1);
            repeat_last(2);
            break;
        case '{':
            take_interval();
            break;
        default:
            skip(1);
            add(1);
            break;
        }
    }

    void skip(std::size_t length) { rest_.remove_prefix(std::min(length, rest_.size())); }

    void add(std::size_t size)
    {
        last_ = size;
        groups_.back() = std::min(groups_.back() + size, size_cap);
    }

    void repeat_last(std::size_t times)
    {
        const std::size_t repeated = std::min(last_ * std::min(times, factor_cap), size_cap);
        groups_.back() = std::min(groups_.back() - last_ + repeated, size_cap);
        last_ = repeated;
    }

    void close_group()
    {
        if (groups_.size() == 1) {
            add(1);
            return;
        }
        const std::size_t group = groups_.back();
        groups_.pop_back();
        add(group);
    }

    /// A bracket expression may hold "]" as its first character and within "[:...:]" and the like.
    std::size_t bracket_length() const
    {
        std::size_t at = 1;
        at += at < rest_.size() && rest_[at] == '^' ? 1 : 0;
        at += at < rest_.size() && rest_[at] == ']' ? 1 : 0;
        while (at < rest_.size() && rest_[at] != ']') {
            at = rest_[at] == '[' ? end_of_class(at) : at + 1;
        }
        return at + 1;
    }

    std::size_t end_of_class(std::size_t at) const
    {
        if (at + 1 >= rest_.size() ||
            std::string_view(":.=").find(rest_[at + 1]) == std::string_view::npos) {
            return at + 1;
        }
        const char closing[] = {rest_[at + 1], ']'};
        const std::size_t end = rest_.find(std::string_view(closing, 2), at + 2);
        return end == std::string_view::npos ? rest_.size() : end + 2;
    }

    /// "{3}", "{3,}" or "{3,5}"; a brace that starts none of these is a character.
    void take_interval()
    {
        const std::size_t end = rest_.find('}');
        const std::string_view bounds =
            rest_.substr(1, end == std::string_view::npos ? 0 : end - 1);
        const std::size_t comma = bounds.find(',');
        const auto least = number(bounds.substr(0, comma));
        const std::string_view most_text =
            comma == std::string_view::npos ? "" : bounds.substr(comma + 1);
        const auto most = number(most_text);
        if (!least && !most) {
            skip(1);
            add(1);
            return;
        }
        skip(end + 1);
        // "{3,}" is three matches followed by any number of the same.
        const std::size_t times = least.value_or(0) + (comma == std::string_view::npos ? 0 : 1);
        repeat_last(std::max({times, most.value_or(0), std::size_t{1}}));
    }

    static std::optional<std::size_t> number(std::string_view digits)
    {
        std::uint16_t value = 0;
        const auto [end, error] =
            std::from_chars(digits.data(), digits.data() + digits.size(), value);
        if (error == std::errc::result_out_of_range) {
            return factor_cap;
        }
        return error == std::errc() && end == digits.data() + digits.size()
                   ? std::optional<std::size_t>(value)
                   : std::nullopt;
    }

    std::string_view rest_;
    std::vector<std::size_t> groups_ = {0};
    /// Size of what a repetition at this point would repeat.
    std::size_t last_ = 0;
};

} // namespace

std::size_t unrolled_regex_size(std::string_view regex)
{
    return RegexSizer(regex).size();
}

} // namespace ovhost

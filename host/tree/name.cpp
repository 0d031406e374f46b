#include "host/tree/name.h"

#include <algorithm>
#include <functional>
#include <utility>

namespace ovhost
{

namespace
{

constexpr std::string_view wildcard = "*";

bool stands_for(const NamePattern::Part &part, std::string_view component)
{
    return !part || *part == component;
}

struct Component {
    std::string text;
    /// Whether the component held an escape: "\*" and "*" are one text but two patterns.
    bool escaped = false;
};

bool is_escapable(char character)
{
    return character == '/' || character == '\\' || character == '*';
}

/// Takes "/component" off the front of `rest`.
std::optional<Component> take_component(std::string_view &rest)
{
    if (rest.front() != '/') {
        return std::nullopt;
    }
    Component component;
    std::size_t at = 1;
    for (; at < rest.size() && rest[at] != '/'; ++at) {
        if (rest[at] == '\\') {
            component.escaped = true;
            if (++at == rest.size() || !is_escapable(rest[at])) {
                return std::nullopt;
            }
        }
        if (rest[at] == '\0') {
            return std::nullopt;
        }
        component.text += rest[at];
    }
    if (component.text.empty()) {
        return std::nullopt;
    }
    rest.remove_prefix(at);
    return component;
}

/// Hands the components of a name to `accept`, one by one; false when the name is invalid.
template <typename Accept>
bool take_apart(std::string_view name, Accept accept)
{
    if (name == "/") {
        return true;
    }
    if (name.empty()) {
        return false;
    }
    for (std::size_t count = 0; !name.empty(); ++count) {
        std::optional<Component> component = take_component(name);
        if (!component || count == max_name_components) {
            return false;
        }
        accept(*std::move(component));
    }
    return true;
}

void append_escaped(std::string &name, std::string_view component)
{
    if (component == wildcard) {
        name += "\\*";
        return;
    }
    for (const char character : component) {
        if (character == '/' || character == '\\') {
            name += '\\';
        }
        name += character;
    }
}

bool is_number(std::string_view component)
{
    return !component.empty() && std::ranges::all_of(component, [](char character) {
        return character >= '0' && character <= '9';
    });
}

std::string_view without_leading_zeros(std::string_view digits)
{
    digits.remove_prefix(std::min(digits.find_first_not_of('0'), digits.size()));
    return digits;
}

std::strong_ordering compare_numbers(std::string_view left, std::string_view right)
{
    const std::string_view left_digits = without_leading_zeros(left);
    const std::string_view right_digits = without_leading_zeros(right);
    if (const auto order = left_digits.size() <=> right_digits.size(); order != 0) {
        return order;
    }
    if (const auto order = left_digits <=> right_digits; order != 0) {
        return order;
    }
    return left.size() <=> right.size();
}

} // namespace

std::optional<std::vector<std::string>> split_name(std::string_view name)
{
    std::vector<std::string> parts;
    const bool valid = take_apart(
        name, [&parts](Component component) { parts.push_back(std::move(component.text)); });
    return valid ? std::optional(std::move(parts)) : std::nullopt;
}

bool is_valid_name(std::span<const std::string> parts)
{
    return parts.size() <= max_name_components &&
           std::ranges::all_of(parts, [](const std::string &part) {
               return !part.empty() && part.find('\0') == std::string::npos;
           });
}

std::string escape_component(std::string_view component)
{
    std::string escaped;
    append_escaped(escaped, component);
    return escaped;
}

std::string join_name(std::span<const std::string> parts)
{
    if (parts.empty()) {
        return "/";
    }
    std::string name;
    for (const std::string &part : parts) {
        name += '/';
        append_escaped(name, part);
    }
    return name;
}

std::strong_ordering compare_components(std::string_view left, std::string_view right)
{
    const bool left_is_number = is_number(left);
    const bool right_is_number = is_number(right);
    if (left_is_number != right_is_number) {
        return left_is_number ? std::strong_ordering::less : std::strong_ordering::greater;
    }
    return left_is_number ? compare_numbers(left, right) : left <=> right;
}

NamePattern::NamePattern(std::vector<Part> parts) : parts_(std::move(parts)) {}

std::optional<NamePattern> NamePattern::parse(std::string_view pattern)
{
    std::vector<Part> parts;
    const bool valid = take_apart(pattern, [&parts](Component component) {
        const bool matches_any = component.text == wildcard && !component.escaped;
        parts.push_back(matches_any ? Part() : Part(std::move(component.text)));
    });
    return valid ? std::optional(NamePattern(std::move(parts))) : std::nullopt;
}

bool NamePattern::matches(std::span<const std::string> name) const
{
    return std::ranges::equal(parts_, name, stands_for);
}

bool NamePattern::matches(std::span<const char *const> name) const
{
    return std::ranges::equal(parts_, name, stands_for);
}

} // namespace ovhost

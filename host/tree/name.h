#pragma once
// Node names: text to components and back, the order of components, and patterns over names.
// tree.h keeps nodes under their components; value_format.h checks values that are names.
//
// A name is "/" followed by components with "/" between them. A slash inside a component is written
// "\/" and a backslash "\\", so that an address prefix stands as one component:
// "/route/10.0.0.0\/8" is {"route", "10.0.0.0/8"}. A component that is a single star may be written
// "\*"; in a pattern it must be. No other escape exists: a backslash before anything else, or at
// the end, makes the name invalid, as do an empty component (hence a "/" at the end), a NUL byte
// and more than max_name_components components. "/" alone is the root: the name without components.

#include <compare>
#include <cstddef>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace ovhost
{

/// Walks over names recurse once per component; the limit bounds the depth of every such walk.
inline constexpr std::size_t max_name_components = 256;

/// Takes a name apart; the components come unescaped. Nothing when the name is invalid.
[[nodiscard]] std::optional<std::vector<std::string>> split_name(std::string_view name);

/// Whether the components form a name: few enough, none empty, none with a NUL byte.
[[nodiscard]] bool is_valid_name(std::span<const std::string> parts);

/// A component as it is written in a name. A single star becomes "\*", so that a joined name used
/// as a pattern matches that name alone.
[[nodiscard]] std::string escape_component(std::string_view component);

/// The name made of the components: split_name(join_name(parts)) == parts for every valid name.
[[nodiscard]] std::string join_name(std::span<const std::string> parts);

/// The order of a node's children: components made of digits alone come first, by their number (of
/// two ways to write one number the shorter comes first); the others follow bytewise.
[[nodiscard]] std::strong_ordering compare_components(std::string_view left,
                                                      std::string_view right);

/// A name in which a component that is a bare "*" stands for exactly one component of any text.
/// A star next to other characters is an ordinary character.
class NamePattern
{
  public:
    /// One component of a pattern; without a text it is the wildcard.
    using Part = std::optional<std::string>;

    /// Nothing when the text would not be a valid name.
    [[nodiscard]] static std::optional<NamePattern> parse(std::string_view pattern);

    [[nodiscard]] bool matches(std::span<const std::string> name) const;
    [[nodiscard]] bool matches(std::span<const char *const> name) const;

    [[nodiscard]] std::span<const Part> parts() const { return parts_; }

  private:
    explicit NamePattern(std::vector<Part> parts);

    std::vector<Part> parts_;
};

} // namespace ovhost

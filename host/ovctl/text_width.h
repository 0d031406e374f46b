#pragma once
// How much room texts take on a terminal. table.h lays out columns by it.

#include <cstddef>
#include <string>
#include <string_view>

namespace ovhost
{

/// Columns that a text takes up: two for a wide character, none for one that joins the one before.
[[nodiscard]] std::size_t width_of(std::string_view text);

/// The text, or its beginning with "…" when it takes up more than `width` columns.
[[nodiscard]] std::string fitted(std::string_view text, std::size_t width);

} // namespace ovhost

#pragma once
// What the renderers (render*.h) have in common: members of a result as text for people. A member
// that is missing or of another type throws nlohmann::json::exception.

#include <nlohmann/json_fwd.hpp>

#include <iosfwd>
#include <string>
#include <vector>

namespace ovhost
{

[[nodiscard]] std::string text_of(const nlohmann::json &object, const char *member);

/// A text, or what stands for null.
[[nodiscard]] std::string text_or(const nlohmann::json &object, const char *member,
                                  const char *otherwise);

[[nodiscard]] long count_of(const nlohmann::json &object, const char *member);

/// "1 change", "2 changes".
[[nodiscard]] std::string counted(long count, const char *one, const char *many);

/// Names and values in two columns.
void print_fact(std::ostream &out, const char *name, const std::string &value);

/// Rows of equally many cells; the first has the headings. table.h has tables with more to say.
using TableRows = std::vector<std::vector<std::string>>;
void print_table(std::ostream &out, const TableRows &rows);

} // namespace ovhost

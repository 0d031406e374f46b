// What tests do with whole files.
#pragma once

#include <filesystem>
#include <optional>
#include <string>

namespace ovtest
{

// Replaces the file's content, and makes the directories above it. Throws std::runtime_error.
void write_file(const std::filesystem::path &file, const std::string &text);

// Nothing when there is no such file.
[[nodiscard]] std::optional<std::string> read_file(const std::filesystem::path &file);

} // namespace ovtest

// What the store's tests share: small contents, and looks at the files beneath.
#pragma once

#include <filesystem>
#include <map>
#include <string>
#include <utility>
#include <vector>

#include "host/store/store.h"
#include "tests/support/files.h"

namespace ovtest
{

// Name to type and text.
using Nodes = std::map<std::string, std::pair<std::uint32_t, std::string>>;
using Files = std::map<std::string, std::string>;

[[nodiscard]] Nodes nodes_of(const ovhost::Store &store);

// A change that sets a node, and one that removes it.
[[nodiscard]] ovhost::StoredChange put(std::string name, std::string text, std::uint32_t type = 10);
[[nodiscard]] ovhost::StoredChange gone(std::string name);

// Changes that set /n/0 and so on, all to one text.
[[nodiscard]] std::vector<ovhost::StoredChange> numbered(int count, const std::string &text);

// The message opening this directory is refused with; "" when it is not refused.
[[nodiscard]] std::string refusal(const std::filesystem::path &dir);

// Every regular file of a directory and its bytes, but for the lock file and empty files.
[[nodiscard]] Files files_of(const std::filesystem::path &dir);

// Runs SQL on a database file of any kind, which is made when it is missing.
void run_sql(const std::filesystem::path &file, const std::string &sql);

} // namespace ovtest

#include "tests/store/store_testing.h"

#include <sqlite3.h>

#include <stdexcept>

namespace ovtest
{

namespace fs = std::filesystem;

Nodes nodes_of(const ovhost::Store &store)
{
    Nodes nodes;
    store.load([&nodes](ovhost::StoredNode &&node) {
        nodes[node.name] = {node.type, std::move(node.text)};
    });
    return nodes;
}

ovhost::StoredChange put(std::string name, std::string text, std::uint32_t type)
{
    return {std::move(name), ovhost::StoredValue{type, std::move(text)}};
}

ovhost::StoredChange gone(std::string name)
{
    return {std::move(name), std::nullopt};
}

std::vector<ovhost::StoredChange> numbered(int count, const std::string &text)
{
    std::vector<ovhost::StoredChange> changes;
    for (int i = 0; i < count; ++i)
        changes.push_back(put("/n/" + std::to_string(i), text));
    return changes;
}

std::string refusal(const fs::path &dir)
{
    try {
        const ovhost::Store store = ovhost::Store::open(dir);
        return {};
    } catch (const ovhost::StoreError &error) {
        return error.what();
    }
}

Files files_of(const fs::path &dir)
{
    Files files;
    for (const fs::directory_entry &entry : fs::directory_iterator(dir)) {
        const std::string name = entry.path().filename().string();
        if (!entry.is_regular_file() || name == "lock")
            continue;
        if (entry.file_size() != 0)
            files[name] = read_file(entry.path()).value();
    }
    return files;
}

void run_sql(const fs::path &file, const std::string &sql)
{
    sqlite3 *db = nullptr;
    const int opened = sqlite3_open(file.c_str(), &db);
    const int status =
        opened == SQLITE_OK ? sqlite3_exec(db, sql.c_str(), nullptr, nullptr, nullptr) : opened;
    const std::string message = sqlite3_errmsg(db);
    sqlite3_close(db);
    if (status != SQLITE_OK)
        throw std::runtime_error(message + ": " + sql);
}

} // namespace ovtest

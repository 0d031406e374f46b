#include "tests/commit/support.h"

#include "framework/mdb_db.h"
#include "host/tree/name.h"

#include <gtest/gtest.h>

namespace commit_test
{

std::vector<std::string> parts_of(const std::string &name)
{
    return ovhost::split_name(name).value();
}

Config config_of(const ovhost::Tree &tree)
{
    Config config;
    tree.visit([&config](ovhost::Tree::Parts name, const ovhost::Value &value) {
        config.emplace(ovhost::join_name(name), value.text);
    });
    return config;
}

ovhost::Tree tree_of(const Config &config)
{
    ovhost::Tree tree;
    for (const auto &[name, text] : config) {
        tree.set(parts_of(name), {bt_string, text});
    }
    return tree;
}

std::optional<std::string> read(const mdb_db *db, const std::string &name)
{
    tstring *text = nullptr;
    EXPECT_EQ(mdb_get_node_value_tstr(nullptr, db, name.c_str(), 0, nullptr, &text), 0);
    if (text == nullptr) {
        return std::nullopt;
    }
    std::string copy = ts_str(text);
    ts_free(&text);
    return copy;
}

int write(const md_dbinfo *info, const std::string &name, const std::string &text)
{
    return mdb_set_node_str(info->commit, const_cast<mdb_db *>(info->newdb), bsso_modify, 0,
                            bt_string, text.c_str(), "%s", name.c_str());
}

int remove(const md_dbinfo *info, const std::string &name)
{
    return mdb_set_node_str(info->commit, const_cast<mdb_db *>(info->newdb), bsso_delete, 0,
                            bt_none, nullptr, "%s", name.c_str());
}

std::string described(const mdb_db_change *change)
{
    static const std::map<int, std::string> kinds = {
        {mdct_add, "add "}, {mdct_modify, "modify "}, {mdct_delete, "delete "}};
    return kinds.at(change->mdc_change_type) + ts_str(change->mdc_name);
}

std::vector<std::string> described(const mdb_db_change_array *changes)
{
    std::vector<std::string> texts;
    for (int32 index = 0; index < mdb_db_change_array_length_quick(changes); ++index) {
        texts.push_back(
            described(mdb_db_change_array_get_quick(changes, static_cast<uint32>(index))));
    }
    return texts;
}

ScriptedModule::ScriptedModule(std::string name, std::vector<std::string> patterns)
    : name_(std::move(name)), patterns_(std::move(patterns))
{
}

void ScriptedModule::note(const std::string &what)
{
    if (calls != nullptr) {
        calls->push_back(name_ + " " + what);
    }
}

void ScriptedModule::start(const mdb_db *running)
{
    note("start");
    if (on_start) {
        on_start(running);
    }
}

int ScriptedModule::check_change(md_dbinfo *info, mdb_db_change *change)
{
    note("check " + described(change));
    return on_change ? on_change(info, change) : 0;
}

int ScriptedModule::check_commit(md_dbinfo *info, const mdb_db_change_array *changes)
{
    note("check commit");
    return on_commit ? on_commit(info, changes) : 0;
}

int ScriptedModule::apply(const md_dbinfo *info, const mdb_db_change_array *changes)
{
    note("apply");
    return on_apply ? on_apply(info, changes) : 0;
}

void ScriptedModule::notify(const mdb_db_change_array *changes)
{
    note("notify");
    if (on_notify) {
        on_notify(changes);
    }
}

void MemoryStore::load(const std::function<void(ovhost::StoredNode &&)> &take) const
{
    for (const auto &[name, value] : nodes) {
        take({name, value.type, value.text});
    }
}

std::uint64_t MemoryStore::commit(std::span<const ovhost::StoredChange> changes,
                                  const ovhost::CommitNote &told)
{
    ++attempts;
    if (calls != nullptr) {
        calls->emplace_back("store");
    }
    if (failure) {
        throw ovhost::StoreError(*failure);
    }
    for (const ovhost::StoredChange &change : changes) {
        if (change.after) {
            nodes[change.name] = *change.after;
        } else {
            nodes.erase(change.name);
        }
    }
    note = told;
    return ++commits;
}

Config MemoryStore::config() const
{
    Config config;
    for (const auto &[name, value] : nodes) {
        config.emplace(name, value.text);
    }
    return config;
}

Bench::Bench(std::initializer_list<ovhost::Module *> modules)
{
    for (ovhost::Module *module : modules) {
        engine.add_module(*module);
    }
}

void Bench::start_with(const Config &config)
{
    store.nodes.clear();
    for (const auto &[name, text] : config) {
        store.nodes.emplace(name, ovhost::StoredValue{bt_string, text});
    }
    engine.load();
}

ovhost::Candidate
Bench::candidate(const std::vector<std::pair<std::string, std::optional<std::string>>> &edits) const
{
    ovhost::Candidate candidate(engine.running());
    for (const auto &[name, text] : edits) {
        const std::optional<std::string> fault =
            text ? candidate.set(name, bt_string, *text) : candidate.erase(name);
        EXPECT_EQ(fault, std::nullopt);
    }
    return candidate;
}

} // namespace commit_test

#include "framework/mdb_db.h"

#include "framework/logging.h"
#include "host/framework/c_boundary.h"
#include "host/framework/format.h"
#include "host/framework/log_config.h"
#include "host/framework/objects.h"
#include "host/tree/name.h"
#include "host/tree/value_type.h"

#include <cstdarg>
#include <optional>
#include <string>
#include <utility>
#include <vector>

namespace
{

using ovhost::at_c_boundary;
using ovhost::hand_out;
using ovhost::NamePattern;
using ovhost::split_name;
using ovhost::Tree;
using ovhost::Value;

/// The value of the node a write is about, as the operation needs it.
enum class WriteKind { remove, write };

std::optional<WriteKind> kind_of(int op)
{
    switch (op) {
    case bsso_delete:
        return WriteKind::remove;
    case bsso_create:
    case bsso_modify:
        return WriteKind::write;
    default:
        return std::nullopt;
    }
}

int refuse_write(mdb_db &db, const std::string &name)
{
    ++db.refused_writes;
    ovhost::log_host_line(ov_log_error, "mdb_db",
                          "write of node " + name +
                              " refused: a database may be written only while a commit is checked");
    return lc_err_assertion_failed;
}

/// Writes into a copy of the handle, so that a write which fails halfway has written nothing.
int write_node(mdb_db &db, int op, const std::string &name, Value value)
{
    const std::optional<WriteKind> kind = kind_of(op);
    if (!kind) {
        return lc_err_assertion_failed;
    }
    if (!db.writable) {
        return refuse_write(db, name);
    }
    const std::optional<std::vector<std::string>> parts = split_name(name);
    // The root's name is good for queries; as a node it is none.
    if (!parts || parts->empty()) {
        return lc_err_bad_path;
    }
    Tree written = db.tree;
    if (*kind == WriteKind::remove) {
        written.erase(*parts);
    } else if (ovhost::value_fault(value.type, value.text)) {
        return lc_err_bad_type;
    } else {
        written.set(*parts, std::move(value));
    }
    db.tree = std::move(written);
    return lc_err_no_error;
}

/// What all queries have in common: answer(parts) runs when nothing is null and the name is good.
template <typename Result, typename Answer>
int query(const mdb_db *db, const char *name, Result **ret, Answer &&answer)
{
    if (ret == nullptr) {
        return lc_err_unexpected_null;
    }
    *ret = nullptr;
    if (db == nullptr || name == nullptr) {
        return lc_err_unexpected_null;
    }
    return at_c_boundary([&]() -> int {
        const std::optional<std::vector<std::string>> parts = split_name(name);
        return parts ? answer(*parts) : lc_err_bad_path;
    });
}

} // namespace

int mdb_get_node_value_tstr(md_commit * /*commit*/, const mdb_db *db, const char *name,
                            uint32 /*options*/, void * /*further*/, tstring **ret)
{
    return query(db, name, ret, [&](Tree::Parts parts) -> int {
        const Value *value = db->tree.value(parts);
        return value == nullptr ? lc_err_no_error : hand_out(ret, tstring{value->text});
    });
}

int mdb_get_node_binding(md_commit * /*commit*/, const mdb_db *db, const char *name,
                         uint32 /*options*/, bn_binding **ret)
{
    return query(db, name, ret, [&](Tree::Parts parts) -> int {
        const Value *value = db->tree.value(parts);
        if (value == nullptr) {
            return lc_err_no_error;
        }
        bn_binding binding;
        binding.name = name;
        binding.attribs.attribs.emplace(ba_value, *value);
        return hand_out(ret, std::move(binding));
    });
}

int mdb_get_tstr_array(md_commit * /*commit*/, const mdb_db *db, const char *parent,
                       uint32 /*options1*/, uint32 /*options2*/, uint32 /*options3*/,
                       tstr_array **ret)
{
    return query(db, parent, ret, [&](Tree::Parts parts) {
        return hand_out(ret, tstr_array(db->tree.children(parts)));
    });
}

int mdb_get_matching_tstr_array(md_commit * /*commit*/, const mdb_db *db, const char *pattern,
                                uint32 /*options*/, tstr_array **ret)
{
    // Neither option makes a difference: the database holds no state nodes, and a pattern always
    // stands for whole names.
    return query(db, pattern, ret, [&](Tree::Parts /*parts*/) -> int {
        const std::optional<NamePattern> parsed = NamePattern::parse(pattern);
        return parsed ? hand_out(ret, tstr_array(db->tree.matching(*parsed))) : lc_err_bad_path;
    });
}

int mdb_set_node_str(md_commit * /*commit*/, mdb_db *db, int op, uint32 /*flags*/, bn_type type,
                     const char *value, const char *name_format, ...)
{
    if (db == nullptr || name_format == nullptr || (value == nullptr && op != bsso_delete)) {
        return lc_err_unexpected_null;
    }
    va_list arguments;
    va_start(arguments, name_format);
    const ovhost::PrintedText name = ovhost::print_text(name_format, arguments);
    va_end(arguments);
    if (!name) {
        return lc_err_generic_error;
    }
    return at_c_boundary([&] {
        return write_node(*db, op, name.get(), Value{type, value == nullptr ? "" : value});
    });
}

int mdb_set_node_binding(md_commit * /*commit*/, mdb_db *db, int op, uint32 /*flags*/,
                         const bn_binding *binding)
{
    if (db == nullptr || binding == nullptr) {
        return lc_err_unexpected_null;
    }
    return at_c_boundary([&] {
        const auto value = binding->attribs.attribs.find(ba_value);
        return write_node(*db, op, binding->name,
                          value == binding->attribs.attribs.end() ? Value{bt_none, ""}
                                                                  : value->second);
    });
}

int32 mdb_db_change_array_length_quick(const mdb_db_change_array *changes)
{
    return static_cast<int32>(changes->changes.size());
}

mdb_db_change *mdb_db_change_array_get_quick(const mdb_db_change_array *changes, uint32 index)
{
    return changes->changes[index].get();
}

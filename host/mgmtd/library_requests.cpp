#include "host/mgmtd/library_requests.h"

#include "host/control/arguments.h"
#include "host/control/request_error.h"
#include "host/framework/objects.h"
#include "host/mgmtd/configuration.h"
#include "host/modules/interface_nodes.h"
#include "host/modules/upgrade_alarm.h"
#include "host/tree/name.h"
#include "orvale/md_tunneld_tunnel_common.h"
#include "orvale/md_utils.h"

#include <nlohmann/json.hpp>

#include <string>
#include <vector>

namespace ovhost
{
namespace
{

using nlohmann::json;

/// The candidate as a database that the library may write. What it writes becomes the candidate
/// only when it has not failed.
class CandidateDb
{
  public:
    explicit CandidateDb(Candidate &candidate) : candidate_(candidate)
    {
        db_.tree = candidate.tree();
        db_.writable = true;
    }

    [[nodiscard]] mdb_db *get() { return &db_; }
    [[nodiscard]] Tree &tree() { return db_.tree; }

    void keep(int err, const std::string &deed)
    {
        if (err != 0) {
            throw RequestError(error_code::internal,
                               "cannot " + deed + ": error code " + std::to_string(err));
        }
        candidate_.replace(std::move(db_.tree));
    }

  private:
    Candidate &candidate_;
    mdb_db db_;
};

std::vector<std::string> node_with_children(const Tree &tree, const std::string &name)
{
    std::optional<std::vector<std::string>> parts = split_name(name);
    if (!parts || parts->empty()) {
        throw RequestError(error_code::bad_value,
                           "\"" + name + "\" is not the name of a node: write it as /part/part");
    }
    if (!tree.exists(*parts)) {
        throw RequestError(error_code::not_found,
                           "no node " + name + " in the candidate configuration");
    }
    return *std::move(parts);
}

/// The library writes a child's name as it stands: one that needs escapes it would not find.
std::size_t erase_escaped_children(Tree &tree, const std::vector<std::string> &parent)
{
    std::size_t erased = 0;
    for (const std::string &child : tree.children(parent)) {
        if (join_name(std::vector<std::string>{child}) != "/" + child) {
            std::vector<std::string> node = parent;
            node.push_back(child);
            erased += tree.erase(node);
        }
    }
    return erased;
}

} // namespace

json answer_enable(Configuration &configuration, const json &request)
{
    const std::string name = required_text(request, "name");
    const bool enabled = optional_flag(request, "enabled", true);
    CandidateDb db(configuration.candidate());
    if (db.tree().value(std::vector<std::string>{"net", "interface", "config", name}) == nullptr) {
        throw RequestError(error_code::not_found, "there is no interface \"" + name +
                                                      "\" with a record " + interface_record(name) +
                                                      " in the candidate configuration");
    }
    if (const auto fault = interface_name_fault(name)) {
        throw RequestError(error_code::bad_value, *fault);
    }
    db.keep(md_set_if_enable(db.get(), name.c_str(), enabled),
            (enabled ? "enable " : "disable ") + name);
    return json::object();
}

json answer_clear(Configuration &configuration, const json &request)
{
    CandidateDb db(configuration.candidate());
    const std::vector<std::string> parent =
        node_with_children(db.tree(), required_text(request, "name"));
    const std::string name = join_name(parent);
    const std::size_t escaped = erase_escaped_children(db.tree(), parent);
    int removed = 0;
    db.keep(md_delete_children(nullptr, db.get(), name.c_str(), &removed), "clear " + name);
    return {{"removed", escaped + static_cast<std::size_t>(removed)}};
}

json answer_alarm(const json &request)
{
    const std::string text = required_text(request, "text");
    if (const auto fault = alarm_fault(text)) {
        throw RequestError(error_code::bad_value, *fault);
    }
    if (const auto failure = write_alarm(text)) {
        throw RequestError(error_code::internal, *failure);
    }
    return json::object();
}

} // namespace ovhost

#pragma once
// The candidate: a client's edits on top of the running configuration, not yet in force.
// engine.h checks and commits it; the running configuration itself is the engine's.

#include "host/tree/diff.h"
#include "host/tree/tree.h"

#include <optional>
#include <span>
#include <string>
#include <utility>
#include <vector>

namespace ovhost
{

/// One step of a load: a node to write, or one to remove with all below it.
struct Edit {
    std::string name;
    bn_type type = 0;
    std::string text;
    bool erase = false;
};

class Candidate
{
  public:
    /// Begins without edits.
    explicit Candidate(Tree running = {});

    /// Writes one node. Answers what is wrong with the name or the value, and then has written
    /// nothing; nothing when done.
    [[nodiscard]] std::optional<std::string> set(const std::string &name, bn_type type,
                                                 const std::string &text);

    /// Removes a node and all below it. Answers what is wrong: no such node is a fault, so that a
    /// misspelt name does not pass for done.
    [[nodiscard]] std::optional<std::string> erase(const std::string &name);

    /// Makes all edits in their order, or none of them when any has a fault; answers every fault.
    /// Removing a node that is not there is none: a file says how things shall be.
    [[nodiscard]] std::vector<std::string> load(std::span<const Edit> edits);

    /// Drops all edits and begins again from the running configuration.
    void discard(Tree running) noexcept;

    /// Drops all edits and makes those that lead to another configuration.
    void replace(Tree configuration) { tree_ = std::move(configuration); }

    /// Keeps the edits, as over() has them, and begins again from the running configuration.
    void rebase(Tree running);

    /// The configuration as edited.
    [[nodiscard]] const Tree &tree() const { return tree_; }

    /// The edits laid over the running configuration: tree() as long as nothing else was committed
    /// since the candidate began. Otherwise the other commit is kept, and where both have changed
    /// one node the edit counts.
    [[nodiscard]] Tree over(const Tree &running) const;

    /// What would change if the candidate were committed as it is.
    [[nodiscard]] std::vector<Change> pending(const Tree &running) const;

  private:
    Tree base_;
    Tree tree_;
};

} // namespace ovhost

#pragma once
// The daemon's modules (host/modules/): which there are, and the order in which a commit asks them.
// configuration.h owns them; whoever uses that need not know them all.

#include "host/modules/held_ids.h"

#include <memory>

namespace ovhost
{

class CommitEngine;

class ModuleSet
{
  public:
    ModuleSet();
    ~ModuleSet();
    ModuleSet(const ModuleSet &) = delete;
    ModuleSet &operator=(const ModuleSet &) = delete;

    /// The engine must not outlive the modules.
    void add_to(CommitEngine &engine);

    /// Tunnel IDs that were freed a short time ago.
    [[nodiscard]] const HeldIds &held_ids() const;

  private:
    struct Modules;
    std::unique_ptr<Modules> modules_;
};

} // namespace ovhost

#pragma once
// The module that announces every change to jsond.

#include "host/commit/module.h"

namespace ovhost
{

class ChangeEventsModule : public Module
{
  public:
    [[nodiscard]] std::string name() const override { return "events"; }

    /// Sends one event for each change, in the order of the changes.
    void notify(const mdb_db_change_array *changes) override;
};

} // namespace ovhost

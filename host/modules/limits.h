#pragma once
// The module that keeps the data plane's limits file in step with the configuration.

#include "host/commit/module.h"

namespace ovhost
{

class LimitsModule : public Module
{
  public:
    [[nodiscard]] std::string name() const override { return "limits"; }
    [[nodiscard]] std::vector<std::string> patterns() const override;

    /// Writes the limits file anew from the configuration that is in force now.
    int apply(const md_dbinfo *dbinfo, const mdb_db_change_array *changes) override;
};

} // namespace ovhost

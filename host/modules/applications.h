#pragma once
// The module of the applications that users define by rules:
//
//   /ov/tunneld/app/config/RULE/name  string  the application; several rules may be of one
//   /ov/tunneld/app/config/RULE/...           what its traffic looks like
//
// An application stays as long as an ACL or a map names it.

#include "host/commit/module.h"

namespace ovhost
{

class ApplicationsModule : public Module
{
  public:
    [[nodiscard]] std::string name() const override { return "application"; }
    [[nodiscard]] std::vector<std::string> patterns() const override;

    int check_change(md_dbinfo *dbinfo, mdb_db_change *change) override;

    /// Every rule must have a name: the library cannot count the rules of an application otherwise.
    int check_commit(md_dbinfo *dbinfo, const mdb_db_change_array *changes) override;
};

} // namespace ovhost

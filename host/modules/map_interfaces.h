#pragma once
// The modules of what maps name interfaces by: VLANs, labels, and the interfaces that routes
// prefer.
//
//   /ov/tunneld/net/interface/tunnel/vlan/config/NAME  a VLAN, kept while a route map prefers it
//   /ov/iflabels/config/CATEGORY/LABEL                 a label, kept while a map or an ACL
//                                                      matches by it
//   /ov/tunneld/net/routes/config/ipv4/prefix/PREFIX/nhop/ADDRESS/preferred_if
//                                                      the interface that a next hop prefers; the
//                                                      last one is kept while a route map goes by
//                                                      it

#include "host/commit/module.h"

namespace ovhost
{

class VlansModule : public Module
{
  public:
    [[nodiscard]] std::string name() const override { return "vlan"; }
    [[nodiscard]] std::vector<std::string> patterns() const override;

    int check_change(md_dbinfo *dbinfo, mdb_db_change *change) override;
};

class InterfaceLabelsModule : public Module
{
  public:
    [[nodiscard]] std::string name() const override { return "interface-label"; }
    [[nodiscard]] std::vector<std::string> patterns() const override;

    int check_change(md_dbinfo *dbinfo, mdb_db_change *change) override;
};

class PreferredInterfacesModule : public Module
{
  public:
    [[nodiscard]] std::string name() const override { return "preferred-interface"; }
    [[nodiscard]] std::vector<std::string> patterns() const override;

    int check_change(md_dbinfo *dbinfo, mdb_db_change *change) override;
};

} // namespace ovhost

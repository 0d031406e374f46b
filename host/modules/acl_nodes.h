#pragma once
// ACLs as configuration nodes:
//
//   /ov/tunneld/acl/config/ACL                          string  ACL again
//   /ov/tunneld/acl/config/ACL/entry/NUMBER             uint16  NUMBER again, 1 to 65535
//   /ov/tunneld/acl/config/ACL/entry/NUMBER/matchstr    string
//   /ov/tunneld/acl/config/ACL/entry/NUMBER/protocol    string  a protocol's number or name
//   /ov/tunneld/acl/config/ACL/entry/NUMBER/application string
//   /ov/tunneld/acl/config/ACL/KEY/MAP/prio/PRIORITY    uint32  a reference: see acl_references.h
//
// The first two are there as long as anything that users set is below them. acls.h has the module.

#include "framework/mdb_db.h"

#include <string>

namespace ovhost
{

inline constexpr const char *acls_node = "/ov/tunneld/acl/config";

/// The component with an ACL's name, counted from 0.
inline constexpr std::size_t acl_name_part = 4;

[[nodiscard]] std::string acl_node(const std::string &acl);

[[nodiscard]] std::string acl_entry_node(const std::string &acl, const std::string &number);

[[nodiscard]] bool has_acl(const mdb_db *db, const std::string &acl);

} // namespace ovhost

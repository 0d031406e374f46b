#include "host/modules/node_access.h"

#include "framework/errors.h"

namespace ovhost
{

TstringPtr attribute_text(const bn_attrib_array *attribs)
{
    tstring *text = nullptr;
    const int err = bn_attrib_array_get_attrib_tstr(attribs, ba_value, &text);
    return TstringPtr(err == 0 ? text : nullptr);
}

BindingPtr node_binding(const mdb_db *db, const char *name)
{
    bn_binding *binding = nullptr;
    const int err = mdb_get_node_binding(nullptr, db, name, 0, &binding);
    return BindingPtr(err == 0 ? binding : nullptr);
}

std::string type_name(bn_type type)
{
    const char *const name = lc_enum_to_string_quiet_null(bn_type_map, type);
    return name != nullptr ? name : std::to_string(type);
}

std::optional<bn_type> find_type(const std::string &name)
{
    bn_type type = 0;
    // The operation would take a NUL byte for the end of the name.
    const bool found = name.find('\0') == std::string::npos &&
                       lc_string_to_enum(bn_type_map, name.c_str(), &type) == 0;
    return found ? std::optional(type) : std::nullopt;
}

} // namespace ovhost

#include "host/modules/node_access.h"

#include "framework/errors.h"

#include <charconv>
#include <new>

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

std::optional<std::string> node_text(const mdb_db *db, const std::string &name)
{
    tstring *text = nullptr;
    const int err = mdb_get_node_value_tstr(nullptr, db, name.c_str(), 0, nullptr, &text);
    const TstringPtr owned(err == 0 ? text : nullptr);
    return owned ? std::optional<std::string>(ts_str(owned.get())) : std::nullopt;
}

std::vector<std::string> child_names(const mdb_db *db, const std::string &parent)
{
    tstr_array *array = nullptr;
    const int err = mdb_get_tstr_array(nullptr, db, parent.c_str(), 0, 0, 0, &array);
    const TstrArrayPtr owned(err == 0 ? array : nullptr);
    const auto count = owned ? static_cast<uint32>(tstr_array_length_quick(owned.get())) : 0;
    std::vector<std::string> names;
    names.reserve(count);
    for (uint32 i = 0; i < count; ++i) {
        names.emplace_back(tstr_array_get_str_quick(owned.get(), i));
    }
    return names;
}

std::optional<uint32> parse_number(std::string_view text)
{
    uint32 number = 0;
    const char *const text_end = text.data() + text.size();
    const auto [end, fault] = std::from_chars(text.data(), text_end, number);
    return fault == std::errc() && end == text_end && !text.empty() ? std::optional(number)
                                                                    : std::nullopt;
}

TstringPtr make_tstring(const std::string &text)
{
    tstring *made = nullptr;
    if (ts_new_str(&made, text.c_str()) != 0) {
        throw std::bad_alloc();
    }
    return TstringPtr(made);
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

#include "host/modules/node_access.h"

#include "framework/errors.h"

#include <charconv>
#include <new>
#include <stdexcept>

namespace ovhost
{
namespace
{

std::optional<std::string> copied(const OwnedString &text)
{
    return text.get() != nullptr ? std::optional<std::string>(ts_str(text.get())) : std::nullopt;
}

} // namespace

void require(int err, std::string_view deed, std::string_view object)
{
    if (err != 0) {
        throw std::runtime_error("cannot " + std::string(deed) + (object.empty() ? "" : " ") +
                                 std::string(object) + ": error code " + std::to_string(err));
    }
}

std::optional<std::string> attribute_text(const bn_attrib_array *attribs)
{
    OwnedString text;
    require(bn_attrib_array_get_attrib_tstr(attribs, ba_value, text.out()),
            "read a change's value");
    return copied(text);
}

std::optional<std::string> node_text(const mdb_db *db, const std::string &name)
{
    OwnedString text;
    require(mdb_get_node_value_tstr(nullptr, db, name.c_str(), 0, nullptr, text.out()), "read",
            name);
    return copied(text);
}

std::vector<std::string> child_names(const mdb_db *db, const std::string &parent)
{
    OwnedStrings names;
    require(mdb_get_tstr_array(nullptr, db, parent.c_str(), 0, 0, 0, names.out()),
            "list the nodes of", parent);
    return texts_of(names.get());
}

std::vector<std::string> matching_nodes(const mdb_db *db, const std::string &pattern)
{
    OwnedStrings names;
    require(mdb_get_matching_tstr_array(nullptr, db, pattern.c_str(), mdqf_sel_class_no_state,
                                        names.out()),
            "look for", pattern);
    return texts_of(names.get());
}

std::vector<std::string> texts_of(const tstr_array *array)
{
    const auto count =
        array != nullptr ? static_cast<uint32>(tstr_array_length_quick(array)) : uint32{0};
    std::vector<std::string> texts;
    texts.reserve(count);
    for (uint32 i = 0; i < count; ++i) {
        texts.emplace_back(tstr_array_get_str_quick(array, i));
    }
    return texts;
}

bool is_whole_text(std::string_view text)
{
    return text.find('\0') == std::string_view::npos;
}

std::optional<uint32> parse_number(std::string_view text)
{
    uint32 number = 0;
    const char *const text_end = text.data() + text.size();
    const auto [end, fault] = std::from_chars(text.data(), text_end, number);
    return fault == std::errc() && end == text_end && !text.empty() ? std::optional(number)
                                                                    : std::nullopt;
}

TstringCopy::TstringCopy(const std::string &text)
{
    if (ts_new_str(copy_.out(), text.c_str()) != 0) {
        throw std::bad_alloc();
    }
}

std::string type_name(bn_type type)
{
    const char *const name = lc_enum_to_string_quiet_null(bn_type_map, type);
    return name != nullptr ? name : std::to_string(type);
}

std::optional<bn_type> find_type(const std::string &name)
{
    bn_type type = 0;
    const bool found =
        is_whole_text(name) && lc_string_to_enum(bn_type_map, name.c_str(), &type) == 0;
    return found ? std::optional(type) : std::nullopt;
}

} // namespace ovhost

#include "host/support/user_name.h"

#include <grp.h>
#include <pwd.h>

#include <cerrno>
#include <vector>

namespace ovhost
{

namespace
{

/// Calls `look_up` with more and more room for the texts of an entry, until they fit.
template <typename LookUp>
void with_room(LookUp look_up)
{
    constexpr std::size_t largest = 1UL << 20;
    std::vector<char> texts(1024);
    while (look_up(texts) == ERANGE && texts.size() < largest) {
        texts.resize(texts.size() * 2);
    }
}

} // namespace

std::string user_name(uid_t user)
{
    std::string name = std::to_string(user);
    with_room([&](std::vector<char> &texts) {
        passwd entry{};
        passwd *found = nullptr;
        const int error = ::getpwuid_r(user, &entry, texts.data(), texts.size(), &found);
        if (found != nullptr) {
            name = found->pw_name;
        }
        return error;
    });
    return name;
}

std::optional<gid_t> find_group(const std::string &name)
{
    std::optional<gid_t> number;
    with_room([&](std::vector<char> &texts) {
        group entry{};
        group *found = nullptr;
        const int error = ::getgrnam_r(name.c_str(), &entry, texts.data(), texts.size(), &found);
        if (found != nullptr) {
            number = found->gr_gid;
        }
        return error;
    });
    return number;
}

} // namespace ovhost

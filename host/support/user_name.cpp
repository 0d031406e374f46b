#include "host/support/user_name.h"

#include <pwd.h>

#include <cerrno>
#include <vector>

namespace ovhost
{

std::string user_name(uid_t user)
{
    constexpr std::size_t largest = 1UL << 20;
    passwd entry{};
    passwd *found = nullptr;
    std::vector<char> texts(1024);
    while (::getpwuid_r(user, &entry, texts.data(), texts.size(), &found) == ERANGE &&
           texts.size() < largest)
        texts.resize(texts.size() * 2);
    return found != nullptr ? found->pw_name : std::to_string(user);
}

} // namespace ovhost

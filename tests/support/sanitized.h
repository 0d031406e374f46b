#pragma once
// Whether the tests run under the address sanitizer, which takes several times as long: the longest
// of them then go fewer of the same steps.

namespace ovtest
{

#if defined(__SANITIZE_ADDRESS__)
inline constexpr bool sanitized = true;
#elif defined(__has_feature)
#if __has_feature(address_sanitizer)
inline constexpr bool sanitized = true;
#else
inline constexpr bool sanitized = false;
#endif
#else
inline constexpr bool sanitized = false;
#endif

} // namespace ovtest

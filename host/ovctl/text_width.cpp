#include "host/ovctl/text_width.h"

#include "host/support/utf8.h"

#include <algorithm>
#include <clocale>
#include <cwchar>

namespace ovhost
{

namespace
{

/// The character set is always UTF-8 here, whatever the user's locale says of the terminal: bytes
/// are printed as they are.
class Utf8Locale
{
  public:
    Utf8Locale() : locale_(::newlocale(LC_CTYPE_MASK, "C.UTF-8", nullptr))
    {
        if (locale_ != nullptr) {
            before_ = ::uselocale(locale_);
        }
    }
    ~Utf8Locale()
    {
        if (locale_ == nullptr) {
            return;
        }
        ::uselocale(before_);
        ::freelocale(locale_);
    }
    Utf8Locale(const Utf8Locale &) = delete;
    Utf8Locale &operator=(const Utf8Locale &) = delete;

  private:
    locale_t locale_;
    locale_t before_ = nullptr;
};

struct Character {
    std::size_t bytes;
    std::size_t width;
};

Character first_character(std::string_view text)
{
    const std::size_t bytes = std::max<std::size_t>(utf8_character_length(text), 1);
    wchar_t character = 0;
    std::mbstate_t state{};
    if (std::mbrtowc(&character, text.data(), bytes, &state) != bytes) {
        return {bytes, 1};
    }
    // Unassigned ones have no width; terminals show something for them.
    const int width = ::wcwidth(character);
    return {bytes, width < 0 ? 1 : static_cast<std::size_t>(width)};
}

/// The bytes of the longest beginning that takes up no more than `width` columns.
std::size_t bytes_within(std::string_view text, std::size_t width)
{
    const Utf8Locale utf8;
    std::size_t bytes = 0;
    while (bytes < text.size()) {
        const Character next = first_character(text.substr(bytes));
        if (next.width > width) {
            break;
        }
        width -= next.width;
        bytes += next.bytes;
    }
    return bytes;
}

} // namespace

std::size_t width_of(std::string_view text)
{
    const Utf8Locale utf8;
    std::size_t width = 0;
    while (!text.empty()) {
        const Character next = first_character(text);
        width += next.width;
        text.remove_prefix(next.bytes);
    }
    return width;
}

std::string fitted(std::string_view text, std::size_t width)
{
    if (bytes_within(text, width) == text.size()) {
        return std::string(text);
    }
    const std::size_t bytes = width == 0 ? 0 : bytes_within(text, width - 1);
    return std::string(text.substr(0, bytes)) + (width == 0 ? "" : "…");
}

} // namespace ovhost

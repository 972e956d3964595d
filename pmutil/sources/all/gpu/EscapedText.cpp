#include "all/gpu/EscapedText.h"

#include "pmutil/Escape.h"

namespace pmutil {

namespace {
constexpr char kQuote = '"';
constexpr char kNullText[] = "<NULL>";
} // namespace

std::string EscapedOrNull(const char* text)
{
    return text == nullptr ? kNullText : EscapeText(std::string_view(text), kQuote);
}

std::string EscapedOrNull(const char16_t* text)
{
    return text == nullptr ? kNullText : EscapeText(std::u16string_view(text), kQuote);
}

} // namespace pmutil

#include "pmutil/Format.h"

#include <cstdio>
#include <cstring>
#include <iterator>

namespace pmutil {

namespace {

// Returns the length of the text as vsnprintf does; `buffer` has all of it only if it fits.
// Negative on failure.
PMUTIL_PRINTF(3, 0)
int TryFormat(char* buffer, std::size_t size, const char* format, std::va_list arguments)
{
    std::va_list again;
    va_copy(again, arguments);
    const int length = std::vsnprintf(buffer, size, format, again);
    va_end(again);
    return length;
}

} // namespace

std::string FormatStringV(const char* format, std::va_list arguments)
{
    // The format of all log statements; vsnprintf is slower.
    if (std::strcmp(format, "%s") == 0) {
        std::va_list again;
        va_copy(again, arguments);
        const char* const text = va_arg(again, const char*);
        va_end(again);
        if (text != nullptr)
            return text;
    }
    constexpr int kMaxGrowths = 2;
    char first[256];
    int length = TryFormat(first, std::size(first), format, arguments);
    if (length >= 0 && static_cast<std::size_t>(length) < std::size(first))
        return std::string(first, static_cast<std::size_t>(length));
    for (int growths = 0; length >= 0 && growths < kMaxGrowths; ++growths) {
        std::string text(static_cast<std::size_t>(length), '\0');
        length = TryFormat(text.data(), text.size() + 1, format, arguments);
        // A second attempt is needed only if another thread changes an argument meanwhile.
        if (length >= 0 && static_cast<std::size_t>(length) <= text.size()) {
            text.resize(static_cast<std::size_t>(length));
            return text;
        }
    }
    return {};
}

std::string FormatString(const char* format, ...)
{
    std::va_list arguments;
    va_start(arguments, format);
    std::string text;
    try {
        text = FormatStringV(format, arguments);
    } catch (...) {
        va_end(arguments);
        throw;
    }
    va_end(arguments);
    return text;
}

std::string MakeHexFormat(int bytes, const char* lengthModifier)
{
    return FormatString("0x%%0%d%sx", 2 * bytes, lengthModifier);
}

} // namespace pmutil

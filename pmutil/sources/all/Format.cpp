#include "pmutil/Format.h"

#include <cstdio>
#include <vector>

namespace pmutil {

namespace {

// The C library's length for the text, which is in `buffer` only if it fits; negative on failure.
PMUTIL_PRINTF(2, 0)
int TryFormat(std::vector<char>& buffer, const char* format, std::va_list arguments)
{
    std::va_list again;
    va_copy(again, arguments);
    const int length = std::vsnprintf(buffer.data(), buffer.size(), format, again);
    va_end(again);
    return length;
}

} // namespace

std::string FormatStringV(const char* format, std::va_list arguments)
{
    constexpr std::size_t kFirstSize = 256;
    constexpr int kMaxGrowths = 2;
    std::vector<char> buffer(kFirstSize);
    for (int growths = 0;; ++growths) {
        const int length = TryFormat(buffer, format, arguments);
        if (length < 0)
            return {};
        const auto size = static_cast<std::size_t>(length);
        if (size < buffer.size())
            return std::string(buffer.data(), size);
        // Only a value that changes between the attempts gets here more than once.
        if (growths == kMaxGrowths)
            return {};
        buffer.resize(size + 1);
    }
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

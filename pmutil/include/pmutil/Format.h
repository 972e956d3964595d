// printf-style formatting into strings.
#pragma once

#include <cstdarg>
#include <string>

namespace pmutil {

#if defined(__clang__)
#define PMUTIL_PRINTF(formatIndex, firstArgument)                                                  \
    __attribute__((format(printf, formatIndex, firstArgument)))
#elif defined(__GNUC__)
#define PMUTIL_PRINTF(formatIndex, firstArgument)                                                  \
    __attribute__((format(gnu_printf, formatIndex, firstArgument)))
#else
#define PMUTIL_PRINTF(formatIndex, firstArgument)
#endif

// A printf-style format and its arguments as a string of any length.
std::string FormatString(const char* format, ...) PMUTIL_PRINTF(1, 2);
std::string FormatStringV(const char* format, std::va_list arguments) PMUTIL_PRINTF(1, 0);

// A format text for hexadecimal output of an integer of `bytes` bytes: MakeHexFormat(4, "l") gives
// "0x%08lx".
std::string MakeHexFormat(int bytes, const char* lengthModifier);

} // namespace pmutil

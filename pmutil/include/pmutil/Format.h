// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// printf-style formatting to strings.
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

// Format the arguments to a string of any length. Return an empty string if the C library fails.
std::string FormatString(const char* format, ...) PMUTIL_PRINTF(1, 2);
std::string FormatStringV(const char* format, std::va_list arguments) PMUTIL_PRINTF(1, 0);

// Returns a hexadecimal format for an integer of `bytes` bytes: MakeHexFormat(4, "l") returns
// "0x%08lx".
std::string MakeHexFormat(int bytes, const char* lengthModifier);

} // namespace pmutil

// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// Writes lines to a C stream on which a write may fail after any byte: a full disk, or a
// non-blocking pipe.
#pragma once

#include <cstddef>
#include <cstdio>
#include <string>

#include "pmutil/System.h"

namespace pmutil {

// Writes `line`, which must end with a line end, by one call of put(text), which returns the number
// of bytes that were written. Returns false if not all were written; the line is then lost. If a
// part was written, the next call writes a line end first, so that the next line starts on a new
// line. Until then the stream's error indicator stays set, so that all callers see that state.
//
// The stream must be unbuffered: a buffered stream accepts the whole line and fails at the flush.
template <typename Put>
bool PutLine(std::FILE* stream, std::string line, const Put& put)
{
    const bool wasCut = std::ferror(stream) != 0;
    if (wasCut)
        line.insert(0, 1, '\n');
    std::clearerr(stream);
    const std::size_t written = put(line);
    if (written == line.size())
        return true;
    const bool isCut = wasCut ? written != 1 : written != 0;
    if (!isCut)
        DiscardUnwritten(stream);
    return false;
}

} // namespace pmutil

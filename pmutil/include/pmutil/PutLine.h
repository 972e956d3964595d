// Lines on a C stream that may fail at any byte: a full disk, a pipe that doesn't wait for its
// reader.
#pragma once

#include <cstddef>
#include <cstdio>
#include <string>

#include "pmutil/System.h"

namespace pmutil {

// Writes `line`, which ends in a line end, by one call of put(text), which returns how many of the
// text's bytes `stream` took. Returns false if it didn't take all; the line is lost then. If it
// took a part, the next line begins with a line end, so that it stands on a line of its own. The
// stream's error indicator stays set until then, so that all writers of lines share that state.
//
// The stream must be unbuffered for that: a buffered one takes any line whole, and fails when it is
// flushed.
template <typename Put>
bool PutLine(std::FILE* stream, std::string line, const Put& put)
{
    const bool wasCut = std::ferror(stream) != 0;
    if (wasCut)
        line.insert(0, 1, '\n');
    std::clearerr(stream);
    const std::size_t taken = put(line);
    if (taken == line.size())
        return true;
    const bool isCut = wasCut ? taken != 1 : taken != 0;
    if (!isCut)
        DiscardUnwritten(stream);
    return false;
}

} // namespace pmutil

// Lines on the process's standard streams.
#pragma once

#include <cstdio>
#include <ostream>
#include <string>

namespace assay {

// The text, or "<NULL>" for a null pointer.
inline const char* TextOrNull(const char* text)
{
    return text != nullptr ? text : "<NULL>";
}

// Takes the buffer from standard output, so that a line that it doesn't take whole is known to be
// cut. Call it before the first output.
void PrepareOutput();

// Writes the text and a line end in one piece to `out` and flushes it. `file` is the C stream
// behind `out`. If that fails the line is lost, the result is false, and the next line is tried
// afresh; it begins with a line end if a part of this one got out. Never throws.
bool WriteLine(std::ostream& out, std::FILE* file, const std::string& text) noexcept;

} // namespace assay

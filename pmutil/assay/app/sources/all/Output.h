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

// Writes the text and a line end to `out` and flushes it. `file` is the C stream behind `out`. If
// that fails the line is lost, the result is false, and both streams are ready to try the next line
// afresh. Never throws.
bool WriteLine(std::ostream& out, std::FILE* file, const std::string& text) noexcept;

} // namespace assay

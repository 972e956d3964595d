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

// Makes standard output unbuffered, so that WriteLine detects a line that is written only in part.
// Call it before the first output.
void PrepareOutput();

// Writes the text and a line end in one call to `out` and flushes it. `file` is the C stream of
// `out`. Returns false if that fails; the line is then lost. If a part of it was written, the next
// line begins with a line end. Never throws.
bool WriteLine(std::ostream& out, std::FILE* file, const std::string& text) noexcept;

} // namespace assay
